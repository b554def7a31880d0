#ifndef VELKSDK_AUTOBLOCK_FILE_H
#define VELKSDK_AUTOBLOCK_FILE_H

#include <optional>

#include "sqlite.h"
#include "velk_paths.h"

namespace velk {

/// Where addresses are kept.
constexpr char kAutoBlockPath[] = VELK_ROOT "/etc/private/autoblock.db";

/// Opens the file. A connection serves one call: kept ones would not survive a fork().
/// @return nothing when there is no such file. Throws std::runtime_error with the reason when it
///         cannot be used.
std::optional<Connection> OpenAutoBlockFile();

/// Opens the file and makes it first where it is missing; any number of processes may do so at
/// the same moment. Throws like OpenAutoBlockFile().
Connection OpenOrMakeAutoBlockFile();

}  // namespace velk

#endif
