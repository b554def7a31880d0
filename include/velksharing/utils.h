#ifndef VELKSHARING_UTILS_H
#define VELKSHARING_UTILS_H

#include <json/value.h>

#include <set>
#include <string>
#include <vector>

#include "velksharing/export.h"

/// Text forms of values, password digests, chance, splitting of texts, the translation between
/// names and ids of accounts and groups, and the platform's two programs: a link's public URL, and
/// a call of the web API. Free functions; every one may be called from any thread.
///
///     std::string digest;
///     bool done = Sha1WithSaltHashPassword("open sesame", "x7Gq2L", digest);
///     unsigned int uid;
///     if (UserToUID(" Ann ", uid) && IsProbabilityHit(0.01f)) purge();
///
///     std::string url;
///     _tag_SHARING_URL_TYPE type;
///     if (GetSharingURL(link.get_hash(), 0, true, "", url, type)) show(url);

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

/// What kind of URL the platform gives: the number that its program prints. The library passes it
/// on as it is and names no values.
enum _tag_SHARING_URL_TYPE : int {};

/// Asks the platform's program `VELK_ROOT/bin/velksharingurl` for the public URL of a link.
///
/// The program gets the five arguments, empty ones included, and answers with two lines: the URL,
/// and its kind. It runs without a shell, with the ids and the environment of the caller, and is
/// done when this returns: a program that does not end keeps the caller. Its exit status does not
/// count. What it leaves running in the background is not waited for, unless that holds the output
/// and the two lines are not complete.
///
/// @param arg_text the link's hash, `arg_number` a port, `arg_flag` whether the URL is an HTTPS
///        one, `arg_text2` a host, `arg_text3` a path: what they mean, 0 and empty ones too, is
///        up to the program.
/// @param url receives the first line up to a zero byte, without its last character, which is
///        taken for the newline: so a line that ends without one loses a character. A line is cut
///        after 4095 bytes, which leaves 4094 for the URL; its rest is then read as the kind.
///        Assigned as soon as the first line is there, even when the second does not come; left
///        alone otherwise.
/// @param type receives the number at the start of the second line, of which only three characters
///        are read: -99 to 999; 0 when there is none. Left alone on failure.
/// @return false, with a line in the log, when the program cannot be started (a text too long for
///         an argument, 128 KiB, is a reason), when a text holds a zero byte, which no argument
///         can, and for fewer than two lines.
VELK_EXPORT bool GetSharingURL(const std::string &arg_text, int arg_number, bool arg_flag,
                               const std::string &arg_text2, const std::string &arg_text3,
                               std::string &url, _tag_SHARING_URL_TYPE &type);

/// As above, with an empty `arg_text2`: the host is left to the platform.
VELK_EXPORT bool GetSharingURL(const std::string &arg_text, int arg_number, bool arg_flag,
                               const std::string &arg_text3, std::string &url,
                               _tag_SHARING_URL_TYPE &type);

/// Sends one request to the system's web API, through the platform's program
/// `VELK_ROOT/bin/velkwebapi`, and reads the JSON document that it prints.
///
///     Json::Value params;
///     params["limit"] = 50;
///     Json::Value answer;
///     if (SendWebapi(answer, "VELK.Sharing.Link", 1, "list", params) &&
///         answer["success"].asBool())
///       show(answer["data"]);
///
/// The program runs without a shell, with the ids and the environment of the caller, and is done
/// when this returns. Its output is read to the end, whatever its size, and kept in memory while
/// it is parsed. The end comes when everybody who holds the output has closed it: a process that
/// the program leaves in the background with this output keeps the caller waiting.
///
/// @param out receives the answer. Set to an empty object first; after a reply that is no JSON it
///        holds what could be read. Must be another object than `params`, which would be emptied.
/// @param params an object (or null, for none) of texts, numbers, booleans and nulls. Each member
///        becomes one argument NAME=VALUE, in ascending order of the names. Other accounts of the
///        machine can see the arguments of a running program: put no secret there.
/// @return false, with a line in the log, when the program cannot be started (a member too long
///         for an argument, 128 KiB, is a reason), when a text holds a zero byte, which no argument
///         can, and when the output is no JSON or is nested too deep. True for every JSON, one that
///         reports an error too; the exit status does not count.
/// @throws Json::LogicError for `params` of another kind, and for a member that is an array or an
///         object; no program has been started then.
VELK_EXPORT bool SendWebapi(Json::Value &out, const std::string &api, int version,
                            const std::string &method, const Json::Value &params);

}  // namespace sharing
}  // namespace VELK

#endif
