#include "secret.h"

#include <cstring>

namespace velk {

Secret::~Secret() {
  if (!bytes_.empty()) explicit_bzero(bytes_.data(), bytes_.size());
}

}  // namespace velk
