#ifndef BENCH_STAGE_H
#define BENCH_STAGE_H

#include <string>

namespace velk_bench {

/// The sharing database that both sides are measured on: before each run the same one again.
///
/// There is one database for each number of links, made when it is first asked for and taken away
/// at the end. Each run gets a copy of it, on the disk before the run starts. All of this is in the
/// build folder, and the constructor throws when the library's database is not.
class Stage {
 public:
  Stage();
  Stage(const Stage &) = delete;
  Stage &operator=(const Stage &) = delete;
  ~Stage();

  /// Puts a database of `links` links where the library looks for it.
  void Set(long links);

  /// The last run has written: the database is not what it was.
  void Spoil() { links_ = 0; }

 private:
  long links_ = 0;  ///< In the database that is there now, when it is as it was made.
};

}  // namespace velk_bench

#endif
