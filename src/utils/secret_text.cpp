#include "internal/secret_text.h"

#include <openssl/crypto.h>

namespace VELK::sharing::internal {

SecretText::SecretText(std::initializer_list<std::string_view> pieces) {
  std::size_t size = 0;
  for (const std::string_view piece : pieces) size += piece.size();
  text_.reserve(size);
  for (const std::string_view piece : pieces) text_ += piece;
}

SecretText::~SecretText() {
  OPENSSL_cleanse(text_.data(), text_.size());
}

}  // namespace VELK::sharing::internal
