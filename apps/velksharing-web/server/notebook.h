#ifndef VELKSHARING_WEB_SERVER_NOTEBOOK_H
#define VELKSHARING_WEB_SERVER_NOTEBOOK_H

#include <vector>

#include "server/settings.h"
#include "watch/witness.h"

namespace web {

/// The witness of a process that answers one request (plain CGI) and has no observer: it keeps what
/// was said until the visitor has the answer. It counts nothing, for nobody would read it.
class Notebook : public watch::Witness {
 public:
  void Keep(const audit::Record &record) override { records_.push_back(record); }
  void Count(const watch::Finished &) override {}

  /// Writes it to the audit trail, and removes there what is too old. Waits for others who write,
  /// 10 seconds for each; a failure is logged.
  void Store(const Settings &settings) const;

 private:
  std::vector<audit::Record> records_;
};

}  // namespace web

#endif
