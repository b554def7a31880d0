#include "gate/path_readings.h"

#include <algorithm>
#include <iterator>
#include <string>
#include <utility>

#include "http/text.h"

namespace web::gate {
namespace {

constexpr char kSeparator = Reading::kSeparator;

bool IsControl(char byte) {
  return static_cast<unsigned char>(byte) < ' ' || byte == '\x7f';
}

/// The byte of the escape that stands at `at`; nothing where none stands.
std::optional<char> EscapedByte(std::string_view text, size_t at) {
  if (text.size() - at < 3 || text[at] != '%') return std::nullopt;
  const int high = HexDigitValue(text[at + 1]);
  const int low = HexDigitValue(text[at + 2]);
  if (high < 0 || low < 0) return std::nullopt;
  return static_cast<char>(high * 16 + low);
}

/// Whether an escape stays one as long as nobody decodes the path: it need not be one, so that it
/// tells the path from others; or the bare byte would mean something else there.
bool IsKept(char byte, std::string_view behind) {
  if (byte == '%')
    return behind.size() >= 2 && HexDigitValue(behind[0]) >= 0 && HexDigitValue(behind[1]) >= 0;
  return byte == '\\' || IsPlainInPath(byte);
}

/// The text of the reading that is closest to what was sent.
std::optional<std::string> AsSent(std::string_view path) {
  if (path.empty() || path.front() != '/') return std::nullopt;
  if (path.back() == '/') path.remove_suffix(1);
  std::string text;
  text.reserve(path.size());
  for (size_t at = 0; at < path.size(); ++at) {
    const char byte = path[at];
    if (IsControl(byte) || byte == ' ') return std::nullopt;
    if (byte != '%') {
      text += byte == '/' ? kSeparator : byte;
      continue;
    }
    const std::optional<char> escaped = EscapedByte(path, at);
    if (!escaped || IsControl(*escaped)) return std::nullopt;
    if (IsKept(*escaped, path.substr(at + 3))) {
      text += path.substr(at, 3);
    } else {
      text += *escaped;
    }
    at += 2;
  }
  return text;
}

/// Whether a control character would come out of an escape.
bool HidesControlCharacter(std::string_view text) {
  for (size_t at = text.find('%'); at != std::string_view::npos; at = text.find('%', at + 1)) {
    const std::optional<char> escaped = EscapedByte(text, at);
    if (escaped && IsControl(*escaped)) return true;
  }
  return false;
}

/// Whether two bytes begin a character that has more bytes than it needs. Careless decoders make
/// slashes and dots of such.
bool BeginsOverlongCharacter(char first, char second) {
  const auto lead = static_cast<unsigned char>(first);
  const auto next = static_cast<unsigned char>(second);
  if (lead == 0xc0 || lead == 0xc1) return true;
  if (next < 0x80) return false;
  return (lead == 0xe0 && next < 0xa0) || (lead == 0xf0 && next < 0x90) ||
         (lead == 0xf8 && next < 0x88) || (lead == 0xfc && next < 0x84);
}

bool HasOverlongCharacter(const std::string &text) {
  return std::ranges::adjacent_find(text, BeginsOverlongCharacter) != text.end();
}

// The steps. Each gives the text that it makes of another; nothing where it has nothing to do.

std::optional<std::string> Decoded(const std::string &text) {
  std::string decoded;
  decoded.reserve(text.size());
  for (size_t at = 0; at < text.size(); ++at) {
    const std::optional<char> escaped = EscapedByte(text, at);
    decoded += escaped.value_or(text[at]);
    if (escaped) at += 2;
  }
  if (decoded.size() == text.size()) return std::nullopt;
  return decoded;
}

std::optional<std::string> SeparatedBy(char separator, const std::string &text) {
  if (text.find(separator) == std::string::npos) return std::nullopt;
  std::string separated = text;
  std::ranges::replace(separated, separator, kSeparator);
  return separated;
}

std::optional<std::string> SeparatedBySlashes(const std::string &text) {
  return SeparatedBy('/', text);
}

std::optional<std::string> SeparatedByBackslashes(const std::string &text) {
  return SeparatedBy('\\', text);
}

std::optional<std::string> Merged(const std::string &text) {
  const auto are_separators = [](char one, char next) {
    return one == kSeparator && next == kSeparator;
  };
  std::string merged;
  std::ranges::unique_copy(text, std::back_inserter(merged), are_separators);
  if (merged.ends_with(kSeparator)) merged.pop_back();
  if (merged.size() == text.size()) return std::nullopt;
  return merged;
}

std::optional<std::string> Resolved(const std::string &text) {
  std::string resolved;
  std::string_view rest = text;
  while (!rest.empty()) {
    const std::string_view component = rest.substr(0, rest.find(kSeparator, 1));
    rest.remove_prefix(component.size());
    const std::string_view name = component.substr(1);
    if (name == "..") {
      resolved.resize(std::min(resolved.rfind(kSeparator), resolved.size()));
    } else if (name != ".") {
      resolved += component;
    }
  }
  if (resolved.size() == text.size()) return std::nullopt;
  return resolved;
}

std::optional<std::string> WithoutParameters(const std::string &text) {
  std::string without;
  bool in_parameters = false;
  for (const char byte : text) {
    if (byte == kSeparator) in_parameters = false;
    if (byte == ';') in_parameters = true;
    if (!in_parameters) without += byte;
  }
  if (without.size() == text.size()) return std::nullopt;
  return without;
}

std::optional<std::string> EndedBefore(char end, const std::string &text) {
  const size_t at = text.find(end);
  if (at == std::string::npos) return std::nullopt;
  return text.substr(0, at);
}

std::optional<std::string> EndedBeforeParameters(const std::string &text) {
  return EndedBefore(';', text);
}

std::optional<std::string> EndedBeforeQuery(const std::string &text) {
  return EndedBefore('?', text);
}

std::optional<std::string> EndedBeforeFragment(const std::string &text) {
  return EndedBefore('#', text);
}

std::optional<std::string> WithoutHost(const std::string &text) {
  if (text.size() < 2 || text[0] != kSeparator || text[1] != kSeparator) return std::nullopt;
  const size_t host = std::min(text.find_first_not_of(kSeparator), text.size());
  return text.substr(std::min(text.find(kSeparator, host), text.size()));
}

using Step = std::optional<std::string> (*)(const std::string &text);
constexpr Step kSteps[] = {Decoded,
                           SeparatedBySlashes,
                           SeparatedByBackslashes,
                           Merged,
                           Resolved,
                           WithoutParameters,
                           EndedBeforeParameters,
                           EndedBeforeQuery,
                           EndedBeforeFragment,
                           WithoutHost};

/// This text and all that the steps make of it. Each step leaves less to do, so there is an end.
std::optional<std::vector<Reading>> AllFrom(std::string text) {
  std::vector<Reading> readings;
  readings.emplace_back(std::move(text));
  for (size_t at = 0; at < readings.size(); ++at) {
    const std::string &known = readings[at].text();
    if (HidesControlCharacter(known) || HasOverlongCharacter(known)) return std::nullopt;
    for (const Step step : kSteps) {
      std::optional<std::string> made = step(readings[at].text());
      if (!made) continue;
      Reading reading(*std::move(made));
      if (std::ranges::find(readings, reading) != readings.end()) continue;
      if (readings.size() == kMostReadings) return std::nullopt;
      readings.push_back(std::move(reading));
    }
  }
  return readings;
}

}  // namespace

std::optional<std::vector<Reading>> ReadingsOf(std::string_view path) {
  std::optional<std::string> text = AsSent(path);
  if (!text) return std::nullopt;
  return AllFrom(*std::move(text));
}

std::optional<Reading> OnlyReading(std::string_view path) {
  const std::optional<std::string> text = AsSent(path);
  if (!text) return std::nullopt;
  std::optional<std::vector<Reading>> readings = AllFrom(Decoded(*text).value_or(*text));
  if (!readings || readings->size() != 1) return std::nullopt;
  return std::move(readings->front());
}

}  // namespace web::gate
