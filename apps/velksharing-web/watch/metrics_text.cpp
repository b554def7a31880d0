#include "watch/metrics_text.h"

#include <cstdio>

namespace web::watch {
namespace {

constexpr double kMicroseconds = 1e6;

/// In seconds, with no more digits than it has: "0.0005", "10".
std::string Seconds(uint64_t microseconds) {
  char text[32] = "";
  snprintf(text, sizeof(text), "%.12g", static_cast<double>(microseconds) / kMicroseconds);
  return text;
}

/// Lines of the text. Labels are words of our own: nothing in them needs an escape.
class Lines {
 public:
  void Describe(const std::string &name, const char *type, const char *help) {
    text_ += "# HELP " + name + " " + help + "\n# TYPE " + name + " " + type + "\n";
  }

  /// @param labels "" or "{…}".
  void Add(const std::string &name, const std::string &labels, const std::string &value) {
    text_ += name + labels + " " + value + "\n";
  }
  void Add(const std::string &name, const std::string &labels, uint64_t value) {
    Add(name, labels, std::to_string(value));
  }

  void Append(const Lines &others) { text_ += others.text_; }

  const std::string &text() const { return text_; }

 private:
  std::string text_;
};

std::string Label(const char *name, std::string_view value) {
  return std::string(name) + "=\"" + std::string(value) + "\"";
}

void AddRequests(const CounterTable &counters, Lines &lines) {
  const std::string name = "velksharing_requests_total";
  lines.Describe(name, "counter",
                 "Requests that are over, by what they were about, HTTP status and result of the "
                 "access check.");
  for (size_t route = 0; route < kRoutes; ++route) {
    for (size_t status = 0; status < std::size(kStatuses); ++status) {
      for (size_t result = 0; result < std::size(kResults); ++result) {
        const uint64_t count = Value(counters.requests[route][status][result]);
        if (count == 0) continue;
        lines.Add(name,
                  "{" + Label("route", kRouteNames[route]) + "," +
                      Label("status", StatusLabel(status)) + "," +
                      Label("result", kResults[result]) + "}",
                  count);
      }
    }
  }
}

/// The count is that of the buckets, so that all numbers of one scrape belong together.
void AddTimesOf(size_t route, const CounterTable &counters, const std::string &name, Lines &lines) {
  const std::string label = Label("route", kRouteNames[route]);
  const uint64_t sum = Value(counters.time_sums[route]);
  uint64_t count = 0;
  Lines own;
  for (size_t place = 0; place <= kBucketLimits.size(); ++place) {
    const bool has_limit = place < kBucketLimits.size();
    count += Value(counters.times[route][place]);
    const std::string limit =
        has_limit ? Seconds(static_cast<uint64_t>(kBucketLimits[place])) : "+Inf";
    own.Add(name + "_bucket", "{" + label + "," + Label("le", limit) + "}", count);
  }
  if (count == 0) return;
  own.Add(name + "_sum", "{" + label + "}", Seconds(sum));
  own.Add(name + "_count", "{" + label + "}", count);
  lines.Append(own);
}

void AddTimes(const CounterTable &counters, Lines &lines) {
  const std::string name = "velksharing_request_duration_seconds";
  lines.Describe(name, "histogram",
                 "Time from a request's head to its answer, without the sending of it.");
  for (size_t route = 0; route < kRoutes; ++route) AddTimesOf(route, counters, name, lines);
}

void AddRefusals(const CounterTable &counters, Lines &lines) {
  const std::string name = "velksharing_logins_refused_total";
  lines.Describe(name, "counter", "Logins that the access check refused, by its reason.");
  for (const std::string_view reason : kRefusals)
    lines.Add(name, "{" + Label("reason", reason) + "}",
              Value(counters.refused_logins[ResultPlace(reason)]));
}

void AddProcesses(const CounterTable &counters, Lines &lines) {
  const std::string name = "velksharing_processes_replaced_total";
  lines.Describe(name, "counter", "Processes that ended unasked and were replaced.");
  lines.Add(name, "{" + Label("process", "worker") + "}", Value(counters.replaced_workers));
  lines.Add(name, "{" + Label("process", "observer") + "}", Value(counters.replaced_observers));
}

void AddAudit(const CounterTable &counters, Lines &lines) {
  lines.Describe("velksharing_audit_records_total", "counter",
                 "Records stored in the audit trail.");
  lines.Add("velksharing_audit_records_total", "", Value(counters.kept_records));
  const std::string name = "velksharing_audit_records_dropped_total";
  lines.Describe(name, "counter",
                 "Records that are missing in the audit trail, because the observer was too slow "
                 "or the file could not be written.");
  lines.Add(name, "{" + Label("reason", "queue") + "}", Value(counters.records_without_room));
  lines.Add(name, "{" + Label("reason", "file") + "}", Value(counters.records_not_stored));
}

void AddGauge(const std::string &name, const char *help, const std::optional<int> &value,
              Lines &lines) {
  if (!value) return;
  lines.Describe(name, "gauge", help);
  lines.Add(name, "", static_cast<uint64_t>(*value));
}

void AddGauges(const Gauges &gauges, Lines &lines) {
  AddGauge("velksharing_database_up", "Whether the sharing database can be used.",
           gauges.is_database_up ? 1 : 0, lines);
  AddGauge("velksharing_sessions_live", "Sessions that have not lapsed.", gauges.sessions, lines);
  AddGauge("velksharing_grants_live", "Grants of sessions on links that have not lapsed.",
           gauges.grants, lines);
  AddGauge("velksharing_blocked_addresses", "Addresses that are blocked now.",
           gauges.blocked_addresses, lines);
}

void AddBuild(Lines &lines) {
  lines.Describe("velksharing_build_info", "gauge", "The program's version; always 1.");
  lines.Add("velksharing_build_info", "{" + Label("version", VELKSHARING_VERSION) + "}", 1);
}

}  // namespace

std::string MetricsText(const CounterTable &counters, const Gauges &gauges) {
  Lines lines;
  AddRequests(counters, lines);
  AddTimes(counters, lines);
  AddRefusals(counters, lines);
  AddGauges(gauges, lines);
  AddProcesses(counters, lines);
  AddAudit(counters, lines);
  AddBuild(lines);
  return lines.text();
}

}  // namespace web::watch
