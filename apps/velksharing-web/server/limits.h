#ifndef VELKSHARING_WEB_SERVER_LIMITS_H
#define VELKSHARING_WEB_SERVER_LIMITS_H

#include <chrono>
#include <cstddef>

/// What a visitor may ask of the program, however it is run.

namespace web {

constexpr size_t kHeadLimit = 16 * 1024;  ///< Request line and header fields, in bytes.
constexpr size_t kFormLimit = 64 * 1024;  ///< Request body, in bytes.
/// A body that is too large is read and thrown away up to here, in bytes: a visitor who is still
/// sending when the connection closes may lose the answer on its way.
constexpr size_t kDiscardLimit = 1024 * 1024;
/// How long a visitor may take for the head, for the form, and between two bytes of an answer.
constexpr std::chrono::seconds kPatience{15};
/// How much is handed over at once of a body that is not sent from where it lies.
constexpr size_t kPiece = 32 * 1024;

}  // namespace web

#endif
