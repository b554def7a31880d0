#include "site/link.h"

#include <syslog.h>
#include <velksharing/database.h>

#include <algorithm>
#include <utility>

#include "site/redirect_target.h"

namespace web {
namespace {

using VELK::sharing::db::Result;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;

/// The address that the link's owner stored, where it is one that browsers can be sent to.
std::string StoredTarget(const Entry &entry) {
  std::string target = entry.get_redirect_uri();
  if (IsWebAddress(target)) return target;
  syslog(LOG_WARNING, "link %d: its redirect target is no http or https address; ignored",
         entry.get_id());
  return "";
}

void ReadRedirect(Link &link) {
  switch (link.entry->get_redirect_type()) {
    case Entry::REDIRECT_NONE:
      break;
    case Entry::REDIRECT_URLPARAM:
      link.continue_to = StoredTarget(*link.entry);
      break;
    case Entry::REDIRECT_ALWAYS:
      link.target = StoredTarget(*link.entry);
      break;
  }
}

/// "" for a link that names no path.
std::string SharedPath(const Entry &entry) {
  const Json::Value path = entry.get_app()["path"];
  return path.isString() ? path.asString() : "";
}

/// Opens what the link shares, where there is anything.
bool OpenTree(Link &link, const std::vector<std::string> &parts) {
  const std::string path = SharedPath(*link.entry);
  if (path.empty() || path.find('\0') != std::string::npos) return false;
  link.tree = share::SharedTree::Open(path, link.entry->get_owner_uid(), parts, link.item);
  return link.tree.has_value();
}

}  // namespace

bool Link::IsOpen() const {
  return entry->get_protect_type() == Entry::PROTECT_NONE;
}

bool Link::CanDownload() const {
  const Json::Value hidden = entry->get_app()["hide_download"];
  return !(hidden.isBool() && hidden.asBool());
}

std::optional<Link> OpenLink(EntryPointer entry, const std::vector<std::string> &parts,
                             std::vector<gate::Prefix> prefixes) {
  Link link;
  link.entry = std::move(entry);
  link.prefixes = std::move(prefixes);
  ReadRedirect(link);
  const bool has_tree = link.target.empty() && OpenTree(link, parts);
  if (!has_tree && link.target.empty() && link.prefixes.empty()) return std::nullopt;
  return link;
}

bool AdmitsVisitors(const Entry &link) {
  if (!link.IsValid()) return false;
  const int limit = link.get_expire_times();
  return limit <= 0 || link.get_use_count() < limit;
}

std::string ShortenedHash(const std::string &hash) {
  return hash.empty() ? "" : hash.substr(0, std::min<size_t>(3, hash.size() / 2)) + "…";
}

bool DatabaseAnswers() {
  SharingDB &db = SharingDB::Instance();
  Result result;
  return db.IsGood() && db.Execute("SELECT 1 FROM entry LIMIT 1", result);
}

}  // namespace web
