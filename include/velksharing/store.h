#ifndef VELKSHARING_STORE_H
#define VELKSHARING_STORE_H

#include <memory>
#include <string>
#include <vector>

#include "velksharing/database.h"
#include "velksharing/export.h"
#include "velksharing/record.h"

/// The stores: one per kind of record, each over its own table of a sharing database.
///
///     EntryDB links(SharingDB::Instance());
///     record::Entry link;
///     if (links.GetByHash("aB3xK9pQ2", link)) {
///       link.set_enabled(false);
///       links.Update(link);
///     }
///
/// A store is cheap: make one for a piece of work. It refers to its connection, which must
/// outlive it, and belongs to that connection's thread. Operations report success as bool; why one
/// failed says the connection's GetLastError(). Deleting a record deletes no other: grants of a
/// link or session that is gone stay until a purge, and never count for another, because ids are
/// not used again.

namespace VELK {
namespace sharing {
namespace db {

class EntryDBPrivate;
class ObjectDBPrivate;
class SessionDBPrivate;
class TokenDBPrivate;

/// What every store can do with its table; base of the stores' private sides.
class VELK_EXPORT ObjectDB {
 public:
  ObjectDB(const ObjectDB &) = delete;
  ObjectDB &operator=(const ObjectDB &) = delete;
  virtual ~ObjectDB();

  /// Inserts a record and gives it its row id. Refuses one that is not legal.
  virtual bool Create(record::Object &obj);
  /// Writes all columns of a stored record. Refuses one that is not legal.
  virtual bool Update(const record::Object &obj);
  /// Deletes a row; one that does not exist is no failure.
  virtual bool Delete(int id);
  virtual bool Delete(const record::Object &obj);
  /// Loads a row; false when there is none or it cannot be used. The condition plays no part.
  virtual bool GetById(int id, record::Object &obj) const;
  /// Counts the rows that the condition admits, and clears it.
  /// @param count left alone on failure.
  virtual bool Count(int &count) const;

  /// The store's condition, to be filled right before Count() or Query().
  Condition &GetCondition() const;

  /// Loads the rows that the condition admits, leaving out those that cannot be used, and clears
  /// the condition. For record::Entry, record::Session and record::Token.
  /// @param out replaced; left alone on failure.
  template <typename T>
  bool Query(std::vector<T> &out) const;

 protected:
  /// @param table the table's name. Without one (null) every statement fails.
  ObjectDB(BaseDB &db, const char *table);

  /// Runs a statement and loads its first row; false when it fails, gives no row, or gives one
  /// that cannot be used.
  bool LoadFirst(const std::string &sql, record::Object &obj) const;

  BaseDB &GetDB() const;
  const std::string &GetTable() const;

 private:
  std::unique_ptr<ObjectDBPrivate> private_;
};

/// The links.
class VELK_EXPORT EntryDB {
 public:
  explicit EntryDB(BaseDB &db);
  EntryDB(const EntryDB &) = delete;
  EntryDB &operator=(const EntryDB &) = delete;
  virtual ~EntryDB();

  /// Inserts a link under the hash that it holds.
  bool Create(record::Entry &entry);
  /// Inserts a link under a fresh random hash of SHARING_HASH_LENGTH letters and digits. Tries up
  /// to 51 times, one character longer after every third try; the link keeps the last hash tried.
  bool CreateWithHash(record::Entry &entry);
  /// Writes all columns of a stored link. Refuses one that is not legal.
  bool Update(const record::Entry &entry);
  /// Deletes a row; one that does not exist is no failure.
  bool Delete(int id);
  bool Delete(const record::Entry &entry);

  /// False when there is no such row or it cannot be used.
  bool GetById(int id, record::Entry &entry) const;
  /// The link of a grant.
  bool GetByToken(const record::Token &token, record::Entry &entry) const;
  /// False for an unknown hash, with `entry` left alone, and for a link that cannot be used.
  bool GetByHash(const std::string &hash, record::Entry &entry) const;

  /// Counts the rows that the condition admits, and clears it.
  bool Count(int &count) const;
  /// The filter, order and page of the next Count() or Query().
  Condition &GetCondition() const;
  /// Loads the rows that the condition admits and that can be used, and clears it.
  bool Query(std::vector<record::Entry> &entries) const;

  /// Deletes every link of one owner.
  bool DeleteByOwnerUid(unsigned int uid);
  /// With the given probability, deletes the links marked for automatic removal that are past
  /// their expiry or have reached their number of uses.
  bool PurgeExpired(float probability);
  /// Deletes expired links, marked for automatic removal or not.
  /// @param uid only this owner's; UID_ERR: every owner's.
  /// @param project only this application's; "": every application's.
  bool PurgeExpiredByOwnerProject(unsigned int uid, const std::string &project);

 private:
  std::unique_ptr<EntryDBPrivate> private_;
};

/// The visitors' sessions.
class VELK_EXPORT SessionDB {
 public:
  explicit SessionDB(BaseDB &db);
  SessionDB(const SessionDB &) = delete;
  SessionDB &operator=(const SessionDB &) = delete;
  virtual ~SessionDB();

  /// Inserts a session under the identifier that it holds.
  bool Create(record::Session &session);
  /// Inserts a session under a fresh random identifier of SHARING_SESSION_LENGTH characters that
  /// need no escaping in a URL. Tries up to 51 times; the session keeps the last one tried.
  bool CreateWithSessionId(record::Session &session);
  /// Writes all columns of a stored session. Refuses one that is not legal.
  bool Update(const record::Session &session);
  /// Deletes a row; one that does not exist is no failure.
  bool Delete(int id);
  bool Delete(const record::Session &session);

  /// False when there is no such row or it cannot be used.
  bool GetById(int id, record::Session &session) const;
  /// Counts the rows that the condition admits, and clears it.
  bool Count(int &count) const;
  /// The filter, order and page of the next Count() or Query().
  Condition &GetCondition() const;
  /// Loads the rows that the condition admits and that can be used, and clears it.
  bool Query(std::vector<record::Session> &sessions) const;

  /// False for an unknown identifier, and for a lapsed session, which is loaded all the same.
  bool GetBySessionId(const std::string &session_id, record::Session &session) const;
  /// Deletes by identifier; one that does not exist is no failure.
  bool DeleteBySessionId(const std::string &session_id);
  /// With the given probability, deletes the sessions whose time-out lies before this second.
  bool PurgeExpired(float probability);

 private:
  std::unique_ptr<SessionDBPrivate> private_;
};

/// The grants.
class VELK_EXPORT TokenDB {
 public:
  explicit TokenDB(BaseDB &db);
  TokenDB(const TokenDB &) = delete;
  TokenDB &operator=(const TokenDB &) = delete;
  virtual ~TokenDB();

  /// Inserts a grant. Refuses one that is not legal.
  bool Create(record::Token &token);
  /// Writes all columns of a stored grant. Refuses one that is not legal.
  bool Update(const record::Token &token);
  /// Deletes a row; one that does not exist is no failure.
  bool Delete(int id);
  bool Delete(const record::Token &token);

  /// False when there is no such row or it cannot be used.
  bool GetById(int id, record::Token &token) const;
  /// Counts the rows that the condition admits, and clears it.
  bool Count(int &count) const;
  /// The filter, order and page of the next Count() or Query().
  Condition &GetCondition() const;
  /// Loads the rows that the condition admits and that can be used, and clears it.
  bool Query(std::vector<record::Token> &tokens) const;

  /// The grant of one stored session on one stored link. False when there is none, and for a
  /// lapsed one, which is loaded all the same.
  bool GetBySessionEntry(const record::Session &session, const record::Entry &entry,
                         record::Token &token) const;
  /// Deletes every grant on one link.
  bool PurgeByEntry(const record::Entry &entry);
  /// With the given probability, deletes the grants whose time-out lies before this second.
  bool PurgeExpired(float probability);

 private:
  std::unique_ptr<TokenDBPrivate> private_;
};

}  // namespace db
}  // namespace sharing
}  // namespace VELK

#endif
