#include "team.h"

#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <exception>
#include <stdexcept>

namespace velk_bench {
namespace {

// What the owner says, and what a process answers.
constexpr char kTakeATurn = 't';
constexpr char kFinish = 'f';
constexpr char kDone = '.';
constexpr char kReport = '=';
constexpr char kFailed = '!';

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
      if (written <= 0) throw std::runtime_error("nobody reads");
      at += written;
    }
  }

  /// One byte; 0 at the end.
  char ReadByte() {
    char byte = 0;
    return read(ends_[0], &byte, 1) == 1 ? byte : '\0';
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

using MakeMember = std::function<std::unique_ptr<Member>(int number)>;

/// What a process does from its first instruction on.
void Live(int number, const MakeMember &make, Pipe &orders, Pipe &answers) {
  try {
    const std::unique_ptr<Member> member = make(number);
    answers.Write({kDone});
    while (orders.ReadByte() == kTakeATurn) {
      member->Turn();
      answers.Write({kDone});
    }
    answers.Write(kReport + member->Report());
  } catch (const std::exception &error) {
    answers.Write(kFailed + std::string(error.what()));
  }
}

}  // namespace

class Team::Process {
 public:
  Process(int number, const MakeMember &make) {
    std::fflush(nullptr);
    const pid_t owner = getpid();
    id_ = fork();
    if (id_ == -1) throw std::runtime_error("no process");
    if (id_ == 0) {
      prctl(PR_SET_PDEATHSIG, SIGKILL);
      if (getppid() == owner) Live(number, make, orders_, answers_);
      _exit(0);  // the owner's destructors are not ours to run
    }
    orders_.CloseReadEnd();
    answers_.CloseWriteEnd();
  }
  Process(const Process &) = delete;
  Process &operator=(const Process &) = delete;
  ~Process() {
    kill(id_, SIGKILL);
    while (waitpid(id_, nullptr, 0) == -1) {
    }
  }

  void Order(char order) { orders_.Write({order}); }

  void Expect(char expected) {
    const char answer = answers_.ReadByte();
    if (answer == expected) return;
    throw std::runtime_error(answer == kFailed ? answers_.ReadToEnd() : "a process has died");
  }

  std::string Report() {
    Expect(kReport);
    return answers_.ReadToEnd();
  }

 private:
  pid_t id_ = -1;
  Pipe orders_;
  Pipe answers_;
};

Team::Team(int count, const MakeMember &make) {
  for (int number = 0; number < count; ++number)
    processes_.push_back(std::make_unique<Process>(number, make));
  for (const auto &process : processes_) process->Expect(kDone);
}

Team::~Team() = default;

void Team::Turn() {
  for (const auto &process : processes_) process->Order(kTakeATurn);
  for (const auto &process : processes_) process->Expect(kDone);
}

std::vector<std::string> Team::Finish() {
  for (const auto &process : processes_) process->Order(kFinish);
  std::vector<std::string> reports;
  for (const auto &process : processes_) reports.push_back(process->Report());
  processes_.clear();
  return reports;
}

std::string RunApart(const std::function<std::string()> &body) {
  class Alone : public Member {
   public:
    explicit Alone(const std::function<std::string()> &work) : work_(work) {}
    void Turn() override {}
    std::string Report() override { return work_(); }

   private:
    const std::function<std::string()> &work_;
  };
  return Team(1, [&body](int) { return std::make_unique<Alone>(body); }).Finish()[0];
}

}  // namespace velk_bench
