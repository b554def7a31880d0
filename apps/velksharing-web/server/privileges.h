#ifndef VELKSHARING_WEB_SERVER_PRIVILEGES_H
#define VELKSHARING_WEB_SERVER_PRIVILEGES_H

namespace web {

/// Gives up, for good, whatever the program does not need. Of all capabilities at most CAP_SETUID
/// and CAP_SETGID stay, for the files of the links' owners, and programs that are started get none.
/// Root becomes the system account without supplementary groups and can gain no privileges any
/// more; anybody else stays who it is. New files are their owner's alone, and memory is written to
/// no core file.
///
/// To be called while the process has one thread, after the sockets are open.
/// @throws std::runtime_error naming the step when the process has anything else afterwards: it
///         must not go on then.
void LimitPrivileges();

}  // namespace web

#endif
