#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <velksharing/utils.h>

#include <cstdio>
#include <set>
#include <string>
#include <vector>

#include "fault/platform_override.h"
#include "support/log_capture.h"
#include "support/log_matcher.h"

namespace {

using namespace VELK::sharing;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
namespace real = velk_test::real;

/// A platform that converts nothing and knows nobody until a test says otherwise, and notes every
/// question. Buffers have room for 492 bytes and a zero.
class UserGroupFault : public ::testing::Test {
 protected:
  void SetUp() override {
    Overrides().login_name_convert = [this](const char *name, char *out, size_t capacity) {
      return Answer("convert", name, login_, out, capacity);
    };
    Overrides().fqdn_to_netbios = [this](const char *name, char *out, size_t capacity) {
      return Answer("netbios", name, netbios_, out, capacity);
    };
    Overrides().real_name_get = [this](const char *name, char *out, size_t capacity) {
      const int length = Answer("real", name, real_, out, capacity);
      return length > 0 ? length : real_failure_;
    };
    Overrides().user_get = [this](const char *name, VELKUSER **user) {
      calls_.push_back("user " + std::string(name));
      *user = has_account_ ? &account_ : nullptr;
      return user_answer_;
    };
    Overrides().user_get_by_uid = [this](unsigned int uid, VELKUSER **user) {
      calls_.push_back("uid " + std::to_string(uid));
      *user = has_account_ ? &account_ : nullptr;
      return user_answer_;
    };
    Overrides().user_free = [this](VELKUSER *user) {
      if (user == &account_) ++freed_;
    };
  }

  int Answer(const std::string &question, const char *name, const std::string &answer, char *out,
             size_t capacity) {
    calls_.push_back(question + " " + name);
    EXPECT_EQ(493u, capacity);
    for (size_t i = 0; i < capacity; ++i) EXPECT_EQ('\0', out[i]) << "a buffer that is not zeroed";
    return answer.empty() ? 0 : snprintf(out, capacity, "%s", answer.c_str());
  }

  void KnowAccount(int answer) {
    has_account_ = true;
    user_answer_ = answer;
  }

  const OverrideScope scope_;
  std::string login_;
  std::string netbios_;
  std::string real_;
  int real_failure_ = -1;
  bool has_account_ = false;
  int user_answer_ = -1;
  std::string account_name_ = "Account";
  VELKUSER account_ = {account_name_.data(), 1026};
  std::vector<std::string> calls_;
  int freed_ = 0;
};

TEST_F(UserGroupFault, RealNameIsThatOfTheConvertedName) {
  login_ = "login";
  real_ = "Real";
  EXPECT_EQ("Real", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real login"));
}

TEST_F(UserGroupFault, RealNameIsThatOfTheTypedNameWhenItCannotBeConverted) {
  real_ = "Real";
  EXPECT_EQ("Real", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real typed"));
}

TEST_F(UserGroupFault, RealNameMayBeEmpty) {
  real_failure_ = 0;
  EXPECT_EQ("", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real typed"));
}

TEST_F(UserGroupFault, RealNameIsTheAccountsWhenThereIsNoOther) {
  KnowAccount(0);
  EXPECT_EQ("Account", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real typed", "user typed"));
  EXPECT_EQ(1, freed_);
}

TEST_F(UserGroupFault, RealNameIsTheAccountsForAnyAnswerFromZeroOn) {
  KnowAccount(1);
  EXPECT_EQ("Account", GetRealUsername("typed"));
  EXPECT_EQ(1, freed_);
}

TEST_F(UserGroupFault, RealNameIsTheLoginWhenNothingIsKnown) {
  login_ = "login";
  EXPECT_EQ("login", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real login", "user login"));
  EXPECT_EQ(0, freed_);
}

TEST_F(UserGroupFault, RealNameFreesARecordThatCameWithAFailure) {
  KnowAccount(-1);
  EXPECT_EQ("typed", GetRealUsername("typed"));
  EXPECT_EQ(1, freed_);
}

TEST_F(UserGroupFault, RealNameOfADomainAccountIsThatOfItsShortForm) {
  netbios_ = "SHORT\\ann";
  real_ = "SHORT\\Ann";
  EXPECT_EQ("SHORT\\Ann", GetRealUsername("long.example\\ann"));
  EXPECT_THAT(calls_, ElementsAre("convert long.example\\ann", "netbios long.example\\ann",
                                  "real SHORT\\ann"));
}

TEST_F(UserGroupFault, RealNameOfADomainAccountWithoutAShortFormIsThatOfItsLogin) {
  login_ = "LONG\\ann";
  real_ = "LONG\\Ann";
  EXPECT_EQ("LONG\\Ann", GetRealUsername("typed"));
  EXPECT_THAT(calls_, ElementsAre("convert typed", "netbios LONG\\ann", "real LONG\\ann"));
}

TEST_F(UserGroupFault, RealNameOfADomainAccountThatIsNotFoundIsEmpty) {
  KnowAccount(0);
  EXPECT_EQ("", GetRealUsername("LONG\\ann"));
  EXPECT_THAT(calls_, ElementsAre("convert LONG\\ann", "netbios LONG\\ann", "real LONG\\ann"));
  EXPECT_EQ(0, freed_);
}

TEST_F(UserGroupFault, NamesAreCutAt492Bytes) {
  const std::string typed(600, 'x');
  const std::string cut(492, 'x');
  EXPECT_EQ(cut, GetRealUsername(typed.c_str()));
  EXPECT_THAT(calls_, ElementsAre("convert " + typed, "real " + cut, "user " + cut));

  account_name_ = std::string(600, 'y');
  account_.name = account_name_.data();
  KnowAccount(0);
  EXPECT_EQ(std::string(492, 'y'), GetRealUsername(typed.c_str()));
}

TEST_F(UserGroupFault, UserGetAsksForTheRealName) {
  real_ = "Real";
  KnowAccount(0);
  VELKUSER *user = nullptr;
  EXPECT_TRUE(UserGet("typed", user));
  EXPECT_EQ(&account_, user);
  EXPECT_THAT(calls_, ElementsAre("convert typed", "real typed", "user Real"));
  EXPECT_EQ(0, freed_) << "the record is the caller's";
}

TEST_F(UserGroupFault, UserGetTakesOnlyMinusOneAsAFailure) {
  real_ = "Real";
  KnowAccount(-2);
  VELKUSER *user = nullptr;
  EXPECT_TRUE(UserGet("typed", user));
  KnowAccount(1);
  EXPECT_TRUE(UserGet("typed", user));
}

TEST_F(UserGroupFault, UserGetLogsTheRealName) {
  real_ = "Real";
  const LogCapture log;
  VELKUSER *user = nullptr;
  EXPECT_FALSE(UserGet("typed", user));
  EXPECT_THAT(log.lines(),
              ElementsAre(velk_test::ErrorLine("%s:%d No such user [%s]",
                                               "utils_user_group:# No such user [Real]")));
}

TEST_F(UserGroupFault, UserToUidTakesOnlyZeroAsSuccess) {
  real_ = "Real";
  unsigned int uid = 77;
  for (const int answer : {1, -1, -2}) {
    KnowAccount(answer);
    EXPECT_FALSE(UserToUID("typed", uid)) << answer;
    EXPECT_EQ(77u, uid);
  }
  EXPECT_EQ(3, freed_);
  KnowAccount(0);
  EXPECT_TRUE(UserToUID("typed", uid));
  EXPECT_EQ(1026u, uid);
  EXPECT_EQ(4, freed_);
}

TEST_F(UserGroupFault, UidToUserTakesOnlyZeroAsSuccess) {
  std::string name = "before";
  for (const int answer : {1, -1, -2}) {
    KnowAccount(answer);
    EXPECT_FALSE(UIDToUser(1026, name)) << answer;
    EXPECT_EQ("before", name);
  }
  EXPECT_EQ(3, freed_);
  KnowAccount(0);
  EXPECT_TRUE(UIDToUser(1026, name));
  EXPECT_EQ("Account", name);
  EXPECT_EQ(4, freed_);
}

TEST_F(UserGroupFault, GroupToGidTakesOnlyZeroAsSuccess) {
  unsigned int gid = 77;
  Overrides().group_get_gid = [](const char *, unsigned int *) { return 1; };
  EXPECT_FALSE(GroupToGID("group", gid));
  Overrides().group_get_gid = [](const char *name, unsigned int *out) {
    EXPECT_STREQ("group", name);
    *out = 5;
    return 0;
  };
  EXPECT_TRUE(GroupToGID("group", gid));
  EXPECT_EQ(5u, gid);
}

TEST_F(UserGroupFault, GidToGroupTakesOnlyZeroAsSuccessAndFreesTheRecord) {
  std::string group_name = "staff";
  VELKGROUP group = {group_name.data(), 50};
  int answer = 1;
  int freed = 0;
  Overrides().group_get_by_gid = [&](unsigned int, VELKGROUP **out) {
    *out = &group;
    return answer;
  };
  Overrides().group_free = [&](VELKGROUP *given) { freed += given == &group ? 1 : 0; };
  std::string name = "before";
  EXPECT_FALSE(GIDToGroup(50, name));
  EXPECT_EQ("before", name);
  answer = 0;
  EXPECT_TRUE(GIDToGroup(50, name));
  EXPECT_EQ("staff", name);
  EXPECT_EQ(2, freed);
}

/// The group list of root, with names of the test's choice in it.
class UserGroupsFault : public UserGroupFault {
 protected:
  void SetUp() override {
    UserGroupFault::SetUp();
    Overrides().group_info = [this](const char *user, int arg1, int arg2) {
      EXPECT_STREQ("Account", user);
      EXPECT_EQ(1, arg1);
      EXPECT_EQ(0, arg2);
      return list_ = real::GroupInfo("root", 1, 0);
    };
    Overrides().list_name = [this](const VLIBCSzHash *list, size_t index, int *end) {
      EXPECT_EQ(list_, list);
      if (end != nullptr) *end = index >= names_.size() ? 1 : 0;
      return index < names_.size() ? names_[index] : nullptr;
    };
    Overrides().list_free = [this](VLIBCSzHash *list) {
      EXPECT_EQ(list_, list);
      ++freed_lists_;
      real::ListFree(list);
    };
    Overrides().group_get_gid = [](const char *name, unsigned int *gid) {
      if (std::string(name) == "unknown") return -1;
      *gid = static_cast<unsigned int>(std::stoul(name));
      return 0;
    };
  }

  std::vector<const char *> names_;
  VLIBCSzHash *list_ = nullptr;
  int freed_lists_ = 0;
};

TEST_F(UserGroupsFault, AreAddedByTheirIds) {
  names_ = {"5", "7", "5"};
  std::set<unsigned int> gids = {1};
  EXPECT_TRUE(UserGroupsGet(&account_, gids));
  EXPECT_THAT(gids, ElementsAre(1u, 5u, 7u));
  EXPECT_EQ(1, freed_lists_);
}

TEST_F(UserGroupsFault, WithoutANameOrAnIdAreSkipped) {
  names_ = {nullptr, "unknown", "7", nullptr};
  std::set<unsigned int> gids;
  EXPECT_TRUE(UserGroupsGet(&account_, gids));
  EXPECT_THAT(gids, ElementsAre(7u));
  EXPECT_EQ(1, freed_lists_);
}

TEST_F(UserGroupsFault, MayBeNone) {
  std::set<unsigned int> gids = {1};
  EXPECT_TRUE(UserGroupsGet(&account_, gids));
  EXPECT_THAT(gids, ElementsAre(1u));
  EXPECT_EQ(1, freed_lists_);
}

TEST_F(UserGroupsFault, FailWithoutAList) {
  Overrides().group_info = [](const char *, int, int) {
    return static_cast<VLIBCSzHash *>(nullptr);
  };
  std::set<unsigned int> gids = {1};
  EXPECT_FALSE(UserGroupsGet(&account_, gids));
  EXPECT_THAT(gids, ElementsAre(1u));
}

}  // namespace
