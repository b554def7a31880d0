#include "share/http_date.h"

#include <array>
#include <cstdio>

namespace web::share {
namespace {

constexpr std::array<const char *, 7> kDays = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
constexpr std::array<const char *, 12> kMonths = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                                  "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};

// strptime() knows months and days in the language of the process, which is never set: English.
std::optional<time_t> ParseForm(const std::string &text, const char *form) {
  tm date = {};
  const char *rest = strptime(text.c_str(), form, &date);
  if (rest == nullptr || *rest != '\0') return std::nullopt;
  return timegm(&date);
}

}  // namespace

std::string FormatHttpDate(time_t moment) {
  tm date = {};
  if (gmtime_r(&moment, &date) == nullptr) return "";
  std::array<char, 64> text = {};
  const int length = snprintf(text.data(), text.size(), "%s, %02d %s %04d %02d:%02d:%02d GMT",
                              kDays.at(static_cast<size_t>(date.tm_wday)), date.tm_mday,
                              kMonths.at(static_cast<size_t>(date.tm_mon)), date.tm_year + 1900,
                              date.tm_hour, date.tm_min, date.tm_sec);
  return std::string(text.data(), static_cast<size_t>(length));
}

std::optional<time_t> ParseHttpDate(const std::string &text) {
  for (const char *form :
       {"%a, %d %b %Y %H:%M:%S GMT", "%A, %d-%b-%y %H:%M:%S GMT", "%a %b %e %H:%M:%S %Y"}) {
    if (const std::optional<time_t> moment = ParseForm(text, form)) return moment;
  }
  return std::nullopt;
}

}  // namespace web::share
