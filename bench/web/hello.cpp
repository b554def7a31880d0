// The least that a FastCGI program can do: gives one small file, read at the start, to everybody.
//
//   velksharing_bench_hello SOCKET WORKERS FILE

#include <fcgiapp.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <exception>
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

namespace {

constexpr int kBacklog = 1024;

std::string Answer(const std::string &path) {
  std::ifstream file(path, std::ios::binary);
  const std::string content(std::istreambuf_iterator<char>(file), {});
  if (content.empty()) throw std::runtime_error("nothing to give in " + path);
  return "Content-Type: text/plain; charset=utf-8\r\nContent-Length: " +
         std::to_string(content.size()) + "\r\n\r\n" + content;
}

int Serve(int socket, const std::string &answer) {
  FCGX_Request request = {};
  FCGX_InitRequest(&request, socket, 0);
  while (FCGX_Accept_r(&request) == 0) {
    FCGX_PutStr(answer.data(), static_cast<int>(answer.size()), request.out);
    FCGX_Finish_r(&request);
  }
  return EXIT_FAILURE;
}

/// A process that serves until its parent ends.
void StartWorker(int socket, const std::string &answer) {
  const pid_t parent = getpid();
  const pid_t worker = fork();
  if (worker == -1) throw std::runtime_error("cannot fork");
  if (worker != 0) return;
  prctl(PR_SET_PDEATHSIG, SIGTERM);
  _exit(getppid() == parent ? Serve(socket, answer) : EXIT_FAILURE);
}

int Run(const std::string &path, int workers, const std::string &file) {
  const std::string answer = Answer(file);
  if (FCGX_Init() != 0) throw std::runtime_error("FastCGI does not start");
  const int socket = FCGX_OpenSocket(path.c_str(), kBacklog);
  if (socket < 0) throw std::runtime_error("cannot listen on " + path);
  for (int started = 0; started < workers; ++started) StartWorker(socket, answer);
  wait(nullptr);  // nobody ends before this process, unless something is wrong
  return EXIT_FAILURE;
}

}  // namespace

int main(int argc, char **argv) {
  try {
    if (argc == 4 && std::atoi(argv[2]) > 0) return Run(argv[1], std::atoi(argv[2]), argv[3]);
    std::cerr << "usage: velksharing_bench_hello SOCKET WORKERS FILE\n";
  } catch (const std::exception &error) {
    std::cerr << "velksharing_bench_hello: " << error.what() << '\n';
  }
  return 2;
}
