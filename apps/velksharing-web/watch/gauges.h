#ifndef VELKSHARING_WEB_WATCH_GAUGES_H
#define VELKSHARING_WEB_WATCH_GAUGES_H

#include <memory>
#include <optional>

namespace VELK::sharing::db {
class SharingDB;
}

namespace web::watch {

/// What is so at the moment. Nothing stands for what could not be found out.
struct Gauges {
  bool is_database_up = false;
  std::optional<int> sessions;  ///< That have not lapsed.
  std::optional<int> grants;    ///< That have not lapsed.
  std::optional<int> blocked_addresses;
};

/// Looks it up, on a connection of its own. For one thread at a time, not across fork().
class GaugeReader {
 public:
  GaugeReader();
  GaugeReader(const GaugeReader &) = delete;
  GaugeReader &operator=(const GaugeReader &) = delete;
  ~GaugeReader();

  /// Reads all of it now. A database that could not be used is opened anew.
  Gauges Read();

 private:
  void ReadDatabase(Gauges &gauges);

  std::unique_ptr<VELK::sharing::db::SharingDB> database_;
};

}  // namespace web::watch

#endif
