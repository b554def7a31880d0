#include "pages/language_choice.h"

#include <algorithm>

#include "http/quality.h"
#include "http/text.h"

namespace web {
namespace {

/// One wish of the field: a tag or "*", and how much it is wanted, 0 to 1000; 0 is not at all.
struct Wish {
  std::string_view tag;
  int quality = 1000;
};

std::vector<Wish> ReadWishes(std::string_view field) {
  std::vector<Wish> wishes;
  while (!field.empty()) {
    std::string_view wish = TakePart(field, ',');
    const std::string_view tag = Trimmed(TakePart(wish, ';'));
    if (!tag.empty()) wishes.push_back({tag, QualityOf(wish)});
  }
  return wishes;
}

/// Whether `tag` is `start` or a kind of it: "de-CH" of "de".
bool IsKindOf(std::string_view tag, std::string_view start) {
  return IsSameText(tag.substr(0, start.size()), start) &&
         (tag.size() == start.size() || tag[start.size()] == '-');
}

bool Fits(const Wish &wish, std::string_view language) {
  return wish.tag == "*" || IsKindOf(wish.tag, language) || IsKindOf(language, wish.tag);
}

bool IsRefused(const std::vector<Wish> &wishes, std::string_view language) {
  return std::any_of(wishes.begin(), wishes.end(), [language](const Wish &wish) {
    return wish.quality == 0 && IsSameText(wish.tag, language);
  });
}

}  // namespace

const std::string &ChooseAmong(const std::vector<std::string> &offered,
                               std::string_view accept_language) {
  std::vector<Wish> wishes = ReadWishes(accept_language);
  std::stable_sort(wishes.begin(), wishes.end(), [](const Wish &left, const Wish &right) {
    return left.quality > right.quality;
  });
  for (const Wish &wish : wishes) {
    if (wish.quality == 0) break;
    const auto found =
        std::find_if(offered.begin(), offered.end(), [&](const std::string &language) {
          return Fits(wish, language) && !IsRefused(wishes, language);
        });
    if (found != offered.end()) return *found;
  }
  return offered.front();
}

}  // namespace web
