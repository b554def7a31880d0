#ifndef VELKSHARING_CONSTANTS_H
#define VELKSHARING_CONSTANTS_H

#include "velksharing/export.h"

/// Names and numbers that the library, its callers and the database share: columns of the tables,
/// keys of the JSON forms, texts of enumerations, lengths and paths.
///
/// Two constants may have equal texts ("none", "password"); use the one of your enumeration.

namespace VELK {
namespace sharing {

/// The user id that means no account.
constexpr unsigned int UID_ERR = 0xFFFFFFFFu;

// Columns and JSON keys of a link
/// "id": row id column of every table.
extern VELK_EXPORT const char *const SZK_ID_;
/// "hash": a link's public random key.
extern VELK_EXPORT const char *const SZK_HASH;
/// "project_name": the application that owns a link.
extern VELK_EXPORT const char *const SZK_PROJECT_NAME;
/// "enabled": link switched on.
extern VELK_EXPORT const char *const SZK_ENABLED_;
/// "owner_uid": user id of a link's owner.
extern VELK_EXPORT const char *const SZK_OWNER_UID;
/// "owner_user": the owner's account name (JSON form only).
extern VELK_EXPORT const char *const SZK_OWNER_USER;
/// "start_at": usable from this moment.
extern VELK_EXPORT const char *const SZK_START_AT;
/// "expire_at": unusable after this moment.
extern VELK_EXPORT const char *const SZK_EXPIRE_AT;
/// "expire_times": number of uses allowed.
extern VELK_EXPORT const char *const SZK_EXPIRE_TIMES;
/// "use_count": uses so far.
extern VELK_EXPORT const char *const SZK_USE_COUNT;
/// "auto_gc": may be purged automatically once expired.
extern VELK_EXPORT const char *const SZK_AUTO_GC;
/// "data": column that holds a link's other fields as JSON.
extern VELK_EXPORT const char *const SZK_DATA;
/// "enable_match_ip": a visitor is bound to the address of the login.
extern VELK_EXPORT const char *const SZK_ENABLE_MATCH_IP;

// Protection of a link
/// "protect_title": title shown with the prompt.
extern VELK_EXPORT const char *const SZK_PROTECT_TITLE;
/// "protect_type": kind of protection, one of the next three.
extern VELK_EXPORT const char *const SZK_PROTECT_TYPE;
/// "none": open link.
extern VELK_EXPORT const char *const SZK_PROTECT_PROTECT_NONE;
/// "password": link password.
extern VELK_EXPORT const char *const SZK_PROTECT_PROTECT_PASSWORD;
/// "user": permitted accounts and groups.
extern VELK_EXPORT const char *const SZK_PROTECT_PROTECT_USER;
/// "protect_password": digest of the link password.
extern VELK_EXPORT const char *const SZK_PROTECT_PASSWORD;
/// "protect_password_algo": digest algorithm, one of the next two.
extern VELK_EXPORT const char *const SZK_PROTECT_PASSWORD_ALGO;
/// "default": salted SHA-1.
extern VELK_EXPORT const char *const SZK_PROTECT_PASSWORD_ALGO_DEFAULT;
/// "md5": unsalted MD5.
extern VELK_EXPORT const char *const SZK_PROTECT_PASSWORD_ALGO_MD5;
/// "protect_password_salt": salt of the digest.
extern VELK_EXPORT const char *const SZK_PROTECT_PASSWORD_SALT;
/// "protect_uids": permitted user ids.
extern VELK_EXPORT const char *const SZK_PROTECT_UIDS;
/// "protect_extra_users": permitted names without an id.
extern VELK_EXPORT const char *const SZK_PROTECT_EXTRA_USERS;
/// "protect_gids": permitted group ids.
extern VELK_EXPORT const char *const SZK_PROTECT_GIDS;
/// "protect_extra_groups": permitted group names without an id.
extern VELK_EXPORT const char *const SZK_PROTECT_EXTRA_GROUPS;
/// "protect_users": permitted account names (JSON form only).
extern VELK_EXPORT const char *const SZK_PROTECT_USERS;
/// "protect_groups": permitted group names (JSON form only).
extern VELK_EXPORT const char *const SZK_PROTECT_GROUPS;

// Redirection and the application's own data
/// "redirect_type": kind of redirect, one of the next three.
extern VELK_EXPORT const char *const SZK_REDIRECT_TYPE;
/// "none": no redirect.
extern VELK_EXPORT const char *const SZK_REDIRECT_REDIRECT_NONE;
/// "url_param": target passed on as URL parameter.
extern VELK_EXPORT const char *const SZK_REDIRECT_REDIRECT_URLPARAM;
/// "always": always redirect.
extern VELK_EXPORT const char *const SZK_REDIRECT_REDIRECT_ALWAYS;
/// "redirect_uri": redirect target.
extern VELK_EXPORT const char *const SZK_REDIRECT_URI;
/// "app": the application's JSON document.
extern VELK_EXPORT const char *const SZK_APP;
/// "private_data": the application's private JSON document.
extern VELK_EXPORT const char *const SZK_PRIVATE_DATA;

// Sessions and grants
/// "session_id": a session's random identifier; in a grant, the session's row id.
extern VELK_EXPORT const char *const SZK_SESSION_ID_;
/// "uid": account of a session.
extern VELK_EXPORT const char *const SZK_UID_;
/// "ip": address of a session.
extern VELK_EXPORT const char *const SZK_IP_;
/// "timeout": moment at which a session or grant lapses.
extern VELK_EXPORT const char *const SZK_TIMEOUT;
/// "entry_id": row id of the link of a grant.
extern VELK_EXPORT const char *const SZK_ENTRY_ID;

// Request parameters and page data of front ends; the library itself reads none of these
/// "sharing_id": link that a request is about.
extern VELK_EXPORT const char *const SZK_SHARING_ID;
/// "sharing_sid": session identifier, also as cookie name.
extern VELK_EXPORT const char *const SZK_SHARING_SID;
/// "password": link password typed by a visitor.
extern VELK_EXPORT const char *const SZK_PASSWORD_;
/// "zed_username": account name typed by a visitor.
extern VELK_EXPORT const char *const SZK_ZED_USERNAME;
/// "zed_password": account password typed by a visitor.
extern VELK_EXPORT const char *const SZK_ZED_PASSWORD;
/// "plugins": page plug-ins.
extern VELK_EXPORT const char *const SZK_PLUGINS;
/// "jsconfig": page configuration.
extern VELK_EXPORT const char *const SZK_JSCONFIG;
/// "assistant": page assistant.
extern VELK_EXPORT const char *const SZK_ASSISTANT;
/// "external_ip": the server's address as visitors see it.
extern VELK_EXPORT const char *const SZK_EXTERNAL_IP_;
/// "action": what a request asks for.
extern VELK_EXPORT const char *const SZK_ACTION;

/// Characters of a generated link hash, before it grows on collisions.
extern VELK_EXPORT const int SHARING_HASH_LENGTH;
/// Characters of a generated session identifier.
extern VELK_EXPORT const int SHARING_SESSION_LENGTH;
/// Random keys drawn after the first before a creation gives up.
extern VELK_EXPORT const int SHARING_MAX_RETRY_TIMES;
/// Characters of a generated password salt.
extern VELK_EXPORT const int SHARING_PASS_HASH_LENGTH;

/// The sharing database's file.
extern VELK_EXPORT const char *const SZF_SHARING_DB_PATH;

}  // namespace sharing
}  // namespace VELK

/// The CGI variable of the request header that may carry a session identifier.
extern VELK_EXPORT const char *const SZ_X_SHARING_HEADER;

#endif
