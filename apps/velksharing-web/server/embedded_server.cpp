#include "server/embedded_server.h"

#include <fcntl.h>
#include <microhttpd.h>

#include <cstring>
#include <stdexcept>

#include "server/acceptor.h"
#include "server/answer_head.h"
#include "server/auth_questions.h"
#include "server/body_copy.h"
#include "server/connection_watch.h"
#include "server/embedded_response.h"
#include "server/limits.h"
#include "server/message_head.h"
#include "server/sockets.h"
#include "server/target.h"
#include "server/trusted_proxies.h"

namespace web {
namespace {

constexpr int kBadRequest = 400;
constexpr int kHeadTooLarge = 431;
constexpr unsigned kUnusualHeads = 4;  // so that a head that is too large still gets its answer
constexpr size_t kConnectionMemory = kUnusualHeads * kHeadLimit;
constexpr size_t kThreadStack = 1024 * 1024;

/// A request from its first line to the last byte of its answer.
struct Exchange {
  Visit visit;
  std::string target;
  Request request;
  bool has_head = false;
  int refusal = 0;  ///< Status to refuse it with, 0 for none.
};

int SocketOf(MHD_Connection *connection) {
  return MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD)->connect_fd;
}

std::string PeerOf(MHD_Connection *connection) {
  const auto *info = MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CLIENT_ADDRESS);
  return info == nullptr || info->client_addr == nullptr ? "" : PeerAddress(info->client_addr);
}

/// The library closes what is above its limit, and counts a connection until its thread is gone. So
/// it gets one that is never reached.
unsigned ConnectionLimit(const Settings &settings) {
  return 2 * static_cast<unsigned>(settings.connections) + 64;
}

size_t HeadSizeOf(MHD_Connection *connection) {
  return MHD_get_connection_info(connection, MHD_CONNECTION_INFO_REQUEST_HEADER_SIZE)->header_size;
}

/// What the library itself answered; 0 when the connection broke before.
int StatusOf(MHD_Connection *connection) {
  const auto *info = MHD_get_connection_info(connection, MHD_CONNECTION_INFO_HTTP_STATUS);
  return info == nullptr ? 0 : static_cast<int>(info->http_status);
}

MHD_Result AddField(void *fields, MHD_ValueKind, const char *name, size_t name_size,
                    const char *value, size_t value_size) {
  static_cast<std::vector<RawField> *>(fields)->push_back({{name, name_size}, {value, value_size}});
  return MHD_YES;
}

std::vector<RawField> FieldsOf(MHD_Connection *connection) {
  std::vector<RawField> fields;
  MHD_get_connection_values_n(connection, MHD_HEADER_KIND, &AddField, &fields);
  return fields;
}

/// Escapes stay as they were sent: whoever knows what a path means decodes it.
size_t KeepEscapes(void *, MHD_Connection *, char *text) {
  return strlen(text);
}

}  // namespace

class EmbeddedServerPrivate {
 public:
  EmbeddedServerPrivate(int listening_socket, const Settings &settings, Service &service);
  ~EmbeddedServerPrivate();

  void StopAccepting() { acceptor_->Stop(); }

 private:
  static void *OnTarget(void *self, const char *target, MHD_Connection *connection);
  static MHD_Result OnRequest(void *self, MHD_Connection *connection, const char *path,
                              const char *method, const char *version, const char *data,
                              size_t *size, void **context);
  static void OnEnd(void *self, MHD_Connection *connection, void **context,
                    MHD_RequestTerminationCode code);
  static void OnConnection(void *self, MHD_Connection *connection, void **context,
                           MHD_ConnectionNotificationCode code);

  /// @return whether the request's body is to be waited for.
  bool TakeHead(Exchange &exchange, MHD_Connection *connection, const char *method,
                const char *version);
  /// A file could become shorter while it is sent.
  void WatchBody(const Response &response, MHD_Connection *connection);
  MHD_Result Reply(Exchange &exchange, MHD_Connection *connection);

  const TrustedProxies proxies_;
  const AuthQuestions questions_;
  Service &service_;
  ConnectionWatch watch_{kPatience};
  MHD_Daemon *daemon_ = nullptr;
  std::unique_ptr<Acceptor> acceptor_;
};

EmbeddedServerPrivate::EmbeddedServerPrivate(int listening_socket, const Settings &settings,
                                             Service &service)
    : proxies_(settings.trusted_proxies), questions_(settings), service_(service) {
  daemon_ =
      MHD_start_daemon(MHD_USE_POLL_INTERNAL_THREAD | MHD_USE_THREAD_PER_CONNECTION | MHD_USE_ITC |
                           MHD_USE_NO_LISTEN_SOCKET,
                       0, nullptr, nullptr, &OnRequest, this,                                    //
                       MHD_OPTION_CONNECTION_LIMIT, ConnectionLimit(settings),                   //
                       MHD_OPTION_CONNECTION_MEMORY_LIMIT, kConnectionMemory,                    //
                       MHD_OPTION_CONNECTION_TIMEOUT, static_cast<unsigned>(kPatience.count()),  //
                       MHD_OPTION_THREAD_STACK_SIZE, kThreadStack,                               //
                       MHD_OPTION_SIGPIPE_HANDLED_BY_APP, 1,                                     //
                       MHD_OPTION_UNESCAPE_CALLBACK, &KeepEscapes, nullptr,                      //
                       MHD_OPTION_URI_LOG_CALLBACK, &OnTarget, this,                             //
                       MHD_OPTION_NOTIFY_COMPLETED, &OnEnd, this,                                //
                       MHD_OPTION_NOTIFY_CONNECTION, &OnConnection, this,                        //
                       MHD_OPTION_END);
  if (daemon_ == nullptr) throw std::runtime_error("the HTTP server does not start");
  acceptor_ = std::make_unique<Acceptor>(
      listening_socket, settings.connections,
      [this](UniqueFd connection, const sockaddr *peer, socklen_t size) {
        // Closes what it does not take.
        if (MHD_add_connection(daemon_, connection.Release(), peer, size) != MHD_YES)
          acceptor_->Release();
      });
  acceptor_->Start();
}

EmbeddedServerPrivate::~EmbeddedServerPrivate() {
  acceptor_->Stop();
  MHD_stop_daemon(daemon_);
}

void *EmbeddedServerPrivate::OnTarget(void *self, const char *target, MHD_Connection *connection) {
  auto *exchange = new Exchange;
  exchange->target = target;
  exchange->visit.address = PeerOf(connection);
  static_cast<EmbeddedServerPrivate *>(self)->service_.Begin();
  return exchange;
}

MHD_Result EmbeddedServerPrivate::OnRequest(void *self, MHD_Connection *connection, const char *,
                                            const char *method, const char *version,
                                            const char *data, size_t *size, void **context) {
  auto &server = *static_cast<EmbeddedServerPrivate *>(self);
  auto &exchange = *static_cast<Exchange *>(*context);
  if (!exchange.has_head) {
    exchange.has_head = true;
    const bool waits = server.TakeHead(exchange, connection, method, version);
    return waits ? MHD_YES : server.Reply(exchange, connection);
  }
  if (*size > 0) {
    if (exchange.refusal == 0) exchange.request.body.append(data, *size);
    *size = 0;
    return MHD_YES;
  }
  return server.Reply(exchange, connection);
}

bool EmbeddedServerPrivate::TakeHead(Exchange &exchange, MHD_Connection *connection,
                                     const char *method, const char *version) {
  exchange.visit.head = std::chrono::steady_clock::now();
  Request &request = exchange.request;
  request.method = exchange.visit.method = method;
  const std::vector<RawField> fields = FieldsOf(connection);
  for (const auto &[name, value] : fields)
    request.headers.Add(std::string(name), std::string(value));
  const std::string peer = PeerOf(connection);
  const bool is_identified = proxies_.Identify(peer, request);
  const HeadVerdict verdict = JudgeHead(request, version);
  exchange.visit.address = request.remote_address;

  exchange.refusal = verdict.refusal;
  const std::string_view head(method, HeadSizeOf(connection));
  if (!IsAccountedFor(head, version, fields)) exchange.refusal = kBadRequest;
  if (!is_identified || !SetTarget(exchange.target, request)) exchange.refusal = kBadRequest;
  questions_.Recognise(request, proxies_.Trusts(peer));
  if (head.size() > kHeadLimit) exchange.refusal = kHeadTooLarge;
  if (exchange.refusal != 0 && (verdict.body_length == 0 || verdict.body_length > kDiscardLimit))
    return false;
  // In one place from the beginning: growing would leave copies of a password behind.
  if (exchange.refusal == 0) request.body.reserve(verdict.body_length);
  watch_.Expect(SocketOf(connection));
  return true;
}

void EmbeddedServerPrivate::WatchBody(const Response &response, MHD_Connection *connection) {
  const auto *body = std::get_if<FileBody>(&response.body);
  if (body == nullptr) return;
  UniqueFd file(fcntl(body->file.get(), F_DUPFD_CLOEXEC, 0));
  if (file.IsOpen())
    watch_.WatchFile(SocketOf(connection), std::move(file), body->offset + body->length);
}

MHD_Result EmbeddedServerPrivate::Reply(Exchange &exchange, MHD_Connection *connection) {
  watch_.Forget(SocketOf(connection));
  Response response = exchange.refusal == 0 ? service_.Answer(exchange.request, exchange.visit.note)
                                            : service_.Refuse(exchange.request, exchange.refusal);
  if (exchange.refusal != 0 || service_.IsStopping()) response.headers.Set("Connection", "close");
  exchange.visit.MarkAnswered();
  exchange.visit.status = response.status;
  if (HasBody(response, exchange.request.method))
    exchange.visit.bytes = BodyLength(response).value_or(0);
  TakeSmallFileIn(response);
  WatchBody(response, connection);
  const EmbeddedResponse embedded =
      MakeEmbeddedResponse(response, exchange.request.method, exchange.visit.bytes);
  if (embedded == nullptr) return MHD_NO;
  return MHD_queue_response(connection, static_cast<unsigned>(response.status), embedded.get());
}

void EmbeddedServerPrivate::OnEnd(void *self, MHD_Connection *connection, void **context,
                                  MHD_RequestTerminationCode code) {
  auto &server = *static_cast<EmbeddedServerPrivate *>(self);
  const std::unique_ptr<Exchange> exchange(static_cast<Exchange *>(*context));
  *context = nullptr;
  if (exchange == nullptr) return;
  if (exchange->visit.status == 0) exchange->visit.status = StatusOf(connection);
  exchange->visit.is_whole = code == MHD_REQUEST_TERMINATED_COMPLETED_OK;
  server.service_.End(exchange->visit);
  server.watch_.Expect(SocketOf(connection));
}

void EmbeddedServerPrivate::OnConnection(void *self, MHD_Connection *connection, void **,
                                         MHD_ConnectionNotificationCode code) {
  auto &server = *static_cast<EmbeddedServerPrivate *>(self);
  if (code == MHD_CONNECTION_NOTIFY_STARTED) {
    server.watch_.Expect(SocketOf(connection));
  } else {
    server.watch_.Forget(SocketOf(connection));
    server.acceptor_->Release();
  }
}

EmbeddedServer::EmbeddedServer(int listening_socket, const Settings &settings, Service &service)
    : private_(std::make_unique<EmbeddedServerPrivate>(listening_socket, settings, service)) {}

EmbeddedServer::~EmbeddedServer() = default;

void EmbeddedServer::StopAccepting() {
  private_->StopAccepting();
}

}  // namespace web
