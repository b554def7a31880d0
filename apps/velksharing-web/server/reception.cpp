#include "server/reception.h"

namespace web {

UniqueFd Reception::Accept(Clerk &clerk) {
  ++waiting_threads_;
  TakePlace(clerk);
  const bool is_there = wait_.Wait();
  --waiting_threads_;
  UniqueFd connection = is_there ? wait_.Accept(0, nullptr, nullptr) : UniqueFd();
  GivePlace();
  return connection;
}

void Reception::TakePlace(Clerk &clerk) {
  {
    const std::lock_guard guard(mutex_);
    if (!is_taken_) {
      is_taken_ = true;
      return;
    }
    queue_.push_back(&clerk);
  }
  clerk.is_called_.acquire();
}

void Reception::GivePlace() {
  Clerk *next = nullptr;
  {
    const std::lock_guard guard(mutex_);
    is_taken_ = !queue_.empty();
    if (!is_taken_) return;
    next = queue_.back();
    queue_.pop_back();
  }
  next->is_called_.release();
}

}  // namespace web
