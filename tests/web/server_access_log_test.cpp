#include "server/access_log.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "support/temp_dir.h"

namespace {

using testing::HasSubstr;
using testing::MatchesRegex;
using velk_test::ReadFile;
using velk_test::TempDir;
using web::AccessLine;
using web::AccessLog;
using web::Visit;

Visit SampleVisit() {
  Visit visit;
  visit.address = "192.0.2.7";
  visit.method = "GET";
  visit.note.route = "file";
  visit.note.link = "aB3…";
  visit.note.code = 1;
  visit.status = 206;
  visit.bytes = 5'000'000'000;
  return visit;
}

TEST(WebAccessLog, LineHasTheDocumentedWords) {
  EXPECT_THAT(AccessLine(SampleVisit()),
              MatchesRegex("[-0-9]+T[:0-9]+[.][0-9]{3}Z 192[.]0[.]2[.]7 GET file aB3… 206 "
                           "5000000000 [0-9]+[.][0-9] 1 done"));
}

TEST(WebAccessLog, WhatIsNotKnownIsADash) {
  Visit visit;
  visit.is_whole = false;
  EXPECT_THAT(AccessLine(visit), MatchesRegex("[^ ]+ - - none - - 0 [0-9.]+ 0 cut"));
}

TEST(WebAccessLog, BytesFromOutsideAreEscapedAndCut) {
  Visit visit = SampleVisit();
  visit.method = "G\nT\x1b \"" + std::string(100, 'x');
  visit.note.link = "a b…";
  EXPECT_THAT(AccessLine(visit), HasSubstr(" G\\x0aT\\x1b\\x20\\x22xxxxxxxxxx... "));
  EXPECT_THAT(AccessLine(visit), HasSubstr(" a\\x20b… "));
}

TEST(WebAccessLog, AppendsToItsFile) {
  const TempDir folder;
  const std::string path = folder.File("log");
  velk_test::WriteFile(path, "before\n");
  AccessLog log(path);
  std::string error;
  ASSERT_TRUE(log.Open(error)) << error;
  log.Write(SampleVisit());
  EXPECT_THAT(ReadFile(path), MatchesRegex("before\n[^\n]+ done\n"));
}

TEST(WebAccessLog, GoesOnWithItsFileWhenANewOneCannotBeHad) {
  const TempDir folder;
  const std::string old_name = folder.File("log");
  AccessLog log(old_name);
  std::string error;
  ASSERT_TRUE(log.Open(error)) << error;
  const std::string moved = folder.File("moved");
  rename(old_name.c_str(), moved.c_str());
  mkdir(old_name.c_str(), 0700);
  EXPECT_FALSE(log.Open(error));
  EXPECT_THAT(error, HasSubstr(old_name));
  log.Write(SampleVisit());
  EXPECT_THAT(ReadFile(moved), HasSubstr(" done\n"));
}

}  // namespace
