#ifndef OPERATIONS_SECRET_INPUT_H
#define OPERATIONS_SECRET_INPUT_H

#include "operations/secret.h"

namespace operations {

/// The first line of an open file, without its end, which is "\n", "\r\n" or that of the file.
/// Nothing behind the line is read.
/// @param is_over asked when a signal interrupts the reading: whether to give up. Null: never.
/// @throws Failure INVALID when there is no line or it is too long, SYSTEM when it cannot be read.
Secret ReadSecretLine(int file, bool (*is_over)() = nullptr);

}  // namespace operations

#endif
