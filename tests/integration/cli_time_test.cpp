// Times as an administrator types them.

#include <ctime>

#include "integration/cli_support.h"

namespace {

using velk_test::Outcome;

class CliTime : public velk_test::CommandLine {
 protected:
  /// What --expire makes of a text in the zone of Berlin; -1 when it is refused.
  static long Expiry(const std::string &text) {
    const Outcome outcome =
        Run({"link", "create", "--project", "files", "--expire", text}, "", {"TZ=Europe/Berlin"});
    if (outcome.status != 0) {
      EXPECT_EQ(2, outcome.status) << text;
      return -1;
    }
    const std::string hash = outcome.out.substr(0, outcome.out.find('\n'));
    return RunJson({"link", "show", hash})["expire_at"].asInt64();
  }
};

TEST_F(CliTime, LocalTime) {
  EXPECT_EQ(1798740000 - 3600, Expiry("2026-12-31 18:00"));
  EXPECT_EQ(1798740000 - 3600 + 7, Expiry("2026-12-31 18:00:07"));
  EXPECT_EQ(1798740000 - 3600, Expiry("2026-12-31T18:00"));
}

TEST_F(CliTime, Rfc3339) {
  EXPECT_EQ(1798740000, Expiry("2026-12-31T18:00:00Z"));
  EXPECT_EQ(1798740000, Expiry("2026-12-31T20:00:00+02:00"));
  EXPECT_EQ(1798740000, Expiry("2026-12-31T12:30:00-05:30"));
}

TEST_F(CliTime, SecondsSinceTheEpoch) {
  EXPECT_EQ(1, Expiry("@1"));
  EXPECT_EQ(253402300799, Expiry("@253402300799"));
}

TEST_F(CliTime, FromNow) {
  for (const auto &[text, seconds] : std::map<std::string, long>{
           {"+45s", 45}, {"+30m", 1800}, {"+2h", 7200}, {"+7d", 604800}, {"+1w", 604800}}) {
    const long before = time(nullptr);
    const long moment = Expiry(text);
    EXPECT_GE(moment, before + seconds) << text;
    EXPECT_LE(moment, time(nullptr) + seconds) << text;
  }
}

TEST_F(CliTime, WhatIsNoTimeIsRefused) {
  for (const char *text : {"",
                           "soon",
                           "2026-02-30 10:00",
                           "2026-12-31",
                           "2026-12-31 25:00",
                           "2026-12-31 18:00x",
                           "2026-12-31 18:00:0x",
                           "2026-12-31T18:00:00+2",
                           "2026-12-31T18:00:00+24:00",
                           "@",
                           "@x",
                           "@-5",
                           "@0",
                           "@253402300800",
                           "@99999999999999999999",
                           "+",
                           "+7",
                           "+d",
                           "+0d",
                           "+-7d",
                           "+7y",
                           "+99999999999d",
                           "2026-03-29 02:30"}) {
    EXPECT_EQ(-1, Expiry(text)) << text;
  }
}

TEST_F(CliTime, DetailsShowLocalTime) {
  const std::string hash = MakeLink({"--expire", "2026-12-31T18:00:00Z"});
  EXPECT_THAT(Run({"link", "show", hash}, "", {"TZ=Europe/Berlin"}).out,
              testing::HasSubstr("2026-12-31 19:00:00"));
}

}  // namespace
