#ifndef VELKSHARING_RECORD_H
#define VELKSHARING_RECORD_H

#include <json/value.h>

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "velksharing/export.h"

/// The three records of the sharing database: the link, the visitor's session, and the grant of a
/// session on a link.
///
///     record::Entry link;
///     link.set_project_name("photo").set_owner_user("ann").set_app(Json::objectValue);
///     link.set_protect_type(record::Entry::PROTECT_PASSWORD)
///         .set_protect_password("secret", true, record::Entry::ENCRYPT_ALGO_DEFAULT);
///     bool stored = db::EntryDB(db::SharingDB::Instance()).CreateWithHash(link);
///
/// Records are values: copies are deep. A moved-from record stays usable; its texts and lists are
/// empty after move construction. A record belongs to one thread at a time. Times are seconds
/// since the Unix epoch, 0 when not set. Where a comment gives none, an operation cannot fail.

namespace VELK {
namespace sharing {

namespace db {
class Row;
}

namespace record {

class EntryPrivate;
class SessionPrivate;
class TokenPrivate;

/// What a store knows of a record.
class VELK_EXPORT Object {
 public:
  virtual ~Object();

  /// The texts of the stored columns, in the table's order, without the row id.
  virtual std::vector<std::string> GetFieldList() const = 0;
  /// The same texts by column name.
  virtual std::map<std::string, std::string> GetFieldMap() const = 0;
  /// Whether the fields are consistent enough to be stored or used; logs the first that is not.
  virtual bool IsLegal() const = 0;
  /// The form for callers, a JSON object.
  virtual void ToJSON(Json::Value &out) const = 0;
  /// Loads every field from a row.
  /// @return whether the loaded record may be used; if not, its fields may be partly overwritten.
  virtual bool FromRow(const db::Row &row) = 0;

  virtual int get_id() const = 0;  ///< Row id; 0 when not stored.
  virtual void set_id(int id) = 0;

 protected:
  Object();
  Object(const Object &other);
  Object &operator=(const Object &other);
};

/// A sharing link.
class VELK_EXPORT Entry {
 public:
  /// What a visitor must show.
  enum ProtectType : int {
    PROTECT_NONE = 0,      ///< Nothing.
    PROTECT_PASSWORD = 1,  ///< The link's password.
    PROTECT_USER = 2       ///< An account that is permitted itself or through a group.
  };
  /// Where a visitor is sent.
  enum RedirectType : int {
    REDIRECT_NONE = 0,      ///< Nowhere.
    REDIRECT_URLPARAM = 1,  ///< The page gets the target as a URL parameter.
    REDIRECT_ALWAYS = 2     ///< To the target.
  };
  /// How the link's password is kept. Any other value counts as ENCRYPT_ALGO_MD5.
  enum PasswordEncryptAlgo : int {
    ENCRYPT_ALGO_DEFAULT = 0,  ///< Salted SHA-1.
    ENCRYPT_ALGO_MD5 = 1       ///< Unsalted MD5, for digests taken over from elsewhere.
  };

  /// An enabled, open link without limits. It is not legal before hash, project, owner and `app`
  /// are set.
  Entry();
  Entry(const Entry &other);
  Entry(Entry &&other);
  Entry &operator=(const Entry &other);
  Entry &operator=(Entry &&other);
  virtual ~Entry();

  /// The record as a store sees it; valid as long as this.
  record::Object &GetObject();
  const record::Object &GetCObject() const;

  /// The texts of the stored columns, as Object says.
  std::vector<std::string> GetFieldList() const;
  std::map<std::string, std::string> GetFieldMap() const;

  /// Whether the link may be stored: the last set_protect_password() worked; hash, project and
  /// owner are set; `app` and `private_data` are JSON objects; a password link has digest and,
  /// by default, salt; a link for accounts permits at least one account or group.
  bool IsLegal() const;

  /// Whether the link may be used now: legal, enabled, started, not past its expiry, and its use
  /// count not above its number of uses. A count that has just reached the number is still valid
  /// here; only a new login is refused then.
  bool IsValid() const;

  /// Whether `password` opens the link; any text does unless it is protected by a password.
  /// Compares in constant time.
  bool IsPasswordValid(const std::string &password) const;

  /// The form for front ends: no ids, no digest or salt, no `private_data`. Times are local, as
  /// "%Y-%m-%d %H:%M:%S", "" when not set.
  void ToJSON(Json::Value &out) const;

  /// @return false when the row's data is no JSON object of the expected form, or the link is not
  ///         legal. Texts of a kind that is not known load as protection by account, as MD5, as
  ///         redirecting always.
  bool FromRow(const db::Row &row);

  int get_id() const;
  Entry &set_id(int id);

  /// The random key by which visitors name the link.
  std::string get_hash() const;
  Entry &set_hash(std::string hash);

  /// The application that shares.
  std::string get_project_name() const;
  Entry &set_project_name(const std::string &project_name);

  /// Whether the link is switched on.
  bool get_enabled() const;
  Entry &set_enabled(const bool &enabled);

  /// The account on whose behalf is shared; UID_ERR when not set.
  unsigned int get_owner_uid() const;
  Entry &set_owner_uid(unsigned int owner_uid);

  /// The owner's account name; "" when the id has none.
  std::string get_owner_user() const;
  /// Sets the owner by name; an unknown name sets UID_ERR.
  Entry &set_owner_user(const std::string &name);

  /// The link works from this second; 0 or less: from the start.
  long get_start_at() const;
  Entry &set_start_at(long start_at);
  /// The link works up to and including this second; 0 or less: for ever.
  long get_expire_at() const;
  Entry &set_expire_at(long expire_at);

  /// The time in local time by a strftime() format; "" when not set or when the text is empty or
  /// longer than 127 bytes.
  std::string get_start_at_str(const char *format) const;
  std::string get_expire_at_str(const char *format) const;
  /// Sets the time from local time by a strptime() format, daylight saving as it is today; a text
  /// that is empty or does not fit sets 0.
  Entry &set_start_at_str(const std::string &text, const char *format);
  Entry &set_expire_at_str(const std::string &text, const char *format);

  /// Number of uses allowed; 0 or less: any number.
  int get_expire_times() const;
  /// Going from 0 to any other number starts the use count anew; every other change keeps it.
  Entry &set_expire_times(const int &expire_times);

  /// Uses so far.
  int get_use_count() const;
  Entry &set_use_count(const int &use_count);
  /// Adds one to the use count of this record, whatever the limit (only the largest number there
  /// is stays as it is); storing it is the caller's.
  Entry &inc_use_count();

  /// Whether the link may be purged automatically once it has expired.
  bool get_auto_gc() const;
  Entry &set_auto_gc(const bool &auto_gc);

  /// Whether a visitor is held to the address of the login.
  bool get_enable_match_ip() const;
  Entry &set_enable_match_ip(bool enable_match_ip);

  /// What a visitor must show.
  Entry::ProtectType get_protect_type() const;
  Entry &set_protect_type(Entry::ProtectType protect_type);

  /// The title shown with the prompt.
  std::string get_protect_title() const;
  Entry &set_protect_title(const std::string &protect_title);

  /// The stored digest, its algorithm and its salt. For storing, never for showing.
  std::string get_protect_password() const;
  Entry::PasswordEncryptAlgo get_protect_password_algo() const;
  std::string get_protect_password_salt() const;

  /// Sets the link's password; the kind of protection is not touched.
  /// @param hash true: `password` is digested by `algo`, with a fresh salt by default; false: it
  ///        is a digest already, made by `algo` with the salt that the record holds.
  /// A failure (no randomness, or an empty password with MD5) leaves no password and makes the
  /// link illegal until a later call works.
  Entry &set_protect_password(const std::string &password, bool hash,
                              Entry::PasswordEncryptAlgo algo);

  /// Permitted accounts and groups. Setting names keeps those without an id as names, which do not
  /// count at a login; setting ids drops such names. Getting ids tries these names again; getting
  /// names leaves out ids without a name.
  std::vector<unsigned int> get_protect_uids() const;
  Entry &set_protect_uids(const std::vector<unsigned int> &uids);
  std::vector<unsigned int> get_protect_gids() const;
  Entry &set_protect_gids(const std::vector<unsigned int> &gids);
  std::vector<std::string> get_protect_users() const;
  Entry &set_protect_users(const std::vector<std::string> &names);
  std::vector<std::string> get_protect_groups() const;
  Entry &set_protect_groups(const std::vector<std::string> &names);

  /// Where a visitor is sent, and the target. The library only keeps them.
  Entry::RedirectType get_redirect_type() const;
  Entry &set_redirect_type(Entry::RedirectType redirect_type);
  std::string get_redirect_uri() const;
  Entry &set_redirect_uri(const std::string &redirect_uri);

  /// The application's data, shown to front ends; must become an object. A link whose data cannot
  /// be read back is stored, but never loaded: at most 990 levels deep, no infinite numbers.
  Json::Value get_app() const;
  Entry &set_app(const Json::Value &app);
  /// The application's data that front ends do not see; an object, with the same limits.
  Json::Value get_private_data() const;
  Entry &set_private_data(const Json::Value &private_data);

 private:
  std::unique_ptr<EntryPrivate> private_;
};

/// A visitor's login: who comes from which address, and until when.
class VELK_EXPORT Session {
 public:
  Session();
  Session(const Session &other);
  Session(Session &&other);
  Session &operator=(const Session &other);
  Session &operator=(Session &&other);
  virtual ~Session();

  /// The record as a store sees it; valid as long as this.
  record::Object &GetObject();
  const record::Object &GetCObject() const;

  /// The texts of the stored columns, as Object says.
  std::vector<std::string> GetFieldList() const;
  std::map<std::string, std::string> GetFieldMap() const;
  /// Whether identifier and address are set and the session has not lapsed.
  bool IsLegal() const;
  /// Sets the members of the stored columns; others of `out` stay, unless it is no object. Holds
  /// the identifier: a secret.
  void ToJSON(Json::Value &out) const;
  /// @return IsLegal(); a lapsed session is loaded in full all the same.
  bool FromRow(const db::Row &row);

  int get_id() const;
  Session &set_id(int id);
  /// The random identifier that the visitor's browser keeps. A secret.
  std::string get_session_id() const;
  Session &set_session_id(const std::string &session_id);
  /// The account that logged in; UID_ERR for none.
  unsigned int get_uid() const;
  Session &set_uid(unsigned int uid);
  /// The visitor's address as text.
  std::string get_ip() const;
  Session &set_ip(const std::string &ip);
  /// The session has lapsed from this second on.
  long get_timeout() const;
  Session &set_timeout(long timeout);

 private:
  std::unique_ptr<SessionPrivate> private_;
};

/// A grant: one session may use one link for a time.
class VELK_EXPORT Token {
 public:
  Token();
  Token(const Token &other);
  Token(Token &&other);
  Token &operator=(const Token &other);
  Token &operator=(Token &&other);
  virtual ~Token();

  /// The record as a store sees it; valid as long as this.
  record::Object &GetObject();
  const record::Object &GetCObject() const;

  /// The texts of the stored columns, as Object says.
  std::vector<std::string> GetFieldList() const;
  std::map<std::string, std::string> GetFieldMap() const;
  /// Whether link and session are set and the grant has not lapsed.
  bool IsLegal() const;
  /// Sets the members of the stored columns; others of `out` stay, unless it is no object.
  void ToJSON(Json::Value &out) const;
  /// @return IsLegal(); a lapsed grant is loaded in full all the same.
  bool FromRow(const db::Row &row);

  int get_id() const;
  Token &set_id(int id);
  /// Row id of the link.
  int get_entry_id() const;
  Token &set_entry_id(int entry_id);
  /// Row id of the session (not its random identifier).
  int get_session_id() const;
  Token &set_session_id(int session_id);
  /// The grant has lapsed from this second on.
  long get_timeout() const;
  Token &set_timeout(long timeout);

 private:
  std::unique_ptr<TokenPrivate> private_;
};

}  // namespace record
}  // namespace sharing
}  // namespace VELK

#endif
