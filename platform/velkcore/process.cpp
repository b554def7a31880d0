#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>

#include <cerrno>
#include <memory>
#include <mutex>
#include <string_view>
#include <unordered_map>
#include <utility>

#include "descriptor.h"
#include "velk/velkcore.h"

namespace {

using velkcore::Descriptor;

/// An error number on its way to errno.
struct Failure {
  int error;
};

void Require(int error) {
  if (error != 0) throw Failure{error};
}

void RequireCall(bool succeeded) {
  if (!succeeded) Require(errno);
}

/// The streams that wait to be closed, and their children. Lives until the process is gone, so
/// that a stream can still be closed by what runs at exit.
class Children {
 public:
  static Children &Instance() {
    static Children *const children = new Children;
    return *children;
  }

  /// Makes room for `stream`, so that SetChild() cannot fail once there is a child.
  void Add(FILE *stream) {
    const std::lock_guard guard(mutex_);
    children_.emplace(stream, 0);
  }

  void SetChild(FILE *stream, pid_t child) {
    const std::lock_guard guard(mutex_);
    children_.find(stream)->second = child;
  }

  /// Forgets `stream` and gives its child; -1 when it is not known.
  pid_t Remove(FILE *stream) {
    const std::lock_guard guard(mutex_);
    const auto found = children_.find(stream);
    if (found == children_.end()) return -1;
    const pid_t child = found->second;
    children_.erase(found);
    return child;
  }

 private:
  std::mutex mutex_;
  std::unordered_map<FILE *, pid_t> children_;
};

/// Takes the stream back when the child does not start.
struct DropStream {
  void operator()(FILE *stream) const {
    const int saved_errno = errno;
    Children::Instance().Remove(stream);
    fclose(stream);
    errno = saved_errno;
  }
};
using PendingStream = std::unique_ptr<FILE, DropStream>;

struct Pipe {
  Descriptor reading;
  Descriptor writing;
};

/// What the child's descriptors become. A standard descriptor that the caller has closed is
/// /dev/null in the child: what the program opens next must not take its place.
class FileActions {
 public:
  FileActions() { Require(posix_spawn_file_actions_init(&actions_)); }
  FileActions(const FileActions &) = delete;
  FileActions &operator=(const FileActions &) = delete;
  ~FileActions() { posix_spawn_file_actions_destroy(&actions_); }

  void Connect(int standard, const Descriptor &end) {
    Require(posix_spawn_file_actions_adddup2(&actions_, end.number(), standard));
  }

  void Inherit(int standard) {
    if (fcntl(standard, F_GETFD) == -1) return ConnectToNothing(standard);
    // Onto itself: that takes its close-on-exec flag away, should it have one.
    Require(posix_spawn_file_actions_adddup2(&actions_, standard, standard));
  }

  void ConnectToNothing(int standard) {
    Require(posix_spawn_file_actions_addopen(&actions_, standard, "/dev/null", O_RDWR, 0));
  }

  void CloseAllOthers() {
    Require(posix_spawn_file_actions_addclosefrom_np(&actions_, STDERR_FILENO + 1));
  }

  const posix_spawn_file_actions_t *get() const { return &actions_; }

 private:
  posix_spawn_file_actions_t actions_;
};

/// How the child takes signals: none blocked, and those at their defaults whose being ignored by
/// us would break an ordinary program.
class SignalAttributes {
 public:
  SignalAttributes() {
    Require(posix_spawnattr_init(&attributes_));
    sigset_t signals;
    sigemptyset(&signals);
    posix_spawnattr_setsigmask(&attributes_, &signals);
    sigaddset(&signals, SIGPIPE);
    sigaddset(&signals, SIGCHLD);
    posix_spawnattr_setsigdefault(&attributes_, &signals);
    posix_spawnattr_setflags(&attributes_, POSIX_SPAWN_SETSIGMASK | POSIX_SPAWN_SETSIGDEF);
  }
  SignalAttributes(const SignalAttributes &) = delete;
  SignalAttributes &operator=(const SignalAttributes &) = delete;
  ~SignalAttributes() { posix_spawnattr_destroy(&attributes_); }

  const posix_spawnattr_t *get() const { return &attributes_; }

 private:
  posix_spawnattr_t attributes_;
};

/// A pipe made while the caller has standard descriptors closed takes their numbers, and would
/// be overwritten by what the child puts there.
Descriptor AboveStandard(Descriptor end) {
  if (end.number() > STDERR_FILENO) return end;
  Descriptor raised(fcntl(end.number(), F_DUPFD_CLOEXEC, STDERR_FILENO + 1));
  RequireCall(raised.IsOpen());
  return raised;
}

Pipe MakePipe() {
  int ends[2];
  RequireCall(pipe2(ends, O_CLOEXEC) == 0);
  Descriptor reading(ends[0]);
  Descriptor writing(ends[1]);
  return {AboveStandard(std::move(reading)), AboveStandard(std::move(writing))};
}

PendingStream MakeStream(Descriptor end, const char *mode) {
  FILE *const opened = fdopen(end.number(), mode);
  RequireCall(opened != nullptr);
  end.Release();
  PendingStream stream(opened);
  Children::Instance().Add(opened);
  return stream;
}

pid_t Spawn(const char *path, const char *const argv[], const FileActions &actions) {
  const SignalAttributes attributes;
  pid_t child = 0;
  // The standard's own signature says "char *const" for what it never writes to.
  Require(posix_spawn(&child, path, actions.get(), attributes.get(),
                      const_cast<char *const *>(argv), environ));
  return child;
}

/// Everything that can fail comes before the child: a child that runs is always returned.
FILE *Start(const char *path, const char *const argv[], FileActions &actions, Descriptor own_end,
            const char *mode) {
  PendingStream stream = MakeStream(std::move(own_end), mode);
  actions.Inherit(STDERR_FILENO);
  actions.CloseAllOthers();
  Children::Instance().SetChild(stream.get(), Spawn(path, argv, actions));
  return stream.release();
}

FILE *OpenReader(const char *path, const char *const argv[]) {
  Pipe pipe = MakePipe();
  FileActions actions;
  actions.ConnectToNothing(STDIN_FILENO);
  actions.Connect(STDOUT_FILENO, pipe.writing);
  return Start(path, argv, actions, std::move(pipe.reading), "r");
}

FILE *OpenWriter(const char *path, const char *const argv[]) {
  Pipe pipe = MakePipe();
  FileActions actions;
  actions.Connect(STDIN_FILENO, pipe.reading);
  actions.Inherit(STDOUT_FILENO);
  return Start(path, argv, actions, std::move(pipe.writing), "w");
}

FILE *Open(const char *path, std::string_view mode, const char *const argv[]) {
  if (mode == "r") return OpenReader(path, argv);
  if (mode == "w") return OpenWriter(path, argv);
  errno = EINVAL;
  return nullptr;
}

int Wait(pid_t child) {
  int status = 0;
  pid_t ended;
  do {
    ended = waitpid(child, &status, 0);
  } while (ended == -1 && errno == EINTR);
  return ended == child ? status : -1;
}

}  // namespace

FILE *VLIBCPopenv(const char *path, const char *mode, const char *const argv[]) {
  if (path == nullptr || mode == nullptr || argv == nullptr || argv[0] == nullptr) {
    errno = EINVAL;
    return nullptr;
  }
  try {
    return Open(path, mode, argv);
  } catch (const Failure &failure) {
    errno = failure.error;
  } catch (...) {
    errno = ENOMEM;  // what else the standard library throws
  }
  return nullptr;
}

int VLIBCPclose(FILE *file) {
  const pid_t child = file == nullptr ? -1 : Children::Instance().Remove(file);
  if (child == -1) {
    errno = EINVAL;
    return -1;
  }
  // Only the child's end counts; what it did not read any more is its own affair.
  fclose(file);
  return Wait(child);
}
