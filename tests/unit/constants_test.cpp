#include <gtest/gtest.h>
#include <velksharing/constants.h>

#include <string>
#include <utility>
#include <vector>

#include "velk_paths.h"

namespace {

using namespace VELK::sharing;

TEST(Constants, NameColumnsAndKeys) {
  const std::vector<std::pair<std::string, const char *>> expected = {
      {"id", SZK_ID_},
      {"hash", SZK_HASH},
      {"project_name", SZK_PROJECT_NAME},
      {"enabled", SZK_ENABLED_},
      {"owner_uid", SZK_OWNER_UID},
      {"owner_user", SZK_OWNER_USER},
      {"start_at", SZK_START_AT},
      {"expire_at", SZK_EXPIRE_AT},
      {"expire_times", SZK_EXPIRE_TIMES},
      {"use_count", SZK_USE_COUNT},
      {"auto_gc", SZK_AUTO_GC},
      {"data", SZK_DATA},
      {"enable_match_ip", SZK_ENABLE_MATCH_IP},
      {"protect_title", SZK_PROTECT_TITLE},
      {"protect_type", SZK_PROTECT_TYPE},
      {"none", SZK_PROTECT_PROTECT_NONE},
      {"password", SZK_PROTECT_PROTECT_PASSWORD},
      {"user", SZK_PROTECT_PROTECT_USER},
      {"protect_password", SZK_PROTECT_PASSWORD},
      {"protect_password_algo", SZK_PROTECT_PASSWORD_ALGO},
      {"default", SZK_PROTECT_PASSWORD_ALGO_DEFAULT},
      {"md5", SZK_PROTECT_PASSWORD_ALGO_MD5},
      {"protect_password_salt", SZK_PROTECT_PASSWORD_SALT},
      {"protect_uids", SZK_PROTECT_UIDS},
      {"protect_extra_users", SZK_PROTECT_EXTRA_USERS},
      {"protect_gids", SZK_PROTECT_GIDS},
      {"protect_extra_groups", SZK_PROTECT_EXTRA_GROUPS},
      {"protect_users", SZK_PROTECT_USERS},
      {"protect_groups", SZK_PROTECT_GROUPS},
      {"redirect_type", SZK_REDIRECT_TYPE},
      {"none", SZK_REDIRECT_REDIRECT_NONE},
      {"url_param", SZK_REDIRECT_REDIRECT_URLPARAM},
      {"always", SZK_REDIRECT_REDIRECT_ALWAYS},
      {"redirect_uri", SZK_REDIRECT_URI},
      {"app", SZK_APP},
      {"private_data", SZK_PRIVATE_DATA},
      {"session_id", SZK_SESSION_ID_},
      {"uid", SZK_UID_},
      {"ip", SZK_IP_},
      {"timeout", SZK_TIMEOUT},
      {"entry_id", SZK_ENTRY_ID},
      {"sharing_id", SZK_SHARING_ID},
      {"sharing_sid", SZK_SHARING_SID},
      {"password", SZK_PASSWORD_},
      {"zed_username", SZK_ZED_USERNAME},
      {"zed_password", SZK_ZED_PASSWORD},
      {"plugins", SZK_PLUGINS},
      {"jsconfig", SZK_JSCONFIG},
      {"assistant", SZK_ASSISTANT},
      {"external_ip", SZK_EXTERNAL_IP_},
      {"action", SZK_ACTION}};
  for (const auto &[text, constant] : expected) EXPECT_STREQ(text.c_str(), constant);
}

TEST(Constants, KeepEqualTextsInVariablesOfTheirOwn) {
  EXPECT_NE(&SZK_PROTECT_PROTECT_NONE, &SZK_REDIRECT_REDIRECT_NONE);
  EXPECT_NE(&SZK_PROTECT_PROTECT_PASSWORD, &SZK_PASSWORD_);
}

TEST(Constants, GiveLengthsAndAttempts) {
  EXPECT_EQ(9, SHARING_HASH_LENGTH);
  EXPECT_EQ(32, SHARING_SESSION_LENGTH);
  EXPECT_EQ(50, SHARING_MAX_RETRY_TIMES);
  EXPECT_EQ(6, SHARING_PASS_HASH_LENGTH);
}

TEST(Constants, NameTheDatabaseTheHeaderAndNoAccount) {
  EXPECT_STREQ(VELK_ROOT "/etc/private/session/sharing.db", SZF_SHARING_DB_PATH);
  EXPECT_STREQ("HTTP_X_VELK_SHARING", SZ_X_SHARING_HEADER);
  EXPECT_EQ(4294967295u, UID_ERR);
}

}  // namespace
