#include "watch/watch.h"

namespace web::watch {

Watch::Watch(bool keeps_audit) {
  if (keeps_audit) channel_.emplace();
}

void Watch::Keep(const audit::Record &record) {
  if (channel_ && !channel_->Send(record)) Add(counters_.table().records_without_room);
}

}  // namespace web::watch
