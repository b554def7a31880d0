#ifndef BENCH_STAGE_H
#define BENCH_STAGE_H

#include <string>

namespace velk_bench {

/// The databases that the sides are measured on: before each run the same two again.
///
/// There is one master for each number of links, made when it is first asked for and taken away at
/// the end. Each side gets a copy of it, on the disk before the run starts. All of this is in the
/// build folder, and the constructor throws when the library's database is not.
class Stage {
 public:
  Stage();
  Stage(const Stage &) = delete;
  Stage &operator=(const Stage &) = delete;
  ~Stage();

  /// Puts databases of `links` links where the sides look for them. No process may have them open.
  void Set(long links);

  /// The databases are not what they were made as any more.
  void Spoil() { links_ = 0; }

 private:
  long links_ = 0;  ///< In the databases that are there now; 0 for none that can be used.
};

/// Where the sides look.
std::string LibraryDatabase();
std::string BaselineDatabase();

}  // namespace velk_bench

#endif
