// What is noted of visitors' coming and going, for the audit trail.
#include "site_support.h"

namespace {

using velk_test::Browser;
using Event = web::AccessNote::Event;

const char *const kLink = "/sharing/abc";

class SiteEvent : public velk_test::SiteTest {
 protected:
  static int IdOf(const std::string &hash) {
    return std::stoi(Value("SELECT id FROM entry WHERE hash = '" + hash + "'"));
  }
};

TEST_F(SiteEvent, ALoginIsNotedWithItsLinkWhetherItWorkedOrNot) {
  StoreWithPassword("other");
  StoreWithPassword("abc");
  Browser browser(site());
  browser.Submit(kLink, {{"password", "wrong"}});
  EXPECT_EQ(Event::LOGIN, browser.note().event);
  EXPECT_EQ(-9, browser.note().code);
  EXPECT_EQ(IdOf("abc"), browser.note().entry_id);
  browser.Submit(kLink, {{"password", "secret"}});
  EXPECT_EQ(Event::LOGIN, browser.note().event);
  EXPECT_EQ(1, browser.note().code);
  EXPECT_EQ(IdOf("abc"), browser.note().entry_id);
  EXPECT_FALSE(browser.note().uid);
}

TEST_F(SiteEvent, LookingIsNone) {
  StoreWithPassword("abc");
  Browser browser(site());
  browser.Get(kLink);
  EXPECT_EQ(Event::NONE, browser.note().event);
  browser.Submit(kLink, {{"password", "secret"}});
  browser.Get(kLink);
  EXPECT_EQ(Event::NONE, browser.note().event);
}

TEST_F(SiteEvent, AFormThatIsNotOursIsNoLogin) {
  StoreWithPassword("abc");
  Browser browser(site());
  browser.Post(kLink, {{"password", "secret"}});
  EXPECT_EQ(Event::NONE, browser.note().event);
}

TEST_F(SiteEvent, AnOpenLinkIsEnteredOnce) {
  StoreOpen("abc");
  Browser browser(site());
  browser.Get(kLink);
  EXPECT_EQ(Event::ENTER, browser.note().event);
  EXPECT_EQ(IdOf("abc"), browser.note().entry_id);
  browser.Get(kLink);
  EXPECT_EQ(Event::NONE, browser.note().event);
}

TEST_F(SiteEvent, ALogoutIsNotedWithItsLink) {
  StoreWithPassword("abc");
  Browser browser(site());
  browser.Submit(kLink, {{"password", "secret"}});
  browser.Submit(kLink, "/sharing/abc/logout", {});
  EXPECT_EQ(Event::LOGOUT, browser.note().event);
  EXPECT_EQ(1, browser.note().code);
  EXPECT_EQ(IdOf("abc"), browser.note().entry_id);
}

}  // namespace
