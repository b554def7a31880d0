#include "site/form_token.h"

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <openssl/hmac.h>
#include <sys/random.h>

#include <algorithm>

#include "http/text.h"
#include "http/wipe.h"

namespace web {
namespace {

constexpr size_t kKeyBytes = 16;

std::string LowercaseHex(const unsigned char *bytes, size_t length) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  text.reserve(2 * length);
  for (size_t at = 0; at < length; ++at) {
    text += kDigits[bytes[at] >> 4];
    text += kDigits[bytes[at] & 0x0f];
  }
  return text;
}

bool IsLowercaseHexDigit(char byte) {
  return IsDigit(byte) || (byte >= 'a' && byte <= 'f');
}

/// "example.org:8080" of an origin such as "https://example.org:8080"; "" when it is none.
std::string_view AuthorityOf(std::string_view origin) {
  const size_t scheme_end = origin.find("://");
  return scheme_end == std::string_view::npos ? std::string_view() : origin.substr(scheme_end + 3);
}

/// Origins leave the usual port out; not every client does so in Host.
std::string_view WithoutUsualPort(std::string_view authority) {
  for (const std::string_view port : {":443", ":80"})
    if (authority.ends_with(port)) return authority.substr(0, authority.size() - port.size());
  return authority;
}

bool IsSameHost(std::string_view one, std::string_view other) {
  return IsSameText(WithoutUsualPort(one), WithoutUsualPort(other));
}

}  // namespace

FormTokens::FormTokens(std::string secret) : secret_(std::move(secret)) {}

FormTokens::~FormTokens() {
  Wipe(secret_);
}

std::string FormTokens::NewKey() {
  unsigned char bytes[kKeyBytes];
  if (getrandom(bytes, sizeof bytes, 0) != static_cast<ssize_t>(sizeof bytes)) return "";
  return LowercaseHex(bytes, sizeof bytes);
}

bool FormTokens::IsKey(std::string_view text) {
  return text.size() == 2 * kKeyBytes && std::ranges::all_of(text, IsLowercaseHexDigit);
}

std::string FormTokens::Token(std::string_view key, std::string_view hash) const {
  // The key's length is fixed, so what follows it cannot be taken for a part of it.
  if (!IsKey(key)) return "";
  std::string message(key);
  message += hash;
  unsigned char digest[EVP_MAX_MD_SIZE];
  unsigned int length = 0;
  if (HMAC(EVP_sha256(), secret_.data(), static_cast<int>(secret_.size()),
           reinterpret_cast<const unsigned char *>(message.data()), message.size(), digest,
           &length) == nullptr) {
    return "";
  }
  return LowercaseHex(digest, length);
}

bool FormTokens::IsRight(std::string_view token, std::string_view key,
                         std::string_view hash) const {
  const std::string right = Token(key, hash);
  return !right.empty() && token.size() == right.size() &&
         CRYPTO_memcmp(token.data(), right.data(), right.size()) == 0;
}

bool IsFromOwnPage(const Request &request) {
  // Scripts cannot set this field, and a proxy in between does not blur it.
  const std::string_view site = request.headers.Get("Sec-Fetch-Site");
  if (!site.empty()) return site == "same-origin" || site == "none";
  const std::string_view origin = request.headers.Get("Origin");
  // Our pages send no referrer, and browsers then send this origin with their forms.
  if (origin.empty() || origin == "null") return true;
  return IsSameHost(AuthorityOf(origin), request.headers.Get("Host"));
}

}  // namespace web
