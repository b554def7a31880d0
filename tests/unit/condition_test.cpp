#include <gtest/gtest.h>
#include <velksharing/database.h>

#include <limits>

#include "support/temp_dir.h"

namespace {

using VELK::sharing::db::BaseDB;

class Condition : public ::testing::Test {
 protected:
  velk_test::TempDir folder_;
  BaseDB db_{folder_.File("condition.db"), 0600};
  VELK::sharing::db::Condition condition_{db_};
};

TEST_F(Condition, RendersNothingWhenEmpty) {
  EXPECT_TRUE(condition_.IsEmpty());
  EXPECT_EQ("", condition_.GetSQL());
}

TEST_F(Condition, RendersAColumnAndItsValue) {
  condition_.Where("a", "1");
  EXPECT_EQ(" WHERE `a` = '1'", condition_.GetSQL());
  EXPECT_FALSE(condition_.IsEmpty());
}

TEST_F(Condition, RendersAnExpressionAsItIs) {
  condition_.Where("a'b  > (1");
  EXPECT_EQ(" WHERE a'b  > (1", condition_.GetSQL());
}

TEST_F(Condition, ComparesWithTheEmptyText) {
  condition_.Where("col", "");
  EXPECT_EQ(" WHERE `col` = ''", condition_.GetSQL());
}

TEST_F(Condition, IgnoresAnEmptyExpressionAndAnEmptyColumn) {
  condition_.Where("").Where("", "").Where("", "value");
  condition_.OrWhere("").OrWhere("", "").OrWhere("", "value");
  EXPECT_TRUE(condition_.IsEmpty());
  EXPECT_EQ("", condition_.GetSQL());
}

TEST_F(Condition, EscapesValuesAndColumns) {
  condition_.Where("na'me", "O'Brien");
  EXPECT_EQ(" WHERE `na''me` = 'O''Brien'", condition_.GetSQL());
}

TEST_F(Condition, CutsAValueAtAZeroByte) {
  condition_.Where("a", std::string("x\0' OR 1", 8));
  EXPECT_EQ(" WHERE `a` = 'x'", condition_.GetSQL());
}

TEST_F(Condition, JoinsTermsWithAndAndOr) {
  condition_.Where("a", "1").OrWhere("b = 2").Where("c", "3").Where("d < 4");
  EXPECT_EQ(" WHERE `a` = '1' OR b = 2 AND `c` = '3' AND d < 4", condition_.GetSQL());
}

TEST_F(Condition, StartsWithWhereEvenForAnOr) {
  condition_.OrWhere("a = 1");
  EXPECT_EQ(" WHERE a = 1", condition_.GetSQL());
}

TEST_F(Condition, JoinsAColumnAndValueWithAndEvenInOrWhere) {
  condition_.Where("a", "1").OrWhere("b", "2");
  EXPECT_EQ(" WHERE `a` = '1' AND `b` = '2'", condition_.GetSQL());
}

TEST_F(Condition, OrdersByColumnsInTheOrderGiven) {
  condition_.OrderBy("a", true).OrderBy("b", false);
  EXPECT_EQ(" ORDER BY a DESC,b ASC", condition_.GetSQL());
}

TEST_F(Condition, KeepsAnEmptyOrderColumn) {
  condition_.OrderBy("", false);
  EXPECT_FALSE(condition_.IsEmpty());
  EXPECT_EQ(" ORDER BY  ASC", condition_.GetSQL());
}

TEST_F(Condition, EscapesOrderColumns) {
  condition_.OrderBy("a'b", false);
  EXPECT_EQ(" ORDER BY a''b ASC", condition_.GetSQL());
}

TEST_F(Condition, LimitTakesTheOffsetFirst) {
  condition_.Limit(20, 10);
  EXPECT_EQ(" LIMIT 10 OFFSET 20", condition_.GetSQL());
}

TEST_F(Condition, PageRendersLimitAndOffset) {
  condition_.Page(3, 10);
  EXPECT_EQ(" LIMIT 10 OFFSET 20", condition_.GetSQL());
}

TEST_F(Condition, TheFirstPageHasNoOffset) {
  condition_.Page(1, 10);
  EXPECT_EQ(" LIMIT 10", condition_.GetSQL());
}

TEST_F(Condition, APageBeforeTheFirstHasNoOffset) {
  condition_.Page(0, 10);
  EXPECT_EQ(" LIMIT 10", condition_.GetSQL());
}

TEST_F(Condition, APageBeyondAllNumbersStillHasItsSize) {
  const int most = std::numeric_limits<int>::max();
  condition_.Page(most, most);
  EXPECT_EQ(0u, condition_.GetSQL().find(" LIMIT 2147483647"));
  condition_.Page(std::numeric_limits<int>::min(), 10);
  EXPECT_EQ(0u, condition_.GetSQL().find(" LIMIT 10"));
}

TEST_F(Condition, RendersAnOffsetWithoutALimit) {
  condition_.Limit(5, 0);
  EXPECT_EQ(" OFFSET 5", condition_.GetSQL());
}

TEST_F(Condition, IsNotEmptyAfterALimitOfZero) {
  condition_.Limit(0, 0);
  EXPECT_FALSE(condition_.IsEmpty());
  EXPECT_EQ("", condition_.GetSQL());
}

TEST_F(Condition, IsEmptyAfterTheLimitThatMeansUnset) {
  condition_.Limit(-1, -1);
  EXPECT_TRUE(condition_.IsEmpty());
}

TEST_F(Condition, IgnoresNegativeLimits) {
  condition_.Limit(-20, -10);
  EXPECT_EQ("", condition_.GetSQL());
}

TEST_F(Condition, RendersFilterOrderAndPageInThisOrder) {
  condition_.Page(2, 5).OrderBy("a", false).Where("b", "1");
  EXPECT_EQ(" WHERE `b` = '1' ORDER BY a ASC LIMIT 5 OFFSET 5", condition_.GetSQL());
}

TEST_F(Condition, AccumulatesUntilItIsCleared) {
  condition_.Where("a", "1");
  EXPECT_EQ(condition_.GetSQL(), condition_.GetSQL());
  condition_.Where("b", "2").OrderBy("c", true).Page(1, 1);
  EXPECT_EQ(" WHERE `a` = '1' AND `b` = '2' ORDER BY c DESC LIMIT 1", condition_.GetSQL());
  condition_.Clear();
  EXPECT_TRUE(condition_.IsEmpty());
  EXPECT_EQ("", condition_.GetSQL());
}

TEST_F(Condition, EveryStepReturnsTheCondition) {
  EXPECT_EQ(&condition_, &condition_.Where("a = 1"));
  EXPECT_EQ(&condition_, &condition_.Where("a", "1"));
  EXPECT_EQ(&condition_, &condition_.OrWhere("a = 1"));
  EXPECT_EQ(&condition_, &condition_.OrWhere("a", "1"));
  EXPECT_EQ(&condition_, &condition_.OrderBy("a", true));
  EXPECT_EQ(&condition_, &condition_.Limit(1, 2));
  EXPECT_EQ(&condition_, &condition_.Page(1, 2));
  EXPECT_EQ(&condition_, &condition_.Clear());
}

TEST_F(Condition, OnAConnectionThatIsNotGoodStillRenders) {
  BaseDB broken(folder_.File("missing/condition.db"), 0600);
  VELK::sharing::db::Condition condition(broken);
  condition.Where("a", "O'Brien");
  EXPECT_EQ(" WHERE `a` = 'O''Brien'", condition.GetSQL());
}

}  // namespace
