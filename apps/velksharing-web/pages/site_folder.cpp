#include "pages/site_folder.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <system_error>

namespace web {
namespace {

constexpr size_t kLargestFile = 1024 * 1024;

class Descriptor {
 public:
  explicit Descriptor(int number) : fd(number) {}
  Descriptor(const Descriptor &) = delete;
  Descriptor &operator=(const Descriptor &) = delete;
  ~Descriptor() {
    if (fd >= 0) close(fd);
  }
  const int fd;
};

/// Reads `name` below `folder`; what does not exist is left out.
class Reading {
 public:
  Reading(const std::string &folder, SourceFiles &files, std::string &error)
      : folder_(folder), files_(files), error_(error) {}

  bool ReadFile(const std::string &name) {
    // Without waiting for somebody to write into a named pipe.
    const Descriptor file(open((folder_ + "/" + name).c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
    if (file.fd < 0) return errno == ENOENT || Fail(name, errno);

    struct stat status = {};
    if (fstat(file.fd, &status) != 0) return Fail(name, errno);
    if (!S_ISREG(status.st_mode)) return Fail(name, "not a regular file");

    std::string content;
    char buffer[16 * 1024];
    ssize_t count = 0;
    while ((count = read(file.fd, buffer, sizeof buffer)) > 0) {
      content.append(buffer, static_cast<size_t>(count));
      if (content.size() > kLargestFile) return Fail(name, "larger than 1 MiB");
    }
    if (count < 0) return Fail(name, errno);
    files_[name] = std::move(content);
    return true;
  }

  bool ReadAll(const std::string &subfolder, const std::string &extension) {
    std::error_code failure;
    std::filesystem::directory_iterator entry(folder_ + "/" + subfolder, failure);
    if (failure == std::errc::no_such_file_or_directory) return true;
    for (; !failure && entry != std::filesystem::directory_iterator(); entry.increment(failure)) {
      const std::filesystem::path name = entry->path().filename();
      if (name.extension() != extension || name.native().front() == '.') continue;
      if (!ReadFile(subfolder + "/" + name.native())) return false;
    }
    return !failure || Fail(subfolder, failure.value());
  }

 private:
  bool Fail(const std::string &name, int number) {
    return Fail(name, std::generic_category().message(number));
  }

  bool Fail(const std::string &name, const std::string &reason) {
    error_ = name + ": " + reason;
    return false;
  }

  const std::string &folder_;
  SourceFiles &files_;
  std::string &error_;
};

}  // namespace

bool ReadSiteFolder(const std::string &folder, SourceFiles &files, std::string &error) {
  std::error_code failure;
  if (!std::filesystem::is_directory(folder, failure)) {
    error = failure ? failure.message() : "not a folder";
    return false;
  }
  Reading reading(folder, files, error);
  return reading.ReadAll("templates", ".mustache") && reading.ReadAll("catalogues", ".json") &&
         reading.ReadFile("style.css") && reading.ReadFile("logo.svg") &&
         reading.ReadFile("logo.png");
}

}  // namespace web
