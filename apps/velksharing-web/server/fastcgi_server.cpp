#include "server/fastcgi_server.h"

#include <fcgiapp.h>
#include <poll.h>
#include <sys/socket.h>

#include <atomic>
#include <cerrno>
#include <stdexcept>
#include <string_view>
#include <thread>
#include <vector>

#include "server/answer_head.h"
#include "server/auth_questions.h"
#include "server/body_copy.h"
#include "server/cgi_request.h"
#include "server/file_offload.h"
#include "server/limits.h"
#include "server/reception.h"

namespace web {
namespace {

// Roles, which no public header has.
constexpr int kResponder = 1;
constexpr int kAuthorizer = 2;
constexpr int kLookAround = 1000;  // milliseconds between looks whether others need the thread

/// A request of the web server, and the connection that it came by.
class Channel {
 public:
  Channel();
  Channel(const Channel &) = delete;
  Channel &operator=(const Channel &) = delete;
  ~Channel() { Cut(); }

  /// Takes over a new connection. There must be none.
  void Adopt(UniqueFd connection);
  /// Takes the next request of the connection.
  bool Accept() { return FCGX_Accept_r(&request_) == 0; }
  /// Ends an answer that was given whole.
  bool Finish();
  /// Closes the connection: the web server sees that the answer is not whole.
  void Cut() { FCGX_Free(&request_, 1); }

  ssize_t Read(char *buffer, size_t size);
  bool Write(std::string_view bytes);

  /// -1 for none.
  int connection() const { return request_.ipcFd; }
  bool IsResponder() const { return request_.role == kResponder; }
  bool IsAuthorizer() const { return request_.role == kAuthorizer; }
  const char *const *environment() const { return request_.envp; }

 private:
  FCGX_Request request_ = {};
};

Channel::Channel() {
  // The library takes no connections by itself: it would wait for one, and for what comes on it,
  // while nobody else could take any.
  constexpr int kNoSocket = -1;
  FCGX_InitRequest(&request_, kNoSocket, FCGI_FAIL_ACCEPT_ON_INTR);
}

void Channel::Adopt(UniqueFd connection) {
  const timeval patience = {kPatience.count(), 0};
  for (const int direction : {SO_RCVTIMEO, SO_SNDTIMEO})
    setsockopt(connection.get(), SOL_SOCKET, direction, &patience, sizeof(patience));
  request_.ipcFd = connection.Release();
  request_.keepConnection = 1;  // or the library begins by closing it
}

bool Channel::Finish() {
  // The stream that is closed last takes the end of the request along, and tells how that went.
  FCGX_FClose(request_.err);
  const bool is_sent = FCGX_FClose(request_.out) == 0;
  FCGX_Finish_r(&request_);
  return is_sent;
}

ssize_t Channel::Read(char *buffer, size_t size) {
  return FCGX_GetStr(buffer, static_cast<int>(size), request_.in);
}

bool Channel::Write(std::string_view bytes) {
  const int size = static_cast<int>(bytes.size());
  return FCGX_PutStr(bytes.data(), size, request_.out) == size;
}

bool IsReady(const pollfd &watched) {
  return watched.revents != 0;
}

}  // namespace

class FastCgiServerPrivate {
 public:
  FastCgiServerPrivate(int listening_socket, const Settings &settings, Service &service);
  ~FastCgiServerPrivate();

  void StopAccepting() { reception_.Stop(); }

 private:
  /// What a thread works with, and others see.
  struct Post {
    std::atomic<int> connection = -1;  ///< That it answers on; -1 for none.
    Reception::Clerk clerk;
  };

  void Serve(Post &post);
  bool AcceptNext(Channel &channel, Reception::Clerk &clerk);
  bool AcceptCounted(Channel &channel);
  bool WaitForKept(Channel &channel);
  bool IsStopped() const;

  CgiRequest Read(Channel &channel) const;
  void Respond(Channel &channel);
  bool Send(Response &response, Channel &channel, Visit &visit);

  const FileOffload offload_;
  const AuthQuestions questions_;
  Service &service_;
  Reception reception_;
  std::vector<Post> posts_;  ///< Of each thread.
  std::vector<std::thread> threads_;
};

FastCgiServerPrivate::FastCgiServerPrivate(int listening_socket, const Settings &settings,
                                           Service &service)
    : offload_(settings),
      questions_(settings),
      service_(service),
      reception_(listening_socket),
      posts_(static_cast<size_t>(settings.threads)) {
  if (FCGX_Init() != 0) throw std::runtime_error("FastCGI does not start");
  for (Post &post : posts_) threads_.emplace_back([this, &post] { Serve(post); });
}

FastCgiServerPrivate::~FastCgiServerPrivate() {
  StopAccepting();
  for (const Post &post : posts_) shutdown(post.connection, SHUT_RDWR);
  for (std::thread &thread : threads_) thread.join();
}

void FastCgiServerPrivate::Serve(Post &post) {
  Channel channel;
  while (true) {
    if (AcceptNext(channel, post.clerk)) {
      post.connection = channel.connection();
      Respond(channel);
      post.connection = -1;
    } else if (IsStopped()) {
      return;
    }
  }
}

bool FastCgiServerPrivate::AcceptNext(Channel &channel, Reception::Clerk &clerk) {
  if (channel.connection() >= 0) return WaitForKept(channel) && AcceptCounted(channel);
  UniqueFd connection = reception_.Accept(clerk);
  if (!connection.IsOpen()) return false;
  channel.Adopt(std::move(connection));
  return AcceptCounted(channel);
}

bool FastCgiServerPrivate::AcceptCounted(Channel &channel) {
  service_.Begin();
  if (channel.Accept()) return true;
  service_.Drop();
  return false;
}

bool FastCgiServerPrivate::WaitForKept(Channel &channel) {
  pollfd watched[] = {{reception_.stop_descriptor(), POLLIN, 0}, {channel.connection(), POLLIN, 0}};
  const int ready = poll(watched, 2, kLookAround);
  if (ready == 0 && reception_.IsEmpty()) channel.Cut();
  return ready > 0 && !IsReady(watched[0]);
}

bool FastCgiServerPrivate::IsStopped() const {
  pollfd watched = {reception_.stop_descriptor(), POLLIN, 0};
  return poll(&watched, 1, 0) > 0;
}

CgiRequest FastCgiServerPrivate::Read(Channel &channel) const {
  const char *const *environment = channel.environment();
  if (AuthQuestions::Is(environment, channel.IsAuthorizer()))
    return {questions_.Read(environment, channel.IsAuthorizer()), 0};
  CgiRequest cgi = ReadCgiRequest(
      environment, [&channel](char *buffer, size_t size) { return channel.Read(buffer, size); });
  if (!channel.IsResponder()) cgi.refusal = 501;
  return cgi;
}

void FastCgiServerPrivate::Respond(Channel &channel) {
  Visit visit;
  CgiRequest cgi = Read(channel);
  visit.address = cgi.request.remote_address;
  visit.method = cgi.request.method;
  Response response = cgi.refusal == 0 ? service_.Answer(cgi.request, visit.note)
                                       : service_.Refuse(cgi.request, cgi.refusal);
  visit.MarkAnswered();
  visit.status = response.status;
  visit.is_whole = Send(response, channel, visit) && channel.Finish();
  if (!visit.is_whole) channel.Cut();
  service_.End(visit);
}

bool FastCgiServerPrivate::Send(Response &response, Channel &channel, Visit &visit) {
  const bool has_body = HasBody(response, visit.method);
  const auto offloaded = has_body ? offload_.FieldFor(response) : std::nullopt;
  if (offloaded) {
    visit.bytes = BodyLength(response).value_or(0);
    response.headers.Set(offloaded->first, offloaded->second);
    response.body = std::unique_ptr<StreamBody>();  // of a length that the web server finds out
    return channel.Write(CgiHead(response));
  }
  if (!channel.Write(CgiHead(response))) return false;
  if (!has_body) return true;
  const Copied copied = CopyBody(response, [&channel](const char *bytes, size_t size) {
    return channel.Write({bytes, size});
  });
  visit.bytes = copied.bytes;
  return copied.is_whole;
}

FastCgiServer::FastCgiServer(int listening_socket, const Settings &settings, Service &service)
    : private_(std::make_unique<FastCgiServerPrivate>(listening_socket, settings, service)) {}

FastCgiServer::~FastCgiServer() = default;

void FastCgiServer::StopAccepting() {
  private_->StopAccepting();
}

}  // namespace web
