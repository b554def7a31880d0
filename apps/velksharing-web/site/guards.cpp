#include "site/guards.h"

#include <syslog.h>
#include <velksharing/database.h>

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
constexpr char kWords[] =
    "SELECT hash, data FROM entry INDEXED BY entry_guards WHERE instr(data, '\"protects\"') > 0"
    " ORDER BY id";
constexpr char kSpeakers[] =
    "SELECT * FROM entry INDEXED BY entry_guards WHERE instr(data, '\"protects\"') > 0"
    " ORDER BY id";

/// Every text of `app.protects` that is a prefix.
/// @param[out] refused receives the first that is none.
std::vector<gate::Prefix> OwnPrefixes(const Entry &link, std::optional<std::string> &refused) {
  std::vector<gate::Prefix> prefixes;
  const Json::Value app = link.get_app();
  if (!app.isObject() || !app["protects"].isArray()) return prefixes;
  for (const Json::Value &value : app["protects"]) {
    auto prefix = value.isString() ? gate::Prefix::Parse(value.asString()) : std::nullopt;
    if (prefix) {
      prefixes.push_back(std::move(*prefix));
    } else if (!refused) {
      refused = value.isString() ? value.asString() : "a value that is no text";
    }
  }
  return prefixes;
}

std::vector<gate::Prefix> PrefixesIn(const Row &row) {
  const int id = row.GetField("id").AsInt(0);
  Entry link;
  if (!link.FromRow(row)) {
    syslog(LOG_WARNING, "link %d: cannot be read, and guards nothing", id);
    return {};
  }
  std::optional<std::string> refused;
  std::vector<gate::Prefix> prefixes = OwnPrefixes(link, refused);
  if (refused)
    syslog(LOG_WARNING, "link %d: what it says to protect is no prefix of addresses, and ignored",
           id);
  return prefixes;
}

/// Reads every link to make the index, but does not keep them all in memory.
bool MakeIndex(SharingDB &db) {
  Result result;
  Row row;
  if (!db.Execute("PRAGMA cache_size", result) || !result.NextRow(row)) return false;
  const int usual = row.GetField("cache_size").AsInt(0);
  Result changed;
  Result changed_back;
  return db.Execute("PRAGMA cache_size = 100", changed) && db.Execute(kIndex) &&
         db.Execute("PRAGMA cache_size = " + std::to_string(usual), changed_back);
}

bool ReadWords(Result &words) {
  SharingDB &db = SharingDB::Instance();
  if (!db.IsGood()) return false;
  return db.Execute(kWords, words) || (MakeIndex(db) && db.Execute(kWords, words));
}

}  // namespace

Guards::Guards(std::vector<gate::GuardedPrefix> configured) : configured_(std::move(configured)) {
  Rebuild();
}

bool Guards::Refresh() {
  Result words;
  if (ReadWords(words) && (AreKnown(words) || ReadAnew())) return true;
  speakers_.clear();
  Rebuild();
  return false;
}

bool Guards::AreKnown(Result &words) const {
  size_t count = 0;
  for (Row row; words.NextRow(row); ++count) {
    if (count == speakers_.size()) return false;
    const Speaker &known = speakers_[count];
    if (row.GetField("data").AsString("") != known.data) return false;
    if (row.GetField("hash").AsString("") != known.hash) return false;
  }
  return count == speakers_.size();
}

bool Guards::ReadAnew() {
  Result result;
  if (!SharingDB::Instance().Execute(kSpeakers, result)) return false;
  speakers_.clear();
  for (Row row; result.NextRow(row);)
    speakers_.push_back(
        {row.GetField("hash").AsString(""), row.GetField("data").AsString(""), PrefixesIn(row)});
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
  std::optional<std::string> refused;
  std::vector<gate::Prefix> prefixes = OwnPrefixes(link, refused);
  for (const gate::GuardedPrefix &guarded : configured_)
    if (guarded.hash == link.get_hash()) prefixes.push_back(guarded.prefix);
  return prefixes;
}

}  // namespace web
