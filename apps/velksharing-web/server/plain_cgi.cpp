#include "server/plain_cgi.h"

#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>

#include "server/answer_head.h"
#include "server/auth_questions.h"
#include "server/body_copy.h"
#include "server/cgi_request.h"
#include "server/limits.h"
#include "server/sockets.h"

namespace web {
namespace {

constexpr int kDone = 0;
constexpr int kCut = 1;

ssize_t ReadInput(char *buffer, size_t size) {
  constexpr std::chrono::milliseconds kWait = kPatience;
  pollfd input = {STDIN_FILENO, POLLIN, 0};
  if (poll(&input, 1, static_cast<int>(kWait.count())) <= 0) return -1;
  return read(STDIN_FILENO, buffer, size);
}

bool WriteOutput(const char *bytes, size_t size) {
  while (size > 0) {
    const ssize_t done = write(STDOUT_FILENO, bytes, size);
    if (done < 0 && errno == EINTR) continue;
    if (done <= 0) return false;
    bytes += done;
    size -= static_cast<size_t>(done);
  }
  return true;
}

bool Send(Response &response, Visit &visit) {
  const std::string head = CgiHead(response);
  if (!WriteOutput(head.data(), head.size())) return false;
  if (!HasBody(response, visit.method)) return true;
  const Copied copied = CopyBody(response, &WriteOutput);
  visit.bytes = copied.bytes;
  return copied.is_whole;
}

/// Questions are told apart here, too: what nobody takes for one is answered with a page.
CgiRequest ReadRequest(const Settings &settings) {
  if (AuthQuestions::Is(environ, false)) return {AuthQuestions(settings).Read(environ, false), 0};
  return ReadCgiRequest(environ, &ReadInput);
}

void CloseOutput() {
  const UniqueFd nothing(open("/dev/null", O_WRONLY | O_CLOEXEC));
  dup2(nothing.get(), STDOUT_FILENO);
}

}  // namespace

bool IsPlainCgi() {
  return getenv("GATEWAY_INTERFACE") != nullptr && !IsListening(STDIN_FILENO);
}

int ServePlainCgi(const Settings &settings, Service &service) {
  Visit visit;
  service.Begin();
  CgiRequest cgi = ReadRequest(settings);
  // A visitor's field Proxy. Authenticators could take it for the proxy that they are to use.
  unsetenv("HTTP_PROXY");
  visit.address = cgi.request.remote_address;
  visit.method = cgi.request.method;
  Response response = cgi.refusal == 0 ? service.Answer(cgi.request, visit.note)
                                       : service.Refuse(cgi.request, cgi.refusal);
  visit.MarkAnswered();
  visit.status = response.status;
  visit.is_whole = Send(response, visit);
  service.End(visit);
  CloseOutput();
  return visit.is_whole ? kDone : kCut;
}

}  // namespace web
