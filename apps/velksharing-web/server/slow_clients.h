#ifndef VELKSHARING_WEB_SERVER_SLOW_CLIENTS_H
#define VELKSHARING_WEB_SERVER_SLOW_CLIENTS_H

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>

namespace web {

/// Cuts connections whose visitor does not finish what he began to send. A visitor who sends a
/// byte now and then would never run into a time-out of silence. Any thread may call.
class SlowClients {
 public:
  using Clock = std::chrono::steady_clock;

  explicit SlowClients(std::chrono::milliseconds patience);
  SlowClients(const SlowClients &) = delete;
  SlowClients &operator=(const SlowClients &) = delete;
  ~SlowClients();

  /// From now on the visitor has the whole patience; the count begins anew.
  void Expect(int socket);
  /// The visitor has sent what was expected. Also to be called before the socket is closed.
  void Forget(int socket);

 private:
  void Watch();
  void CutLate(Clock::time_point now);

  const std::chrono::milliseconds patience_;
  std::mutex mutex_;
  std::condition_variable is_over_changed_;
  bool is_over_ = false;
  std::map<int, Clock::time_point> deadlines_;
  std::thread watch_;
};

}  // namespace web

#endif
