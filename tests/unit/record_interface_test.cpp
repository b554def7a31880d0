#include <gtest/gtest.h>
#include <velksharing/record.h>

#include <set>
#include <type_traits>

#include "support/sample_records.h"

namespace {

using namespace VELK::sharing::record;

template <typename Record>
class RecordInterface : public ::testing::Test {};

using Records = ::testing::Types<Entry, Session, Token>;
TYPED_TEST_SUITE(RecordInterface, Records);

TYPED_TEST(RecordInterface, IsAValue) {
  EXPECT_TRUE(std::is_default_constructible_v<TypeParam>);
  EXPECT_TRUE(std::is_copy_constructible_v<TypeParam>);
  EXPECT_TRUE(std::is_copy_assignable_v<TypeParam>);
  EXPECT_TRUE(std::has_virtual_destructor_v<TypeParam>);
}

TYPED_TEST(RecordInterface, HoldsNothingButItsPrivateObject) {
  EXPECT_EQ(2 * sizeof(void *), sizeof(TypeParam));
}

TYPED_TEST(RecordInterface, HasOneNameForEveryColumn) {
  const TypeParam record;
  EXPECT_EQ(record.GetFieldList().size(), record.GetFieldMap().size());
}

TYPED_TEST(RecordInterface, HasTheSameTextsInListAndMap) {
  const TypeParam record;
  const std::vector<std::string> list = record.GetFieldList();
  std::multiset<std::string> of_map;
  for (const auto &[name, text] : record.GetFieldMap()) of_map.insert(text);
  EXPECT_EQ(std::multiset<std::string>(list.begin(), list.end()), of_map);
}

TYPED_TEST(RecordInterface, KeepsTheRowIdOutOfItsColumns) {
  TypeParam record;
  record.set_id(424242);
  EXPECT_EQ(0u, record.GetFieldMap().count("id"));
  for (const std::string &text : record.GetFieldList()) EXPECT_NE("424242", text);
}

TYPED_TEST(RecordInterface, CannotBeLoadedFromARowThatIsNotGood) {
  TypeParam record;
  EXPECT_FALSE(record.FromRow(VELK::sharing::db::Row()));
}

TYPED_TEST(RecordInterface, GivesAnObjectAsJson) {
  Json::Value json;
  TypeParam().ToJSON(json);
  EXPECT_TRUE(json.isObject());
  Json::Value through_object;
  TypeParam().GetCObject().ToJSON(through_object);
  EXPECT_EQ(json, through_object);
}

}  // namespace
