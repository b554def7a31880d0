#include <cstdlib>
#include <ctime>
#include <vector>

#include "baseline_link.h"
#include "operations.h"
#include "sqlite.h"
#include "stage.h"

namespace velk_bench {
namespace {

constexpr long kLifetimeSeconds = 86400;
constexpr size_t kSessionLength = 32;
constexpr std::int64_t kNoAccount = 0xFFFFFFFF;

struct Session {
  std::int64_t id = 0;
  std::string session_id;
  std::int64_t uid = kNoAccount;
  std::string ip;
  std::int64_t timeout = 0;
};

struct Grant {
  std::int64_t id = 0;
  std::int64_t entry_id = 0;
  std::int64_t session_id = 0;
  std::int64_t timeout = 0;
};

struct Found {
  Session session;
  Link link;
  Grant grant;
};

std::int64_t EndOfLifetime() {
  return time(nullptr) + kLifetimeSeconds;
}

bool IsLapsed(std::int64_t timeout) {
  return time(nullptr) >= timeout;
}

/// The statements are those that the library sends, in the same order, with values in place of its
/// literals. Numbers that are part of a statement stay: SQLite needs them to choose its indexes.
class BaselineSide : public Operations {
 public:
  explicit BaselineSide(const std::string &path) : connection_(path) {}

  bool Login(const Visit &visit) override {
    const char *address = getenv("REMOTE_ADDR");
    Link link;
    if (address == nullptr || !FindLink(visit.hash, link)) return false;
    if (!link.IsValid() || link.IsUsedUp() || !link.IsPasswordValid(kPassword)) return false;
    return CountUse(visit) && LetIn(link, address);
  }

  bool Check(const Visit &visit) override {
    const char *address = getenv("REMOTE_ADDR");
    Found found;
    if (address == nullptr || !Find(visit, found) || !found.link.IsValid()) return false;
    if (found.link.data["enable_match_ip"].asBool() && found.session.ip != address) return false;
    found.session.timeout = EndOfLifetime();
    UpdateSession(found.session);
    found.grant.timeout = EndOfLifetime();
    UpdateGrant(found.grant);
    return true;
  }

  bool ReadForCheck(const Visit &visit) override {
    Found found;
    return Find(visit, found);
  }

  bool Logout(const Visit &visit) override {
    Found found;
    if (!Find(visit, found)) return false;
    delete_grant_.Bind(1, found.grant.id).Run();
    return true;
  }

  bool CountUse(const Visit &visit) override {
    Link link;
    if (!FindLink(visit.hash, link)) return false;
    ++link.use_count;
    UpdateLink(link);
    return true;
  }

  bool Create(long id) override {
    const Link link = NewLink(ContentOf(id));
    const std::string data = DataText(link);
    insert_link_.Bind(1, link.hash)
        .Bind(2, link.project_name)
        .Bind(3, link.enabled)
        .Bind(4, link.owner_uid)
        .Bind(5, link.start_at)
        .Bind(6, link.expire_at)
        .Bind(7, link.expire_times)
        .Bind(8, link.use_count)
        .Bind(9, link.auto_gc)
        .Bind(10, data)
        .Run();
    return connection_.LastInsertId() > 0;
  }

  bool List() override {
    const Statement::Scope scope(list_.Bind(1, 1).Bind(2, kLinksOfAPage));
    std::vector<Link> page;
    while (list_.NextRow()) {
      Link &link = page.emplace_back();
      ReadColumns(list_, link);
      if (!ReadData(list_, link)) return false;
    }
    return page.size() == kLinksOfAPage;
  }

  bool ListAgainstBareSelect() override {
    struct UnparsedLink : Link {
      std::string data_text;
    };
    const Statement::Scope scope(list_.Bind(1, 1).Bind(2, kLinksOfAPage));
    std::vector<UnparsedLink> page;
    while (list_.NextRow()) {
      UnparsedLink &link = page.emplace_back();
      ReadColumns(list_, link);
      link.data_text = list_.Text(10);
    }
    return page.size() == kLinksOfAPage;
  }

  bool PurgeLinks() override {
    const std::int64_t now = time(nullptr);
    purge_links_.Bind(1, now).Run();
    return true;
  }

  bool PurgeLinksOfOwnerProject() override {
    const std::int64_t now = time(nullptr);
    purge_links_of_.Bind(1, kPurgedOwner).Bind(2, kPurgedProject).Bind(3, now).Run();
    return true;
  }

  bool PurgeSessions() override {
    purge_sessions_.Bind(1, time(nullptr)).Run();
    return true;
  }

  bool PurgeGrants() override {
    purge_grants_.Bind(1, time(nullptr)).Run();
    return true;
  }

 private:
  bool Find(const Visit &visit, Found &found) {
    return FindSession(visit.session_id, found.session) && FindLink(visit.hash, found.link) &&
           FindGrant(found.session.id, found.link.id, found.grant);
  }

  bool FindSession(const std::string &session_id, Session &session) {
    const Statement::Scope scope(find_session_.Bind(1, session_id));
    if (!find_session_.NextRow()) return false;
    session.id = find_session_.Number(0);
    session.session_id = find_session_.Text(1);
    session.uid = find_session_.Number(2);
    session.ip = find_session_.Text(3);
    session.timeout = find_session_.Number(4);
    return !IsLapsed(session.timeout);
  }

  bool FindLink(const std::string &hash, Link &link) {
    const Statement::Scope scope(find_link_.Bind(1, hash));
    if (!find_link_.NextRow()) return false;
    ReadColumns(find_link_, link);
    return ReadData(find_link_, link);
  }

  bool FindGrant(std::int64_t session_id, std::int64_t entry_id, Grant &grant) {
    const Statement::Scope scope(find_grant_.Bind(1, session_id).Bind(2, entry_id));
    if (!find_grant_.NextRow()) return false;
    grant.id = find_grant_.Number(0);
    grant.entry_id = find_grant_.Number(1);
    grant.session_id = find_grant_.Number(2);
    grant.timeout = find_grant_.Number(3);
    return !IsLapsed(grant.timeout);
  }

  bool LetIn(const Link &link, const char *address) {
    Session session;
    session.session_id = RandomText(kUrlCharacters, kSessionLength);
    session.ip = address;
    session.timeout = EndOfLifetime();
    InsertSession(session);

    Grant grant;
    if (!FindGrant(session.id, link.id, grant)) {
      grant.entry_id = link.id;
      grant.session_id = session.id;
      grant.timeout = EndOfLifetime();
      insert_grant_.Bind(1, grant.entry_id).Bind(2, grant.session_id).Bind(3, grant.timeout).Run();
    }
    UpdateSession(session);
    return true;
  }

  void InsertSession(Session &session) {
    insert_session_.Bind(1, session.session_id)
        .Bind(2, session.uid)
        .Bind(3, session.ip)
        .Bind(4, session.timeout)
        .Run();
    session.id = connection_.LastInsertId();
  }

  void UpdateSession(const Session &session) {
    update_session_.Bind(1, session.ip)
        .Bind(2, session.session_id)
        .Bind(3, session.timeout)
        .Bind(4, session.uid)
        .Bind(5, session.id)
        .Run();
  }

  void UpdateGrant(const Grant &grant) {
    update_grant_.Bind(1, grant.entry_id)
        .Bind(2, grant.session_id)
        .Bind(3, grant.timeout)
        .Bind(4, grant.id)
        .Run();
  }

  void UpdateLink(const Link &link) {
    const std::string data = DataText(link);
    update_link_.Bind(1, link.auto_gc)
        .Bind(2, data)
        .Bind(3, link.enabled)
        .Bind(4, link.expire_at)
        .Bind(5, link.expire_times)
        .Bind(6, link.hash)
        .Bind(7, link.owner_uid)
        .Bind(8, link.project_name)
        .Bind(9, link.start_at)
        .Bind(10, link.use_count)
        .Bind(11, link.id)
        .Run();
  }

  Connection connection_;

  Statement find_session_{connection_, "SELECT * FROM session WHERE session_id = ?"};
  Statement find_link_{connection_, "SELECT * FROM entry WHERE hash = ?"};
  Statement find_grant_{connection_, "SELECT * FROM token WHERE session_id = ? AND entry_id = ?"};
  Statement list_{connection_, "SELECT * FROM entry WHERE `enabled` = ? ORDER BY id DESC LIMIT ?"};

  Statement insert_session_{connection_, "INSERT INTO session VALUES (NULL,?,?,?,?)"};
  Statement insert_grant_{connection_, "INSERT INTO token VALUES (NULL,?,?,?)"};
  Statement insert_link_{connection_, "INSERT INTO entry VALUES (NULL,?,?,?,?,?,?,?,?,?,?)",
                         Commit::kFlushed};

  Statement update_session_{connection_,
                            "UPDATE session SET ip=?,session_id=?,timeout=?,uid=? WHERE id=?"};
  Statement update_grant_{connection_,
                          "UPDATE token SET entry_id=?,session_id=?,timeout=? WHERE id=?"};
  Statement update_link_{connection_,
                         "UPDATE entry SET auto_gc=?,data=?,enabled=?,expire_at=?,expire_times=?,"
                         "hash=?,owner_uid=?,project_name=?,start_at=?,use_count=? WHERE id=?",
                         Commit::kFlushed};

  Statement delete_grant_{connection_, "DELETE FROM token WHERE id=?", Commit::kFlushed};
  Statement purge_links_{connection_,
                         "DELETE FROM entry WHERE auto_gc = 1 AND ((expire_at != 0 AND"
                         " expire_at < ?) OR (expire_times != 0 AND use_count >= expire_times))",
                         Commit::kFlushed};
  Statement purge_links_of_{connection_,
                            "DELETE FROM entry WHERE owner_uid = ? AND project_name = ? AND"
                            " ((expire_at != 0 AND expire_at < ?) OR"
                            " (expire_times != 0 AND use_count >= expire_times))",
                            Commit::kFlushed};
  Statement purge_sessions_{connection_, "DELETE FROM session WHERE timeout < ?", Commit::kFlushed};
  Statement purge_grants_{connection_, "DELETE FROM token WHERE timeout < ?", Commit::kFlushed};
};

}  // namespace

std::unique_ptr<Operations> OpenBaseline() {
  return std::make_unique<BaselineSide>(BaselineDatabase());
}

}  // namespace velk_bench
