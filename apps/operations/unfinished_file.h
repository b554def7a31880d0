#ifndef OPERATIONS_UNFINISHED_FILE_H
#define OPERATIONS_UNFINISHED_FILE_H

#include <string>

namespace operations {

/// A new file of mode 0600 while it grows: under a name of its own beside the target, and gone
/// with this object unless it was published. So the target is there when it is complete, or not at
/// all. What SQLite may leave beside it goes, too.
class UnfinishedFile {
 public:
  /// @throws Failure INVALID for an empty name, REFUSED when the target exists, SYSTEM when no
  ///         file can be made there.
  explicit UnfinishedFile(const std::string &target);
  UnfinishedFile(const UnfinishedFile &) = delete;
  UnfinishedFile &operator=(const UnfinishedFile &) = delete;
  ~UnfinishedFile();

  /// Where it is for now.
  const std::string &path() const { return path_; }

  /// Adds text at its end.
  /// @throws Failure SYSTEM.
  void Write(const std::string &text);

  /// Flushes it to the disk and gives it the target's name.
  /// @throws Failure REFUSED when the target exists by now, SYSTEM.
  void Publish();

 private:
  void Rename() const;
  void FlushFolder() const;

  std::string target_;
  std::string path_;
  int file_ = -1;
  bool published_ = false;
};

}  // namespace operations

#endif
