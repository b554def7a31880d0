#include "watch/audit_keeper.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <syslog.h>

#include <stdexcept>

#include "audit/database.h"

namespace web::watch {
namespace {

using std::chrono::microseconds;
using std::chrono::milliseconds;

constexpr int kFilePatience = 500;     // milliseconds that one attempt waits for others
constexpr milliseconds kBetween{100};  // attempts, while others hold the file
constexpr milliseconds kLookAround{60'000};
constexpr size_t kMostWaiting = 10'000;  // beyond that they stay in the channel
constexpr size_t kBatch = 1'000;
constexpr std::chrono::hours kBetweenRemovals{1};
constexpr std::chrono::minutes kBetweenComplaints{1};

int64_t MomentBefore(std::chrono::hours span) {
  const auto moment = std::chrono::system_clock::now() - span;
  return std::chrono::duration_cast<microseconds>(moment.time_since_epoch()).count();
}

}  // namespace

AuditKeeper::AuditKeeper(AuditChannel &channel, const std::string &path,
                         std::chrono::hours retention, CounterTable &counters)
    : channel_(channel),
      path_(path),
      retention_(retention),
      counters_(counters),
      writer_(path, kFilePatience),
      stop_(eventfd(0, EFD_CLOEXEC)) {
  if (!stop_.IsOpen()) throw std::runtime_error("no descriptor for the audit trail");
  thread_ = std::thread([this] { Run(); });
}

AuditKeeper::~AuditKeeper() {
  eventfd_write(stop_.get(), 1);
  thread_.join();
}

void AuditKeeper::Finish(std::chrono::seconds patience) {
  std::unique_lock lock(end_mutex_);
  has_ended_.wait_for(lock, patience, [this] { return is_over_; });
}

void AuditKeeper::Run() {
  while (!IsStopped() && !(channel_.IsAtEnd() && waiting_.empty())) {
    RemoveOldWhenDue();
    WaitForMore();
    TakeIn();
    Store();
  }
  Lose();
  const std::lock_guard guard(end_mutex_);
  is_over_ = true;
  has_ended_.notify_all();
}

void AuditKeeper::WaitForMore() const {
  const bool takes_more = waiting_.size() < kMostWaiting && !channel_.IsAtEnd();
  pollfd watched[] = {{stop_.get(), POLLIN, 0}, {takes_more ? channel_.receiver() : -1, POLLIN, 0}};
  const milliseconds patience = waiting_.empty() ? kLookAround : kBetween;
  poll(watched, 2, static_cast<int>(patience.count()));
}

void AuditKeeper::TakeIn() {
  while (waiting_.size() < kMostWaiting) {
    const auto record = channel_.Receive();
    if (!record) return;
    waiting_.push_back(*record);
  }
}

void AuditKeeper::Store() {
  while (!waiting_.empty()) {
    const auto end = waiting_.begin() + static_cast<long>(std::min(kBatch, waiting_.size()));
    const std::vector<audit::Record> batch(waiting_.begin(), end);
    try {
      writer_.Append(batch);
    } catch (const audit::DatabaseError &error) {
      Complain(error.what());
      if (!error.IsBusy()) Lose();
      return;
    }
    Add(counters_.kept_records, batch.size());
    waiting_.erase(waiting_.begin(), end);
  }
}

void AuditKeeper::RemoveOldWhenDue() {
  if (Clock::now() < next_removal_) return;
  try {
    writer_.RemoveBefore(MomentBefore(retention_));
    next_removal_ = Clock::now() + kBetweenRemovals;
  } catch (const audit::DatabaseError &error) {
    Complain(error.what());
    next_removal_ = Clock::now() + kBetweenComplaints;
  }
}

void AuditKeeper::Complain(const char *reason) {
  if (Clock::now() < next_complaint_) return;
  next_complaint_ = Clock::now() + kBetweenComplaints;
  syslog(LOG_ERR, "audit trail %s: %s", path_.c_str(), reason);
}

void AuditKeeper::Lose() {
  Add(counters_.records_not_stored, waiting_.size());
  waiting_.clear();
}

bool AuditKeeper::IsStopped() const {
  pollfd watched = {stop_.get(), POLLIN, 0};
  return poll(&watched, 1, 0) > 0;
}

}  // namespace web::watch
