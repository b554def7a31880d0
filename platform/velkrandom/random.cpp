#include <string.h>
#include <sys/random.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdint>
#include <stdexcept>
#include <system_error>

#include "velk/velkrandom.h"

namespace VELK {
namespace RANDOM {

const char *const POOL_ALPHA_NUMERIC =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
const char *const POOL_URL_FRIENDLY =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";

namespace {

constexpr size_t kByteValues = 256;

/// Bytes that will be somebody's secret; wiped when they have been used.
class SecretBytes {
 public:
  SecretBytes() = default;
  SecretBytes(const SecretBytes &) = delete;
  SecretBytes &operator=(const SecretBytes &) = delete;
  ~SecretBytes() { explicit_bzero(bytes_.data(), bytes_.size()); }

  unsigned char *data() { return bytes_.data(); }
  unsigned char operator[](size_t index) const { return bytes_[index]; }
  size_t size() const { return bytes_.size(); }

 private:
  std::array<unsigned char, 256> bytes_;  // the most that getrandom() never cuts short
};

/// False, with errno set, when the kernel gives no random bytes.
bool Fill(void *out, size_t size) {
  unsigned char *next = static_cast<unsigned char *>(out);
  while (size > 0) {
    const ssize_t count = getrandom(next, size, 0);
    if (count == -1 && errno == EINTR) continue;
    if (count == -1) return false;
    next += count;
    size -= static_cast<size_t>(count);
  }
  return true;
}

uint32_t RandomWord() {
  uint32_t word;
  if (!Fill(&word, sizeof(word))) {
    throw std::system_error(errno, std::generic_category(), "getrandom");
  }
  return word;
}

/// Bytes to ask for so that `wanted` of them are most probably below `limit`.
size_t BytesToAskFor(size_t wanted, size_t limit) {
  constexpr size_t kSpare = 8;
  return wanted * kByteValues / limit + kSpare;
}

bool Draw(const std::string &pool, size_t length, std::string &out) {
  // The largest multiple of the pool's size: the bytes from there on would favour its beginning.
  const size_t limit = kByteValues - kByteValues % pool.size();
  SecretBytes bytes;
  out.reserve(length);
  while (out.size() < length) {
    const size_t asked = std::min(bytes.size(), BytesToAskFor(length - out.size(), limit));
    if (!Fill(bytes.data(), asked)) return false;
    for (size_t i = 0; i < asked && out.size() < length; ++i) {
      if (bytes[i] < limit) out.push_back(pool[bytes[i] % pool.size()]);
    }
  }
  return true;
}

}  // namespace

VELKRandomBase::VELKRandomBase() = default;
VELKRandomBase::~VELKRandomBase() = default;

int VELKRandomBase::random(int low, int high) {
  if (low > high) throw std::invalid_argument("random: low is greater than high");
  constexpr uint64_t kWordValues = uint64_t{1} << 32;
  const uint64_t range = static_cast<uint64_t>(int64_t{high} - low) + 1;
  // The largest multiple of the range: the words from there on would favour small results.
  const uint64_t limit = kWordValues - kWordValues % range;
  uint64_t word;
  do {
    word = RandomWord();
  } while (word >= limit);
  return static_cast<int>(low + static_cast<int64_t>(word % range));
}

VELKRandom::VELKRandom() = default;
VELKRandom::~VELKRandom() = default;

bool VELKRandom::getString(const std::string &pool, unsigned int length, std::string &out) {
  std::string drawn;  // apart from `out`, which may be the pool itself
  const bool good = !pool.empty() && pool.size() <= kByteValues && Draw(pool, length, drawn);
  if (!good) drawn.clear();
  out.swap(drawn);
  return good;
}

}  // namespace RANDOM
}  // namespace VELK
