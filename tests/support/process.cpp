#include "support/process.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <stdexcept>

#include "support/temp_dir.h"

namespace velk_test {
namespace {

int StatusOf(int wait_status) {
  return WIFSIGNALED(wait_status) ? 128 + WTERMSIG(wait_status) : WEXITSTATUS(wait_status);
}

int Wait(pid_t child) {
  int status = 0;
  while (waitpid(child, &status, 0) == -1) {
  }
  return StatusOf(status);
}

pid_t Fork(const std::function<int()> &body) {
  fflush(nullptr);
  const pid_t child = fork();
  if (child != 0) return child;
  const int result = body();
  fflush(nullptr);
  _exit(result);
}

void Redirect(const std::string &path, int flags, int descriptor) {
  const int file = open(path.c_str(), flags, 0600);
  if (file == -1 || dup2(file, descriptor) == -1) _exit(126);
  close(file);
}

}  // namespace

Outcome RunProgram(const std::vector<std::string> &arguments, const std::string &input,
                   const std::vector<std::string> &environment) {
  // Files, not pipes: no program can block on a full one.
  const TempDir folder;
  WriteFile(folder.File("in"), input);
  fflush(nullptr);
  const pid_t child = fork();
  if (child == 0) {
    Redirect(folder.File("in"), O_RDONLY, STDIN_FILENO);
    Redirect(folder.File("out"), O_WRONLY | O_CREAT, STDOUT_FILENO);
    Redirect(folder.File("err"), O_WRONLY | O_CREAT, STDERR_FILENO);
    for (const std::string &variable : environment) putenv(const_cast<char *>(variable.c_str()));
    std::vector<char *> argv;
    for (const std::string &argument : arguments)
      argv.push_back(const_cast<char *>(argument.c_str()));
    argv.push_back(nullptr);
    execvp(argv[0], argv.data());
    _exit(127);
  }
  Outcome outcome;
  outcome.status = Wait(child);
  outcome.out = ReadFile(folder.File("out"));
  outcome.err = ReadFile(folder.File("err"));
  return outcome;
}

int RunForked(const std::function<int()> &body) {
  return Wait(Fork(body));
}

std::vector<int> RunForkedTogether(int count, const std::function<int(int)> &body) {
  int gate[2];  // reading from it ends when the last writing end is closed: ours
  if (pipe(gate) != 0) throw std::runtime_error("pipe failed");
  std::vector<pid_t> children;
  for (int number = 0; number < count; ++number) {
    children.push_back(Fork([&body, &gate, number] {
      char nothing;
      close(gate[1]);
      if (read(gate[0], &nothing, 1) != 0) return 255;
      close(gate[0]);
      return body(number);
    }));
  }
  close(gate[0]);
  close(gate[1]);
  std::vector<int> statuses;
  for (const pid_t child : children) statuses.push_back(Wait(child));
  return statuses;
}

}  // namespace velk_test
