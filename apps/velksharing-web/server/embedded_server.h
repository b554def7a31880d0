#ifndef VELKSHARING_WEB_SERVER_EMBEDDED_SERVER_H
#define VELKSHARING_WEB_SERVER_EMBEDDED_SERVER_H

#include <memory>

#include "http/unique_fd.h"
#include "server/service.h"
#include "server/settings.h"

namespace web {

class EmbeddedServerPrivate;

/// An HTTP server in this process, with a thread for each connection. Heads, forms and slow
/// visitors are limited as limits.h says; a message whose length can be understood in two ways is
/// refused, and its connection closed.
class EmbeddedServer {
 public:
  /// Begins to serve.
  /// @param listening_socket shared with other processes; must be open until StopAccepting().
  /// @param service must outlive the server.
  /// @throws std::runtime_error.
  EmbeddedServer(int listening_socket, const Settings &settings, Service &service);
  EmbeddedServer(const EmbeddedServer &) = delete;
  EmbeddedServer &operator=(const EmbeddedServer &) = delete;
  /// Cuts the connections that are left, and waits for their threads.
  ~EmbeddedServer();

  /// Takes no more connections, and does not use the listening socket any more.
  void StopAccepting();

 private:
  std::unique_ptr<EmbeddedServerPrivate> private_;
};

}  // namespace web

#endif
