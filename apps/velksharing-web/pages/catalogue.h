#ifndef VELKSHARING_WEB_PAGES_CATALOGUE_H
#define VELKSHARING_WEB_PAGES_CATALOGUE_H

#include <cstdint>
#include <ctime>
#include <initializer_list>
#include <map>
#include <string>
#include <string_view>
#include <utility>

namespace web {

/// The texts of one language, by key, and its way to write numbers, sizes and times.
///
/// A text may have places like "{count}" that are filled in. How numbers and times look are texts,
/// too: "format_decimal", "format_thousands", "format_time" with {d} {dd} {mm} {month} {yyyy}
/// {HH} {MM}, and "month_01" to "month_12".
class Catalogue {
 public:
  using Texts = std::map<std::string, std::string, std::less<>>;
  using Place = std::pair<std::string_view, std::string_view>;  ///< Name and what fills it.

  /// Reads a JSON object of texts.
  /// @param[out] error on failure, one line.
  static bool Read(std::string_view json, Texts &texts, std::string &error);

  explicit Catalogue(Texts texts);

  /// The text of a key; the key in angle quotes when there is none, for somebody to notice.
  std::string Text(std::string_view key) const;
  /// The text with its places filled.
  std::string Text(std::string_view key, std::initializer_list<Place> places) const;
  /// KEY_one or KEY_other, with the number for {count}.
  std::string Count(std::string_view key, uint64_t count) const;

  std::string Number(uint64_t number) const;
  /// "1.4 MB": two digits at least where there are any, in powers of 1000.
  std::string Size(uint64_t bytes) const;
  /// Date and time of the day, in the process's time zone. A time that no calendar has is "".
  std::string Time(time_t time) const;

  const Texts &texts() const { return texts_; }

 private:
  Texts texts_;
};

}  // namespace web

#endif
