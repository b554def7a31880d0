// On a machine with winbind and a domain: ctest puts a libwbclient.so.0 in the loader's way that
// behaves as if there were.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

#include "support/process.h"
#include "support/temp_dir.h"
#include "velk/velkwins.h"

namespace {

using velk_test::RunProgram;
using velk_test::TempDir;
using velk_test::WriteFile;

constexpr char kName[] = "corp.example.com\\alice";
constexpr char kConverted[] = "CORP\\alice";
constexpr size_t kConvertedLength = sizeof(kConverted) - 1;

std::string Converted(const std::string &name) {
  char out[493] = "";
  const int length = VELKWinsUserNameFqdn2Netbios(name.c_str(), out, sizeof(out));
  return {out, static_cast<size_t>(length)};
}

/// What another process makes of kName whose loader looks into `folder` first.
std::string PrintedWithLibraryFrom(const std::string &folder) {
  return RunProgram({VELKWINS_CONVERT, kName}, "", {"LD_LIBRARY_PATH=" + folder}).out;
}

TEST(VelkWinsDomain, ReplacesTheRealmByItsShortName) {
  EXPECT_EQ(Converted(kName), kConverted);
}

TEST(VelkWinsDomain, KeepsTheAccountAsItIs) {
  EXPECT_EQ(Converted("corp.example.com\\Alice B. \xff\\x"), "CORP\\Alice B. \xff\\x");
}

TEST(VelkWinsDomain, ReturnsTheLengthOfWhatItWrote) {
  char out[493] = "";
  EXPECT_EQ(VELKWinsUserNameFqdn2Netbios(kName, out, sizeof(out)),
            static_cast<int>(kConvertedLength));
  EXPECT_STREQ(out, kConverted);
}

TEST(VelkWinsDomain, MayReplaceItsOwnInput) {
  char name[] = "corp.example.com\\alice";
  EXPECT_GT(VELKWinsUserNameFqdn2Netbios(name, name, sizeof(name)), 0);
  EXPECT_STREQ(name, kConverted);
}

TEST(VelkWinsDomain, FillsABufferOfExactlyTheRightSize) {
  char out[kConvertedLength + 1] = "";
  EXPECT_GT(VELKWinsUserNameFqdn2Netbios(kName, out, sizeof(out)), 0);
  EXPECT_STREQ(out, kConverted);
}

TEST(VelkWinsDomain, LeavesABufferAloneThatIsTooSmall) {
  char out[] = "untouched...";
  for (size_t capacity = 0; capacity <= kConvertedLength; ++capacity) {
    EXPECT_EQ(VELKWinsUserNameFqdn2Netbios(kName, out, capacity), 0) << capacity;
    EXPECT_STREQ(out, "untouched...");
  }
}

TEST(VelkWinsDomain, ConvertsNoUnknownDomain) {
  EXPECT_EQ(Converted("other.example.com\\alice"), "");
}

TEST(VelkWinsDomain, ConvertsNoDomainWithoutAShortName) {
  EXPECT_EQ(Converted("null.example.com\\alice"), "");
  EXPECT_EQ(Converted("empty.example.com\\alice"), "");
  EXPECT_EQ(Converted("nothing.example.com\\alice"), "");
}

TEST(VelkWinsDomain, ConvertsNoNameWithoutARealmOrAnAccount) {
  for (const char *const name : {"", "corp.example.com", "\\alice", "corp.example.com\\"}) {
    EXPECT_EQ(Converted(name), "") << name;
  }
}

TEST(VelkWinsDomain, AsksForNoRealmThatWinbindWouldCutOff) {
  EXPECT_EQ(Converted(std::string(255, 'r') + "\\alice"), kConverted);
  EXPECT_EQ(Converted(std::string(256, 'r') + "\\alice"), "");
}

TEST(VelkWinsDomain, GivesBackWhatTheLibraryHandsOut) {
  for (const char *const name : {kName, "null.example.com\\a", "other.example.com\\a"}) {
    Converted(name);
  }
  void *const library = dlopen("libwbclient.so.0", RTLD_NOW | RTLD_NOLOAD);
  ASSERT_NE(library, nullptr);
  const int *const held = static_cast<int *>(dlsym(library, "FakeWbclientHeld"));
  ASSERT_NE(held, nullptr);
  EXPECT_EQ(*held, 0);
  dlclose(library);
}

TEST(VelkWinsDomain, ServesManyThreadsAtOnce) {
  std::vector<std::thread> threads;
  std::vector<int> right(8);
  for (int &count : right) {
    threads.emplace_back([&count] {
      for (int i = 0; i < 1000; ++i) count += Converted(kName) == kConverted ? 1 : 0;
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(right, std::vector<int>(8, 1000));
}

TEST(VelkWinsDomain, IsConvertedByAnotherProcessWithTheSameLibrary) {
  EXPECT_EQ(PrintedWithLibraryFrom(FAKE_WBCLIENT_DIR), "10 CORP\\alice\n");
}

TEST(VelkWinsDomain, IsNotConvertedWhereTheLibraryCannotBeLoaded) {
  const TempDir folder;
  WriteFile(folder.File("libwbclient.so.0"), "no library");
  EXPECT_EQ(PrintedWithLibraryFrom(folder.path()), "0 \n");
}

TEST(VelkWinsDomain, IsNotConvertedWhereTheLibraryLacksTheCalls) {
  EXPECT_EQ(PrintedWithLibraryFrom(USELESS_WBCLIENT_DIR), "0 \n");
}

}  // namespace
