#ifndef TESTS_WEB_SERVER_LISTENER_H
#define TESTS_WEB_SERVER_LISTENER_H

#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>

#include "http/unique_fd.h"

namespace web_test {

/// A socket that listens on a port of this machine.
class Listener {
 public:
  Listener() : socket_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0)) {
    address_.sin_family = AF_INET;
    address_.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    EXPECT_EQ(0, bind(socket_.get(), reinterpret_cast<sockaddr *>(&address_), sizeof address_));
    EXPECT_EQ(0, listen(socket_.get(), 8));
    socklen_t size = sizeof address_;
    getsockname(socket_.get(), reinterpret_cast<sockaddr *>(&address_), &size);
  }

  web::UniqueFd Connect() const {
    web::UniqueFd client(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
    EXPECT_EQ(
        0, connect(client.get(), reinterpret_cast<const sockaddr *>(&address_), sizeof address_));
    return client;
  }
  web::UniqueFd Accept() const { return web::UniqueFd(accept(socket_.get(), nullptr, nullptr)); }
  int get() const { return socket_.get(); }

 private:
  web::UniqueFd socket_;
  sockaddr_in address_ = {};
};

}  // namespace web_test

#endif
