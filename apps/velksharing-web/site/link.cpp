#include "site/link.h"

#include <syslog.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

#include <utility>

#include "site/redirect_target.h"

namespace web {
namespace {

using VELK::sharing::db::EntryDB;
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
  switch (link.entry.get_redirect_type()) {
    case Entry::REDIRECT_NONE:
      break;
    case Entry::REDIRECT_URLPARAM:
      link.continue_to = StoredTarget(link.entry);
      break;
    case Entry::REDIRECT_ALWAYS:
      link.target = StoredTarget(link.entry);
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
  const std::string path = SharedPath(link.entry);
  if (path.empty() || path.find('\0') != std::string::npos) return false;
  link.tree = share::SharedTree::Open(path, link.entry.get_owner_uid(), parts, link.item);
  return link.tree.has_value();
}

}  // namespace

bool Link::IsOpen() const {
  return entry.get_protect_type() == Entry::PROTECT_NONE;
}

bool Link::CanDownload() const {
  const Json::Value hidden = entry.get_app()["hide_download"];
  return !(hidden.isBool() && hidden.asBool());
}

std::optional<Link> OpenLink(Entry entry, const std::vector<std::string> &parts) {
  Link link;
  link.entry = std::move(entry);
  ReadRedirect(link);
  if (link.target.empty() && !OpenTree(link, parts)) return std::nullopt;
  return link;
}

std::optional<Link> FindLink(const std::string &hash, const std::vector<std::string> &parts) {
  Entry entry;
  if (!EntryDB(SharingDB::Instance()).GetByHash(hash, entry)) return std::nullopt;
  return OpenLink(std::move(entry), parts);
}

bool AdmitsVisitors(const Link &link) {
  if (!link.entry.IsValid()) return false;
  return !link.HasUseLimit() || link.entry.get_use_count() < link.entry.get_expire_times();
}

bool DatabaseAnswers() {
  SharingDB &db = SharingDB::Instance();
  Result result;
  return db.IsGood() && db.Execute("SELECT 1 FROM entry LIMIT 1", result);
}

}  // namespace web
