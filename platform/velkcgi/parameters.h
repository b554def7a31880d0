#ifndef VELKCGI_PARAMETERS_H
#define VELKCGI_PARAMETERS_H

#include <optional>
#include <string_view>

#include "secret.h"

namespace velk {

/// Finds a parameter of an "application/x-www-form-urlencoded" text and decodes it: '+' is a
/// blank, "%41" a byte; a broken escape stands for itself. The first of equal names counts.
/// @return nothing when there is none, or when its value holds a zero byte.
std::optional<Secret> FindParameter(std::string_view encoded, std::string_view name);

/// A parameter of the current request: of its query, else of its body.
std::optional<Secret> RequestParameter(std::string_view name);

}  // namespace velk

#endif
