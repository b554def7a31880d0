// Databases that older releases left behind open in this one, with all that they hold.

#include <gtest/gtest.h>
#include <velksharing/access.h>
#include <velksharing/store.h>

#include <cstdlib>
#include <filesystem>
#include <string>

#include "support/build_folders.h"
#include "support/process.h"
#include "support/raw_database.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;
using velk_test::RawDatabase;
using velk_test::SharingDatabasePath;

using Rows = std::vector<std::vector<std::string>>;

std::string OldDatabase(int version) {
  return std::string(VELK_SOURCE_DIR "/tests/data/sharing-v") + std::to_string(version) + ".db";
}

/// The parameter is the schema version of the old file.
class OldData : public testing::TestWithParam<int> {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    velk_test::RemoveSharingDatabase();
    velk_test::InstallScripts();
    std::filesystem::copy_file(OldDatabase(GetParam()), SharingDatabasePath());
    std::filesystem::permissions(SharingDatabasePath(), std::filesystem::perms(0660));
    ASSERT_EQ(setenv("REMOTE_ADDR", "192.0.2.1", 1), 0);
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) velk_test::RemoveSharingDatabase();
  }

  static Rows AllRows(const std::string &path) {
    Rows all;
    RawDatabase database(path);
    for (const std::string table : {"entry", "session", "token"}) {
      for (auto &row : database.Rows("SELECT * FROM " + table + " ORDER BY id"))
        all.push_back(std::move(row));
    }
    return all;
  }
};

INSTANTIATE_TEST_SUITE_P(Versions, OldData, testing::Values(1, 2));

TEST_P(OldData, IsMigratedAndKeepsItsRows) {
  const Rows before = AllRows(SharingDatabasePath());
  ASSERT_FALSE(before.empty());
  ASSERT_EQ(velk_test::RunForked([] { return SharingDB::Instance().IsGood() ? 0 : 1; }), 0);
  EXPECT_EQ(RawDatabase(SharingDatabasePath()).Value("PRAGMA user_version"), "2");
  EXPECT_EQ(AllRows(SharingDatabasePath()), before);
}

TEST_P(OldData, HoldsLinksThatStillLetVisitorsIn) {
  EXPECT_EQ(
      velk_test::RunForked([] {
        const _tag_sharing_login_params params = {"aB3xK9pQ2", nullptr, nullptr, nullptr, nullptr};
        std::string session_id;
        return VELK::VelkSharingLogin(session_id, &params, false);
      }),
      VELK_SHARING_LOGIN_OK);
}

TEST_P(OldData, GivesTheNextLinkAnIdThatNoOldGrantPointsAt) {
  EXPECT_EQ(velk_test::RunForked([] {
              Entry link;
              link.set_project_name("photo").set_owner_uid(1026);
              link.set_app(Json::Value(Json::objectValue));
              return EntryDB(SharingDB::Instance()).CreateWithHash(link) ? link.get_id() : 255;
            }),
            4);
}

}  // namespace
