#ifndef VELKSHARING_WEB_SERVER_TESTIMONY_H
#define VELKSHARING_WEB_SERVER_TESTIMONY_H

#include <optional>
#include <string>

#include "server/access_log.h"
#include "watch/shortened_address.h"
#include "watch/witness.h"

/// What the witness is told of a request.

namespace web {

/// For the counters. Its texts are those of the visit.
watch::Finished FinishedOf(const Visit &visit);

/// For the audit trail: nothing for a request that was no coming or going.
/// @param address the visitor's, of which `form` says how much is kept.
std::optional<audit::Record> AuditRecordOf(const AccessNote &note, const std::string &address,
                                           watch::AddressForm form);

}  // namespace web

#endif
