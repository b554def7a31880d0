#ifndef VELKSHARING_UTILS_H
#define VELKSHARING_UTILS_H

#include <set>
#include <string>
#include <vector>

#include "velksharing/export.h"

/// Text forms of values, password digests, chance, splitting of texts, and the translation
/// between names and ids of accounts and groups. Free functions; every one may be called from any
/// thread.
///
///     std::string digest;
///     bool done = Sha1WithSaltHashPassword("open sesame", "x7Gq2L", digest);
///     unsigned int uid;
///     if (UserToUID(" Ann ", uid) && IsProbabilityHit(0.01f)) purge();

struct VELKUSER_tag;
typedef struct VELKUSER_tag VELKUSER;  ///< The platform's account record (velk/velksdk.h).

namespace VELK {
namespace sharing {

/// The bare text of a value, as it goes into a statement: numbers in signed decimal, true and
/// false as "1" and "0", a string as it is. Nothing is quoted or escaped.
template <typename T>
std::string ToString(T &value);

extern template VELK_EXPORT std::string ToString<std::string>(std::string &value);
extern template VELK_EXPORT std::string ToString<bool>(bool &value);
extern template VELK_EXPORT std::string ToString<const bool>(const bool &value);
extern template VELK_EXPORT std::string ToString<int>(int &value);
extern template VELK_EXPORT std::string ToString<const int>(const int &value);
extern template VELK_EXPORT std::string ToString<const long>(const long &value);

/// SHA-1 over `password` followed directly by `salt`.
/// @param out receives 40 lowercase hexadecimal characters; left alone on failure.
/// @return false when memory runs out. An empty password is hashed like any other.
VELK_EXPORT bool Sha1WithSaltHashPassword(const std::string &password, const std::string &salt,
                                          std::string &out);

/// MD5 over `password`, for digests taken over from elsewhere.
/// @param out receives 32 lowercase hexadecimal characters; left alone on failure.
/// @return false for an empty password or when the digest is not to be had.
VELK_EXPORT bool MD5HashPassword(const std::string &password, std::string &out);

/// Draws a chance, for work that is done on some calls only.
/// @param probability 0 (never) to 1 (always); cut down to whole percents.
/// @return true with that probability; false when there is no randomness to be had.
VELK_EXPORT bool IsProbabilityHit(float probability);

/// Splits `text` at every occurrence of the whole `delimiter` and drops empty pieces. Pieces are
/// not trimmed.
/// @return false, with `out` left alone, for a null or empty delimiter.
VELK_EXPORT bool StringExplode(std::vector<std::string> &out, const std::string &text,
                               const char *delimiter);

/// The account's own spelling of a name that a person typed. Names are cut at 492 bytes.
/// @return the typed name itself when no account is known for it; "" for null and for a
///         domain\account that cannot be found.
VELK_EXPORT std::string GetRealUsername(const char *name);

/// Looks an account up by a typed name.
/// @param user receives the account on success, to be freed with VELKUserFree().
/// @return false, with a line in the log, when there is no such account.
VELK_EXPORT bool UserGet(const char *name, VELKUSER *&user);

/// @param uid receives the user id of a typed account name; left alone when it is unknown.
/// @return whether the account exists.
VELK_EXPORT bool UserToUID(const std::string &name, unsigned int &uid);

/// @param name receives the account name of a user id; left alone when it is unknown.
/// @return whether the account exists.
VELK_EXPORT bool UIDToUser(const unsigned int &uid, std::string &name);

/// @param gid receives the id of a group name; left alone when it is unknown.
/// @return whether the group exists.
VELK_EXPORT bool GroupToGID(const std::string &name, unsigned int &gid);

/// @param name receives the name of a group id; left alone when it is unknown.
/// @return whether the group exists.
VELK_EXPORT bool GIDToGroup(const unsigned int &gid, std::string &name);

/// Adds the ids of all groups that `user` belongs to, the primary one included, to `gids`; groups
/// without an id are skipped.
/// @return false for null and when the account's groups are not to be had.
VELK_EXPORT bool UserGroupsGet(VELKUSER *user, std::set<unsigned int> &gids);

}  // namespace sharing
}  // namespace VELK

#endif
