#include "record/read_entry_data.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <utility>

namespace VELK::sharing::record {
namespace {

constexpr std::size_t kTexts = 16;
// In bytes. Parsed, a text may take fifty times as much memory.
constexpr std::size_t kLongestText = 4096;

/// The last few; the oldest makes room for the next.
template <typename T>
class Recent {
 public:
  /// @return what was forgotten.
  T Add(T item) {
    std::swap(items_[oldest_], item);
    oldest_ = (oldest_ + 1) % items_.size();
    return item;
  }
  const std::array<T, kTexts> &items() const { return items_; }

 private:
  std::array<T, kTexts> items_{};
  std::size_t oldest_ = 0;
};

/// Texts that have come at least twice, with what they say.
class ParsedTexts {
 public:
  std::shared_ptr<const EntryData> Find(const std::string &text) {
    const std::unique_lock lock(mutex_, std::try_to_lock);
    if (!lock) return nullptr;
    for (const Parsed &parsed : parsed_.items()) {
      if (parsed.data != nullptr && parsed.text == text) return parsed.data;
    }
    return nullptr;
  }

  /// Takes note of a text that was not found. A list of links, each of which comes once, is not
  /// kept.
  void Add(const std::string &text, const EntryData &data) {
    if (text.size() > kLongestText || !HasComeBefore(text)) return;
    Parsed parsed = {text, std::make_shared<EntryData>(data)};
    const std::unique_lock lock(mutex_, std::try_to_lock);
    if (lock) parsed = parsed_.Add(std::move(parsed));  // which ends after the lock
  }

 private:
  struct Parsed {
    std::string text;
    std::shared_ptr<const EntryData> data;
  };

  bool HasComeBefore(const std::string &text) {
    const std::size_t hash = std::hash<std::string>()(text);
    const std::unique_lock lock(mutex_, std::try_to_lock);
    if (!lock) return false;
    const auto &once = once_.items();
    if (std::find(once.begin(), once.end(), hash) != once.end()) return true;
    once_.Add(hash);
    return false;
  }

  // Only tried: whoever would have to wait parses instead. So a fork() of a program that has
  // another thread here leaves the child nothing to wait for.
  std::mutex mutex_;
  Recent<Parsed> parsed_;
  Recent<std::size_t> once_;  ///< Hashes of texts that have come once.
};

/// Never destroyed: a link may be loaded until the very end.
ParsedTexts &Texts() {
  static ParsedTexts &texts = *new ParsedTexts;
  return texts;
}

// Made before there are threads: one could fork while another makes it.
[[maybe_unused]] const ParsedTexts &made_at_start = Texts();

}  // namespace

bool ReadEntryData(const std::string &text, EntryData &data) {
  if (const std::shared_ptr<const EntryData> known = Texts().Find(text)) {
    data = *known;
    return true;
  }
  if (!data.Parse(text)) return false;
  Texts().Add(text, data);
  return true;
}

}  // namespace VELK::sharing::record
