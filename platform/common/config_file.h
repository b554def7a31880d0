#ifndef COMMON_CONFIG_FILE_H
#define COMMON_CONFIG_FILE_H

#include <functional>
#include <initializer_list>
#include <stdexcept>
#include <string>
#include <string_view>

/// Configuration files of lines "key = value"; a # starts a comment.

namespace velk {

/// What is wrong with a setting ("unknown key") or, from ReadConfigFile(), with a file
/// ("/etc/x.conf:3: unknown key").
class ConfigMistake : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Hands every setting of a file to `setting`, which throws ConfigMistake for one that it does not
/// like. A missing file has no settings.
/// @param repeatable keys that may be given several times.
/// @throws ConfigMistake for what `setting` refuses, a line of another form, another key that is
///         given twice, and a file that cannot be read.
void ReadConfigFile(
    const std::string &path,
    const std::function<void(std::string_view key, std::string_view value)> &setting,
    std::initializer_list<std::string_view> repeatable = {});

/// A whole number from `lowest` to `highest`.
/// @throws ConfigMistake.
long ConfigNumber(std::string_view value, long lowest, long highest);

}  // namespace velk

#endif
