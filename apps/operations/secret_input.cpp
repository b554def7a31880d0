#include "operations/secret_input.h"

#include <unistd.h>

#include <cerrno>
#include <string>

#include "operations/failure.h"

namespace operations {
namespace {

void Append(Secret &line, char byte) {
  if (line.Append(byte)) return;
  throw Failure(Failure::INVALID,
                "the secret is longer than " + std::to_string(Secret::kCapacity) + " bytes");
}

/// @return false at the end of the file.
bool ReadByte(int file, bool (*is_over)(), char &byte) {
  for (;;) {
    const ssize_t count = read(file, &byte, 1);
    if (count >= 0) return count == 1;
    const bool go_on = errno == EINTR && (is_over == nullptr || !is_over());
    if (!go_on) throw SystemFailure("the secret could not be read");
  }
}

/// Byte by byte, so that nothing of the secret stays in a buffer and nothing behind it is taken.
/// @return false when the file ended before its first byte.
bool ReadLine(int file, bool (*is_over)(), Secret &line) {
  bool any = false;
  bool held_return = false;  // A "\r" that belongs to the line's end if "\n" comes next.
  char byte = 0;
  while (ReadByte(file, is_over, byte)) {
    any = true;
    if (byte == '\n') return true;
    if (held_return) Append(line, '\r');
    held_return = byte == '\r';
    if (!held_return) Append(line, byte);
  }
  if (held_return) Append(line, '\r');
  return any;
}

}  // namespace

Secret ReadSecretLine(int file, bool (*is_over)()) {
  Secret line;
  if (!ReadLine(file, is_over, line))
    throw Failure(Failure::INVALID, "there is no line to read the secret from");
  return line;
}

}  // namespace operations
