#include "password_input.h"

#include <fcntl.h>
#include <signal.h>
#include <termios.h>
#include <unistd.h>

#include <array>

#include "operations/failure.h"
#include "operations/secret_input.h"

namespace command_line {
namespace {

using operations::Failure;
using operations::ReadSecretLine;
using operations::SystemFailure;

constexpr int kQuestions = 3;

volatile sig_atomic_t caught_signal = 0;

/// While it lives, a signal that would end the program only interrupts the reading; it is sent
/// again at the end, when the terminal echoes again.
class SignalPostponement {
 public:
  SignalPostponement() {
    caught_signal = 0;
    struct sigaction remember = {};
    remember.sa_handler = [](int signal) { caught_signal = signal; };
    struct sigaction ignore = {};
    ignore.sa_handler = SIG_IGN;
    for (std::size_t i = 0; i < kSignals.size(); ++i)
      sigaction(kSignals[i], kSignals[i] == SIGTSTP ? &ignore : &remember, &before_[i]);
  }
  SignalPostponement(const SignalPostponement &) = delete;
  SignalPostponement &operator=(const SignalPostponement &) = delete;
  ~SignalPostponement() {
    for (std::size_t i = 0; i < kSignals.size(); ++i) sigaction(kSignals[i], &before_[i], nullptr);
    if (caught_signal != 0) raise(caught_signal);
  }

 private:
  static constexpr std::array<int, 5> kSignals = {SIGINT, SIGQUIT, SIGTERM, SIGHUP, SIGTSTP};

  std::array<struct sigaction, kSignals.size()> before_ = {};
};

/// The controlling terminal, not echoing while this lives.
class SilentTerminal {
 public:
  SilentTerminal() : file_(open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY)) {
    if (file_ < 0) {
      throw Failure(Failure::SYSTEM,
                    "there is no terminal to ask for the password on; use --password-stdin or "
                    "--password-file");
    }
    if (tcgetattr(file_, &before_) != 0) Close("the terminal could not be read");
    struct termios silent = before_;
    silent.c_lflag &= ~static_cast<tcflag_t>(ECHO);
    silent.c_lflag |= ECHONL;
    if (tcsetattr(file_, TCSAFLUSH, &silent) != 0) Close("the terminal could not be silenced");
  }
  SilentTerminal(const SilentTerminal &) = delete;
  SilentTerminal &operator=(const SilentTerminal &) = delete;
  ~SilentTerminal() {
    tcsetattr(file_, TCSAFLUSH, &before_);
    close(file_);
  }

  int file() const { return file_; }

  void Say(const std::string &text) const {
    // Who cannot see the question can still answer it.
    [[maybe_unused]] const ssize_t written = write(file_, text.data(), text.size());
  }

 private:
  [[noreturn]] void Close(const char *what) const {
    const Failure failure = SystemFailure(what);
    close(file_);
    throw failure;
  }

  int file_;
  struct termios before_ = {};
};

}  // namespace

Secret AskSecret(const std::string &question) {
  const SignalPostponement postponed;
  const SilentTerminal terminal;
  terminal.Say(question + ": ");
  return ReadSecretLine(terminal.file(), [] { return caught_signal != 0; });
}

Secret AskNewSecret(const std::string &question) {
  for (int asked = 0; asked < kQuestions; ++asked) {
    Secret first = AskSecret(asked == 0 ? question : "They differ. " + question);
    if (first.Equals(AskSecret("The same again"))) return first;
  }
  throw Failure(Failure::INVALID, "the passwords differ");
}

Secret ReadSecretFromInput() {
  return ReadSecretLine(STDIN_FILENO);
}

Secret ReadSecretFromFile(const std::string &path) {
  const int file = open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY);
  if (file < 0) throw SystemFailure(path);
  try {
    Secret line = ReadSecretLine(file);
    close(file);
    return line;
  } catch (...) {
    close(file);
    throw;
  }
}

void PasswordSource::AddTo(CLI::App &command) {
  from_input_option_ = command.add_flag("--password-stdin", from_input_,
                                        "Read the password from the first line of standard input");
  from_file_option_ =
      command.add_option("--password-file", file_, "Read the password from a file's first line")
          ->type_name("FILE")
          ->excludes(from_input_option_);
}

std::optional<Secret> PasswordSource::Read() const {
  if (from_input_) return ReadSecretFromInput();
  if (from_file_option_->count() != 0) return ReadSecretFromFile(file_);
  return std::nullopt;
}

}  // namespace command_line
