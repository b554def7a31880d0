#ifndef TESTS_WEB_WATCH_SUPPORT_H
#define TESTS_WEB_WATCH_SUPPORT_H

#include <string>

#include "audit/record.h"

namespace velk_test {

/// A refused login to link 7 at this second.
inline audit::Record SampleRecord(int64_t second = 1'000) {
  audit::Record record;
  record.time = second * 1'000'000 + 5;
  record.entry_id = 7;
  record.event = audit::Event::LOGIN;
  record.result = -9;
  record.address = "192.0.2.0/24";
  return record;
}

}  // namespace velk_test

#endif
