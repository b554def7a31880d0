#ifndef BENCH_OPERATIONS_H
#define BENCH_OPERATIONS_H

#include <memory>

#include "dataset.h"

namespace velk_bench {

/// What is measured: the same work done by one of two sides, each on its own copy of a database.
///
/// A side is made in the process that uses it, for SQLite's connections do not survive a fork. Each
/// call returns whether it did its work; the baseline's calls may also throw SqliteError.
class Operations {
 public:
  Operations() = default;
  Operations(const Operations &) = delete;
  Operations &operator=(const Operations &) = delete;
  virtual ~Operations() = default;

  /// Lets a visitor without a session in, by the link's password.
  virtual bool Login(const Visit &visit) = 0;
  /// The authorised check: reads session, link and grant, and pushes both time-outs forward.
  virtual bool Check(const Visit &visit) = 0;
  /// What the check reads, without what it writes.
  virtual bool ReadForCheck(const Visit &visit) = 0;
  virtual bool Logout(const Visit &visit) = 0;
  virtual bool CountUse(const Visit &visit) = 0;
  /// Stores a new link with what link `id` has, under a hash and with a salt of its own.
  virtual bool Create(long id) = 0;

  /// The newest 1,000 links, as records.
  virtual bool List() = 0;
  /// List() against less: the baseline leaves the links' JSON unparsed.
  virtual bool ListAgainstBareSelect() = 0;

  virtual bool PurgeLinks() = 0;
  virtual bool PurgeLinksOfOwnerProject() = 0;  ///< Of kPurgedOwner and kPurgedProject.
  virtual bool PurgeSessions() = 0;
  virtual bool PurgeGrants() = 0;
};

/// The library, by its public headers, on the sharing database. Once for each process.
std::unique_ptr<Operations> OpenLibrary();

/// SQLite and JsonCpp by themselves, on a database of its own beside that.
std::unique_ptr<Operations> OpenBaseline();

/// One of the two, by its name.
struct Side {
  const char *name;
  std::unique_ptr<Operations> (*open)();
};
inline constexpr Side kLibrary = {"library", OpenLibrary};
inline constexpr Side kBaseline = {"baseline", OpenBaseline};

}  // namespace velk_bench

#endif
