#include "site/guards.h"

#include <json/reader.h>
#include <syslog.h>
#include <velksharing/database.h>

#include <memory>
#include <optional>
#include <string>
#include <utility>

namespace web {
namespace {

using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

// The index holds the rows that have the word. It needs another name whenever its condition
// changes: one of this name is left as it is.
constexpr char kIndex[] =
    "CREATE INDEX IF NOT EXISTS entry_guards ON entry (id) WHERE instr(data, '\"protects\"') > 0";
constexpr char kSpeakers[] =
    "SELECT id, hash, data FROM entry INDEXED BY entry_guards"
    " WHERE instr(data, '\"protects\"') > 0 ORDER BY id";

/// Every text of `app.protects` that is a prefix.
/// @param[out] are_all whether there is nothing else in it.
std::vector<gate::Prefix> OwnPrefixes(const Json::Value &app, bool &are_all) {
  std::vector<gate::Prefix> prefixes;
  are_all = true;
  if (!app.isObject() || !app["protects"].isArray()) return prefixes;
  for (const Json::Value &value : app["protects"]) {
    auto prefix = value.isString() ? gate::Prefix::Parse(value.asString()) : std::nullopt;
    if (prefix) prefixes.push_back(std::move(*prefix));
    are_all = are_all && prefix;
  }
  return prefixes;
}

/// What a row's link says. It guards that also where it is no link that lets anybody in.
/// @return nothing for what cannot be read: then nobody knows what it guards.
std::optional<std::vector<gate::Prefix>> PrefixesIn(int id, const std::string &data) {
  Json::Value document;
  const std::unique_ptr<Json::CharReader> reader(Json::CharReaderBuilder().newCharReader());
  if (!reader->parse(data.data(), data.data() + data.size(), &document, nullptr) ||
      !document.isObject()) {
    syslog(LOG_ERR, "link %d: its data cannot be read; nobody gets through the gate", id);
    return std::nullopt;
  }
  bool are_all = false;
  std::vector<gate::Prefix> prefixes = OwnPrefixes(document["app"], are_all);
  if (!are_all)
    syslog(LOG_WARNING, "link %d: what it says to protect is no prefix of addresses, and ignored",
           id);
  return prefixes;
}

/// What a column of the first row says.
std::optional<std::string> ReadValue(const char *sql, const char *column) {
  Result result;
  Row row;
  if (!SharingDB::Instance().Execute(sql, result) || !result.NextRow(row)) return std::nullopt;
  return row.GetField(column).AsString("");
}

/// Reads every link to make the index, but does not keep them all in memory.
bool MakeIndex(SharingDB &db) {
  const std::optional<std::string> usual = ReadValue("PRAGMA cache_size", "cache_size");
  if (!usual) return false;
  Result changed;
  Result changed_back;
  const bool is_made = db.Execute("PRAGMA cache_size = 100", changed) && db.Execute(kIndex);
  return db.Execute("PRAGMA cache_size = " + *usual, changed_back) && is_made;
}

/// What is the same for as long as nobody changes a row of the database: neither others, of whose
/// writing the first part tells, nor this connection.
std::optional<std::string> ReadMark() {
  auto others = ReadValue("PRAGMA data_version", "data_version");
  const auto own = ReadValue("SELECT total_changes() AS changes", "changes");
  if (!others || !own) return std::nullopt;
  return *others + ' ' + *own;
}

bool ReadSpeakers(Result &rows) {
  SharingDB &db = SharingDB::Instance();
  return db.Execute(kSpeakers, rows) || (MakeIndex(db) && db.Execute(kSpeakers, rows));
}

}  // namespace

Guards::Guards(std::vector<gate::GuardedPrefix> configured) : configured_(std::move(configured)) {
  Rebuild();
}

bool Guards::Refresh() {
  // Read first: what is written meanwhile counts as not known.
  std::optional<std::string> mark = ReadMark();
  if (mark && mark == mark_) return true;
  mark_.reset();
  Result rows;
  if (mark && ReadSpeakers(rows) && (AreKnown(rows) || ReadAnew())) {
    mark_ = std::move(mark);
    return true;
  }
  speakers_.clear();
  Rebuild();
  return false;
}

bool Guards::AreKnown(Result &rows) const {
  size_t count = 0;
  for (Row row; rows.NextRow(row); ++count) {
    if (count == speakers_.size()) return false;
    const Speaker &known = speakers_[count];
    if (row.GetField("data").AsString("") != known.data) return false;
    if (row.GetField("hash").AsString("") != known.hash) return false;
  }
  return count == speakers_.size();
}

bool Guards::ReadAnew() {
  Result rows;
  if (!ReadSpeakers(rows)) return false;
  speakers_.clear();
  for (Row row; rows.NextRow(row);) {
    Speaker speaker = {row.GetField("hash").AsString(""), row.GetField("data").AsString(""), {}};
    auto prefixes = PrefixesIn(row.GetField("id").AsInt(0), speaker.data);
    if (!prefixes) return false;
    speaker.prefixes = std::move(*prefixes);
    speakers_.push_back(std::move(speaker));
  }
  Rebuild();
  return true;
}

void Guards::Rebuild() {
  prefixes_ = {};
  for (const gate::GuardedPrefix &guarded : configured_)
    prefixes_.Add(guarded.prefix, guarded.hash);
  for (const Speaker &speaker : speakers_)
    for (const gate::Prefix &prefix : speaker.prefixes) prefixes_.Add(prefix, speaker.hash);
}

const std::vector<std::string> &Guards::Find(const gate::Address &address) const {
  return prefixes_.Find(address);
}

std::vector<gate::Prefix> Guards::PrefixesOf(const Entry &link) const {
  bool are_all = false;
  std::vector<gate::Prefix> prefixes = OwnPrefixes(link.get_app(), are_all);
  for (const gate::GuardedPrefix &guarded : configured_)
    if (guarded.hash == link.get_hash()) prefixes.push_back(guarded.prefix);
  return prefixes;
}

}  // namespace web
