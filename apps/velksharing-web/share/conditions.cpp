#include "share/conditions.h"

#include <cinttypes>
#include <cstdio>
#include <optional>
#include <string_view>

#include "http/text.h"
#include "share/http_date.h"

namespace web::share {
namespace {

constexpr std::string_view kWeak = "W/";
constexpr std::string_view kBetweenTags = " \t,";

enum class Comparison { STRONG, WEAK };

// Takes the first entity tag of a list, with its quotes and its mark of weakness.
std::string_view TakeTag(std::string_view &list) {
  const size_t begin = list.find_first_not_of(kBetweenTags);
  if (begin == std::string_view::npos) return {};
  list.remove_prefix(begin);
  const size_t open = list.find('"');
  const size_t close = open == std::string_view::npos ? open : list.find('"', open + 1);
  if (close == std::string_view::npos) return {};
  const std::string_view tag = list.substr(0, close + 1);
  list.remove_prefix(close + 1);
  return tag;
}

bool IsSameTag(std::string_view given, std::string_view tag, Comparison comparison) {
  const bool is_weak = given.starts_with(kWeak);
  if (is_weak && comparison == Comparison::STRONG) return false;
  return (is_weak ? given.substr(kWeak.size()) : given) == tag;
}

bool ListHas(std::string_view list, std::string_view tag, Comparison comparison) {
  for (std::string_view given = TakeTag(list); !given.empty(); given = TakeTag(list)) {
    if (IsSameTag(given, tag, comparison)) return true;
  }
  return false;
}

// A list may come in several fields.
bool AnyMatches(const Fields &request, std::string_view name, std::string_view tag,
                Comparison comparison) {
  for (const auto &[field, value] : request) {
    if (!IsSameText(field, name)) continue;
    if (value == "*" || ListHas(value, tag, comparison)) return true;
  }
  return false;
}

std::optional<time_t> Date(const Fields &request, std::string_view name) {
  const std::string *text = request.Find(name);
  return text == nullptr ? std::nullopt : ParseHttpDate(*text);
}

bool IsAsExpected(const Fields &request, const Validators &file) {
  if (request.Find("If-Match") != nullptr) {
    return AnyMatches(request, "If-Match", file.tag, Comparison::STRONG);
  }
  const std::optional<time_t> date = Date(request, "If-Unmodified-Since");
  return !date || file.modified <= *date;
}

bool IsKnown(const Fields &request, const Validators &file) {
  if (request.Find("If-None-Match") != nullptr) {
    return AnyMatches(request, "If-None-Match", file.tag, Comparison::WEAK);
  }
  const std::optional<time_t> date = Date(request, "If-Modified-Since");
  return date && file.modified <= *date;
}

}  // namespace

Validators ValidatorsOf(const Item &file) {
  char tag[80];
  snprintf(tag, sizeof tag, "\"%" PRIx64 ".%lx-%" PRIx64 "-%" PRIx64 "\"",
           static_cast<uint64_t>(file.changed.tv_sec),
           static_cast<unsigned long>(file.changed.tv_nsec), static_cast<uint64_t>(file.size),
           static_cast<uint64_t>(file.inode));
  return {tag, file.changed.tv_sec};
}

Verdict Weigh(const Fields &request, const Validators &file) {
  if (!IsAsExpected(request, file)) return Verdict::FAILED;
  return IsKnown(request, file) ? Verdict::NOT_MODIFIED : Verdict::SEND;
}

bool MayHoldRange(const Fields &request, const Validators &file, time_t now) {
  const std::string *condition = request.Find("If-Range");
  if (condition == nullptr) return true;
  if (condition->find('"') != std::string::npos) {
    return IsSameTag(*condition, file.tag, Comparison::STRONG);
  }
  constexpr time_t kLongEnough = 2;
  const std::optional<time_t> date = ParseHttpDate(*condition);
  return date == file.modified && now - file.modified >= kLongEnough;
}

}  // namespace web::share
