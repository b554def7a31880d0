// What links guard, while the database fails now and then.
#include <string>

#include "fault/platform_override.h"
#include "site_support.h"
#include "support/log_capture.h"

namespace {

using velk_test::Browser;
using velk_test::LogCapture;
using velk_test::Overrides;
using velk_test::OverrideScope;
namespace real = velk_test::real;

class SiteGuardsFault : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (IsSkipped()) return;
    web::SiteSettings settings;
    settings.runtime_folder = runtime_.path();
    settings.form_secret = "0123456789abcdef0123456789abcdef";
    settings.has_gate = true;
    site_ = std::make_unique<web::Site>(settings);
    StoreGuarding("abc", "/");
    StoreGuarding("def", "/private");
  }

  static void StoreGuarding(const std::string &hash, const std::string &prefix) {
    Json::Value app(Json::objectValue);
    app["protects"].append(prefix);
    Entry entry = velk_test::LinkToNothing(hash);
    Store(WithPassword(entry.set_app(app)));
  }

  const OverrideScope scope_;
  const LogCapture quiet_;
};

TEST_F(SiteGuardsFault, AStatementThatFailsOpensNothingThatAnotherLinkGuards) {
  Browser browser(site());
  browser.Submit("/sharing/abc", {{"password", "secret"}}, {{"Host", "wiki.example"}});
  for (int failing = 0; failing < 12; ++failing) {
    SCOPED_TRACE(failing);
    RunSql("UPDATE entry SET data = data || ' ' WHERE hash = 'def'");  // is read anew
    int statement = 0;
    Overrides().db_execute = [&](VELKDBHandle *handle, const char *sql, DBResult **result) {
      return statement++ == failing ? -1 : real::DbExecute(handle, sql, result);
    };
    EXPECT_NE(204, browser.Ask("http://wiki.example/private/a").status);
    Overrides().db_execute = nullptr;
    EXPECT_EQ(401, browser.Ask("http://wiki.example/private/a").status);
    EXPECT_EQ(204, browser.Ask("http://wiki.example/a").status);
  }
}

TEST_F(SiteGuardsFault, WhileTheGuardsCannotBeReadNobodyIsLetIn) {
  Browser browser(site());
  browser.Submit("/sharing/abc", {{"password", "secret"}}, {{"Host", "wiki.example"}});
  Overrides().db_execute = [](VELKDBHandle *handle, const char *sql, DBResult **result) {
    const bool fails = std::string(sql).find("entry_guards") != std::string::npos;
    return fails ? -1 : real::DbExecute(handle, sql, result);
  };
  EXPECT_EQ(503, browser.Ask("http://wiki.example/a").status);
  Overrides().db_execute = nullptr;
  EXPECT_EQ(204, browser.Ask("http://wiki.example/a").status);
}

}  // namespace
