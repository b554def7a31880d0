// Links for accounts, with a saslauthd that knows one password.
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>
#include <velksharing/store.h>

#include <cstring>
#include <filesystem>
#include <thread>

#include "site_support.h"
#include "support/log_capture.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace fs = std::filesystem;

namespace {

using testing::HasSubstr;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SharingDB;
using velk_test::BodyOf;
using velk_test::Browser;
using velk_test::FieldList;
using velk_test::LogCapture;
using web::Response;

const char *const kLink = "/sharing/abc";
const char *const kPassword = "right";
constexpr unsigned int kOtherUid = 65534;
constexpr unsigned int kNoUid = 3999999999u;

/// Listens where saslauthd would, and takes one password, whatever the account.
class Saslauthd {
 public:
  Saslauthd() : listener_(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    const fs::path path = VELK_SASLAUTHD_SOCKET;
    fs::create_directories(path.parent_path());
    fs::remove(path);
    sockaddr_un address = {};
    address.sun_family = AF_UNIX;
    strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
    EXPECT_EQ(0, bind(listener_, reinterpret_cast<const sockaddr *>(&address), sizeof address));
    EXPECT_EQ(0, listen(listener_, 8));
    thread_ = std::thread([this] { Serve(); });
  }
  Saslauthd(const Saslauthd &) = delete;
  Saslauthd &operator=(const Saslauthd &) = delete;
  ~Saslauthd() {
    shutdown(listener_, SHUT_RDWR);
    thread_.join();
    close(listener_);
    fs::remove(VELK_SASLAUTHD_SOCKET);
  }

 private:
  void Serve() {
    for (int caller; (caller = accept4(listener_, nullptr, nullptr, SOCK_CLOEXEC)) != -1;) {
      ReadField(caller);
      const std::string password = ReadField(caller);
      ReadField(caller);
      ReadField(caller);
      const std::string answer =
          password == kPassword ? std::string("\0\2OK", 4) : std::string("\0\2NO", 4);
      send(caller, answer.data(), answer.size(), MSG_NOSIGNAL);
      close(caller);
    }
  }

  static std::string ReadField(int caller) {
    unsigned char length[2] = {};
    if (recv(caller, length, sizeof length, MSG_WAITALL) != sizeof length) return "";
    std::string field(static_cast<size_t>(length[0] << 8 | length[1]), '\0');
    if (field.empty()) return "";
    recv(caller, field.data(), field.size(), MSG_WAITALL);
    return field;
  }

  const int listener_;
  std::thread thread_;
};

class SiteAccount : public velk_test::SiteTest {
 protected:
  void SetUp() override {
    SiteTest::SetUp();
    if (IsSkipped()) return;
    if (!velk_test::OwnsSaslauthdSocket()) GTEST_SKIP() << "saslauthd may be in use";
    saslauthd_ = std::make_unique<Saslauthd>();
    StorePermitting(0);
  }

  void StorePermitting(unsigned int uid) {
    Entry entry = FolderLink("abc");
    entry.set_protect_type(Entry::PROTECT_USER).set_protect_uids({uid});
    Store(entry);
  }

  static FieldList Credentials(const char *account, const char *password) {
    return {{"zed_username", account}, {"zed_password", password}};
  }

  const LogCapture quiet_;
  std::unique_ptr<Saslauthd> saslauthd_;
};

TEST_F(SiteAccount, NameAndPasswordAreAskedFor) {
  Response response = Browser(site()).Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"zed_username\""));
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"zed_password\""));
}

TEST_F(SiteAccount, APermittedAccountIsLetIn) {
  Browser browser(site());
  ASSERT_EQ(303, browser.Submit(kLink, Credentials("root", kPassword)).status);
  Response page = browser.Get(kLink);
  EXPECT_THAT(BodyOf(page), HasSubstr("hello.txt"));
}

TEST_F(SiteAccount, TheAccountIsNotedOfWhoIsLetInOnly) {
  Browser browser(site());
  browser.Submit(kLink, Credentials("root", "wrong"));
  EXPECT_EQ(std::nullopt, browser.note().uid);
  browser.Submit(kLink, Credentials("root", kPassword));
  EXPECT_EQ(0u, browser.note().uid);
  browser.Submit(kLink, "/sharing/abc/logout", {});
  EXPECT_EQ(0u, browser.note().uid);
}

TEST_F(SiteAccount, AWrongPasswordIsAskedForAgainWithTheNameTyped) {
  Browser browser(site());
  Response response = browser.Submit(kLink, Credentials("root", "wrong"));
  EXPECT_EQ(401, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("value=\"root\""));
  EXPECT_THAT(BodyOf(response), testing::Not(HasSubstr("wrong")));
  EXPECT_EQ(-2, browser.note().code);
}

TEST_F(SiteAccount, AnAccountThatIsNotPermittedIsToldNoMoreThanOneThatIsWrong) {
  Browser browser(site());
  Response refused = browser.Submit(kLink, Credentials("nobody", kPassword));
  EXPECT_EQ(401, refused.status);
  EXPECT_EQ(-10, browser.note().code);
  Response wrong = browser.Submit(kLink, Credentials("nobody", "wrong"));
  EXPECT_EQ(-2, browser.note().code);
  EXPECT_EQ(BodyOf(wrong), BodyOf(refused));
}

TEST_F(SiteAccount, AMissingNameIsAskedForAgain) {
  Browser browser(site());
  EXPECT_EQ(401, browser.Submit(kLink, {}).status);
  EXPECT_EQ(-3, browser.note().code);
}

TEST_F(SiteAccount, AnAccountThatIsNoLongerPermittedHasToLogInAgain) {
  Browser browser(site());
  browser.Submit(kLink, Credentials("root", kPassword));
  Entry entry;
  EntryDB links(SharingDB::Instance());
  ASSERT_TRUE(links.GetByHash("abc", entry));
  ASSERT_TRUE(links.Update(entry.set_protect_uids({kOtherUid})));
  Response response = browser.Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"zed_username\""));
  EXPECT_EQ(-6, browser.note().code);
}

TEST_F(SiteAccount, AnAccountThatIsGoneHasToLogInAgain) {
  Browser browser(site());
  browser.Submit(kLink, Credentials("root", kPassword));
  RunSql("UPDATE session SET uid = " + std::to_string(kNoUid));
  Response response = browser.Get(kLink);
  EXPECT_EQ(200, response.status);
  EXPECT_THAT(BodyOf(response), HasSubstr("name=\"zed_username\""));
  EXPECT_EQ(-4, browser.note().code);
}

}  // namespace
