#include "share/owner.h"

#include <grp.h>
#include <pwd.h>

#include <cerrno>
#include <chrono>
#include <map>
#include <mutex>
#include <string>

namespace web::share {
namespace {

constexpr size_t kSmallestBuffer = 1024;
constexpr size_t kLargestBuffer = 1024 * 1024;
constexpr int kUsualGroups = 32;

std::optional<Owner> FindAccount(uid_t uid, std::string &login_name) {
  std::vector<char> buffer(kSmallestBuffer);
  passwd account = {};
  passwd *found = nullptr;
  int error = 0;
  while ((error = getpwuid_r(uid, &account, buffer.data(), buffer.size(), &found)) == ERANGE &&
         buffer.size() < kLargestBuffer) {
    buffer.resize(buffer.size() * 2);
  }
  if (found == nullptr) return std::nullopt;
  login_name = account.pw_name;
  return Owner{account.pw_uid, account.pw_gid, {}};
}

std::vector<gid_t> FindGroups(const std::string &login_name, gid_t gid) {
  int count = kUsualGroups;
  std::vector<gid_t> groups(kUsualGroups);
  // The account may join a group between two calls.
  while (getgrouplist(login_name.c_str(), gid, groups.data(), &count) < 0) {
    groups.resize(static_cast<size_t>(count));
  }
  groups.resize(static_cast<size_t>(count));
  return groups;
}

std::optional<Owner> AskForOwner(uid_t uid) {
  std::string login_name;
  std::optional<Owner> owner = FindAccount(uid, login_name);
  if (!owner) return std::nullopt;
  owner->groups = FindGroups(login_name, owner->gid);
  return owner;
}

/// What the name service said a moment ago. Asking takes longer than all the rest of a request, and
/// a page of pictures asks for the same account a hundred times.
class RecentOwners {
 public:
  std::optional<Owner> Find(uid_t uid) {
    const Clock::time_point now = Clock::now();
    const std::lock_guard guard(mutex_);
    const auto known = owners_.find(uid);
    if (known != owners_.end() && now < known->second.end) return known->second.owner;
    std::optional<Owner> owner = AskForOwner(uid);
    if (owners_.size() >= kMost) owners_.clear();
    owners_.erase(uid);
    if (owner) owners_.emplace(uid, Answer{*owner, now + kLifetime});
    return owner;
  }

 private:
  using Clock = std::chrono::steady_clock;

  struct Answer {
    Owner owner;
    Clock::time_point end;
  };

  static constexpr std::chrono::seconds kLifetime{5};
  static constexpr size_t kMost = 256;

  std::mutex mutex_;
  std::map<uid_t, Answer> owners_;
};

}  // namespace

std::optional<Owner> FindOwner(uid_t uid) {
  static RecentOwners recent;
  return recent.Find(uid);
}

}  // namespace web::share
