#include "server/testimony.h"

namespace web {
namespace {

using Event = AccessNote::Event;
using std::chrono::microseconds;

std::optional<audit::Event> AuditEvent(Event event) {
  switch (event) {
    case Event::NONE:
      return std::nullopt;
    case Event::LOGIN:
      return audit::Event::LOGIN;
    case Event::ENTER:
      return audit::Event::ENTER;
    case Event::LOGOUT:
      return audit::Event::LOGOUT;
  }
  return std::nullopt;
}

int64_t Now() {
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return std::chrono::duration_cast<microseconds>(now).count();
}

}  // namespace

watch::Finished FinishedOf(const Visit &visit) {
  watch::Finished finished;
  finished.route = visit.note.route;
  finished.status = visit.status;
  finished.result = visit.note.code_name;
  finished.is_login = visit.note.event == Event::LOGIN || visit.note.event == Event::ENTER;
  if (visit.answer_time)
    finished.answer_time = std::chrono::duration_cast<microseconds>(*visit.answer_time);
  return finished;
}

std::optional<audit::Record> AuditRecordOf(const AccessNote &note, const std::string &address,
                                           watch::AddressForm form) {
  const auto event = AuditEvent(note.event);
  if (!event) return std::nullopt;
  audit::Record record;
  record.time = Now();
  record.entry_id = note.entry_id;
  record.event = *event;
  record.result = note.code;
  record.uid = note.uid;
  record.address = watch::ShortenedAddress(address, form);
  return record;
}

}  // namespace web
