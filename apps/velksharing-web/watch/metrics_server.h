#ifndef VELKSHARING_WEB_WATCH_METRICS_SERVER_H
#define VELKSHARING_WEB_WATCH_METRICS_SERVER_H

#include <functional>
#include <string>

#include "http/unique_fd.h"

struct MHD_Daemon;

namespace web::watch {

/// Serves the metrics: GET /metrics and nothing else, on a thread of its own, from construction to
/// destruction.
class MetricsServer {
 public:
  /// @param listening_socket as Listen() of server/sockets.h opens it.
  /// @param text makes the text of one answer; called by that thread alone.
  /// @throws std::runtime_error.
  MetricsServer(UniqueFd listening_socket, std::function<std::string()> text);
  MetricsServer(const MetricsServer &) = delete;
  MetricsServer &operator=(const MetricsServer &) = delete;
  ~MetricsServer();

  /// The text, for the thread.
  std::string Text() const { return text_(); }

 private:
  const std::function<std::string()> text_;
  MHD_Daemon *daemon_;
};

}  // namespace web::watch

#endif
