// Addresses made at random out of dangerous pieces, read by servers that are played here: whatever
// one of them takes for a page below "/private" must never be let through by another key.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "gate/prefix_map.h"

namespace {

using testing::AnyOf;
using testing::ElementsAre;
using testing::IsEmpty;
using web::gate::Address;
using web::gate::Prefix;
using web::gate::PrefixMap;

constexpr int kSpellings = 4'000;
constexpr int kReadings = 100;  // of each

/// How a server goes about a path. None of it is right or wrong: there are servers for each.
struct Server {
  int decodings = 1;
  bool decodes_harmless_first = false;  ///< Letters, digits and "-._~", before all else.
  bool splits_before_decoding = false;  ///< Then an encoded slash is a letter.
  bool resolves_before_decoding = false;
  bool takes_backslashes = false;
  bool takes_host = false;
  bool strips_parameters = false;
  bool resolves_before_merging = false;
  bool merges = false;
  bool resolves = false;
};

std::vector<Server> AllServers() {
  std::vector<Server> servers;
  for (int decodings = 0; decodings <= 3; ++decodings)
    for (int bits = 0; bits < 512; ++bits)
      servers.push_back({decodings, (bits & 1) != 0, (bits & 2) != 0, (bits & 4) != 0,
                         (bits & 8) != 0, (bits & 16) != 0, (bits & 32) != 0, (bits & 64) != 0,
                         (bits & 128) != 0, (bits & 256) != 0});
  return servers;
}

bool IsHarmless(char byte) {
  return isalnum(static_cast<unsigned char>(byte)) != 0 || byte == '-' || byte == '.' ||
         byte == '_' || byte == '~';
}

bool IsHex(char byte) {
  return isxdigit(static_cast<unsigned char>(byte)) != 0;
}

std::string Decode(const std::string &text, bool only_harmless) {
  std::string decoded;
  for (size_t at = 0; at < text.size(); ++at) {
    if (text[at] == '%' && at + 2 < text.size() && IsHex(text[at + 1]) && IsHex(text[at + 2])) {
      const char byte = static_cast<char>(std::stoi(text.substr(at + 1, 2), nullptr, 16));
      if (!only_harmless || IsHarmless(byte)) {
        decoded += byte;
        at += 2;
        continue;
      }
    }
    decoded += text[at];
  }
  return decoded;
}

using Names = std::vector<std::string>;

Names Split(const std::string &path) {
  Names names;
  for (size_t slash = 0; slash + 1 < path.size();) {
    const size_t end = std::min(path.find('/', slash + 1), path.size());
    names.push_back(path.substr(slash + 1, end - slash - 1));
    slash = end;
  }
  return names;
}

std::string Join(const Names &names) {
  std::string path;
  for (const std::string &name : names) path += "/" + name;
  return path.empty() ? "/" : path;
}

void Resolve(Names &names) {
  Names resolved;
  for (const std::string &name : names) {
    if (name == "..") {
      if (!resolved.empty()) resolved.pop_back();
    } else if (name != ".") {
      resolved.push_back(name);
    }
  }
  names = resolved;
}

void TakeHost(std::string &path) {
  if (!path.starts_with("//")) return;
  const size_t slash = path.find('/', std::min(path.find_first_not_of('/'), path.size()));
  path = slash == std::string::npos ? "/" : path.substr(slash);
}

Names ReadBy(const Server &server, std::string path) {
  if (server.decodes_harmless_first) path = Decode(path, true);
  if (server.takes_backslashes) std::replace(path.begin(), path.end(), '\\', '/');
  if (server.takes_host) TakeHost(path);
  Names names = Split(path);
  if (server.resolves_before_decoding) Resolve(names);
  if (!server.splits_before_decoding) names = {Join(names).substr(1)};
  for (int count = 0; count < server.decodings; ++count)
    for (std::string &name : names) name = Decode(name, false);
  if (!server.splits_before_decoding) {
    path = "/" + names.front();
    if (server.takes_backslashes) std::replace(path.begin(), path.end(), '\\', '/');
    names = Split(path);
  }
  if (server.strips_parameters)
    for (std::string &name : names) name.resize(std::min(name.find(';'), name.size()));
  if (server.resolves_before_merging) Resolve(names);
  if (server.merges) std::erase(names, "");
  if (server.resolves) Resolve(names);
  return names;
}

/// What a server in front hands to the next one, who sees a query where one seems to begin.
std::string HandedOn(const Names &names) {
  const std::string path = Join(names);
  return path.substr(0, path.find_first_of("?#"));
}

class Spelling {
 public:
  std::string Next() {
    static const Names kPrivate = {"private", "%70rivate", "%2570rivate", "priv%2561te"};
    static const Names kPieces = {
        "/",          "/",     "/",      "/",    "private",  "private", "public",  "a",
        "..",         "..",    ".",      "%2e",  "%2E",      "%2e%2e",  "%252e",   "%2F",
        "%2f",        "%252F", "\\",     "%5C",  "%255c",    "//",      ";",       ";x=y",
        "%3B",        "%253b", "%3F",    "%23",  "%253F",    "%70",     "%2570",   "riv",
        "ate",        "%72",   "rivate", "/../", "/private", "/..;/",   "/public", "/%70ublic",
        "%5Cy\\..\\", "%25",   "70",     "%%32", "%C3%A9",   "%20",     "/./"};
    return "/" + Pieces(kPieces) + kPrivate[Below(kPrivate.size())] + Pieces(kPieces);
  }
  size_t Below(size_t limit) {
    return std::uniform_int_distribution<size_t>(0, limit - 1)(numbers_);
  }

 private:
  std::string Pieces(const Names &pieces) {
    std::string text;
    for (size_t left = Below(6); left > 0; --left) text += pieces[Below(pieces.size())];
    return text;
  }

  std::mt19937 numbers_{20260101};
};

/// Below "/private", and not below "/private/public".
bool IsForFew(const Names &names) {
  return !names.empty() && names[0] == "private" && (names.size() < 2 || names[1] != "public");
}

class GateServerModels : public testing::Test {
 protected:
  GateServerModels() {
    guards_.Add(*Prefix::Parse("/"), "everyone");
    guards_.Add(*Prefix::Parse("/private"), "few");
    guards_.Add(*Prefix::Parse("/private/public"), "everyone");
  }

  const Server &AnyServer() { return servers_[spelling_.Below(servers_.size())]; }

  /// Lets `read` read each of many addresses many times, and compares with the gate.
  /// @param read what becomes of a path.
  void Compare(const std::function<Names(const std::string &path)> &read) {
    int found_private = 0;
    int let_in = 0;
    for (int count = 0; count < kSpellings; ++count) {
      const std::string path = spelling_.Next();
      const auto address = Address::Parse("https://h" + path);
      if (!address) continue;
      const Names &keys = guards_.Find(*address);
      if (keys == Names{"everyone"}) ++let_in;
      for (int reading = 0; reading < kReadings; ++reading) {
        const Names names = read(path);
        if (!IsForFew(names)) continue;
        ++found_private;
        ASSERT_THAT(keys, AnyOf(IsEmpty(), ElementsAre("few"))) << path << " as " << Join(names);
        if (keys.empty()) break;  // closed for all
      }
    }
    EXPECT_GT(found_private, kSpellings / 10);
    EXPECT_GT(let_in, kSpellings / 100);
  }

 private:
  PrefixMap guards_;
  const std::vector<Server> servers_ = AllServers();
  Spelling spelling_;
};

TEST_F(GateServerModels, NoServerFindsAPrivatePageBehindAnotherKey) {
  Compare([this](const std::string &path) { return ReadBy(AnyServer(), path); });
}

TEST_F(GateServerModels, NoRowOfTwoServersFindsAPrivatePageBehindAnotherKey) {
  Compare([this](const std::string &path) {
    return ReadBy(AnyServer(), HandedOn(ReadBy(AnyServer(), path)));
  });
}

}  // namespace
