#include <gcrypt.h>
#include <openssl/md5.h>

#include <new>

#include "internal/secret_text.h"
#include "velksharing/utils.h"

namespace VELK::sharing {
namespace {

std::string LowercaseHex(const unsigned char *bytes, size_t length) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  text.reserve(2 * length);
  for (size_t i = 0; i < length; ++i) {
    text += kDigits[bytes[i] >> 4];
    text += kDigits[bytes[i] & 0x0f];
  }
  return text;
}

}  // namespace

bool Sha1WithSaltHashPassword(const std::string &password, const std::string &salt,
                              std::string &out) {
  try {
    const internal::SecretText input{password, salt};
    gcry_control(GCRYCTL_DISABLE_SECMEM, 0);
    gcry_control(GCRYCTL_INITIALIZATION_FINISHED, 0);
    std::string digest(gcry_md_get_algo_dlen(GCRY_MD_SHA1), '\0');
    gcry_md_hash_buffer(GCRY_MD_SHA1, digest.data(), input.text().data(), input.text().size());
    out = LowercaseHex(reinterpret_cast<const unsigned char *>(digest.data()), digest.size());
    return true;
  } catch (const std::bad_alloc &) {
    return false;
  }
}

// MD5 is deprecated for good reason; it stays for digests that were made long ago.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
bool MD5HashPassword(const std::string &password, std::string &out) {
  if (password.empty()) return false;
  MD5_CTX context;
  unsigned char digest[MD5_DIGEST_LENGTH];
  if (MD5_Init(&context) <= 0 || MD5_Update(&context, password.data(), password.size()) <= 0 ||
      MD5_Final(digest, &context) <= 0) {
    return false;
  }
  out = LowercaseHex(digest, sizeof digest);
  return true;
}
#pragma GCC diagnostic pop

}  // namespace VELK::sharing
