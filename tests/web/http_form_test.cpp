#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "http/form.h"

namespace {

using testing::ElementsAre;
using web::Form;

std::string Value(const std::optional<Form> &form, const char *name) {
  const std::string *value = form ? form->Find(name) : nullptr;
  return value == nullptr ? "(none)" : *value;
}

TEST(Form, DecodesNamesAndValues) {
  const auto form = Form::Parse("a=1&b+c=x%2By+z&%C3%A4=%26");
  EXPECT_EQ("1", Value(form, "a"));
  EXPECT_EQ("x+y z", Value(form, "b c"));
  EXPECT_EQ("&", Value(form, "ä"));
}

TEST(Form, AFieldWithoutAnEqualsSignIsThere) {
  const auto form = Form::Parse("zip&a=");
  EXPECT_EQ("", Value(form, "zip"));
  EXPECT_EQ("", Value(form, "a"));
  EXPECT_TRUE(form->Has("zip"));
  EXPECT_FALSE(form->Has("z"));
}

TEST(Form, TheFirstOfEqualNamesCounts) {
  EXPECT_EQ("1", Value(Form::Parse("a=1&a=2"), "a"));
}

TEST(Form, GivesEveryValueOfAName) {
  const auto form = Form::Parse("name=a&x=1&name=b");
  ASSERT_TRUE(form);
  EXPECT_THAT(form->All("name"), ElementsAre("a", "b"));
}

TEST(Form, AValueMayHoldEqualsSigns) {
  EXPECT_EQ("b=c", Value(Form::Parse("a=b=c"), "a"));
}

TEST(Form, PassesOverEmptyFields) {
  EXPECT_EQ("1", Value(Form::Parse("&&a=1&"), "a"));
  EXPECT_TRUE(Form::Parse(""));
}

TEST(Form, RefusesWhatIsBroken) {
  for (const char *broken : {"a=%", "a=%zz", "%4=1", "a=b c", "a=\r\n", "a=%00", "%00=a"})
    EXPECT_FALSE(Form::Parse(broken)) << broken;
  EXPECT_FALSE(Form::Parse(std::string_view("a=\0b", 4)));
}

TEST(Form, RefusesTooManyFields) {
  std::string encoded = "a=1";
  for (size_t count = 1; count < Form::kMostFields; ++count) encoded += "&a=1";
  EXPECT_TRUE(Form::Parse(encoded));
  EXPECT_FALSE(Form::Parse(encoded + "&a=1"));
}

}  // namespace
