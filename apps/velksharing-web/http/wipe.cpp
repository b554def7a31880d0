#include "http/wipe.h"

#include <cstring>

namespace web {

void Wipe(std::string &text) {
  // What stood behind the end of a text that has shrunk counts, too.
  text.resize(text.capacity());
  explicit_bzero(text.data(), text.size());
  text.clear();
}

Secret::Secret(std::string_view text) : text_(text) {}

Secret::~Secret() {
  Wipe(text_);
}

}  // namespace web
