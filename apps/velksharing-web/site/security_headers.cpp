#include "site/security_headers.h"

#include <syslog.h>

#include <algorithm>
#include <string>
#include <string_view>
#include <utility>

#include "pages/pages.h"

namespace web {
namespace {

constexpr std::pair<std::string_view, std::string_view> kOnEveryAnswer[] = {
    {"Content-Security-Policy", Pages::kContentSecurityPolicy},
    {"X-Content-Type-Options", "nosniff"},
    {"Referrer-Policy", "no-referrer"},
    {"X-Robots-Tag", "noindex, nofollow, noarchive"},
    {"Cross-Origin-Opener-Policy", "same-origin"},
    {"Cross-Origin-Resource-Policy", "same-origin"},
    {"Permissions-Policy", "camera=(), geolocation=(), microphone=(), payment=(), usb=()"},
    {"Cache-Control", "no-store"},
};

bool FitsAHeader(std::string_view value) {
  return std::ranges::none_of(value, [](char byte) {
    const auto number = static_cast<unsigned char>(byte);
    return (number < ' ' && byte != '\t') || number == 0x7f;
  });
}

Fields WithoutBrokenFields(const Fields &fields) {
  Fields sound;
  for (const auto &[name, value] : fields) {
    if (FitsAHeader(value)) {
      sound.Add(name, value);
    } else {
      syslog(LOG_ERR, "left the field %s out of an answer: it holds a control character",
             name.c_str());
    }
  }
  return sound;
}

}  // namespace

void AddSecurityHeaders(Response &response) {
  if (!std::ranges::all_of(response.headers, FitsAHeader, &Fields::Field::second))
    response.headers = WithoutBrokenFields(response.headers);
  for (const auto &[name, value] : kOnEveryAnswer) {
    if (response.headers.Find(name) == nullptr)
      response.headers.Add(std::string(name), std::string(value));
  }
}

}  // namespace web
