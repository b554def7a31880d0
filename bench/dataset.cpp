#include "dataset.h"

#include <sqlite3.h>
#include <velksharing/record.h>

#include <array>
#include <cstdint>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <vector>

#include "sqlite.h"
#include "velk_paths.h"

namespace velk_bench {
namespace {

using VELK::sharing::record::Entry;

constexpr std::string_view kHashCharacters =
    "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
constexpr std::string_view kSessionCharacters =
    "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-_";
constexpr size_t kHashLength = 9;
constexpr size_t kSessionLength = 32;
constexpr std::array kProjects = {kPurgedProject, "files", "notes", "music", "video"};
constexpr unsigned int kFirstOwner = 1026;
constexpr unsigned int kOwners = 10;
constexpr long kDay = 86400;
constexpr long kTimeLeft = 36000;  // less than a renewal gives

/// Numbers without a pattern, always the same for the same seed (splitmix64).
class Scatter {
 public:
  explicit Scatter(std::uint64_t seed) : state_(seed * 0x9e3779b97f4a7c15) {}

  std::uint64_t Next() {
    std::uint64_t mixed = state_ += 0x9e3779b97f4a7c15;
    mixed = (mixed ^ (mixed >> 30)) * 0xbf58476d1ce4e5b9;
    mixed = (mixed ^ (mixed >> 27)) * 0x94d049bb133111eb;
    return mixed ^ (mixed >> 31);
  }

  std::string Text(std::string_view characters, size_t length) {
    std::string text(length, '\0');
    for (char &character : text) character = characters[Next() % characters.size()];
    return text;
  }

 private:
  std::uint64_t state_;
};

Scatter ScatterOf(long id) {
  return Scatter(static_cast<std::uint64_t>(id));
}

Json::Value AppOf(long id) {
  Json::Value app(Json::objectValue);
  app["album_id"] = static_cast<Json::Int64>(100000 + id);
  app["path"] = "/volume1/photo/2026/summer at the lake/day " + std::to_string(id % 365);
  app["cover"]["id"] = static_cast<Json::Int64>(7 * id);
  app["cover"]["width"] = 4272;
  app["cover"]["height"] = 2848;
  app["permission"].append("view");
  if (id % 3 != 0) app["permission"].append("download");
  return app;
}

Entry LinkOf(long id, long now) {
  const Content content = ContentOf(id);
  const bool live = IsLive(id);
  Entry link;
  link.set_hash(VisitOf(id).hash)
      .set_project_name(content.project_name)
      .set_owner_uid(content.owner_uid)
      .set_protect_type(Entry::PROTECT_PASSWORD)
      .set_protect_title(content.title)
      .set_protect_password(kPassword, true, Entry::ENCRYPT_ALGO_DEFAULT)
      .set_enabled(true)
      .set_enable_match_ip(id % 2 == 0)
      .set_auto_gc(!live || id % 2 == 0)
      .set_app(content.app)
      .set_private_data(Json::Value(Json::objectValue));
  if (!live) link.set_expire_at(now - kDay);
  if (live && id % 2 == 0) link.set_expire_at(now + 365 * kDay);
  return link;
}

void InsertLink(Statement &insert, long id, long now) {
  const std::vector<std::string> values = LinkOf(id, now).GetFieldList();
  int place = 0;
  for (const std::string &value : values) insert.Bind(++place, value);
  insert.Run();
}

void InsertSession(Statement &insert, long id, long timeout) {
  const std::string session_id = VisitOf(id).session_id;
  insert.Bind(1, session_id).Bind(2, 0xFFFFFFFF).Bind(3, kVisitorAddress).Bind(4, timeout).Run();
}

void InsertGrant(Statement &insert, long id, long timeout) {
  insert.Bind(1, id).Bind(2, id).Bind(3, timeout).Run();
}

void Fill(Connection &connection, long links) {
  Statement link(connection, "INSERT INTO entry VALUES (NULL,?,?,?,?,?,?,?,?,?,?)");
  Statement session(connection, "INSERT INTO session VALUES (NULL,?,?,?,?)");
  Statement grant(connection, "INSERT INTO token VALUES (NULL,?,?,?)");
  const long now = time(nullptr);
  connection.Run("BEGIN");
  for (long id = 1; id <= links; ++id) {
    const long timeout = IsLive(id) ? now + kTimeLeft : now - kDay;
    InsertLink(link, id, now);
    InsertSession(session, id, timeout);
    InsertGrant(grant, id, timeout);
  }
  connection.Run("COMMIT");
}

std::string SchemaScript(const char *name) {
  std::ifstream file(std::string(VELK_ROOT "/share/velksharing/db_schema/") + name);
  if (!file) throw std::runtime_error(std::string("no schema script ") + name);
  return std::string(std::istreambuf_iterator<char>(file), {});
}

}  // namespace

Visit VisitOf(long id) {
  Scatter scatter = ScatterOf(id);
  Visit visit;
  visit.hash = scatter.Text(kHashCharacters, kHashLength);
  visit.session_id = scatter.Text(kSessionCharacters, kSessionLength);
  return visit;
}

bool IsLive(long id) {
  return id % 10 != 0;
}

Content ContentOf(long id) {
  Scatter scatter = ScatterOf(-id);
  Content content;
  content.owner_uid = kFirstOwner + static_cast<unsigned int>(scatter.Next() % kOwners);
  content.project_name = kProjects[scatter.Next() % kProjects.size()];
  content.title = "The password is that of last year";
  content.app = AppOf(id);
  return content;
}

void MakeDatabase(const std::string &path, long links) {
  std::ofstream(path).close();
  {
    Connection connection(path);
    connection.Run(SchemaScript("1.sql").c_str());
    connection.Run(SchemaScript("2.sql").c_str());
    connection.Run("PRAGMA synchronous = OFF; PRAGMA cache_size = -400000");
    Fill(connection, links);
  }
  if (std::filesystem::exists(path + "-wal")) throw std::runtime_error(path + " is still in use");
}

}  // namespace velk_bench
