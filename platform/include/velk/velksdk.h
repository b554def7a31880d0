#ifndef VELK_VELKSDK_H
#define VELK_VELKSDK_H

#include <stddef.h>

#include "velk/export.h"

/// Accounts and groups, as the name service of the machine (files, LDAP, Active Directory …)
/// knows them, and the blocking of addresses that keep failing to log in.
///
/// Account calls may be made from any thread. Names are byte strings; a null or empty name, and
/// one of more than 4096 bytes, is never found.

#ifdef __cplusplus
extern "C" {
#endif

/// An account. Made and owned by this library; freed with VELKUserFree().
typedef struct VELKUSER_tag {
  char *name;        ///< The account's own spelling.
  unsigned int uid;  ///< Its user id.
} VELKUSER;

/// A group. Made and owned by this library; freed with VELKGroupFree().
typedef struct VELKGROUP_tag {
  char *name;        ///< The group's own spelling.
  unsigned int gid;  ///< Its group id.
} VELKGROUP;

typedef struct VLIBCSzHash_tag VLIBCSzHash;  ///< A list of texts.

/// Looks an account up by its exact name.
/// @param user receives the account on success and null otherwise.
/// @return 0 found, -1 not found or the lookup failed.
VELK_PLATFORM_API int VELKUserGet(const char *name, VELKUSER **user);

/// Looks an account up by its user id; as VELKUserGet() otherwise.
VELK_PLATFORM_API int VELKUserGetByUID(unsigned int uid, VELKUSER **user);

/// Frees an account. Accepts null.
VELK_PLATFORM_API void VELKUserFree(VELKUSER *user);

/// Turns a name as a person types it into the login form of an account: blanks around it are
/// taken off, and where the name is no account but its ASCII lower-case form is, that is given.
/// @return the length of what was written to `out`, or 0 when neither form is an account or the
///         form does not fit into `capacity` bytes with its terminator (`out` is then left alone).
VELK_PLATFORM_API int VELKUserLoginNameConvert(const char *name, char *out, size_t capacity);

/// The account's own spelling of `name`.
/// @return the length of what was written to `out`, or -1 when there is no such account or it does
///         not fit (`out` is then left alone).
VELK_PLATFORM_API int VLIBUserRealNameGet(const char *name, char *out, size_t capacity);

/// @param gid receives the group's id on success.
/// @return 0 found, -1 not found or the lookup failed.
VELK_PLATFORM_API int VELKGroupGetGID(const char *name, unsigned int *gid);

/// Looks a group up by its id.
/// @param group receives the group on success and null otherwise.
/// @return 0 found, -1 not found or the lookup failed.
VELK_PLATFORM_API int VELKGroupGetByGID(unsigned int gid, VELKGROUP **group);

/// Frees a group. Accepts null.
VELK_PLATFORM_API void VELKGroupFree(VELKGROUP *group);

/// The names of the groups that an account belongs to, its primary group included.
/// @param user the account's name.
/// @param arg1, arg2 always 1 and 0.
/// @return a list to be freed with VLIBCSzHashFree(), or null: no such account, lookup failed.
VELK_PLATFORM_API VLIBCSzHash *VLIBGroupInfoHashGet(const char *user, int arg1, int arg2);

/// One text of a list.
/// @param index counts from 0.
/// @param end receives 1 when `index` lies past the last text, else 0. May be null.
/// @return text owned by the list; null past the end, and for a group id that has no name.
VELK_PLATFORM_API const char *VLIBCSzHashName(const VLIBCSzHash *list, size_t index, int *end);

/// Frees a list. Accepts null.
VELK_PLATFORM_API void VLIBCSzHashFree(VLIBCSzHash *list);

/// The one spelling of an address that the platform uses for visitors: printed by the C library, an
/// IPv4 address written as IPv6 as IPv4, a zone id dropped.
/// @param out receives it; 46 bytes suffice.
/// @return 0, or -1 with `out` left alone: not an address, or no room.
VELK_PLATFORM_API int VELKAddressNormalize(const char *ip, char *out, size_t capacity);

/// What the calls below count an address as, and VELKAutoBlockList() prints: an IPv4 address, or
/// the network of an IPv6 address ("2001:db8:1:2::/64"), which stands for itself.
/// @param out receives it; 49 bytes suffice.
/// @return 0, or -1 with `out` left alone: neither, or no room.
VELK_PLATFORM_API int VELKAutoBlockAddress(const char *ip, char *out, size_t capacity);

/// Counts one failed login from an address, and blocks the address when the count reaches the
/// limit of VELK_ROOT/etc/autoblock.conf (10 failures within 300 seconds block for 86400).
///
/// Addresses are kept in VELK_ROOT/etc/private/autoblock.db, at most 100,000 of them: beyond, the
/// oldest that are not blocked are forgotten first. IPv4 addresses written as IPv6 count as IPv4,
/// other IPv6 addresses count by their /64 ("2001:db8:1:2::/64" names it here, too), zone ids are
/// ignored. Processes may call at the same moment; no failure is lost. While an address is blocked
/// its count stands still; after the block it starts again. A new block writes one log line with
/// address and category.
/// @param category what the visitor failed at, for the log: 1 to 64 letters, digits, '-', '_' and
///        '.'; anything else, and null, is logged as "unknown".
/// @return 0 counted, -1 not an address, or the file is unusable (logged).
VELK_PLATFORM_API int AutoBlockFailLoginSet(const char *ip, const char *category);

/// Forgets the failures and the block of an address.
/// @return 0 (also when there was nothing to forget), -1 as AutoBlockFailLoginSet().
VELK_PLATFORM_API int VELKAutoBlockResetByIP(const char *ip);

/// Whether an address is blocked now.
/// @return 1 blocked, 0 not blocked, -1 not an address or the file is unusable (logged). Only 1
///         may keep a visitor out: a broken file must not lock everybody out.
VELK_PLATFORM_API int VELKAutoBlockIsDenied(const char *ip);

/// Blocks an address by hand, in place of a block that it has. Writes the same log line.
/// @param seconds how long from now; 0 = for ever.
/// @return 0, or -1 as AutoBlockFailLoginSet() and for a negative number of seconds.
VELK_PLATFORM_API int VELKAutoBlockAdd(const char *ip, const char *category, long seconds);

/// One address that has failed or is blocked, as VELKAutoBlockList() reports it. The texts are
/// valid during the call only. Times are seconds since the Unix epoch.
typedef struct VELKAutoBlockRecord_tag {
  const char *address;   ///< Printed by the C library; an IPv6 network as "2001:db8:1:2::/64".
  const char *category;  ///< Of the last failure.
  int attempts;          ///< Failures in the current window.
  long last_failure;     ///< When the last failure was counted; of a hand-made block, its start.
  int blocked;           ///< 1 when blocked now.
  long blocked_until;    ///< End of the block; 0 = for ever. Meaningful only when blocked.
} VELKAutoBlockRecord;

/// Hands every remembered address to `visit`, blocked ones first, then by last failure, newest
/// first, until it returns something other than 0. `visit` may call the functions above.
/// @return 0, or -1 when the file is unusable (logged) or `visit` is null. A missing file is an
///         empty one.
VELK_PLATFORM_API int VELKAutoBlockList(int (*visit)(const VELKAutoBlockRecord *record, void *data),
                                        void *data);

#ifdef __cplusplus
}
#endif

#endif
