#ifndef OPERATIONS_JSON_FORM_H
#define OPERATIONS_JSON_FORM_H

#include <json/value.h>

#include <optional>
#include <string>

#include "operations/blocks.h"
#include "operations/link_url.h"
#include "operations/links.h"
#include "operations/maintenance.h"
#include "operations/sessions.h"
#include "operations/verdict.h"

/// The JSON forms of what the operations give, for machines. Times are whole seconds since the
/// Unix epoch, 0 when not set. Nothing secret is in them: no digest, no salt, and of a session's
/// identifier only the beginning.

namespace operations {

Json::Value ToJson(const Entry &link);
Json::Value ToJson(const LinkList &list, const Page &page);
/// A link that is gone with so many grants.
Json::Value DeletedLinkToJson(const std::string &hash, int grants);
Json::Value ToJson(const LinkUrl &link);
Json::Value ToJson(const Verdict &verdict);
Json::Value ToJson(const SessionList &list, const Page &page);
Json::Value ToJson(const GrantList &list, const Page &page);
Json::Value ToJson(const std::vector<Block> &blocks);
Json::Value ToJson(const Removal &removal);
Json::Value ToJson(const DatabaseStatus &status);
Json::Value ToJson(const CheckReport &report);

/// "none", "password" or "user"; "none", "url_param" or "always".
const char *ProtectTypeName(Entry::ProtectType type);
const char *RedirectTypeName(Entry::RedirectType type);

/// The kind of a name; nothing for other texts.
std::optional<Entry::RedirectType> RedirectTypeFromName(const std::string &name);

/// The first four characters of a session's identifier and an ellipsis: enough to recognise it.
std::string ShortIdentifier(const Session &session);

}  // namespace operations

#endif
