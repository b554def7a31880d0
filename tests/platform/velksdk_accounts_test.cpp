// Accounts and groups that every machine has.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "velk/velksdk.h"

namespace {

using testing::Contains;

std::vector<std::string> GroupsOf(const char *user) {
  std::vector<std::string> names;
  VLIBCSzHash *list = VLIBGroupInfoHashGet(user, 1, 0);
  int end = 0;
  for (size_t index = 0; list != nullptr; ++index) {
    const char *name = VLIBCSzHashName(list, index, &end);
    if (end == 1) break;
    if (name != nullptr) names.push_back(name);
  }
  VLIBCSzHashFree(list);
  return names;
}

TEST(VelkSdkAccounts, FindsAnAccountByName) {
  VELKUSER *user = nullptr;
  ASSERT_EQ(0, VELKUserGet("root", &user));
  EXPECT_STREQ("root", user->name);
  EXPECT_EQ(0U, user->uid);
  VELKUserFree(user);
}

TEST(VelkSdkAccounts, FindsAnAccountByUserId) {
  VELKUSER *user = nullptr;
  ASSERT_EQ(0, VELKUserGetByUID(65534, &user));
  EXPECT_STREQ("nobody", user->name);
  EXPECT_EQ(65534U, user->uid);
  VELKUserFree(user);
}

TEST(VelkSdkAccounts, GivesNullForAnAccountThatIsNotThere) {
  VELKUSER *user = reinterpret_cast<VELKUSER *>(1);
  EXPECT_EQ(-1, VELKUserGet("no-such-account", &user));
  EXPECT_EQ(nullptr, user);
  user = reinterpret_cast<VELKUSER *>(1);
  EXPECT_EQ(-1, VELKUserGetByUID(4294967295U, &user));
  EXPECT_EQ(nullptr, user);
}

TEST(VelkSdkAccounts, NeverFindsANullOrEmptyName) {
  VELKUSER *user = nullptr;
  unsigned int gid = 7;
  EXPECT_EQ(-1, VELKUserGet(nullptr, &user));
  EXPECT_EQ(-1, VELKUserGet("", &user));
  EXPECT_EQ(-1, VELKGroupGetGID(nullptr, &gid));
  EXPECT_EQ(-1, VELKGroupGetGID("", &gid));
  EXPECT_EQ(nullptr, VLIBGroupInfoHashGet(nullptr, 1, 0));
  EXPECT_EQ(nullptr, VLIBGroupInfoHashGet("", 1, 0));
  EXPECT_EQ(7U, gid);
}

TEST(VelkSdkAccounts, NeverFindsAHugeNameOrOneOfBrokenUtf8) {
  VELKUSER *user = nullptr;
  EXPECT_EQ(-1, VELKUserGet(std::string(1 << 20, 'a').c_str(), &user));
  EXPECT_EQ(-1, VELKUserGet("\xff\xfe\xc3", &user));
}

TEST(VelkSdkAccounts, RefusesToAnswerToNowhere) {
  EXPECT_EQ(-1, VELKUserGet("root", nullptr));
  EXPECT_EQ(-1, VELKUserGetByUID(0, nullptr));
  EXPECT_EQ(-1, VELKGroupGetGID("root", nullptr));
  EXPECT_EQ(-1, VELKGroupGetByGID(0, nullptr));
}

TEST(VelkSdkAccounts, FreesNull) {
  VELKUserFree(nullptr);
  VELKGroupFree(nullptr);
  VLIBCSzHashFree(nullptr);
}

TEST(VelkSdkLoginName, TakesBlanksOff) {
  char out[16] = "";
  EXPECT_EQ(4, VELKUserLoginNameConvert(" \t root\r\n", out, sizeof(out)));
  EXPECT_STREQ("root", out);
}

TEST(VelkSdkLoginName, FallsBackToLowerCase) {
  char out[16] = "";
  EXPECT_EQ(4, VELKUserLoginNameConvert("ROOT", out, sizeof(out)));
  EXPECT_STREQ("root", out);
}

TEST(VelkSdkLoginName, IsNotConvertedWhenNeitherFormIsAnAccount) {
  char out[16] = "before";
  EXPECT_EQ(0, VELKUserLoginNameConvert("No-Such", out, sizeof(out)));
  EXPECT_EQ(0, VELKUserLoginNameConvert("   ", out, sizeof(out)));
  EXPECT_EQ(0, VELKUserLoginNameConvert("", out, sizeof(out)));
  EXPECT_EQ(0, VELKUserLoginNameConvert(nullptr, out, sizeof(out)));
  EXPECT_STREQ("before", out);
}

TEST(VelkSdkLoginName, NeedsRoomForItsTerminator) {
  char out[5] = "xxxx";
  EXPECT_EQ(0, VELKUserLoginNameConvert("root", out, 4));
  EXPECT_STREQ("xxxx", out);
  EXPECT_EQ(0, VELKUserLoginNameConvert("root", out, 0));
  EXPECT_EQ(0, VELKUserLoginNameConvert("root", nullptr, 5));
  EXPECT_EQ(4, VELKUserLoginNameConvert("root", out, 5));
  EXPECT_STREQ("root", out);
}

TEST(VelkSdkRealName, IsTheAccountsOwnSpelling) {
  char out[16] = "";
  EXPECT_EQ(6, VLIBUserRealNameGet("nobody", out, sizeof(out)));
  EXPECT_STREQ("nobody", out);
}

TEST(VelkSdkRealName, FailsForAnUnknownAccountAndWithoutRoom) {
  char out[16] = "before";
  EXPECT_EQ(-1, VLIBUserRealNameGet("no-such-account", out, sizeof(out)));
  EXPECT_EQ(-1, VLIBUserRealNameGet(nullptr, out, sizeof(out)));
  EXPECT_EQ(-1, VLIBUserRealNameGet("root", out, 4));
  EXPECT_EQ(-1, VLIBUserRealNameGet("root", out, 0));
  EXPECT_EQ(-1, VLIBUserRealNameGet("root", nullptr, 16));
  EXPECT_STREQ("before", out);
}

TEST(VelkSdkGroups, TranslatesNameAndId) {
  unsigned int gid = 7;
  ASSERT_EQ(0, VELKGroupGetGID("nogroup", &gid));
  EXPECT_EQ(65534U, gid);
  VELKGROUP *group = nullptr;
  ASSERT_EQ(0, VELKGroupGetByGID(gid, &group));
  EXPECT_STREQ("nogroup", group->name);
  EXPECT_EQ(65534U, group->gid);
  VELKGroupFree(group);
}

TEST(VelkSdkGroups, AreNotFoundWhenTheyAreNotThere) {
  unsigned int gid = 7;
  EXPECT_EQ(-1, VELKGroupGetGID("no-such-group", &gid));
  EXPECT_EQ(7U, gid);
  VELKGROUP *group = reinterpret_cast<VELKGROUP *>(1);
  EXPECT_EQ(-1, VELKGroupGetByGID(4294967294U, &group));
  EXPECT_EQ(nullptr, group);
}

TEST(VelkSdkGroups, OfAnAccountIncludeItsPrimaryOne) {
  EXPECT_THAT(GroupsOf("nobody"), Contains("nogroup"));
}

TEST(VelkSdkGroups, OfAnUnknownAccountAreNoList) {
  EXPECT_EQ(nullptr, VLIBGroupInfoHashGet("no-such-account", 1, 0));
}

TEST(VelkSdkGroups, ListEndsPastItsLastText) {
  VLIBCSzHash *list = VLIBGroupInfoHashGet("nobody", 1, 0);
  ASSERT_NE(nullptr, list);
  int end = 1;
  EXPECT_NE(nullptr, VLIBCSzHashName(list, 0, &end));
  EXPECT_EQ(0, end);
  EXPECT_EQ(nullptr, VLIBCSzHashName(list, 100000, &end));
  EXPECT_EQ(1, end);
  EXPECT_EQ(nullptr, VLIBCSzHashName(list, static_cast<size_t>(-1), nullptr));
  VLIBCSzHashFree(list);
}

TEST(VelkSdkGroups, NullListIsAnEmptyOne) {
  int end = 0;
  EXPECT_EQ(nullptr, VLIBCSzHashName(nullptr, 0, &end));
  EXPECT_EQ(1, end);
}

}  // namespace
