#ifndef BENCH_DATASET_H
#define BENCH_DATASET_H

#include <json/value.h>

#include <string>

/// The rows that are measured on.
///
/// A database of n links has n links, n sessions and n grants, whose ids run from 1 to n: session i
/// has grant i on link i. All links ask for a password. Every tenth link, session and grant is
/// lapsed, so that the purges find a tenth of the rows, spread over the whole file; visitors use
/// the others. What a row holds follows from its id alone, but for the salts.

namespace velk_bench {

inline constexpr char kPassword[] = "open sesame 2026";  ///< Of every link.
inline constexpr char kVisitorAddress[] = "192.0.2.10";  ///< Of every session.
inline constexpr unsigned int kPurgedOwner = 1030;       ///< Has a fiftieth of the links
inline constexpr char kPurgedProject[] = "photo";        ///< together with this.
inline constexpr int kLinksOfAPage = 1000;

/// What a visitor brings along.
struct Visit {
  std::string hash;
  std::string session_id;
};
Visit VisitOf(long id);

bool IsLive(long id);

/// What an application shares by link `id`.
struct Content {
  unsigned int owner_uid;
  std::string project_name;
  std::string title;
  Json::Value app;
};
Content ContentOf(long id);

/// Makes a sharing database of the newest schema with `links` links at `path`, as one file that is
/// on the disk. Throws when that fails.
void MakeDatabase(const std::string &path, long links);

}  // namespace velk_bench

#endif
