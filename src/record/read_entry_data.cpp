#include "record/read_entry_data.h"

#include <array>
#include <cstddef>
#include <mutex>
#include <utility>

namespace VELK::sharing::record {
namespace {

constexpr std::size_t kTexts = 16;
constexpr std::size_t kLongestText = 16384;  // bytes; with kTexts it bounds the memory

/// Texts that have been parsed, with what they say; the oldest makes room for the next.
class ParsedTexts {
 public:
  std::shared_ptr<const EntryData> Find(const std::string &text) {
    const std::unique_lock lock(mutex_, std::try_to_lock);
    if (!lock) return nullptr;
    for (const Parsed &parsed : parsed_) {
      if (parsed.data != nullptr && parsed.text == text) return parsed.data;
    }
    return nullptr;
  }

  void Keep(const std::string &text, std::shared_ptr<const EntryData> data) {
    if (text.size() > kLongestText) return;
    Parsed parsed = {text, std::move(data)};  // outside the lock, as is the end of what it replaces
    const std::unique_lock lock(mutex_, std::try_to_lock);
    if (!lock) return;
    std::swap(parsed_[oldest_], parsed);
    oldest_ = (oldest_ + 1) % kTexts;
  }

 private:
  struct Parsed {
    std::string text;
    std::shared_ptr<const EntryData> data;
  };

  // Only tried: whoever would have to wait parses instead. So a fork() of a program that has
  // another thread here leaves the child nothing to wait for.
  std::mutex mutex_;
  std::array<Parsed, kTexts> parsed_;
  std::size_t oldest_ = 0;
};

}  // namespace

std::shared_ptr<const EntryData> ReadEntryData(const std::string &text) {
  static ParsedTexts parsed;
  if (std::shared_ptr<const EntryData> known = parsed.Find(text)) return known;
  auto data = std::make_shared<EntryData>();
  if (!data->Parse(text)) return nullptr;
  parsed.Keep(text, data);
  return data;
}

}  // namespace VELK::sharing::record
