#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>

#include "common/no_throw.h"
#include "common/text.h"
#include "name_service.h"
#include "velk/velksdk.h"

namespace {

using velk::Account;
using velk::CopyText;
using velk::FindAccount;
using velk::NoThrow;
using velk::Trim;

constexpr std::string_view kBlanks = " \t\r\n\v\f";

/// The caller's own record of an account; null when memory is short.
VELKUSER *MakeUser(const Account &account) {
  auto *user = static_cast<VELKUSER *>(calloc(1, sizeof(VELKUSER)));
  if (user == nullptr) return nullptr;
  user->uid = account.uid;
  user->name = strdup(account.name.c_str());
  if (user->name == nullptr) {
    free(user);
    return nullptr;
  }
  return user;
}

template <typename Key>
int GiveUser(Key key, VELKUSER **user) {
  if (user == nullptr) return -1;
  *user = nullptr;
  return NoThrow(-1, [&] {
    const auto account = FindAccount(key);
    if (account) *user = MakeUser(*account);
    return *user != nullptr ? 0 : -1;
  });
}

std::string LowerCase(std::string text) {
  for (char &letter : text) {
    if (letter >= 'A' && letter <= 'Z') letter += 'a' - 'A';
  }
  return text;
}

/// Copies `text` with its terminator.
/// @return its length, or `no_room`.
int Give(const std::string &text, char *out, size_t capacity, int no_room) {
  return CopyText(text, out, capacity) ? static_cast<int>(text.size()) : no_room;
}

}  // namespace

int VELKUserGet(const char *name, VELKUSER **user) {
  return GiveUser(name, user);
}

int VELKUserGetByUID(unsigned int uid, VELKUSER **user) {
  return GiveUser(static_cast<uid_t>(uid), user);
}

void VELKUserFree(VELKUSER *user) {
  if (user == nullptr) return;
  free(user->name);
  free(user);
}

int VELKUserLoginNameConvert(const char *name, char *out, size_t capacity) {
  if (name == nullptr) return 0;
  return NoThrow(0, [&] {
    const std::string typed(Trim(name, kBlanks));
    if (FindAccount(typed.c_str())) return Give(typed, out, capacity, 0);
    const std::string lower = LowerCase(typed);
    if (FindAccount(lower.c_str())) return Give(lower, out, capacity, 0);
    return 0;
  });
}

int VLIBUserRealNameGet(const char *name, char *out, size_t capacity) {
  return NoThrow(-1, [&] {
    const auto account = FindAccount(name);
    return account ? Give(account->name, out, capacity, -1) : -1;
  });
}
