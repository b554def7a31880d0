// Checks of visitors: what they hold up, and what becomes of them when the database fails.
#include <string>

#include "fault/platform_override.h"
#include "site_support.h"
#include "support/log_capture.h"
#include "support/raw_database.h"

namespace {

using velk_test::Browser;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
using velk_test::RawDatabase;
namespace real = velk_test::real;

const char *const kLink = "/sharing/abc";

class SiteCheckFault : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (IsSkipped()) return;
    path_ = Value("SELECT file FROM pragma_database_list WHERE name = 'main'");
  }

  /// A link for root's account, and root's session.
  Browser VisitorWithAccount() {
    Entry entry = FolderLink("abc");
    entry.set_protect_type(Entry::PROTECT_USER).set_protect_uids({0});
    return VisitorOf(entry);
  }

  Browser VisitorOf(const Entry &entry) {
    Store(entry);
    RunSql("INSERT INTO session VALUES (NULL, 'visitor', 0, '192.0.2.1', 4102444800)");
    RunSql("INSERT INTO token SELECT NULL, session.id, entry.id, 4102444800 FROM session, entry");
    Browser browser(site());
    browser.SetCookie(kLink, "sharing_sid", "visitor");
    return browser;
  }

  /// Another process's statement while an account is looked up.
  void WhileAnAccountIsLookedUp(const std::string &sql) {
    Overrides().user_get_by_uid = [this, sql](unsigned int uid, VELKUSER **user) {
      ++lookups_;
      EXPECT_NO_THROW(RawDatabase(path_).Run(sql));
      return real::UserGetByUid(uid, user);
    };
  }

  static void Fail(const std::string &statement) {
    Overrides().db_execute = [statement](VELKDBHandle *handle, const char *sql, DBResult **result) {
      return sql == statement ? -1 : real::DbExecute(handle, sql, result);
    };
  }

  const OverrideScope scope_;
  const LogCapture quiet_;
  std::string path_;
  int lookups_ = 0;
};

TEST_F(SiteCheckFault, AnAccountIsLookedUpWhileOthersWrite) {
  Browser browser = VisitorWithAccount();
  WhileAnAccountIsLookedUp("BEGIN IMMEDIATE; UPDATE session SET ip = ip; COMMIT");
  EXPECT_EQ(200, browser.Get(kLink).status);
  EXPECT_GT(lookups_, 0);
}

TEST_F(SiteCheckFault, AUseOfTheLinkMeanwhileDoesNoHarm) {
  Browser browser = VisitorWithAccount();
  WhileAnAccountIsLookedUp("UPDATE entry SET use_count = use_count + 1");
  EXPECT_EQ(200, browser.Get(kLink).status);
}

TEST_F(SiteCheckFault, ALinkThatChangesMeanwhileIsNotShown) {
  Browser browser = VisitorWithAccount();
  WhileAnAccountIsLookedUp("UPDATE entry SET owner_uid = owner_uid + 1");
  EXPECT_EQ(503, browser.Get(kLink).status);
  Overrides().user_get_by_uid = nullptr;
  RunSql("UPDATE entry SET owner_uid = 0");
}

TEST_F(SiteCheckFault, WithoutATransactionNobodyIsCheckedAndNothingIsTriedFurther) {
  Browser browser = VisitorOf(WithPassword(FolderLink("abc")));
  int later = 0;
  Overrides().db_execute = [&later](VELKDBHandle *handle, const char *sql, DBResult **result) {
    if (std::string(sql) == "BEGIN IMMEDIATE") return -1;
    if (std::string(sql).starts_with("UPDATE")) ++later;
    return real::DbExecute(handle, sql, result);
  };
  EXPECT_EQ(503, browser.Get(kLink).status);
  EXPECT_EQ(0, later);
  Overrides().db_execute = nullptr;
  EXPECT_EQ(200, browser.Get(kLink).status);
}

TEST_F(SiteCheckFault, ACheckThatCannotBeCommittedCountsForNothingAndLeavesNothingOpen) {
  Browser browser = VisitorOf(WithPassword(FolderLink("abc")));
  Fail("COMMIT");
  EXPECT_EQ(503, browser.Get(kLink).status);
  Overrides().db_execute = nullptr;
  EXPECT_EQ("4102444800", Value("SELECT timeout FROM session"));
  EXPECT_NO_THROW(RawDatabase(path_).Run("BEGIN IMMEDIATE; ROLLBACK"));
  EXPECT_EQ(200, browser.Get(kLink).status);
}

}  // namespace
