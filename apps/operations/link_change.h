#ifndef OPERATIONS_LINK_CHANGE_H
#define OPERATIONS_LINK_CHANGE_H

#include <json/value.h>

#include <optional>
#include <string>
#include <vector>

#include "operations/secret.h"
#include "velksharing/record.h"

namespace operations {

/// What an administrator wants of a link: only the members that are set are changed. Times are
/// seconds since the Unix epoch; 0 takes a limit away.
///
/// At most one of `open`, `password`, and `users` with `groups` may be asked for. Taking up one
/// kind of protection forgets what the others had.
struct LinkChange {
  std::optional<std::string> project;
  std::optional<unsigned int> owner_uid;
  std::optional<bool> enabled;

  bool open = false;                               ///< No protection any more.
  std::optional<Secret> password;                  ///< Not empty, without a zero byte.
  std::optional<std::vector<std::string>> users;   ///< Permitted accounts; replaces the list.
  std::optional<std::vector<std::string>> groups;  ///< Permitted groups; replaces the list.
  bool allow_unknown = false;  ///< Take names that this machine does not know; they never count.
  std::optional<std::string> title;

  std::optional<long> start_at;
  std::optional<long> expire_at;
  std::optional<int> expire_times;  ///< 0: any number of uses.
  std::optional<bool> match_ip;
  std::optional<bool> auto_remove;

  std::optional<VELK::sharing::record::Entry::RedirectType> redirect_type;
  std::optional<std::string> redirect_uri;
  std::optional<Json::Value> app;  ///< An object.
  /// Addresses of other applications that the link guards, as `protects` of `app`; replaces the
  /// list, and what else is in `app` stays.
  std::optional<std::vector<std::string>> protects;
  std::optional<Json::Value> private_data;  ///< An object.
};

/// Refuses permitted names that this machine does not know, unless they are allowed.
/// @throws Failure NOT_FOUND, naming them.
void CheckNames(const LinkChange &change);

/// Puts the change into the record; storing it is the caller's.
/// @throws Failure INVALID when the link would make no sense: two kinds of protection, nobody
///         permitted, an end before the start, a redirect without a target, a guarded address that
///         is none. The record is then partly changed.
void Apply(const LinkChange &change, VELK::sharing::record::Entry &link);

}  // namespace operations

#endif
