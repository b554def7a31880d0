#ifndef VELKSHARING_WEB_SERVER_SOCKETS_H
#define VELKSHARING_WEB_SERVER_SOCKETS_H

#include <sys/socket.h>
#include <sys/types.h>

#include <string>

#include "http/unique_fd.h"

namespace web {

/// Who may connect to a socket that has a path.
struct SocketAccess {
  mode_t mode = 0660;
  std::string group;  ///< "" for the process's own.
};

/// Whether a descriptor is a socket that takes connections.
bool IsListening(int fd);

/// Opens a socket that takes connections. It does not block, so that several processes may accept
/// from it.
/// @param address "192.0.2.1:80", "localhost:80", "[2001:db8::1]:80", or a path, of which an
///        abandoned socket is replaced. Port 0 takes a free one.
/// @throws std::runtime_error saying what is wrong with the address.
UniqueFd Listen(const std::string &address, const SocketAccess &access);

/// The socket that whoever started this process opened for it: the first of socket activation
/// (LISTEN_PID, LISTEN_FDS), else a listening standard input. Not open when there is none.
/// @throws std::runtime_error for several sockets, or one that takes no connections.
UniqueFd InheritedSocket();

/// Where a socket listens, as Listen() takes it.
std::string AddressOf(int listening_socket);

/// The other end's address as the platform prints it; "" for a socket with a path.
std::string PeerAddress(const sockaddr *address);

}  // namespace web

#endif
