#ifndef BENCH_BASELINE_LINK_H
#define BENCH_BASELINE_LINK_H

#include <json/value.h>

#include <cstdint>
#include <string>

#include "dataset.h"
#include "sqlite.h"

/// A link as the baseline holds it: the columns in plain members, the JSON as JsonCpp parsed it.

namespace velk_bench {

struct Link {
  std::int64_t id = 0;
  std::string hash;
  std::string project_name;
  bool enabled = true;
  std::int64_t owner_uid = 0;
  std::int64_t start_at = 0;
  std::int64_t expire_at = 0;
  std::int64_t expire_times = 0;
  std::int64_t use_count = 0;
  bool auto_gc = false;
  Json::Value data{Json::objectValue};

  bool IsValid() const;
  bool IsUsedUp() const;
  bool IsPasswordValid(const std::string &password) const;
};

/// The columns of the statement's row but `data`.
void ReadColumns(const Statement &row, Link &link);

/// Parses the row's `data`, as the library does it: the older reader, comments kept.
bool ReadData(const Statement &row, Link &link);

/// The link's `data` on one line.
std::string DataText(const Link &link);

/// A new link under a random hash, with a digest of kPassword under a random salt.
Link NewLink(const Content &content);

/// Random characters, all equally likely.
/// @param characters 64 at most.
std::string RandomText(std::string_view characters, size_t length);

inline constexpr std::string_view kLettersAndDigits =
    "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
inline constexpr std::string_view kUrlCharacters =
    "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789-_";

}  // namespace velk_bench

#endif
