#ifndef VELKSHARING_WEB_SERVER_FASTCGI_SERVER_H
#define VELKSHARING_WEB_SERVER_FASTCGI_SERVER_H

#include <memory>

#include "server/service.h"
#include "server/settings.h"

namespace web {

class FastCgiServerPrivate;

/// Serves FastCGI in this process, with a fixed number of threads, each of which has one connection
/// of the web server at a time. A connection that the web server keeps open is let go of when
/// nothing comes and all threads are taken.
class FastCgiServer {
 public:
  /// Begins to serve.
  /// @param listening_socket does not block, and is shared with other processes; must be open
  ///        until StopAccepting().
  /// @param service must outlive the server.
  /// @throws std::runtime_error.
  FastCgiServer(int listening_socket, const Settings &settings, Service &service);
  FastCgiServer(const FastCgiServer &) = delete;
  FastCgiServer &operator=(const FastCgiServer &) = delete;
  /// Cuts the connections that are left, and waits for the threads.
  ~FastCgiServer();

  /// Takes no more requests; the listening socket may be closed.
  void StopAccepting();

 private:
  std::unique_ptr<FastCgiServerPrivate> private_;
};

}  // namespace web

#endif
