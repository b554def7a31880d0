#ifndef VELKSHARING_WEB_WATCH_METRICS_TEXT_H
#define VELKSHARING_WEB_WATCH_METRICS_TEXT_H

#include <string>

#include "watch/counters.h"
#include "watch/gauges.h"

namespace web::watch {

/// The media type of the text.
inline constexpr char kMetricsType[] = "text/plain; version=0.0.4; charset=utf-8";

/// All metrics in Prometheus' text format. Requests that did not happen are left out, and so are
/// gauges that are not known; every reason for a refused login is there.
std::string MetricsText(const CounterTable &counters, const Gauges &gauges);

}  // namespace web::watch

#endif
