#include "operations/links.h"

#include <algorithm>

#include "operations/moment.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"

namespace operations {
namespace {

using namespace VELK::sharing;
using VELK::sharing::db::Condition;
using VELK::sharing::db::EntryDB;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::TokenDB;

void RefuseIllegal(const Entry &link) {
  if (link.IsLegal()) return;
  throw Failure(Failure::REFUSED, "the link is not fit to be stored; the system log tells why");
}

void Filter(const LinkQuery &query, long now, Condition &condition) {
  if (query.project) condition.Where(SZK_PROJECT_NAME, *query.project);
  if (query.owner_uid) condition.Where("owner_uid = " + std::to_string(*query.owner_uid));
  if (query.state) condition.Where(LinkStateExpression(*query.state, now));
}

void OrderAndPage(const LinkQuery &query, Condition &condition) {
  condition.OrderBy(LinkOrderColumn(query.order), query.descending);
  // Equal rows keep their order from page to page.
  if (query.order != BY_ID) condition.OrderBy(SZK_ID_, query.descending);
  condition.Limit(query.page.offset, query.page.limit);
}

Removal PurgeResult(BaseDB &db, bool purged) {
  if (!purged) throw DatabaseFailure(db, "the links could not be purged");
  Removal removal;
  removal.removed = RemovedRows(db);
  if (!EntryDB(db).Count(removal.remaining))
    throw DatabaseFailure(db, "the links could not be counted");
  return removal;
}

}  // namespace

int FindLinkId(BaseDB &db, const std::string &hash) {
  Result result;
  Row row;
  if (!db.Execute("SELECT id FROM entry WHERE hash = '" + db.Escape(hash) + "'", result))
    throw DatabaseFailure(db, "links could not be read");
  if (!result.NextRow(row)) throw Failure(Failure::NOT_FOUND, "there is no link “" + hash + "”");
  return row.GetField(SZK_ID_).AsInt(0);
}

Entry FindLink(BaseDB &db, const std::string &hash) {
  Entry link;
  if (!EntryDB(db).GetById(FindLinkId(db, hash), link))
    throw Failure(Failure::REFUSED, "link “" + hash + "” cannot be loaded: its row is damaged");
  return link;
}

Entry CreateLink(BaseDB &db, const LinkChange &change) {
  CheckNames(change);
  Entry link;
  link.set_app(Json::objectValue);
  Apply(change, link);
  link.set_hash("to be drawn");
  RefuseIllegal(link);
  // The store takes every failed insert for a collision and tries again: wait for others here.
  Transaction transaction(db, Transaction::WRITE);
  if (!EntryDB(db).CreateWithHash(link)) throw DatabaseFailure(db, "the link could not be stored");
  transaction.Commit();
  return link;
}

Entry ChangeLink(BaseDB &db, const std::string &hash, const LinkChange &change) {
  // Name services may be slow: ask them before visitors have to wait for the lock.
  CheckNames(change);
  Transaction transaction(db, Transaction::WRITE);
  Entry link = FindLink(db, hash);
  Apply(change, link);
  RefuseIllegal(link);
  if (!EntryDB(db).Update(link)) throw DatabaseFailure(db, "the link could not be changed");
  transaction.Commit();
  return link;
}

int DeleteLink(BaseDB &db, const std::string &hash) {
  Transaction transaction(db, Transaction::WRITE);
  Entry link;
  link.set_id(FindLinkId(db, hash));
  if (!EntryDB(db).Delete(link) || !TokenDB(db).PurgeByEntry(link))
    throw DatabaseFailure(db, "the link could not be deleted");
  const int grants = RemovedRows(db);
  transaction.Commit();
  return grants;
}

const char *LinkOrderColumn(LinkOrder order) {
  switch (order) {
    case BY_ID:
      return SZK_ID_;
    case BY_HASH:
      return SZK_HASH;
    case BY_PROJECT:
      return SZK_PROJECT_NAME;
    case BY_OWNER:
      return SZK_OWNER_UID;
    case BY_START:
      return SZK_START_AT;
    case BY_EXPIRY:
      return SZK_EXPIRE_AT;
    case BY_USES_ALLOWED:
      return SZK_EXPIRE_TIMES;
    case BY_USE_COUNT:
      return SZK_USE_COUNT;
  }
  return SZK_ID_;
}

LinkList ListLinks(BaseDB &db, const LinkQuery &query) {
  const long now = Now();
  const Transaction snapshot(db, Transaction::SNAPSHOT);
  const EntryDB links(db);
  LinkList list;
  Filter(query, now, links.GetCondition());
  if (!links.Count(list.total)) throw DatabaseFailure(db, "the links could not be counted");
  Filter(query, now, links.GetCondition());
  OrderAndPage(query, links.GetCondition());
  if (!links.Query(list.links)) throw DatabaseFailure(db, "the links could not be read");
  const int expected = std::clamp(list.total - query.page.offset, 0, query.page.limit);
  list.damaged = std::max(0, expected - static_cast<int>(list.links.size()));
  return list;
}

Removal PurgeLinks(BaseDB &db, std::optional<unsigned int> owner_uid,
                   const std::optional<std::string> &project) {
  // To the store an empty name means every application.
  if (project && project->empty()) throw Failure(Failure::INVALID, "the project must not be empty");
  return PurgeResult(db, EntryDB(db).PurgeExpiredByOwnerProject(owner_uid.value_or(UID_ERR),
                                                                project.value_or("")));
}

Removal PurgeLinksAutomatically(BaseDB &db) {
  return PurgeResult(db, EntryDB(db).PurgeExpired(1.0F));
}

}  // namespace operations
