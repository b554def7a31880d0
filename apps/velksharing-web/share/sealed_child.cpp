#include "share/sealed_child.h"

#include <fcntl.h>
#include <linux/audit.h>
#include <linux/capability.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <poll.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <syslog.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <vector>

#include "http/unique_fd.h"

namespace web::share {
namespace {

using Clock = std::chrono::steady_clock;

// --- In the child -------------------------------------------------------------------------------

constexpr int kResultFd = 3;

#if defined(__x86_64__)
constexpr uint32_t kArchitecture = AUDIT_ARCH_X86_64;
#elif defined(__aarch64__)
constexpr uint32_t kArchitecture = AUDIT_ARCH_AARCH64;
#else
constexpr uint32_t kArchitecture = 0;
#endif

constexpr std::array<uint32_t, 18> kCallsForComputing = {
    SYS_brk,          SYS_mmap,      SYS_munmap,         SYS_mremap,        SYS_mprotect,
    SYS_madvise,      SYS_write,     SYS_futex,          SYS_exit,          SYS_exit_group,
    SYS_rt_sigreturn, SYS_getrandom, SYS_rt_sigprocmask, SYS_clock_gettime, SYS_sched_yield,
    SYS_getpid,       SYS_gettid,    SYS_sigaltstack,
};

constexpr uint32_t kRefuse = SECCOMP_RET_ERRNO | EPERM;

bool LimitTo(__rlimit_resource_t resource, rlim_t most) {
  const rlimit limit = {most, most};
  return setrlimit(resource, &limit) == 0;
}

// Where a sanitizer has taken terabytes of address space for itself, no limit leaves room.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool kAddressSpaceIsLimited = false;
#else
constexpr bool kAddressSpaceIsLimited = true;
#endif

// What the forked copy has already counts, too.
rlim_t AddressSpaceInUse() {
  unsigned long pages = 0;
  FILE *file = fopen("/proc/self/statm", "re");
  if (file == nullptr) return 0;
  if (fscanf(file, "%lu", &pages) != 1) pages = 0;
  fclose(file);
  return pages * static_cast<rlim_t>(sysconf(_SC_PAGESIZE));
}

bool LimitResources(const SealedLimits &limits) {
  const bool is_limited =
      !kAddressSpaceIsLimited || LimitTo(RLIMIT_AS, AddressSpaceInUse() + limits.memory);
  return is_limited && LimitTo(RLIMIT_CPU, static_cast<rlim_t>(limits.seconds)) &&
         LimitTo(RLIMIT_CORE, 0) && LimitTo(RLIMIT_FSIZE, 0) && LimitTo(RLIMIT_NOFILE, 0) &&
         LimitTo(RLIMIT_NPROC, 0);
}

bool CloseAllBut(int result) {
  if (dup2(result, kResultFd) != kResultFd) return false;
  for (int fd = 0; fd < kResultFd; ++fd) close(fd);
  return syscall(SYS_close_range, kResultFd + 1, ~0U, 0) == 0;
}

bool DropCapabilities() {
  __user_cap_header_struct header = {_LINUX_CAPABILITY_VERSION_3, 0};
  const __user_cap_data_struct none[_LINUX_CAPABILITY_U32S_3] = {};
  return syscall(SYS_capset, &header, none) == 0 && prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0;
}

sock_filter Load(size_t offset) {
  return BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<uint32_t>(offset));
}
// Skips the next statement.
sock_filter SkipUnlessEqual(uint32_t value) {
  return BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, value, 0, 1);
}
sock_filter SkipIfEqual(uint32_t value) {
  return BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, value, 1, 0);
}
sock_filter Return(uint32_t action) {
  return BPF_STMT(BPF_RET | BPF_K, action);
}

bool AllowOnlyComputing() {
  // Elsewhere the limits have to do.
  if (kArchitecture == 0) return true;
  std::vector<sock_filter> filter = {
      Load(offsetof(seccomp_data, arch)),
      SkipIfEqual(kArchitecture),
      Return(kRefuse),
      Load(offsetof(seccomp_data, nr)),
  };
  for (const uint32_t call : kCallsForComputing) {
    filter.push_back(SkipUnlessEqual(call));
    filter.push_back(Return(SECCOMP_RET_ALLOW));
  }
  filter.push_back(Return(kRefuse));
  const sock_fprog program = {static_cast<unsigned short>(filter.size()), filter.data()};
  return prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program, 0, 0) == 0;
}

// Handlers of this program are not for its child, and no core file for what strangers sent.
void ForgetSignalHandlers() {
  for (int number = 1; number < NSIG; ++number) signal(number, SIG_DFL);
  sigset_t none;
  sigemptyset(&none);
  sigprocmask(SIG_SETMASK, &none, nullptr);
}

bool Seal(const SealedLimits &limits, int result) {
  ForgetSignalHandlers();
  return CloseAllBut(result) && DropCapabilities() && prctl(PR_SET_PDEATHSIG, SIGKILL) == 0 &&
         prctl(PR_SET_DUMPABLE, 0) == 0 && LimitResources(limits) && AllowOnlyComputing();
}

bool WriteAll(int fd, const std::string &content) {
  size_t written = 0;
  while (written < content.size()) {
    const ssize_t count = write(fd, content.data() + written, content.size() - written);
    if (count < 0) return false;
    written += static_cast<size_t>(count);
  }
  return true;
}

[[noreturn]] void Work(const SealedLimits &limits, const std::function<std::string()> &work,
                       int result) {
  bool is_done = false;
  try {
    is_done = Seal(limits, result) && WriteAll(kResultFd, work());
  } catch (const std::exception &) {
    // Too large: what it came to is told by the status.
  }
  _exit(is_done ? 0 : 1);
}

// --- In the parent ------------------------------------------------------------------------------

int MillisecondsUntil(Clock::time_point deadline) {
  const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
  return left.count() > 0 ? static_cast<int>(left.count()) : 0;
}

// Whether the child closed its end in time, having written no more than it may.
bool ReadResult(int fd, const SealedLimits &limits, std::string &result) {
  const auto deadline = Clock::now() + std::chrono::seconds(2 * limits.seconds);
  std::array<char, 16 * 1024> chunk;
  while (result.size() <= limits.largest_output) {
    pollfd readable = {fd, POLLIN, 0};
    const int ready = poll(&readable, 1, MillisecondsUntil(deadline));
    if (ready < 0 && errno == EINTR) continue;
    if (ready <= 0) return false;
    const ssize_t count = read(fd, chunk.data(), chunk.size());
    if (count < 0 && errno == EINTR) continue;
    if (count <= 0) return count == 0;
    result.append(chunk.data(), static_cast<size_t>(count));
  }
  return false;
}

bool HasEndedWell(pid_t child) {
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) return false;
  }
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace

std::optional<std::string> RunSealed(const SealedLimits &limits,
                                     const std::function<std::string()> &work) {
  int ends[2] = {-1, -1};
  if (pipe2(ends, O_CLOEXEC) != 0) {
    syslog(LOG_ERR, "no pipe to a child process: %s", strerror(errno));
    return std::nullopt;
  }
  const UniqueFd reading(ends[0]);
  UniqueFd writing(ends[1]);
  const pid_t child = fork();
  if (child < 0) {
    syslog(LOG_ERR, "no child process: %s", strerror(errno));
    return std::nullopt;
  }
  if (child == 0) Work(limits, work, writing.get());
  writing.Reset();
  std::string result;
  const bool is_read = ReadResult(reading.get(), limits, result);
  if (!is_read) kill(child, SIGKILL);
  const bool has_ended_well = HasEndedWell(child);
  if (!is_read || !has_ended_well || result.empty()) return std::nullopt;
  return result;
}

}  // namespace web::share
