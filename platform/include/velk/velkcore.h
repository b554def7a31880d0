#ifndef VELK_VELKCORE_H
#define VELK_VELKCORE_H

#include <stdio.h>

#include "velk/export.h"

/// Files and child processes. Every call may be made from any thread; every descriptor made here
/// is close-on-exec.

#ifdef __cplusplus
extern "C" {
#endif

/// @return 1 when `path` names something that exists (a dangling symbolic link does not),
///         0 when it does not, cannot be looked at, or is null.
VELK_PLATFORM_API int VLIBCFileExist(const char *path);

/// Creates an empty regular file with mode 0600 less the umask, or leaves an existing one as it
/// is, apart from its times, which become now. Does not follow a symbolic link at the last
/// component.
/// @return 0, or -1 with errno set: ELOOP for a symbolic link; EINVAL when something that is no
///         regular file is in the way, and for null.
VELK_PLATFORM_API int VLIBCFileTouch(const char *path);

/// Sets the permission mode of `path`, exactly (the umask plays no part). Does not follow a
/// symbolic link at the last component.
/// @param reserved always -1.
/// @param mode permission bits, 0 to 07777.
/// @return 0, or -1 with errno set: ELOOP for a symbolic link; EINVAL for a mode beyond the
///         permission bits, and for null.
VELK_PLATFORM_API int VELKFSAclChmod(const char *path, int reserved, unsigned int mode);

/// Starts the program at `path` with the null-terminated `argv` (argv[0] included), without a
/// shell and without a search along PATH, with the caller's environment, and connects a stream
/// to it.
///
///     const char *const argv[] = {"/usr/bin/id", "-u", NULL};
///     FILE *file = VLIBCPopenv(argv[0], "r", argv);
///     if (file != NULL) {
///       read_all(file);
///       int status = VLIBCPclose(file);
///     }
///
/// The child has descriptors 0 to 2 only (one that the caller has closed is /dev/null there),
/// SIGPIPE and SIGCHLD at their defaults and no signal blocked.
/// @param mode "r": the stream reads the child's standard output (its standard input is
///        /dev/null); "w": the stream writes to the child's standard input. In both cases the
///        rest is the caller's own.
/// @return a stream to be closed with VLIBCPclose() and nothing else, or null with errno set: as
///         execve() does for a program that cannot be executed; EINVAL for another mode, a null
///         argument and an empty `argv`.
VELK_PLATFORM_API FILE *VLIBCPopenv(const char *path, const char *mode, const char *const argv[]);

/// Closes the stream and waits for its child, and for no other child. A signal does not end the
/// waiting.
/// @return the child's status as waitpid() gives it, or -1 with errno set: EINVAL for null and a
///         stream that VLIBCPopenv() did not make (it stays open); ECHILD when the status is
///         lost, because the caller ignores SIGCHLD or has reaped the child itself.
VELK_PLATFORM_API int VLIBCPclose(FILE *file);

#ifdef __cplusplus
}
#endif

#endif
