// Many visitors at the same moment, each served by a process of its own.
#include <gtest/gtest.h>
#include <velk/velksdk.h>

#include <algorithm>
#include <vector>

#include "site_support.h"
#include "support/process.h"
#include "support/raw_database.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace {

using velk_test::Browser;
using velk_test::RawDatabase;
using velk_test::RunForked;
using velk_test::RunForkedTogether;

constexpr int kVisitors = 200;
constexpr int kUses = 5;
constexpr int kLetIn = 0;
constexpr int kHidden = 1;
constexpr int kOther = 2;

/// Never opens the database in this process: a connection does not cross a fork.
class SiteFire : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    RemoveDatabases();
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) RemoveDatabases();
  }

  static void RemoveDatabases() {
    velk_test::RemoveSharingDatabase();
    velk_test::RemoveAutoBlockDatabase();
  }

  web::SiteSettings Settings() const {
    web::SiteSettings settings;
    settings.runtime_folder = runtime_.path();
    settings.form_secret = "0123456789abcdef0123456789abcdef";
    return settings;
  }

  /// One visitor, from the page to the answer to the button.
  int Visit() const {
    web::Site site(Settings());
    Browser browser(site);
    const int status = browser.Submit("/sharing/abc", {}).status;
    if (status == 303 && browser.Get("/sharing/abc").status == 200) return kLetIn;
    return status == 403 || status == 404 ? kHidden : kOther;
  }

  const velk_test::TempDir runtime_;
};

TEST_F(SiteFire, ALinkLetsNoMoreVisitorsInThanItHasUses) {
  const velk_test::TempDir shared;
  ASSERT_EQ(0, RunForked([&] { return velk_test::StoreLimitedLink("abc", shared.path(), kUses); }));

  const std::vector<int> ends = RunForkedTogether(kVisitors, [&](int) { return Visit(); });

  EXPECT_EQ(kUses, std::count(ends.begin(), ends.end(), kLetIn));
  EXPECT_EQ(kVisitors - kUses, std::count(ends.begin(), ends.end(), kHidden));
  RawDatabase database(velk_test::SharingDatabasePath());
  EXPECT_EQ(std::to_string(kUses), database.Value("SELECT use_count FROM entry"));
  EXPECT_EQ(std::to_string(kUses), database.Value("SELECT COUNT(*) FROM session"));
}

}  // namespace
