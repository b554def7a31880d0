#include "operations/json_form.h"

#include "operations/accounts.h"
#include "operations/moment.h"
#include "operations/permissions.h"
#include "operations/secret.h"
#include "velksharing/constants.h"

namespace operations {
namespace {

using namespace VELK::sharing;
using operations::ToJson;  // beside the forms of this file

template <typename T>
Json::Value List(const std::vector<T> &items) {
  Json::Value list(Json::arrayValue);
  for (const T &item : items) list.append(item);
  return list;
}

Json::Int64 Seconds(long moment) {
  return moment > 0 ? moment : 0;
}

Json::Value PageJson(int total, const Page &page) {
  Json::Value json(Json::objectValue);
  json["total"] = total;
  json["offset"] = page.offset;
  json["limit"] = page.limit;
  return json;
}

Json::Value ToJson(const Session &session) {
  Json::Value json(Json::objectValue);
  json[SZK_ID_] = session.get_id();
  json["session"] = ShortIdentifier(session);
  json["account"] = AccountText(session.get_uid());
  json[SZK_IP_] = session.get_ip();
  json[SZK_TIMEOUT] = Seconds(session.get_timeout());
  return json;
}

Json::Value ToJson(const Grant &grant) {
  Json::Value json(Json::objectValue);
  json[SZK_ID_] = grant.token.get_id();
  json[SZK_HASH] = grant.hash;
  json[SZK_ENTRY_ID] = grant.token.get_entry_id();
  json[SZK_SESSION_ID_] = grant.token.get_session_id();
  json[SZK_TIMEOUT] = Seconds(grant.token.get_timeout());
  return json;
}

Json::Value ToJson(const Block &block) {
  Json::Value json(Json::objectValue);
  json["address"] = block.address;
  json["category"] = block.category;
  json["attempts"] = block.attempts;
  json["last_failure"] = Seconds(block.last_failure);
  json["blocked"] = block.blocked;
  json["blocked_until"] = block.blocked ? Seconds(block.blocked_until) : 0;
  return json;
}

void AddProtection(const Entry &link, Json::Value &json) {
  const Permissions permissions = StoredPermissions(link);
  json[SZK_PROTECT_TYPE] = ProtectTypeName(link.get_protect_type());
  json[SZK_PROTECT_TITLE] = link.get_protect_title();
  json[SZK_PROTECT_USERS] = List(link.get_protect_users());
  json[SZK_PROTECT_GROUPS] = List(link.get_protect_groups());
  json[SZK_PROTECT_UIDS] = List(permissions.uids);
  json[SZK_PROTECT_GIDS] = List(permissions.gids);
  json[SZK_PROTECT_EXTRA_USERS] = List(permissions.unknown_users);
  json[SZK_PROTECT_EXTRA_GROUPS] = List(permissions.unknown_groups);
}

template <typename Record>
Json::Value ToArray(const std::vector<Record> &records) {
  Json::Value array(Json::arrayValue);
  for (const Record &record : records) array.append(ToJson(record));
  return array;
}

}  // namespace

Json::Value ToJson(const Entry &link) {
  Json::Value json(Json::objectValue);
  json[SZK_ID_] = link.get_id();
  json[SZK_HASH] = link.get_hash();
  json["state"] = LinkStateName(StateOf(link, Now()));
  json[SZK_PROJECT_NAME] = link.get_project_name();
  json[SZK_OWNER_UID] = link.get_owner_uid();
  json[SZK_OWNER_USER] = link.get_owner_user();
  json[SZK_ENABLED_] = link.get_enabled();
  json[SZK_START_AT] = Seconds(link.get_start_at());
  json[SZK_EXPIRE_AT] = Seconds(link.get_expire_at());
  json[SZK_EXPIRE_TIMES] = link.get_expire_times();
  json[SZK_USE_COUNT] = link.get_use_count();
  json[SZK_AUTO_GC] = link.get_auto_gc();
  json[SZK_ENABLE_MATCH_IP] = link.get_enable_match_ip();
  AddProtection(link, json);
  json[SZK_REDIRECT_TYPE] = RedirectTypeName(link.get_redirect_type());
  json[SZK_REDIRECT_URI] = link.get_redirect_uri();
  json[SZK_APP] = link.get_app();
  json[SZK_PRIVATE_DATA] = link.get_private_data();
  return json;
}

Json::Value ToJson(const LinkList &list, const Page &page) {
  Json::Value json = PageJson(list.total, page);
  json["damaged"] = list.damaged;
  json["links"] = ToArray(list.links);
  return json;
}

Json::Value DeletedLinkToJson(const std::string &hash, int grants) {
  Json::Value json(Json::objectValue);
  json[SZK_HASH] = hash;
  json["tokens"] = grants;
  return json;
}

Json::Value ToJson(const LinkUrl &link) {
  Json::Value json(Json::objectValue);
  json[SZK_HASH] = link.hash;
  json["url"] = link.url;
  json["type"] = link.type;
  return json;
}

Json::Value ToJson(const Verdict &verdict) {
  Json::Value json(Json::objectValue);
  json["let_in"] = verdict.let_in;
  json["reason"] = verdict.reason;
  json["sentence"] = verdict.sentence;
  return json;
}

Json::Value ToJson(const SessionList &list, const Page &page) {
  Json::Value json = PageJson(list.total, page);
  json["lapsed"] = list.lapsed;
  json["sessions"] = ToArray(list.sessions);
  return json;
}

Json::Value ToJson(const GrantList &list, const Page &page) {
  Json::Value json = PageJson(list.total, page);
  json["lapsed"] = list.lapsed;
  json["tokens"] = ToArray(list.grants);
  return json;
}

Json::Value ToJson(const std::vector<Block> &blocks) {
  Json::Value json(Json::objectValue);
  json["blocks"] = ToArray(blocks);
  return json;
}

Json::Value ToJson(const Removal &removal) {
  Json::Value json(Json::objectValue);
  json["before"] = removal.remaining + removal.removed;
  json["removed"] = removal.removed;
  json["after"] = removal.remaining;
  return json;
}

Json::Value ToJson(const DatabaseStatus &status) {
  Json::Value json(Json::objectValue);
  json["path"] = status.path;
  json["version"] = status.version;
  json["journal_mode"] = status.journal_mode;
  json["database_bytes"] = static_cast<Json::Int64>(status.sizes.database);
  json["log_bytes"] = static_cast<Json::Int64>(status.sizes.log);
  json["links"]["total"] = status.links;
  for (std::size_t i = 0; i < kLinkStates.size(); ++i)
    json["links"][LinkStateName(kLinkStates[i])] = status.links_by_state[i];
  json["sessions"]["live"] = status.live_sessions;
  json["sessions"]["lapsed"] = status.lapsed_sessions;
  json["tokens"]["live"] = status.live_grants;
  json["tokens"]["lapsed"] = status.lapsed_grants;
  return json;
}

Json::Value ToJson(const CheckReport &report) {
  Json::Value json(Json::objectValue);
  json["problems"] = List(report.problems);
  json["links"] = report.links;
  Json::Value &damaged = json["damaged_links"] = Json::arrayValue;
  for (const DamagedLink &link : report.damaged_links) {
    Json::Value item(Json::objectValue);
    item[SZK_ID_] = link.id;
    item[SZK_HASH] = link.hash;
    damaged.append(item);
  }
  return json;
}

const char *ProtectTypeName(Entry::ProtectType type) {
  switch (type) {
    case Entry::PROTECT_PASSWORD:
      return SZK_PROTECT_PROTECT_PASSWORD;
    case Entry::PROTECT_USER:
      return SZK_PROTECT_PROTECT_USER;
    case Entry::PROTECT_NONE:
      break;
  }
  return SZK_PROTECT_PROTECT_NONE;
}

const char *RedirectTypeName(Entry::RedirectType type) {
  switch (type) {
    case Entry::REDIRECT_URLPARAM:
      return SZK_REDIRECT_REDIRECT_URLPARAM;
    case Entry::REDIRECT_ALWAYS:
      return SZK_REDIRECT_REDIRECT_ALWAYS;
    case Entry::REDIRECT_NONE:
      break;
  }
  return SZK_REDIRECT_REDIRECT_NONE;
}

std::optional<Entry::RedirectType> RedirectTypeFromName(const std::string &name) {
  for (const Entry::RedirectType type :
       {Entry::REDIRECT_NONE, Entry::REDIRECT_URLPARAM, Entry::REDIRECT_ALWAYS}) {
    if (name == RedirectTypeName(type)) return type;
  }
  return std::nullopt;
}

std::string ShortIdentifier(const Session &session) {
  std::string identifier = session.get_session_id();
  const std::string beginning = identifier.substr(0, 4);
  Wipe(identifier);
  return beginning + "…";
}

}  // namespace operations
