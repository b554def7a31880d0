#include "watch/metrics_server.h"

#include <microhttpd.h>
#include <syslog.h>

#include <exception>
#include <memory>
#include <stdexcept>
#include <string_view>

#include "watch/metrics_text.h"

namespace web::watch {
namespace {

constexpr unsigned kMostConnections = 32;
constexpr unsigned kPatience = 15;  // seconds

struct Reply {
  unsigned status = MHD_HTTP_OK;
  std::string text;
  const char *type = "text/plain; charset=utf-8";
};

Reply Answer(const MetricsServer &server, std::string_view method, std::string_view path) {
  if (path != "/metrics") return {MHD_HTTP_NOT_FOUND, "the metrics are at /metrics\n"};
  if (method != "GET" && method != "HEAD")
    return {MHD_HTTP_METHOD_NOT_ALLOWED, "metrics can only be read\n"};
  return {MHD_HTTP_OK, server.Text(), kMetricsType};
}

Reply AnswerAlways(const MetricsServer &server, std::string_view method, std::string_view path) {
  try {
    return Answer(server, method, path);
  } catch (const std::exception &error) {
    syslog(LOG_ERR, "the metrics failed: %s", error.what());
    return {MHD_HTTP_INTERNAL_SERVER_ERROR, "the log tells why\n"};
  }
}

MHD_Result Send(Reply reply, MHD_Connection *connection) {
  using Response = std::unique_ptr<MHD_Response, decltype(&MHD_destroy_response)>;
  const Response response(
      MHD_create_response_from_buffer(reply.text.size(), reply.text.data(), MHD_RESPMEM_MUST_COPY),
      &MHD_destroy_response);
  if (response == nullptr) return MHD_NO;
  MHD_add_response_header(response.get(), MHD_HTTP_HEADER_CONTENT_TYPE, reply.type);
  if (reply.status == MHD_HTTP_METHOD_NOT_ALLOWED)
    MHD_add_response_header(response.get(), MHD_HTTP_HEADER_ALLOW, "GET, HEAD");
  return MHD_queue_response(connection, reply.status, response.get());
}

/// The library asks once when it has the head, for every piece of a body, and once more.
MHD_Result OnRequest(void *self, MHD_Connection *connection, const char *path, const char *method,
                     const char *, const char *, size_t *body_size, void **context) {
  static char has_head;
  if (*context == nullptr) {
    *context = &has_head;
    return MHD_YES;
  }
  if (*body_size > 0) {
    *body_size = 0;
    return MHD_YES;
  }
  return Send(AnswerAlways(*static_cast<const MetricsServer *>(self), method, path), connection);
}

}  // namespace

MetricsServer::MetricsServer(UniqueFd listening_socket, std::function<std::string()> text)
    : text_(std::move(text)) {
  daemon_ =
      MHD_start_daemon(MHD_USE_POLL_INTERNAL_THREAD, 0, nullptr, nullptr, &OnRequest, this,  //
                       MHD_OPTION_LISTEN_SOCKET, listening_socket.get(),                     //
                       MHD_OPTION_CONNECTION_LIMIT, kMostConnections,                        //
                       MHD_OPTION_CONNECTION_TIMEOUT, kPatience,                             //
                       MHD_OPTION_SIGPIPE_HANDLED_BY_APP, 1,                                 //
                       MHD_OPTION_END);
  if (daemon_ == nullptr) throw std::runtime_error("the metrics' server does not start");
  listening_socket.Release();  // the library closes it
}

MetricsServer::~MetricsServer() {
  MHD_stop_daemon(daemon_);
}

}  // namespace web::watch
