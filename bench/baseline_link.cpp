#include "baseline_link.h"

#include <gcrypt.h>
#include <json/reader.h>
#include <json/writer.h>
#include <sys/random.h>

#include <array>
#include <ctime>
#include <memory>
#include <sstream>
#include <stdexcept>

namespace velk_bench {
namespace {

constexpr size_t kHashLength = 9;
constexpr size_t kSaltLength = 6;
constexpr size_t kSha1Length = 20;

std::string Digest(const std::string &password, const std::string &salt) {
  static const bool ready = gcry_control(GCRYCTL_DISABLE_SECMEM, 0) == 0 &&
                            gcry_control(GCRYCTL_INITIALIZATION_FINISHED, 0) == 0;
  if (!ready) throw std::runtime_error("libgcrypt cannot be used");
  const std::string input = password + salt;
  std::array<unsigned char, kSha1Length> digest{};
  gcry_md_hash_buffer(GCRY_MD_SHA1, digest.data(), input.data(), input.size());

  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  text.reserve(2 * digest.size());
  for (const unsigned char byte : digest) {
    text += kDigits[byte >> 4];
    text += kDigits[byte & 0x0f];
  }
  return text;
}

bool SameInConstantTime(const std::string &one, const std::string &other) {
  if (one.size() != other.size()) return false;
  int difference = 0;
  for (size_t i = 0; i < one.size(); ++i) difference |= one[i] ^ other[i];
  return difference == 0;
}

std::unique_ptr<Json::StreamWriter> CompactWriter() {
  Json::StreamWriterBuilder style;
  style["commentStyle"] = "None";
  style["indentation"] = "";
  style["emitUTF8"] = true;
  return std::unique_ptr<Json::StreamWriter>(style.newStreamWriter());
}

}  // namespace

bool Link::IsValid() const {
  const std::int64_t now = time(nullptr);
  return enabled && start_at <= now && (expire_at == 0 || now <= expire_at) &&
         (expire_times == 0 || use_count <= expire_times);
}

bool Link::IsUsedUp() const {
  return expire_times > 0 && use_count >= expire_times;
}

bool Link::IsPasswordValid(const std::string &password) const {
  const std::string digest = Digest(password, data["protect_password_salt"].asString());
  return SameInConstantTime(digest, data["protect_password"].asString());
}

void ReadColumns(const Statement &row, Link &link) {
  link.id = row.Number(0);
  link.hash = row.Text(1);
  link.project_name = row.Text(2);
  link.enabled = row.Number(3) == 1;
  link.owner_uid = row.Number(4);
  link.start_at = row.Number(5);
  link.expire_at = row.Number(6);
  link.expire_times = row.Number(7);
  link.use_count = row.Number(8);
  link.auto_gc = row.Number(9) != 0;
}

#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
bool ReadData(const Statement &row, Link &link) {
  const std::string_view text = row.Text(10);
  return Json::Reader().parse(text.data(), text.data() + text.size(), link.data, true) &&
         link.data.isObject();
}
#pragma GCC diagnostic pop

std::string DataText(const Link &link) {
  static const std::unique_ptr<Json::StreamWriter> writer = CompactWriter();
  std::ostringstream out;
  writer->write(link.data, &out);
  return std::move(out).str();
}

Link NewLink(const Content &content) {
  Link link;
  link.hash = RandomText(kLettersAndDigits, kHashLength);
  link.project_name = content.project_name;
  link.owner_uid = content.owner_uid;
  link.auto_gc = true;
  const std::string salt = RandomText(kLettersAndDigits, kSaltLength);
  link.data["enable_match_ip"] = true;
  link.data["protect_type"] = "password";
  link.data["protect_title"] = content.title;
  link.data["protect_password"] = Digest(kPassword, salt);
  link.data["protect_password_algo"] = "default";
  link.data["protect_password_salt"] = salt;
  for (const char *list :
       {"protect_uids", "protect_extra_users", "protect_gids", "protect_extra_groups"})
    link.data[list] = Json::Value(Json::arrayValue);
  link.data["redirect_type"] = "none";
  link.data["redirect_uri"] = "";
  link.data["app"] = content.app;
  link.data["private_data"] = Json::Value(Json::objectValue);
  return link;
}

std::string RandomText(std::string_view characters, size_t length) {
  constexpr unsigned char kMask = 63;
  std::array<unsigned char, 64> bytes{};
  std::string text;
  text.reserve(length);
  while (text.size() < length) {
    if (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size()))
      throw std::runtime_error("no random numbers");
    for (const unsigned char byte : bytes) {
      const size_t place = byte & kMask;
      if (place < characters.size() && text.size() < length) text += characters[place];
    }
  }
  return text;
}

}  // namespace velk_bench
