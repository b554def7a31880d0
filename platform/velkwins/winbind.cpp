#include "winbind.h"

#include <dlfcn.h>
#include <stdint.h>
#include <sys/types.h>
#include <time.h>
#include <wbclient.h>

#include <memory>
#include <mutex>

namespace velkwins {
namespace {

/// A name goes to winbind in a field of 256 bytes, which would cut a longer one off, perhaps to
/// the name of another domain.
constexpr size_t kLongestRealm = 255;

/// The calls of libwbclient; null where the machine does not have it.
struct Winbind {
  decltype(&wbcDomainInfo) domain_info = nullptr;
  decltype(&wbcFreeMemory) free_memory = nullptr;
};

Winbind Load() {
  Winbind winbind;
  void *const library = dlopen("libwbclient.so.0", RTLD_NOW | RTLD_LOCAL);
  if (library == nullptr) return winbind;
  winbind.free_memory =
      reinterpret_cast<decltype(winbind.free_memory)>(dlsym(library, "wbcFreeMemory"));
  if (winbind.free_memory == nullptr) return winbind;
  winbind.domain_info =
      reinterpret_cast<decltype(winbind.domain_info)>(dlsym(library, "wbcDomainInfo"));
  return winbind;
}

}  // namespace

std::string ShortDomainName(const std::string &realm) {
  static const Winbind winbind = Load();
  if (winbind.domain_info == nullptr || realm.size() > kLongestRealm) return "";

  // One connection serves the whole process, and not every version of the library locks it.
  static std::mutex one_at_a_time;
  const std::lock_guard guard(one_at_a_time);
  struct wbcDomainInfo *found = nullptr;
  if (winbind.domain_info(realm.c_str(), &found) != WBC_ERR_SUCCESS || found == nullptr) return "";
  const std::unique_ptr<struct wbcDomainInfo, decltype(winbind.free_memory)> domain(
      found, winbind.free_memory);
  return domain->short_name == nullptr ? "" : domain->short_name;
}

}  // namespace velkwins
