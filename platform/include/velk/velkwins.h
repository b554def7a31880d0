#ifndef VELK_VELKWINS_H
#define VELK_VELKWINS_H

#include <stddef.h>

#include "velk/export.h"

/// Names of Windows domain accounts. Works where the machine has libwbclient and winbind, which
/// are looked for at run time; elsewhere nothing is converted.

#ifdef __cplusplus
extern "C" {
#endif

/// Turns "realm.example\account" (a fully qualified domain) into "DOMAIN\account" (its short
/// NetBIOS form). Thread-safe.
/// @param capacity the size of `out` in bytes, the terminating NUL included.
/// @return the length of what was written to `out`, or 0 when nothing was converted: a null
///         argument, no backslash in the name or nothing before or behind it, no winbind, unknown
///         domain, no room (`out` is then left alone).
VELK_PLATFORM_API int VELKWinsUserNameFqdn2Netbios(const char *name, char *out, size_t capacity);

#ifdef __cplusplus
}
#endif

#endif
