#include "operations/sessions.h"

#include "operations/links.h"
#include "operations/moment.h"
#include "velksharing/constants.h"
#include "velksharing/store.h"

namespace operations {
namespace {

using namespace VELK::sharing;
using VELK::sharing::db::Condition;
using VELK::sharing::db::Result;
using VELK::sharing::db::Row;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::TokenDB;

void FilterSessions(const SessionQuery &query, Condition &condition) {
  if (query.uid) condition.Where("uid = " + std::to_string(*query.uid));
  if (query.address) condition.Where(SZK_IP_, *query.address);
}

void FilterGrants(std::optional<int> entry_id, std::optional<int> session_id,
                  Condition &condition) {
  if (entry_id) condition.Where("entry_id = " + std::to_string(*entry_id));
  if (session_id) condition.Where("session_id = " + std::to_string(*session_id));
}

/// Counts and reads one page: live rows, and how many have lapsed beside them.
template <typename Store, typename Record, typename Filter>
void ListLive(BaseDB &db, Filter filter, const Page &page, std::vector<Record> &records, int &total,
              int &lapsed) {
  const std::string now = std::to_string(Now());
  const Transaction snapshot(db, Transaction::SNAPSHOT);
  const Store store(db);
  Condition &condition = store.GetCondition();

  filter(condition.Where("timeout > " + now));
  const bool counted = store.Count(total);
  filter(condition.Where("timeout <= " + now));
  const bool counted_lapsed = store.Count(lapsed);
  filter(condition.Where("timeout > " + now));
  condition.OrderBy(SZK_ID_, true).Limit(page.offset, page.limit);
  if (!counted || !counted_lapsed || !store.Query(records))
    throw DatabaseFailure(db, "the list could not be read");
}

template <typename Store>
void DeleteRow(BaseDB &db, const char *what, int id) {
  if (!Store(db).Delete(id))
    throw DatabaseFailure(db, std::string("the ") + what + " could not be deleted");
  if (RemovedRows(db) == 0) {
    throw Failure(Failure::NOT_FOUND,
                  std::string("there is no ") + what + " " + std::to_string(id));
  }
}

template <typename Store>
Removal Purge(BaseDB &db) {
  Store store(db);
  Removal removal;
  if (!store.PurgeExpired(1.0F)) throw DatabaseFailure(db, "the purge failed");
  removal.removed = RemovedRows(db);
  if (!store.Count(removal.remaining)) throw DatabaseFailure(db, "the rows could not be counted");
  return removal;
}

std::string HashOf(BaseDB &db, int entry_id) {
  Result result;
  Row row;
  if (!db.Execute("SELECT hash FROM entry WHERE id = " + std::to_string(entry_id), result))
    throw DatabaseFailure(db, "links could not be read");
  return result.NextRow(row) ? row.GetField(SZK_HASH).AsString("") : "";
}

}  // namespace

SessionList ListSessions(BaseDB &db, const SessionQuery &query) {
  SessionList list;
  ListLive<SessionDB>(
      db, [&](Condition &condition) { FilterSessions(query, condition); }, query.page,
      list.sessions, list.total, list.lapsed);
  return list;
}

void DeleteSession(BaseDB &db, int id) {
  DeleteRow<SessionDB>(db, "session", id);
}

Removal PurgeSessions(BaseDB &db) {
  return Purge<SessionDB>(db);
}

GrantList ListGrants(BaseDB &db, const GrantQuery &query) {
  std::optional<int> entry_id;
  if (query.hash) entry_id = FindLink(db, *query.hash).get_id();
  GrantList list;
  std::vector<Token> tokens;
  ListLive<TokenDB>(
      db, [&](Condition &condition) { FilterGrants(entry_id, query.session_id, condition); },
      query.page, tokens, list.total, list.lapsed);
  for (const Token &token : tokens)
    list.grants.push_back({token, HashOf(db, token.get_entry_id())});
  return list;
}

void DeleteGrant(BaseDB &db, int id) {
  DeleteRow<TokenDB>(db, "grant", id);
}

Removal PurgeGrants(BaseDB &db) {
  return Purge<TokenDB>(db);
}

}  // namespace operations
