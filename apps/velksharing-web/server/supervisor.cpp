#include "server/supervisor.h"

#include <fcntl.h>
#include <poll.h>
#include <sys/signalfd.h>
#include <sys/wait.h>
#include <syslog.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <exception>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace web {
namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;
using Clock = std::chrono::steady_clock;

constexpr milliseconds kShortestPause{100};
constexpr milliseconds kLongestPause{10'000};
constexpr seconds kLongEnough{10};  // a worker that lived so long was all right
constexpr seconds kBeyondTimeout{3};
constexpr int kBroken = 3;

sigset_t SignalSet() {
  sigset_t set;
  sigemptyset(&set);
  for (const int signal : {SIGTERM, SIGINT, SIGHUP, SIGCHLD}) sigaddset(&set, signal);
  return set;
}

const char *Name(Task task) {
  return task == Task::WORK ? "worker" : "observer";
}

std::string Ending(int status) {
  if (WIFSIGNALED(status))
    return std::string("was ended by signal ") + std::to_string(WTERMSIG(status)) + " (" +
           strsignal(WTERMSIG(status)) + ")";
  return "ended with status " + std::to_string(WEXITSTATUS(status));
}

/// One child's place.
struct Slot {
  Task task = Task::WORK;
  pid_t pid = 0;  ///< 0: nobody there.
  Clock::time_point started;
  Clock::time_point due;  ///< When the next one may start.
  milliseconds pause{0};  ///< How long the last one had to wait.
};

class Supervisor {
 public:
  explicit Supervisor(const Supervision &supervision);

  int Run();

 private:
  void StartDue();
  void Start(Slot &slot);
  [[noreturn]] void BecomeChild(Task task);
  void Reap();
  void Vacate(Slot &slot, int status);
  void Stop();
  void Forward(int signal) const;
  bool IsAnyoneThere() const;
  Clock::time_point NextDue() const;

  std::vector<Slot> slots_;
  const Supervision &supervision_;
  UniqueFd lifeline_;  ///< What children hold.
  UniqueFd hold_;      ///< Closes when this process ends, however it does.
  bool is_stopping_ = false;
};

/// The next signal; 0 when the time is up first.
int NextSignal(Clock::time_point until) {
  const auto left =
      std::max(std::chrono::duration_cast<milliseconds>(until - Clock::now()), milliseconds{1});
  const timespec time = {left.count() / 1000, left.count() % 1000 * 1'000'000};
  const sigset_t set = SignalSet();
  const int signal = sigtimedwait(&set, nullptr, &time);
  return signal < 0 ? 0 : signal;
}

Supervisor::Supervisor(const Supervision &supervision)
    : slots_(static_cast<size_t>(supervision.workers)), supervision_(supervision) {
  if (supervision.has_observer) slots_.emplace_back().task = Task::OBSERVE;
  int ends[2] = {};
  if (pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("no pipe for the workers");
  lifeline_.Reset(ends[0]);
  hold_.Reset(ends[1]);
}

int Supervisor::Run() {
  while (true) {
    StartDue();
    switch (NextSignal(NextDue())) {
      case SIGCHLD:
        Reap();
        break;
      case SIGHUP:
        Forward(SIGHUP);
        break;
      case SIGTERM:
      case SIGINT:
        Stop();
        return 0;
    }
  }
}

void Supervisor::StartDue() {
  for (Slot &slot : slots_)
    if (slot.pid == 0 && slot.due <= Clock::now()) Start(slot);
}

void Supervisor::Start(Slot &slot) {
  slot.started = Clock::now();
  const pid_t pid = fork();
  if (pid == 0) BecomeChild(slot.task);
  if (pid > 0) {
    slot.pid = pid;
    return;
  }
  syslog(LOG_ERR, "cannot start a %s: %s", Name(slot.task), strerror(errno));
  slot.pause = kLongestPause;
  slot.due = Clock::now() + slot.pause;
}

void Supervisor::BecomeChild(Task task) {
  hold_.Reset();
  try {
    WorkerSignals signals(std::move(lifeline_));
    _exit(supervision_.work(task, signals));
  } catch (const std::exception &error) {
    syslog(LOG_ERR, "%s", error.what());
    _exit(kBroken);
  }
}

void Supervisor::Reap() {
  int status = 0;
  pid_t pid = 0;
  while ((pid = waitpid(-1, &status, WNOHANG)) > 0) {
    const auto slot = std::find_if(slots_.begin(), slots_.end(),
                                   [pid](const Slot &candidate) { return candidate.pid == pid; });
    if (slot != slots_.end()) Vacate(*slot, status);
  }
}

void Supervisor::Vacate(Slot &slot, int status) {
  const pid_t pid = std::exchange(slot.pid, 0);
  if (is_stopping_) return;
  const bool lived_long = Clock::now() - slot.started >= kLongEnough;
  slot.pause =
      lived_long ? milliseconds{0} : std::clamp(slot.pause * 2, kShortestPause, kLongestPause);
  slot.due = Clock::now() + slot.pause;
  supervision_.lost(slot.task);
  syslog(LOG_WARNING, "%s %d %s; another one starts in %ld ms", Name(slot.task),
         static_cast<int>(pid), Ending(status).c_str(), static_cast<long>(slot.pause.count()));
}

void Supervisor::Stop() {
  is_stopping_ = true;
  supervision_.stopping();
  Forward(SIGTERM);
  const Clock::time_point end = Clock::now() + supervision_.stop_timeout + kBeyondTimeout;
  while (Reap(), IsAnyoneThere()) {
    const int signal = NextSignal(end);
    if (signal == SIGCHLD || signal == SIGHUP) continue;
    syslog(LOG_WARNING, "killing the processes that are still busy");
    Forward(SIGKILL);
    while (wait(nullptr) > 0) {
    }
    return;
  }
}

void Supervisor::Forward(int signal) const {
  for (const Slot &slot : slots_)
    if (slot.pid != 0) kill(slot.pid, signal);
}

bool Supervisor::IsAnyoneThere() const {
  return std::any_of(slots_.begin(), slots_.end(), [](const Slot &slot) { return slot.pid != 0; });
}

Clock::time_point Supervisor::NextDue() const {
  Clock::time_point next = Clock::now() + std::chrono::hours{1};
  for (const Slot &slot : slots_)
    if (slot.pid == 0) next = std::min(next, slot.due);
  return next;
}

}  // namespace

WorkerSignals::WorkerSignals(UniqueFd lifeline) : lifeline_(std::move(lifeline)) {
  sigset_t set;
  sigemptyset(&set);
  sigaddset(&set, SIGTERM);
  sigaddset(&set, SIGHUP);
  signals_.Reset(signalfd(-1, &set, SFD_CLOEXEC));
  if (!signals_.IsOpen()) throw std::runtime_error("no descriptor for signals");
}

WorkerSignals::Kind WorkerSignals::Wait() {
  pollfd watched[] = {{signals_.get(), POLLIN, 0}, {lifeline_.get(), POLLIN, 0}};
  while (poll(watched, 2, -1) < 0 && errno == EINTR) {
  }
  if (watched[1].revents != 0) return Kind::STOP;
  signalfd_siginfo signal = {};
  if (read(signals_.get(), &signal, sizeof(signal)) != sizeof(signal)) return Kind::STOP;
  return signal.ssi_signo == SIGHUP ? Kind::RELOAD : Kind::STOP;
}

int Supervise(const Supervision &supervision) {
  return Supervisor(supervision).Run();
}

void PrepareSignals() {
  const sigset_t set = SignalSet();
  pthread_sigmask(SIG_BLOCK, &set, nullptr);
  signal(SIGPIPE, SIG_IGN);
}

}  // namespace web
