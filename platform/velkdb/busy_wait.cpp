#include "busy_wait.h"

#include <sqlite3.h>

#include <algorithm>
#include <thread>

namespace velkdb {
namespace {

constexpr std::chrono::seconds kPatience{10};
constexpr std::chrono::microseconds kShortestSleep{50};
constexpr int kDoublings = 7;  // up to 6.4 ms: a write takes less, so nobody sleeps past his turn

/// Between half and one and a half of the nominal time.
std::chrono::nanoseconds SleepTime(int attempt) {
  const std::chrono::nanoseconds nominal = kShortestSleep * (1 << std::min(attempt, kDoublings));
  unsigned short chance = 0;
  sqlite3_randomness(sizeof chance, &chance);
  return nominal / 2 + nominal * chance / 65536;
}

int OnBusy(void *wait, int attempt) {
  return static_cast<BusyWait *>(wait)->Sleep(attempt) ? 1 : 0;
}

}  // namespace

void BusyWait::Attach(sqlite3 *connection) {
  sqlite3_busy_handler(connection, OnBusy, this);
}

void BusyWait::StartStatement() {
  deadline_ = Clock::now() + kPatience;
  in_statement_ = true;
}

bool BusyWait::Sleep(int attempt) {
  const Clock::time_point now = Clock::now();
  if (!in_statement_ && attempt == 0) deadline_ = now + kPatience;
  if (now >= deadline_) return false;
  std::this_thread::sleep_for(
      std::min<std::chrono::nanoseconds>(SleepTime(attempt), deadline_ - now));
  return true;
}

void BusyWait::EndStatement() {
  in_statement_ = false;
}

}  // namespace velkdb
