#include <netinet/in.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

#include "common/no_throw.h"
#include "common/text.h"
#include "login_pam.h"
#include "login_saslauthd.h"
#include "velk/velkcgi.h"

namespace velk {
namespace {

/// saslauthd reads no longer field; one limit for both ways, so that an account's password does
/// not work or fail depending on which of them is in use.
constexpr size_t kLongestField = 256;

bool IsControl(char c) {
  const auto byte = static_cast<unsigned char>(c);
  return byte < 0x20 || byte == 0x7f;
}

/// Whether a name or password may be handed on: 1 to 256 bytes without a control byte.
bool IsAcceptable(const char *text) {
  if (text == nullptr) return false;
  const std::string_view field(text, strnlen(text, kLongestField + 1));
  return !field.empty() && field.size() <= kLongestField &&
         std::none_of(field.begin(), field.end(), IsControl);
}

std::string RemoteAddress() {
  char address[INET6_ADDRSTRLEN];
  return VelkCgiGetRemoteIP(address, sizeof(address)) == 0 ? address : "";
}

/// @return the account's name; nothing when the login is refused.
std::optional<std::string> CheckAccount(const char *name, const char *password) {
  switch (AskSaslauthd(name, password)) {
    case SaslauthdAnswer::kAccepted:
      return name;
    case SaslauthdAnswer::kRefused:
      return std::nullopt;
    case SaslauthdAnswer::kNotReachable:
      break;
  }
  return LoginThroughPam(name, password, RemoteAddress());
}

/// Copies the name where one is wanted; false when it does not fit.
bool GiveName(const std::string &name, char *out, size_t capacity) {
  if (out == nullptr) return capacity == 0;
  return CopyText(name, out, capacity);
}

}  // namespace
}  // namespace velk

int VelkCgiLogin(VelkCgi *cgi, char *name_out, size_t capacity, VelkCgiLoginRecord *record) {
  if (cgi == nullptr || record == nullptr) return 0;
  if (!velk::IsAcceptable(record->name) || !velk::IsAcceptable(record->password)) return 0;
  return velk::NoThrow(0, [&] {
    const auto name = velk::CheckAccount(record->name, record->password);
    return name && velk::GiveName(*name, name_out, capacity) ? 1 : 0;
  });
}
