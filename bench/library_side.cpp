#include <velksharing/access.h>
#include <velksharing/constants.h>
#include <velksharing/store.h>

#include <stdexcept>

#include "operations.h"

namespace velk_bench {
namespace {

using VELK::sharing::db::EntryDB;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::db::TokenDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;
using VELK::sharing::record::Token;

class LibrarySide : public Operations {
 public:
  LibrarySide() : database_(SharingDB::Instance()) {
    if (!database_.IsGood()) throw std::runtime_error("the library cannot open its database");
  }

  bool Login(const Visit &visit) override {
    const _tag_sharing_login_params params = {visit.hash.c_str(), kPassword, nullptr, nullptr,
                                              nullptr};
    std::string session_id;
    return VELK::VelkSharingLogin(session_id, &params, false) == VELK_SHARING_LOGIN_OK;
  }

  bool Check(const Visit &visit) override {
    const _tag_sharing_login_params params = {visit.hash.c_str(), nullptr, nullptr, nullptr,
                                              visit.session_id.c_str()};
    return VELK::VelkSharingIsAuthorized(&params) == VELK_SHARING_AUTH_OK;
  }

  bool ReadForCheck(const Visit &visit) override {
    Session session;
    Entry link;
    Token grant;
    return SessionDB(database_).GetBySessionId(visit.session_id, session) &&
           EntryDB(database_).GetByHash(visit.hash, link) &&
           TokenDB(database_).GetBySessionEntry(session, link, grant);
  }

  bool Logout(const Visit &visit) override {
    return VELK::VelkSharingLogout(visit.hash, visit.session_id) == 1;
  }

  bool CountUse(const Visit &visit) override {
    return VELK::VelkSharingIncreaseUseCount(visit.hash) == 1;
  }

  bool Create(long id) override {
    const Content content = ContentOf(id);
    Entry link;
    link.set_project_name(content.project_name)
        .set_owner_uid(content.owner_uid)
        .set_protect_type(Entry::PROTECT_PASSWORD)
        .set_protect_title(content.title)
        .set_protect_password(kPassword, true, Entry::ENCRYPT_ALGO_DEFAULT)
        .set_app(content.app);
    return EntryDB(database_).CreateWithHash(link);
  }

  bool List() override {
    EntryDB links(database_);
    links.GetCondition()
        .Where(VELK::sharing::SZK_ENABLED_, "1")
        .OrderBy(VELK::sharing::SZK_ID_, true)
        .Page(1, kLinksOfAPage);
    std::vector<Entry> page;
    return links.Query(page) && page.size() == kLinksOfAPage;
  }

  bool ListAgainstBareSelect() override { return List(); }

  bool PurgeLinks() override { return EntryDB(database_).PurgeExpired(1.0F); }
  bool PurgeLinksOfOwnerProject() override {
    return EntryDB(database_).PurgeExpiredByOwnerProject(kPurgedOwner, kPurgedProject);
  }
  bool PurgeSessions() override { return SessionDB(database_).PurgeExpired(1.0F); }
  bool PurgeGrants() override { return TokenDB(database_).PurgeExpired(1.0F); }

 private:
  SharingDB &database_;
};

}  // namespace

std::unique_ptr<Operations> OpenLibrary() {
  return std::make_unique<LibrarySide>();
}

}  // namespace velk_bench
