// Accounts and groups of a large directory. nss_wrapper, loaded by ctest in front of the C library,
// lets this process see only those written here.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "support/temp_dir.h"
#include "velk/velksdk.h"

namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::Optional;

constexpr int kMemberships = 600;
constexpr int kCrowd = 20000;  // members; their group's record fills a buffer of 200 KB

std::string Passwd() {
  return "alice:x:2001:3001::/home/alice:/bin/sh\n"
         "Bob:x:2002:3001::/home/bob:/bin/sh\n"
         "carol:x:2003:3001::/home/carol:/bin/sh\n"
         "Carol:x:2004:3001::/home/carol2:/bin/sh\n"
         "lost:x:2005:4242::/home/lost:/bin/sh\n"
         "joiner:x:2006:3001::/home/joiner:/bin/sh\n"
         "wordy:x:2007:3001:" +
         std::string(10000, 'w') + ":/home/wordy:/bin/sh\n";
}

std::string GroupFile() {
  std::string text = "people:x:3001:\nStaff:x:3002:alice,Bob\ncrowd:x:3003:";
  for (int member = 0; member < kCrowd; ++member) text += "u" + std::to_string(member) + ",";
  text += "alice\n";
  for (int number = 0; number < kMemberships; ++number) {
    text += "g" + std::to_string(number) + ":x:" + std::to_string(20000 + number) + ":joiner\n";
  }
  return text;
}

/// nss_wrapper reads its settings at the first lookup.
class Directory : public testing::Environment {
 public:
  void SetUp() override {
    velk_test::WriteFile(folder_.File("passwd"), Passwd());
    velk_test::WriteFile(folder_.File("group"), GroupFile());
    setenv("NSS_WRAPPER_PASSWD", folder_.File("passwd").c_str(), 1);
    setenv("NSS_WRAPPER_GROUP", folder_.File("group").c_str(), 1);
  }

 private:
  velk_test::TempDir folder_;
};

const auto *const directory = testing::AddGlobalTestEnvironment(new Directory);

std::string LoginName(const char *typed) {
  char out[64] = "";
  return VELKUserLoginNameConvert(typed, out, sizeof(out)) > 0 ? out : "";
}

std::vector<std::optional<std::string>> GroupsOf(const char *user) {
  std::vector<std::optional<std::string>> names;
  VLIBCSzHash *list = VLIBGroupInfoHashGet(user, 1, 0);
  int end = list == nullptr ? 1 : 0;
  for (size_t index = 0; end == 0; ++index) {
    const char *name = VLIBCSzHashName(list, index, &end);
    if (end == 0)
      names.push_back(name == nullptr ? std::nullopt : std::optional<std::string>(name));
  }
  VLIBCSzHashFree(list);
  return names;
}

TEST(VelkSdkDirectory, IsTheOneWrittenHere) {
  VELKUSER *user = nullptr;
  ASSERT_EQ(0, VELKUserGet("alice", &user)) << "nss_wrapper is not loaded: run this through ctest";
  EXPECT_EQ(2001U, user->uid);
  VELKUserFree(user);
  EXPECT_EQ(-1, VELKUserGet("root", &user));
}

TEST(VelkSdkDirectory, ReadsARecordThatOutgrowsTheFirstBuffer) {
  VELKUSER *user = nullptr;
  ASSERT_EQ(0, VELKUserGet("wordy", &user));
  EXPECT_STREQ("wordy", user->name);
  VELKUserFree(user);
  ASSERT_EQ(0, VELKUserGetByUID(2007, &user));
  EXPECT_STREQ("wordy", user->name);
  VELKUserFree(user);
}

TEST(VelkSdkDirectory, ReadsAGroupOfManyThousandMembers) {
  unsigned int gid = 0;
  EXPECT_EQ(0, VELKGroupGetGID("crowd", &gid));
  EXPECT_EQ(3003U, gid);
  VELKGROUP *group = nullptr;
  ASSERT_EQ(0, VELKGroupGetByGID(3003, &group));
  EXPECT_STREQ("crowd", group->name);
  VELKGroupFree(group);
}

TEST(VelkSdkDirectory, LoginNameKeepsTheTypedFormWhereThatIsAnAccount) {
  EXPECT_EQ("Carol", LoginName(" Carol "));
  EXPECT_EQ("carol", LoginName("carol"));
  EXPECT_EQ("Bob", LoginName("Bob"));
}

TEST(VelkSdkDirectory, LoginNameIsTheLowerCaseFormWhereOnlyThatIsAnAccount) {
  EXPECT_EQ("alice", LoginName("ALICE"));
  EXPECT_EQ("carol", LoginName("CAROL"));
}

TEST(VelkSdkDirectory, LoginNameNeverGuessesUpperCase) {
  EXPECT_EQ("", LoginName("bob"));
}

TEST(VelkSdkDirectory, ListsThePrimaryGroupAndTheOthers) {
  EXPECT_THAT(GroupsOf("alice"), testing::UnorderedElementsAre(Optional(std::string("people")),
                                                               Optional(std::string("Staff")),
                                                               Optional(std::string("crowd"))));
}

TEST(VelkSdkDirectory, ListsAGroupIdWithoutANameAsNull) {
  EXPECT_THAT(GroupsOf("lost"), ElementsAre(std::nullopt));
}

TEST(VelkSdkDirectory, ListsSeveralHundredGroups) {
  const auto names = GroupsOf("joiner");
  EXPECT_EQ(kMemberships + 1U, names.size());
  EXPECT_THAT(names, Contains(Optional(std::string("people"))));
  EXPECT_THAT(names, Contains(Optional(std::string("g0"))));
  EXPECT_THAT(names, Contains(Optional(std::string("g599"))));
}

}  // namespace
