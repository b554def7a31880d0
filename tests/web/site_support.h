#ifndef TESTS_WEB_SITE_SUPPORT_H
#define TESTS_WEB_SITE_SUPPORT_H

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>
#include <velksharing/record.h>

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "site/site.h"
#include "support/temp_dir.h"

namespace velk_test {

using HeaderList = std::vector<std::pair<std::string, std::string>>;
using FieldList = std::vector<std::pair<std::string, std::string>>;

/// The body of an answer that has a text or a part of a file.
std::string BodyOf(web::Response &response);
/// All fields and the status, one a line, in order: what a visitor sees beside the body.
std::string HeadOf(const web::Response &response);
/// The JSON document of an answer.
Json::Value JsonOf(web::Response &response);
/// "name=a+b&…"
std::string Encoded(const FieldList &fields);

/// An open link that names nothing to share, of somebody who may read the files of a test.
VELK::sharing::record::Entry LinkToNothing(const std::string &hash);

/// Opens a folder to everybody, stores an open link to it with a use limit.
/// @return 0 when that worked.
int StoreLimitedLink(const std::string &hash, const std::string &folder, int uses);

/// Somebody at a browser: keeps cookies as their paths say, and fills forms in.
class Browser {
 public:
  explicit Browser(web::Site &site, std::string address = "192.0.2.1");

  /// @param target path, and query behind a question mark.
  web::Response Get(const std::string &target, const HeaderList &headers = {});
  web::Response Head(const std::string &target, const HeaderList &headers = {});
  /// Asks a web server for an address, which asks the site.
  web::Response Ask(const std::string &address, const HeaderList &headers = {});
  web::Response AskAsAuthorizer(const std::string &address, const HeaderList &headers = {});
  /// Sends a form as it is, without a token.
  web::Response Post(const std::string &target, const FieldList &fields,
                     const HeaderList &headers = {});
  /// Opens the page at `page`, and sends the fields with its token to `path`.
  web::Response Submit(const std::string &page, const std::string &path, FieldList fields,
                       const HeaderList &headers = {});
  /// The same, where the page posts to its own address.
  web::Response Submit(const std::string &path, const FieldList &fields,
                       const HeaderList &headers = {});
  /// The token in the forms of a page; "" when it has none.
  std::string TokenOf(const std::string &page);

  /// The value of a cookie that would be sent to a path; "" for none.
  std::string CookieFor(const std::string &path, const std::string &name) const;
  void SetCookie(const std::string &path, const std::string &name, const std::string &value);
  void UseHttps() { is_https_ = true; }

  /// What the access log would say about the last request.
  const web::AccessNote &note() const { return note_; }

 private:
  web::Response Send(web::Request request, const HeaderList &headers);
  std::string CookiesFor(const std::string &path) const;
  void Keep(const std::string &cookie);

  web::Site &site_;
  std::string address_;
  bool is_https_ = false;
  std::map<std::pair<std::string, std::string>, std::string> cookies_;  ///< By path and name.
  web::AccessNote note_;
};

/// The handler on a database and on files of its own: a folder with "hello.txt", "page.html",
/// "sub/inner.txt", "odd name ä.txt".
class SiteTest : public testing::Test {
 protected:
  using Entry = VELK::sharing::record::Entry;

  void SetUp() override;
  void TearDown() override;

  /// An open link to the folder, not stored yet.
  Entry FolderLink(const std::string &hash) const;
  /// An open link to a path in that folder.
  Entry LinkTo(const std::string &hash, const std::string &path) const;
  static void Store(Entry entry);
  void StoreOpen(const std::string &hash) const { Store(FolderLink(hash)); }
  void StoreWithPassword(const std::string &hash, const std::string &password = "secret") const;
  static Entry WithPassword(Entry entry, const std::string &password = "secret");

  static void RunSql(const std::string &sql);
  /// The first column of the first row.
  static std::string Value(const std::string &sql);

  web::Site &site() { return *site_; }
  /// A path in the folder that is shared.
  std::string Shared(const std::string &name = "") const;
  TempDir folder_;
  TempDir runtime_;
  std::unique_ptr<web::Site> site_;
};

}  // namespace velk_test

#endif
