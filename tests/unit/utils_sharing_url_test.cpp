#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <velksharing/utils.h>

#include <climits>
#include <cstdio>
#include <string>

#include "support/log_capture.h"
#include "support/log_matcher.h"
#include "support/scripted_program.h"
#include "velk_paths.h"

namespace {

using namespace VELK::sharing;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;
using velk_test::ErrorLine;
using velk_test::FailedCondition;
using velk_test::LogCapture;
using velk_test::ScriptedProgram;

/// What a call gave; `url` and `type` began as "before" and 77.
struct Answer {
  bool done = false;
  std::string url = "before";
  int type = 77;
};

Answer Ask() {
  Answer answer;
  auto type = static_cast<_tag_SHARING_URL_TYPE>(answer.type);
  answer.done = GetSharingURL("hash", 0, false, "", "", answer.url, type);
  answer.type = type;
  return answer;
}

/// The answer when the program prints `output`, a format of printf(1).
Answer AnswerTo(const std::string &output) {
  const ScriptedProgram program("printf '" + output + "'");
  return Ask();
}

void ExpectAnswer(const Answer &answer, const std::string &url, int type) {
  EXPECT_TRUE(answer.done);
  EXPECT_EQ(answer.url, url);
  EXPECT_EQ(answer.type, type);
}

TEST(GetSharingUrl, GivesTheTwoLinesOfTheProgram) {
  const LogCapture log;
  ExpectAnswer(AnswerTo("abc\\n1\\n"), "abc", 1);
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST(GetSharingUrl, RunsTheProgramWithFiveArguments) {
  const ScriptedProgram program("printf '%s\\n' \"$#\" 0");
  std::string url;
  _tag_SHARING_URL_TYPE type;
  EXPECT_TRUE(GetSharingURL("aB3", 8443, true, "files.example.org", "/s/", url, type));
  EXPECT_EQ(url, "5");
  ASSERT_THAT(program.calls(), SizeIs(1));
  EXPECT_EQ(program.calls()[0].path, VELK_ROOT "/bin/velksharingurl");
  EXPECT_EQ(program.calls()[0].mode, "r");
  EXPECT_THAT(program.calls()[0].arguments,
              ElementsAre("velksharingurl", "aB3", "8443", "1", "files.example.org", "/s/"));
}

TEST(GetSharingUrl, PassesEmptyTextsAsEmptyArguments) {
  const ScriptedProgram program("printf '[%s]' \"$@\"; printf '\\n0\\n'");
  std::string url;
  _tag_SHARING_URL_TYPE type;
  EXPECT_TRUE(GetSharingURL("", 0, false, "", "", url, type));
  EXPECT_EQ(url, "[][0][0][][]");
}

TEST(GetSharingUrl, PassesAnEmptyFourthArgumentInItsShortForm) {
  const ScriptedProgram program("printf '[%s]' \"$@\"; printf '\\n4\\n'");
  std::string url;
  _tag_SHARING_URL_TYPE type;
  EXPECT_TRUE(GetSharingURL("aB3", 443, true, "/s/", url, type));
  EXPECT_EQ(url, "[aB3][443][1][][/s/]");
  EXPECT_EQ(type, 4);
}

TEST(GetSharingUrl, PassesNumbersInSignedDecimal) {
  for (const int number : {INT_MIN, -1, 0, INT_MAX}) {
    const ScriptedProgram program("echo \"$2\"; echo 0");
    std::string url;
    _tag_SHARING_URL_TYPE type;
    EXPECT_TRUE(GetSharingURL("hash", number, true, "", "", url, type));
    EXPECT_EQ(url, std::to_string(number));
  }
}

TEST(GetSharingUrl, PassesTextsAsTheyAreWithoutAShell) {
  const ScriptedProgram program("printf '%s' \"$1$4$5\" >\"$FOLDER/got\"; printf 'u\\n0\\n'");
  std::string url;
  _tag_SHARING_URL_TYPE type;
  EXPECT_TRUE(GetSharingURL("a b;$(exit)", 0, true, "'\"\n*", "\\\xff\xc3", url, type));
  EXPECT_EQ(velk_test::ReadFile(program.File("got")), "a b;$(exit)'\"\n*\\\xff\xc3");
}

TEST(GetSharingUrl, TakesAnAnswerThatIgnoresItsArguments) {
  ExpectAnswer(AnswerTo("https://example.org/x\\n2\\nmore\\n"), "https://example.org/x", 2);
}

TEST(GetSharingUrl, MayWriteTheUrlOverTheHash) {
  const ScriptedProgram program("echo \"url of $1\"; echo 1");
  std::string text = "aB3";
  _tag_SHARING_URL_TYPE type;
  EXPECT_TRUE(GetSharingURL(text, 0, false, text, text, text, type));
  EXPECT_EQ(text, "url of aB3");
}

TEST(GetSharingUrl, DropsTheLastCharacterOfALineWithoutNewline) {
  const Answer answer = AnswerTo("abc");
  EXPECT_FALSE(answer.done);
  EXPECT_EQ(answer.url, "ab");
  EXPECT_EQ(answer.type, 77);
}

TEST(GetSharingUrl, LogsAMissingSecondLine) {
  const LogCapture log;
  const Answer answer = AnswerTo("abc\\n");
  EXPECT_FALSE(answer.done);
  EXPECT_EQ(answer.url, "abc");
  EXPECT_EQ(answer.type, 77);
  EXPECT_THAT(log.lines(),
              ElementsAre(FailedCondition("utils_sharing_url",
                                          "NULL == fgets(szType, TYPE_BUF_SIZE_, file.file)")));
}

TEST(GetSharingUrl, LogsAMissingFirstLineAndLeavesTheUrlAlone) {
  const LogCapture log;
  const Answer answer = AnswerTo("");
  EXPECT_FALSE(answer.done);
  EXPECT_EQ(answer.url, "before");
  EXPECT_EQ(answer.type, 77);
  EXPECT_THAT(log.lines(), ElementsAre(FailedCondition(
                               "utils_sharing_url", "NULL == fgets(szUrl, BUF_SIZE_, file.file)")));
}

TEST(GetSharingUrl, LogsThatTheProgramCannotBeStarted) {
  const LogCapture log;
  const ScriptedProgram program("");
  ASSERT_EQ(remove(program.path().c_str()), 0);
  const Answer answer = Ask();
  EXPECT_FALSE(answer.done);
  EXPECT_EQ(answer.url, "before");
  EXPECT_EQ(answer.type, 77);
  EXPECT_THAT(log.lines(),
              ElementsAre(ErrorLine("%s:%d (%u) VLIBCPopenv failed.\n",
                                    "include/internal/popen:# (@) VLIBCPopenv failed.\n"),
                          ErrorLine("%s:%d (%u) popen failed\n\n",
                                    "utils_sharing_url:# (@) popen failed\n\n")));
}

TEST(GetSharingUrl, TakesAnEmptyFirstLineForAnEmptyUrl) {
  ExpectAnswer(AnswerTo("\\n5\\n"), "", 5);
}

TEST(GetSharingUrl, TakesAUrlThatFillsTheLine) {
  const std::string url(4094, 'x');
  ExpectAnswer(AnswerTo(url + "\\n6\\n"), url, 6);
}

TEST(GetSharingUrl, CutsALongerUrlAndReadsItsRestAsTheType) {
  ExpectAnswer(AnswerTo(std::string(4095, 'x') + "\\n6\\n"), std::string(4094, 'x'), 0);
  ExpectAnswer(AnswerTo(std::string(4095, 'x') + "1234\\n6\\n"), std::string(4094, 'x'), 123);
}

TEST(GetSharingUrl, CutsAUrlOfOneHundredMegabytes) {
  const ScriptedProgram program("head -c 100000000 /dev/zero | tr '\\0' x");
  ExpectAnswer(Ask(), std::string(4094, 'x'), 0);
}

TEST(GetSharingUrl, ReadsThreeCharactersOfTheType) {
  ExpectAnswer(AnswerTo("abc\\n12345\\n"), "abc", 123);
  ExpectAnswer(AnswerTo("abc\\n-12345"), "abc", -12);
}

TEST(GetSharingUrl, NeedsNoNewlineBehindTheType) {
  ExpectAnswer(AnswerTo("abc\\n7"), "abc", 7);
}

TEST(GetSharingUrl, TakesATypeThatIsNoNumberForZero) {
  for (const char *const type : {"\\n", "x\\n", "-\\n", " \\n", "\\0001\\n", "\\377"})
    ExpectAnswer(AnswerTo("abc\\n" + std::string(type)), "abc", 0);
}

TEST(GetSharingUrl, ReadsTheNumberThatTheTypeBeginsWith) {
  ExpectAnswer(AnswerTo("abc\\n +4\\n"), "abc", 4);
  ExpectAnswer(AnswerTo("abc\\n4x\\n"), "abc", 4);
}

TEST(GetSharingUrl, EndsTheUrlAtAZeroByte) {
  ExpectAnswer(AnswerTo("ab\\000cd\\n3\\n"), "ab", 3);
  ExpectAnswer(AnswerTo("\\000\\n3\\n"), "", 3);
}

TEST(GetSharingUrl, GivesBytesThatAreNotUtf8AsTheyAre) {
  ExpectAnswer(AnswerTo("a\\377\\303\\n3\\n"), "a\xff\xc3", 3);
}

TEST(GetSharingUrl, KeepsTheCarriageReturnOfALine) {
  ExpectAnswer(AnswerTo("abc\\r\\n3\\r\\n"), "abc\r", 3);
}

TEST(GetSharingUrl, DoesNotLookAtTheExitStatus) {
  const LogCapture log;
  const ScriptedProgram program("printf 'abc\\n1\\n'; exit 2");
  ExpectAnswer(Ask(), "abc", 1);
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST(GetSharingUrl, StartsNoProgramForATextWithAZeroByte) {
  const std::string zero("a\0b", 3);
  for (int position = 0; position < 3; ++position) {
    const LogCapture log;
    const ScriptedProgram program("printf 'abc\\n1\\n'");
    std::string url = "before";
    _tag_SHARING_URL_TYPE type;
    EXPECT_FALSE(GetSharingURL(position == 0 ? zero : "hash", 0, true, position == 1 ? zero : "",
                               position == 2 ? zero : "", url, type));
    EXPECT_EQ(url, "before");
    EXPECT_THAT(program.calls(), IsEmpty());
    EXPECT_THAT(log.lines(), SizeIs(2));
  }
}

TEST(GetSharingUrl, FailsForATextThatIsTooLongForAnArgument) {
  const LogCapture log;
  const ScriptedProgram program("printf 'abc\\n1\\n'");
  std::string url = "before";
  _tag_SHARING_URL_TYPE type;
  EXPECT_FALSE(GetSharingURL(std::string(10u << 20, 'x'), 0, true, "", "", url, type));
  EXPECT_EQ(url, "before");
  EXPECT_THAT(log.lines(), SizeIs(2));
}

}  // namespace
