#include "site/event_note.h"

#include <velksharing/constants.h>
#include <velksharing/database.h>
#include <velksharing/store.h>

namespace web {
namespace {

using VELK::sharing::UID_ERR;
using VELK::sharing::db::SessionDB;
using VELK::sharing::db::SharingDB;
using VELK::sharing::record::Entry;
using VELK::sharing::record::Session;

/// The account of a session, whoever's name was typed: that text may be a password in the wrong
/// field.
std::optional<unsigned int> AccountOf(const std::string &session_id) {
  Session session;
  if (session_id.empty() || !SessionDB(SharingDB::Instance()).GetBySessionId(session_id, session) ||
      session.get_uid() == UID_ERR)
    return std::nullopt;
  return session.get_uid();
}

void NoteAccount(const Entry &entry, const std::string &session_id, AccessNote &note) {
  if (note.code == 1 && entry.get_protect_type() == Entry::PROTECT_USER)
    note.uid = AccountOf(session_id);
}

}  // namespace

void NoteLogin(const Link &link, const std::string &session_id, AccessNote &note) {
  note.event = link.IsOpen() ? AccessNote::Event::ENTER : AccessNote::Event::LOGIN;
  note.entry_id = link.entry->get_id();
  NoteAccount(*link.entry, session_id, note);
}

void NoteLogout(const std::string &hash, const std::string &session_id, AccessNote &note) {
  const EntryPointer entry = FindEntry(hash);
  if (entry == nullptr) return;
  note.event = AccessNote::Event::LOGOUT;
  note.entry_id = entry->get_id();
  NoteAccount(*entry, session_id, note);
}

}  // namespace web
