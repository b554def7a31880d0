#include "processes.h"

#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <exception>
#include <memory>
#include <stdexcept>

namespace velk_bench {
namespace {

class Pipe {
 public:
  Pipe() {
    if (pipe(ends_) != 0) throw std::runtime_error("no pipe");
  }
  Pipe(const Pipe &) = delete;
  Pipe &operator=(const Pipe &) = delete;
  ~Pipe() {
    CloseReadEnd();
    CloseWriteEnd();
  }

  void CloseReadEnd() { Close(ends_[0]); }
  void CloseWriteEnd() { Close(ends_[1]); }

  void Write(const std::string &text) {
    const char *at = text.data();
    const char *const end = at + text.size();
    while (at != end) {
      const ssize_t written = write(ends_[1], at, static_cast<size_t>(end - at));
      if (written <= 0) throw std::runtime_error("the parent is gone");
      at += written;
    }
  }

  std::string ReadToEnd() {
    std::string text;
    char chunk[65536];
    ssize_t length;
    while ((length = read(ends_[0], chunk, sizeof chunk)) > 0)
      text.append(chunk, static_cast<size_t>(length));
    return text;
  }

 private:
  static void Close(int &end) {
    if (end != -1) close(end);
    end = -1;
  }

  int ends_[2];
};

/// Where the processes meet: each says that it is ready by closing its end of one pipe, and goes on
/// when the parent has closed its end of the other.
class Barrier {
 public:
  /// In a process.
  void Wait() {
    ready_.Write("r");
    ready_.CloseWriteEnd();
    gate_.CloseWriteEnd();
    gate_.ReadToEnd();
  }

  /// In the parent. Does not wait for processes that have ended.
  void WaitForAllAndOpen() {
    ready_.CloseWriteEnd();
    ready_.ReadToEnd();
    gate_.CloseReadEnd();
    gate_.CloseWriteEnd();
  }

 private:
  Pipe ready_;
  Pipe gate_;
};

constexpr char kDone = '+';
constexpr char kFailed = '-';

std::string Outcome(int number, const ProcessBody &body, Barrier &barrier) {
  try {
    return kDone + body(number, [&barrier] { barrier.Wait(); });
  } catch (const std::exception &error) {
    return kFailed + std::string(error.what());
  }
}

struct Process {
  pid_t id = -1;
  std::unique_ptr<Pipe> report = std::make_unique<Pipe>();
};

Process Start(int number, const ProcessBody &body, Barrier &barrier) {
  Process process;
  fflush(nullptr);
  process.id = fork();
  if (process.id == -1) throw std::runtime_error("no process");
  if (process.id == 0) {
    process.report->Write(Outcome(number, body, barrier));
    _exit(0);
  }
  process.report->CloseWriteEnd();
  return process;
}

std::string Finish(Process &process) {
  const std::string outcome = process.report->ReadToEnd();
  while (waitpid(process.id, nullptr, 0) == -1) {
  }
  if (outcome.empty()) throw std::runtime_error("a process has died");
  if (outcome[0] == kFailed) throw std::runtime_error(outcome.substr(1));
  return outcome.substr(1);
}

}  // namespace

std::vector<std::string> RunTogether(int count, const ProcessBody &body) {
  Barrier barrier;
  std::vector<Process> processes;
  for (int number = 0; number < count; ++number) processes.push_back(Start(number, body, barrier));
  barrier.WaitForAllAndOpen();
  std::vector<std::string> reports;
  for (Process &process : processes) reports.push_back(Finish(process));
  return reports;
}

void RunApart(const std::function<void()> &body) {
  RunTogether(1, [&body](int, const std::function<void()> &wait) {
    wait();
    body();
    return std::string();
  });
}

}  // namespace velk_bench
