#include "site/guards.h"

#include <syslog.h>
#include <velksharing/database.h>

#include <optional>
#include <string_view>
#include <utility>

namespace web {
namespace {

using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

// The blob is the text "protects" with its quotation marks: texts become parameters, with which an
// index like this one could not be used.
constexpr char kIndex[] =
    "CREATE INDEX IF NOT EXISTS entry_guards ON entry (id)"
    " WHERE instr(data, x'2270726F746563747322') > 0";
constexpr char kSpeakers[] =
    "SELECT * FROM entry INDEXED BY entry_guards"
    " WHERE instr(data, x'2270726F746563747322') > 0";

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

std::vector<gate::Prefix> PrefixesIn(const Row &row, int id) {
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

bool ReadSpeakers(Result &result) {
  SharingDB &db = SharingDB::Instance();
  if (!db.IsGood()) return false;
  if (db.Execute(kSpeakers, result)) return true;
  return db.Execute(kIndex) && db.Execute(kSpeakers, result);
}

}  // namespace

Guards::Guards(std::vector<gate::GuardedPrefix> configured) : configured_(std::move(configured)) {
  Rebuild();
}

bool Guards::Refresh() {
  // Taken out: should one of them fail to be read in the middle, all are read anew the next time.
  Speakers known = std::exchange(speakers_, {});
  Result result;
  const bool is_read = ReadSpeakers(result);
  Speakers speakers;
  bool is_changed = false;
  for (Row row; is_read && result.NextRow(row);) {
    const int id = row.GetField("id").AsInt(0);
    Speaker speaker = {row.GetField("hash").AsString(""), row.GetField("data").AsString(""), {}};
    const auto before = known.find(id);
    if (before != known.end() && before->second.SaysTheSameAs(speaker)) {
      speaker.prefixes = std::move(before->second.prefixes);
    } else {
      speaker.prefixes = PrefixesIn(row, id);
      is_changed = true;
    }
    speakers[id] = std::move(speaker);
  }
  is_changed = is_changed || speakers.size() != known.size();
  speakers_ = std::move(speakers);
  if (is_changed) Rebuild();
  return is_read;
}

void Guards::Rebuild() {
  prefixes_ = {};
  for (const gate::GuardedPrefix &guarded : configured_)
    prefixes_.Add(guarded.prefix, guarded.hash);
  for (const auto &[id, speaker] : speakers_)
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
