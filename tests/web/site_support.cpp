#include "site_support.h"

#include <json/reader.h>
#include <unistd.h>
#include <velk/velksdk.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <filesystem>
#include <regex>
#include <sstream>

#include "http/percent.h"
#include "support/sample_records.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace fs = std::filesystem;

namespace velk_test {
namespace {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

constexpr unsigned int kNobody = 65534;

/// Takes the databases away when the program ends.
class Leftovers : public testing::Environment {
 public:
  void TearDown() override {
    if (!OwnsVelkRoot()) return;
    RemoveSharingDatabase();
    RemoveAutoBlockDatabase();
  }
};

[[maybe_unused]] const testing::Environment *const leftovers =
    testing::AddGlobalTestEnvironment(new Leftovers);

/// Everybody may look at what a link shares, whoever runs the tests.
void OpenForAll(const std::string &path) {
  fs::permissions(path, fs::perms::owner_all | fs::perms::group_read | fs::perms::group_exec |
                            fs::perms::others_read | fs::perms::others_exec);
}

bool IsSentTo(const std::string &cookie_path, const std::string &path) {
  const std::string below = cookie_path.ends_with('/') ? cookie_path : cookie_path + "/";
  return path == cookie_path || path.starts_with(below);
}

}  // namespace

std::string BodyOf(web::Response &response) {
  if (const auto *text = std::get_if<std::string>(&response.body)) return *text;
  if (const auto *file = std::get_if<web::FileBody>(&response.body)) {
    std::string bytes(static_cast<size_t>(file->length), '\0');
    const ssize_t count = pread(file->file.get(), bytes.data(), bytes.size(), file->offset);
    bytes.resize(count < 0 ? 0 : static_cast<size_t>(count));
    return bytes;
  }
  std::string bytes;
  char buffer[4096];
  auto &stream = std::get<std::unique_ptr<web::StreamBody>>(response.body);
  for (ssize_t count; (count = stream->Read(buffer, sizeof buffer)) > 0;)
    bytes.append(buffer, static_cast<size_t>(count));
  return bytes;
}

std::string HeadOf(const web::Response &response) {
  std::string head = std::to_string(response.status) + "\n";
  for (const auto &[name, value] : response.headers) head += name + ": " + value + "\n";
  return head;
}

Json::Value JsonOf(web::Response &response) {
  EXPECT_EQ("application/json", response.headers.Get("Content-Type"));
  Json::Value document;
  std::istringstream stream(BodyOf(response));
  std::string errors;
  EXPECT_TRUE(Json::parseFromStream(Json::CharReaderBuilder(), stream, &document, &errors))
      << errors;
  return document;
}

std::string Encoded(const FieldList &fields) {
  std::string encoded;
  for (const auto &[name, value] : fields) {
    if (!encoded.empty()) encoded += '&';
    encoded += web::PercentEncode(name) + "=" + web::PercentEncode(value);
  }
  return encoded;
}

Entry LinkToNothing(const std::string &hash) {
  Entry entry = SampleEntry(hash);
  // A process that may switch ids opens nothing as root.
  entry.set_owner_uid(getuid() == 0 ? kNobody : getuid());
  return entry;
}

int StoreLimitedLink(const std::string &hash, const std::string &folder, int uses) {
  OpenForAll(folder);
  Json::Value app(Json::objectValue);
  app["path"] = folder;
  Entry entry = LinkToNothing(hash);
  entry.set_app(app).set_expire_times(uses);
  return EntryDB(SharingDB::Instance()).Create(entry) ? 0 : 1;
}

/// @param target path, and query behind a question mark.
web::Request RequestFor(const std::string &method, const std::string &target) {
  web::Request request;
  request.method = method;
  const size_t mark = target.find('?');
  request.path = target.substr(0, mark);
  if (mark != std::string::npos) request.query = target.substr(mark + 1);
  return request;
}

/// As the web server of that address asks; the path is what cookies go by.
web::Request QuestionAbout(const std::string &address, bool is_authorizer) {
  const size_t host = address.find("://");
  const size_t path = host == std::string::npos ? host : address.find('/', host + 3);
  web::Request request = RequestFor("GET", path == std::string::npos ? "/" : address.substr(path));
  request.question = web::Question{address, is_authorizer};
  return request;
}

Browser::Browser(web::Site &site, std::string address)
    : site_(site), address_(std::move(address)) {}

web::Response Browser::Get(const std::string &target, const HeaderList &headers) {
  return Send(RequestFor("GET", target), headers);
}

web::Response Browser::Head(const std::string &target, const HeaderList &headers) {
  return Send(RequestFor("HEAD", target), headers);
}

web::Response Browser::Ask(const std::string &address, const HeaderList &headers) {
  return Send(QuestionAbout(address, false), headers);
}

web::Response Browser::AskAsAuthorizer(const std::string &address, const HeaderList &headers) {
  return Send(QuestionAbout(address, true), headers);
}

web::Response Browser::Post(const std::string &target, const FieldList &fields,
                            const HeaderList &headers) {
  web::Request request = RequestFor("POST", target);
  request.headers.Add("Content-Type", "application/x-www-form-urlencoded");
  request.body = Encoded(fields);
  return Send(std::move(request), headers);
}

web::Response Browser::Submit(const std::string &page, const std::string &path, FieldList fields,
                              const HeaderList &headers) {
  fields.emplace_back("csrf", TokenOf(page));
  return Post(path, fields, headers);
}

web::Response Browser::Submit(const std::string &path, const FieldList &fields,
                              const HeaderList &headers) {
  return Submit(path, path, fields, headers);
}

std::string Browser::TokenOf(const std::string &page) {
  // A peek, so that an open link shows its form instead of what is behind.
  web::Response response = Head(page);
  const std::string body = BodyOf(response);
  static const std::regex field("name=\"csrf\" value=\"([^\"]*)\"");
  std::smatch match;
  return std::regex_search(body, match, field) ? match[1].str() : "";
}

std::string Browser::CookieFor(const std::string &path, const std::string &name) const {
  for (const auto &[key, value] : cookies_)
    if (key.second == name && IsSentTo(key.first, path)) return value;
  return "";
}

void Browser::SetCookie(const std::string &path, const std::string &name,
                        const std::string &value) {
  cookies_[{path, name}] = value;
}

web::Response Browser::Send(web::Request request, const HeaderList &headers) {
  request.remote_address = address_;
  request.is_https = is_https_;
  const std::string cookies = CookiesFor(request.path);
  if (!cookies.empty()) request.headers.Add("Cookie", cookies);
  for (const auto &[name, value] : headers) request.headers.Add(name, value);
  web::Response response = site_.Handle(request, note_);
  for (const auto &[name, value] : response.headers)
    if (name == "Set-Cookie") Keep(value);
  return response;
}

std::string Browser::CookiesFor(const std::string &path) const {
  std::string cookies;
  for (const auto &[key, value] : cookies_) {
    if (!IsSentTo(key.first, path)) continue;
    if (!cookies.empty()) cookies += "; ";
    cookies += key.second + "=" + value;
  }
  return cookies;
}

void Browser::Keep(const std::string &cookie) {
  static const std::regex form("([^=]+)=([^;]*); Path=([^;]+); HttpOnly; SameSite=Lax(; .*)?");
  std::smatch match;
  ASSERT_TRUE(std::regex_match(cookie, match, form)) << cookie;
  const std::pair<std::string, std::string> key = {match[3], match[1]};
  if (cookie.find("Max-Age=0") != std::string::npos) {
    cookies_.erase(key);
  } else {
    cookies_[key] = match[2];
  }
}

void SiteTest::SetUp() {
  if (!OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
  ASSERT_TRUE(SharingDB::Instance().IsGood());
  RunSql("DELETE FROM entry; DELETE FROM session; DELETE FROM token");
  for (const char *address : {"192.0.2.1", "192.0.2.2", "198.51.100.9"})
    ASSERT_EQ(0, VELKAutoBlockResetByIP(address));
  OpenForAll(folder_.path());
  fs::create_directories(Shared("sub"));
  WriteFile(Shared("hello.txt"), "Hello, visitor\n");
  WriteFile(Shared("page.html"), "<script>alert(1)</script>\n");
  WriteFile(Shared("odd name ä.txt"), "odd\n");
  WriteFile(Shared("sub/inner.txt"), "inner\n");
  WriteFile(folder_.File("outside.txt"), "outside of what is shared\n");
  web::SiteSettings settings;
  settings.runtime_folder = runtime_.path();
  settings.form_secret = "0123456789abcdef0123456789abcdef";
  site_ = std::make_unique<web::Site>(settings);
}

void SiteTest::TearDown() {
  if (OwnsVelkRoot()) RemoveAutoBlockDatabase();
}

Entry SiteTest::FolderLink(const std::string &hash) const {
  return LinkTo(hash, Shared());
}

Entry SiteTest::LinkTo(const std::string &hash, const std::string &path) const {
  Json::Value app(Json::objectValue);
  app["path"] = path;
  Entry entry = LinkToNothing(hash);
  entry.set_app(app);
  return entry;
}

void SiteTest::Store(Entry entry) {
  ASSERT_TRUE(EntryDB(SharingDB::Instance()).Create(entry));
}

void SiteTest::StoreWithPassword(const std::string &hash, const std::string &password) const {
  Store(WithPassword(FolderLink(hash), password));
}

Entry SiteTest::WithPassword(Entry entry, const std::string &password) {
  entry.set_protect_type(Entry::PROTECT_PASSWORD);
  entry.set_protect_password(password, true, Entry::ENCRYPT_ALGO_DEFAULT);
  return entry;
}

void SiteTest::RunSql(const std::string &sql) {
  ASSERT_TRUE(SharingDB::Instance().Execute(sql)) << SharingDB::Instance().GetLastError();
}

std::string SiteTest::Value(const std::string &sql) {
  Result result;
  Row row;
  if (!SharingDB::Instance().Execute("SELECT (" + sql + ") AS value", result) ||
      !result.NextRow(row)) {
    ADD_FAILURE() << SharingDB::Instance().GetLastError();
    return "";
  }
  return row.GetField("value").AsString("");
}

std::string SiteTest::Shared(const std::string &name) const {
  return folder_.File(name.empty() ? "shared" : "shared/" + name);
}

}  // namespace velk_test
