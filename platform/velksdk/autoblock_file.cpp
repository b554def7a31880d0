#include "autoblock_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>

#include "velk_paths.h"

namespace velk {
namespace {

constexpr char kFolder[] = VELK_ROOT "/etc/private";
constexpr char kName[] = "/autoblock.db";
constexpr mode_t kMode = 0660;

constexpr char kSchema[] = R"sql(
  CREATE TABLE autoblock (
    address TEXT PRIMARY KEY,
    category TEXT NOT NULL,
    attempts INTEGER NOT NULL,
    first_failure INTEGER NOT NULL,
    last_failure INTEGER NOT NULL,
    blocked_until INTEGER            -- NULL: not blocked; 0: for ever
  ) STRICT, WITHOUT ROWID;
  CREATE INDEX autoblock_last_failure ON autoblock (last_failure);
  PRAGMA journal_mode = WAL;
)sql";

[[noreturn]] void Fail(int error) {
  throw std::runtime_error(strerror(error));
}

/// The folder's path without symlinks, which SQLite refuses anywhere in the path of a file that
/// must be none itself.
std::string RealFolder() {
  const std::unique_ptr<char, decltype(&free)> path(realpath(kFolder, nullptr), free);
  if (path == nullptr) Fail(errno);
  return path.get();
}

/// A new file under a name of its own, which goes away at the end of the scope.
class Draft {
 public:
  explicit Draft(const std::string &final_path) : path_(final_path + ".XXXXXX") {
    const int file = mkostemp(path_.data(), O_CLOEXEC);
    if (file == -1) Fail(errno);
    const int error = Prepare(file);
    close(file);
    if (error == 0) return;
    unlink(path_.c_str());
    Fail(error);
  }
  Draft(const Draft &) = delete;
  Draft &operator=(const Draft &) = delete;
  ~Draft() { unlink(path_.c_str()); }

  const std::string &path() const { return path_; }

 private:
  /// Gives the file its mode and, where we may, its owner; 0 or the error.
  static int Prepare(int file) {
    if (fchmod(file, kMode) == -1) return errno;
    if (geteuid() == 0 && fchown(file, VELK_SYSTEM_UID, VELK_SYSTEM_GID) == -1) return errno;
    return 0;
  }

  std::string path_;
};

/// Makes the file complete under another name and then links it to its own, so that no process
/// ever sees it half made, without its table or with another owner.
void MakeFile() {
  const std::string path = RealFolder() + kName;
  const Draft draft(path);
  Connection(draft.path()).Run(kSchema);
  if (link(draft.path().c_str(), path.c_str()) == -1 && errno != EEXIST) Fail(errno);
}

}  // namespace

std::optional<Connection> OpenAutoBlockFile() {
  struct stat status {};
  if (lstat(kAutoBlockPath, &status) == -1) {
    if (errno == ENOENT) return std::nullopt;
    Fail(errno);
  }
  if (!S_ISREG(status.st_mode)) throw std::runtime_error("not a regular file");
  Connection connection(RealFolder() + kName);
  connection.Run("PRAGMA synchronous = NORMAL");
  return connection;
}

Connection OpenOrMakeAutoBlockFile() {
  if (auto connection = OpenAutoBlockFile()) return std::move(*connection);
  MakeFile();
  if (auto connection = OpenAutoBlockFile()) return std::move(*connection);
  throw std::runtime_error("removed while it was made");
}

}  // namespace velk
