#include "watch/counters.h"

#include <sys/mman.h>

#include <new>
#include <stdexcept>

namespace web::watch {

// A lock would belong to one process, and stay locked when that dies.
static_assert(Counter::is_always_lock_free);

Counters::Counters() {
  void *memory = mmap(nullptr, sizeof(CounterTable), PROT_READ | PROT_WRITE,
                      MAP_SHARED | MAP_ANONYMOUS, -1, 0);
  if (memory == MAP_FAILED) throw std::runtime_error("no memory for the counters");
  table_ = new (memory) CounterTable();
}

Counters::~Counters() {
  munmap(table_, sizeof(CounterTable));
}

void Counters::Count(const Finished &request) {
  const size_t route = RoutePlace(request.route);
  const size_t result = ResultPlace(request.result);
  Add(table_->requests[route][StatusPlace(request.status)][result]);
  if (request.is_login && request.result != "VELK_SHARING_LOGIN_OK")
    Add(table_->refused_logins[result]);
  if (!request.answer_time) return;
  Add(table_->times[route][BucketPlace(*request.answer_time)]);
  Add(table_->time_sums[route], static_cast<uint64_t>(request.answer_time->count()));
}

}  // namespace web::watch
