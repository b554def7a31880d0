#include <gtest/gtest.h>
#include <velksharing/database.h>

#include <limits>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "support/temp_dir.h"

namespace {

using VELK::sharing::db::BaseDB;
using VELK::sharing::db::Field;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using velk_test::TempDir;

class ResultOfAQuery : public ::testing::Test {
 protected:
  void Run(const std::string &sql) { ASSERT_TRUE(db_.Execute(sql, result_)) << db_.GetLastError(); }

  TempDir folder_;
  BaseDB db_{folder_.File("result.db"), 0600};
  Result result_;
  Row row_;
};

TEST(Result, HasNoRowsWithoutAHandle) {
  Result result;
  Row row;
  EXPECT_FALSE(result.IsGood());
  EXPECT_FALSE(result.NextRow(row));
  EXPECT_FALSE(row.IsGood());
}

TEST(Result, HasNoRowsWithANullHandle) {
  Result result(nullptr);
  Row row;
  EXPECT_FALSE(result.IsGood());
  EXPECT_FALSE(result.NextRow(row));
}

TEST_F(ResultOfAQuery, WalksTheRowsInOrder) {
  Run("SELECT 1 AS n UNION ALL SELECT 2 UNION ALL SELECT 3");
  std::vector<int> numbers;
  while (result_.NextRow(row_)) numbers.push_back(row_.GetField("n").AsInt(0));
  EXPECT_EQ((std::vector<int>{1, 2, 3}), numbers);
}

TEST_F(ResultOfAQuery, LeavesTheRowAloneAtTheEnd) {
  Run("SELECT 'last' AS t");
  ASSERT_TRUE(result_.NextRow(row_));
  EXPECT_FALSE(result_.NextRow(row_));
  EXPECT_FALSE(result_.NextRow(row_));
  EXPECT_EQ("last", row_.GetField("t").AsString(""));
}

TEST_F(ResultOfAQuery, IsGoodWithoutRows) {
  Run("SELECT 1 AS n WHERE 0");
  EXPECT_TRUE(result_.IsGood());
  EXPECT_FALSE(result_.NextRow(row_));
  EXPECT_FALSE(row_.IsGood());
}

TEST_F(ResultOfAQuery, IsNotGoodForAStatementThatGivesNoColumns) {
  Run("CREATE TABLE item (id INTEGER)");
  EXPECT_FALSE(result_.IsGood());
  EXPECT_FALSE(result_.NextRow(row_));
}

TEST_F(ResultOfAQuery, OutlivesItsConnection) {
  {
    BaseDB brief(folder_.File("brief.db"), 0600);
    ASSERT_TRUE(brief.Execute("SELECT 'kept' AS t", result_));
  }
  ASSERT_TRUE(result_.NextRow(row_));
  EXPECT_EQ("kept", row_.GetField("t").AsString(""));
}

TEST_F(ResultOfAQuery, KeepsEarlierRowsReadable) {
  Run("SELECT 1 AS n UNION ALL SELECT 2");
  ASSERT_TRUE(result_.NextRow(row_));
  Row second;
  ASSERT_TRUE(result_.NextRow(second));
  EXPECT_EQ(1, row_.GetField("n").AsInt(0));
  EXPECT_EQ(2, second.GetField("n").AsInt(0));
}

TEST(Row, IsNotGoodByDefault) {
  const Row row;
  EXPECT_FALSE(row.IsGood());
  EXPECT_EQ(7, row.GetField("any").AsInt(7));
  EXPECT_FALSE(row.GetField("any").AsBool(true));
  EXPECT_EQ("", row.GetField("any").AsString("other"));
}

TEST(Row, IsNotGoodOnANullResult) {
  EXPECT_FALSE(Row(nullptr, 3).IsGood());
}

TEST_F(ResultOfAQuery, GivesARowThatCanBeCopiedAndLetGo) {
  Run("SELECT 'text' AS t");
  ASSERT_TRUE(result_.NextRow(row_));
  Row copy(row_);
  EXPECT_EQ("text", copy.GetField("t").AsString(""));
  copy.SetResult(nullptr);
  EXPECT_FALSE(copy.IsGood());
  EXPECT_TRUE(row_.IsGood());
}

TEST_F(ResultOfAQuery, GivesARowThatCanBeTurnedToAnother) {
  Run("SELECT 'a' AS t UNION ALL SELECT 'b'");
  Row second;
  ASSERT_TRUE(result_.NextRow(row_));
  ASSERT_TRUE(result_.NextRow(second));
  second.SetRow(0);
  EXPECT_EQ("a", second.GetField("t").AsString(""));
}

TEST_F(ResultOfAQuery, GivesEmptyTextForNullAndForUnknownColumns) {
  Run("SELECT NULL AS n, 'x' AS t");
  ASSERT_TRUE(result_.NextRow(row_));
  EXPECT_EQ("", row_.GetField("n").AsString("default"));
  EXPECT_EQ("", row_.GetField("nowhere").AsString("default"));
  EXPECT_EQ("", row_.GetField("").AsString("default"));
  EXPECT_EQ(5, row_.GetField("n").AsInt(5));
}

TEST_F(ResultOfAQuery, FindsColumnsByTheirOutputName) {
  Run("SELECT COUNT(*) AS c FROM sqlite_master");
  ASSERT_TRUE(result_.NextRow(row_));
  EXPECT_EQ(0, row_.GetField("c").AsInt(-1));
}

TEST_F(ResultOfAQuery, KeepsEveryByteButZero) {
  std::string bytes;
  for (int byte = 1; byte < 256; ++byte) bytes.push_back(static_cast<char>(byte));
  Run("SELECT '" + db_.Escape(bytes) + "' AS t");
  ASSERT_TRUE(result_.NextRow(row_));
  EXPECT_EQ(bytes, row_.GetField("t").AsString(""));
}

TEST(Field, ConvertsItsText) {
  EXPECT_EQ(42, Field("42").AsInt(0));
  EXPECT_EQ(4294967295u, Field("4294967295").AsUInt(0));
  EXPECT_EQ(1700000000L, Field("1700000000").AsTime(0));
  EXPECT_FLOAT_EQ(0.25f, Field("0.25").AsFloat(1.5f));
}

TEST(Field, GivesTheDefaultWithoutANumber) {
  EXPECT_EQ(-3, Field("abc").AsInt(-3));
  EXPECT_EQ(3u, Field("").AsUInt(3));
  EXPECT_EQ(9L, Field(" ").AsTime(9));
  EXPECT_FLOAT_EQ(1.5f, Field("x").AsFloat(1.5f));
}

TEST(Field, IgnoresWhatFollowsTheNumber) {
  EXPECT_EQ(12, Field("12abc").AsInt(0));
}

TEST(Field, GivesTheDefaultForANumberOutOfRange) {
  EXPECT_EQ(5, Field("2147483648").AsInt(5));
  EXPECT_EQ(5, Field("-2147483649").AsInt(5));
  EXPECT_EQ(5u, Field("4294967296").AsUInt(5));
  EXPECT_EQ(5L, Field("9223372036854775808").AsTime(5));
}

TEST(Field, IsUsedUpOnceReadToItsEnd) {
  Field field("42");
  EXPECT_EQ(42, field.AsInt(0));
  EXPECT_EQ(0, field.AsInt(0));
  field.Clear();
  EXPECT_EQ(-1, field.AsInt(-1));
}

TEST(Field, IsUsedUpOnceAConversionFailed) {
  Field field("x12");
  EXPECT_EQ(1, field.AsInt(1));
  EXPECT_FLOAT_EQ(2.0f, field.AsFloat(2.0f));
}

TEST(Field, ConvertsAgainWhenTextWasLeftOver) {
  Field field("42 ");
  EXPECT_EQ(42, field.AsInt(0));
  EXPECT_EQ(42, field.AsInt(0));
}

TEST(Field, IsTrueForExactlyOneText) {
  EXPECT_TRUE(Field("1").AsBool(false));
  for (const char *text : {"0", "2", "yes", "true", "", " 1", "1 ", "01", "11"}) {
    EXPECT_FALSE(Field(text).AsBool(true)) << text;
    EXPECT_FALSE(Field(text).AsBool(false)) << text;
  }
}

TEST(Field, TellsItsTextAndTruthEvenWhenUsedUp) {
  Field field("1");
  EXPECT_EQ(1, field.AsInt(0));
  EXPECT_TRUE(field.AsBool(false));
  EXPECT_EQ("1", field.AsString("other"));
}

TEST(Field, GivesItsTextUnchanged) {
  const std::string text("a\0b\xff ", 5);
  Field field(text);
  EXPECT_EQ(text, field.AsString("default"));
}

TEST(Field, CopiesAndMovesWithItsText) {
  Field field("42");
  Field copy(field);
  EXPECT_EQ(42, copy.AsInt(0));
  Field moved(std::move(field));
  EXPECT_EQ(42, moved.AsInt(0));
  Field assigned("7");
  assigned = Field("8");
  EXPECT_EQ(8, assigned.AsInt(0));
  assigned = copy;
  EXPECT_EQ("42", assigned.AsString(""));
}

TEST(Field, ConvertsTextsOfTenMegabytes) {
  const size_t size = 10u << 20;
  EXPECT_EQ(7, Field(std::string(size, '0') + "7").AsInt(0));
  EXPECT_EQ(7, Field(std::string(size, ' ') + "7").AsInt(0));
  EXPECT_EQ(-1, Field(std::string(size, '9')).AsInt(-1));
  EXPECT_EQ(size, Field(std::string(size, 'x')).AsString("").size());
}

// The conversions promise to be those of a stream that is filled anew but keeps its state. Such a
// stream is what they are compared with.

class StreamField {
 public:
  explicit StreamField(std::string text) : text_(std::move(text)) {}

  template <typename T>
  T As(T def) {
    stream_.str(text_);
    T value = def;
    stream_ >> value;
    return stream_.fail() ? def : value;
  }

 private:
  std::string text_;
  std::stringstream stream_;
};

std::vector<std::string> NumberTexts() {
  const std::vector<std::string> blanks = {"", " ", "\t\n\v\f\r ", "\xc2\xa0"};
  const std::vector<std::string> signs = {"", "-", "+", "--", "+-", "- "};
  const std::vector<std::string> numbers = {
      "",
      "0",
      "00",
      "7",
      "42",
      "0042",
      "2147483647",
      "2147483648",
      "2147483649",
      "4294967295",
      "4294967296",
      "4294967297",
      "9999999999",
      "0x1A",
      "1e3",
      "1E+2",
      "1e-2",
      "1e",
      "1e+",
      "0.25",
      ".5",
      "5.",
      ".",
      "1.2.3",
      "1,234",
      "inf",
      "nan",
      "3.4e38",
      "3.5e38",
      "1e-46",
      "1e999",
      "1e-999",
      "1_000",
      "\xd9\xa1",
      "000000000001",
      "18446744073709551615",
      "18446744073709551616",
      "9223372036854775807",
      "9223372036854775808",
      "9223372036854775809",
      "340282346638528859811704183484516925440",
      "0.1000000000000000055511151231257827021181583404541015625",
      "99999999999999999999999999999999999999999999999999",
      "16777217",
      "1p3",
      "0b1"};
  const std::vector<std::string> tails = {
      "", " ", "x", "e5", ".5", ",", "-1", "\n1", std::string("\0", 1), "'"};
  std::vector<std::string> texts;
  for (const std::string &blank : blanks)
    for (const std::string &sign : signs)
      for (const std::string &number : numbers)
        for (const std::string &tail : tails) texts.push_back(blank + sign + number + tail);
  return texts;
}

template <typename T>
void ExpectLikeAStream(T (Field::*conversion)(T), T def) {
  for (const std::string &text : NumberTexts()) {
    Field field(text);
    StreamField stream(text);
    for (int round = 1; round <= 3; ++round) {
      ASSERT_EQ(stream.As(def), (field.*conversion)(def))
          << ::testing::PrintToString(text) << ", conversion " << round;
    }
  }
}

TEST(FieldLikeAStream, ConvertsToInt) {
  ExpectLikeAStream<int>(&Field::AsInt, 77);
  ExpectLikeAStream<int>(&Field::AsInt, 0);
}

TEST(FieldLikeAStream, ConvertsToUnsigned) {
  ExpectLikeAStream<unsigned int>(&Field::AsUInt, 77u);
}

TEST(FieldLikeAStream, ConvertsToTime) {
  ExpectLikeAStream<long>(&Field::AsTime, -77L);
}

TEST(FieldLikeAStream, ConvertsToFloat) {
  ExpectLikeAStream<float>(&Field::AsFloat, 77.5f);
}

TEST(FieldLikeAStream, ConvertsToOneTypeAfterAnother) {
  for (const std::string &text : NumberTexts()) {
    Field field(text);
    StreamField stream(text);
    const std::string shown = ::testing::PrintToString(text);
    ASSERT_EQ(stream.As<float>(1.5f), field.AsFloat(1.5f)) << shown;
    ASSERT_EQ(stream.As<int>(2), field.AsInt(2)) << shown;
    ASSERT_EQ(stream.As<unsigned int>(3u), field.AsUInt(3u)) << shown;
    ASSERT_EQ(stream.As<long>(4L), field.AsTime(4L)) << shown;
  }
}

}  // namespace
