#ifndef TESTS_SUPPORT_TEMP_DIR_H
#define TESTS_SUPPORT_TEMP_DIR_H

#include <string>

namespace velk_test {

/// A new empty folder, removed with all that is in it at the end of the scope.
class TempDir {
 public:
  TempDir();
  TempDir(const TempDir &) = delete;
  TempDir &operator=(const TempDir &) = delete;
  ~TempDir();

  /// The folder's path, without a slash at its end.
  const std::string &path() const { return path_; }
  /// The path of `name` in the folder.
  std::string File(const std::string &name) const { return path_ + "/" + name; }

 private:
  std::string path_;
};

/// The whole content of a file; "" when it cannot be read.
std::string ReadFile(const std::string &path);

/// Makes or replaces a file. Throws when that fails.
void WriteFile(const std::string &path, const std::string &content);

}  // namespace velk_test

#endif
