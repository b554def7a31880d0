// Counters that processes share, and the text that tells them.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <thread>
#include <vector>

#include "watch/counters.h"
#include "watch/metrics_text.h"

namespace {

using std::chrono::microseconds;
using testing::HasSubstr;
using testing::Not;
using web::watch::Counters;
using web::watch::Finished;
using web::watch::Gauges;
using web::watch::MetricsText;

Finished Sample() {
  Finished request;
  request.route = "login";
  request.status = 401;
  request.result = "VELK_SHARING_LOGIN_WRONG_PASSWORD";
  request.is_login = true;
  request.answer_time = microseconds(1'000);
  return request;
}

std::string TextOf(const Counters &counters) {
  return MetricsText(counters.table(), {});
}

TEST(WatchMetrics, ARequestIsCountedByRouteStatusAndResult) {
  Counters counters;
  counters.Count(Sample());
  counters.Count(Sample());
  EXPECT_THAT(TextOf(counters),
              HasSubstr("\nvelksharing_requests_total{route=\"login\",status=\"401\","
                        "result=\"WRONG_PASSWORD\"} 2\n"));
}

TEST(WatchMetrics, WhatHasNoPlaceOfItsOwnIsCountedAsOther) {
  Counters counters;
  counters.Count({"a route\"\n", 299, "VELK_SHARING_LOGIN_NEW", true, std::nullopt});
  EXPECT_THAT(TextOf(counters),
              HasSubstr("{route=\"none\",status=\"other\",result=\"other\"} 1\n"));
}

TEST(WatchMetrics, ABrokenConnectionHasNoStatusAndNoTime) {
  Counters counters;
  counters.Count({"none", 0, "", false, std::nullopt});
  EXPECT_THAT(TextOf(counters), HasSubstr("{route=\"none\",status=\"none\",result=\"none\"} 1\n"));
  EXPECT_THAT(TextOf(counters), Not(HasSubstr("duration_seconds_count{")));
}

TEST(WatchMetrics, TheHistogramIsCumulative) {
  Counters counters;
  for (const int time : {499, 500, 501, 9'999'999, 10'000'001}) {
    Finished request = Sample();
    request.answer_time = microseconds(time);
    counters.Count(request);
  }
  const std::string text = TextOf(counters);
  const std::string bucket = "velksharing_request_duration_seconds_bucket{route=\"login\",le=\"";
  EXPECT_THAT(text, HasSubstr(bucket + "0.0005\"} 2\n"));
  EXPECT_THAT(text, HasSubstr(bucket + "0.001\"} 3\n"));
  EXPECT_THAT(text, HasSubstr(bucket + "5\"} 3\n"));
  EXPECT_THAT(text, HasSubstr(bucket + "10\"} 4\n"));
  EXPECT_THAT(text, HasSubstr(bucket + "+Inf\"} 5\n"));
  EXPECT_THAT(text, HasSubstr("duration_seconds_sum{route=\"login\"} 20.0015\n"));
  EXPECT_THAT(text, HasSubstr("duration_seconds_count{route=\"login\"} 5\n"));
}

TEST(WatchMetrics, OnlyRefusedLoginsAreCountedAsSuch) {
  Counters counters;
  counters.Count(Sample());
  Finished let_in = Sample();
  let_in.result = "VELK_SHARING_LOGIN_OK";
  counters.Count(let_in);
  Finished check = Sample();
  check.is_login = false;
  check.result = "VELK_SHARING_AUTH_REFUSED";
  counters.Count(check);
  const std::string name = "velksharing_logins_refused_total{reason=";
  EXPECT_THAT(TextOf(counters), HasSubstr(name + "\"WRONG_PASSWORD\"} 1\n"));
  EXPECT_THAT(TextOf(counters), HasSubstr(name + "\"REFUSED\"} 0\n"));
  EXPECT_THAT(TextOf(counters), Not(HasSubstr(name + "\"OK\"")));
}

TEST(WatchMetrics, WhatIsNotKnownIsLeftOut) {
  const Counters counters;
  Gauges gauges;
  EXPECT_THAT(MetricsText(counters.table(), gauges), HasSubstr("velksharing_database_up 0\n"));
  EXPECT_THAT(MetricsText(counters.table(), gauges), Not(HasSubstr("velksharing_sessions_live")));
  gauges = {true, 3, 4, 0};
  const std::string text = MetricsText(counters.table(), gauges);
  EXPECT_THAT(text, HasSubstr("velksharing_database_up 1\n"));
  EXPECT_THAT(text, HasSubstr("velksharing_sessions_live 3\n"));
  EXPECT_THAT(text, HasSubstr("velksharing_grants_live 4\n"));
  EXPECT_THAT(text, HasSubstr("velksharing_blocked_addresses 0\n"));
}

TEST(WatchMetrics, WhatKilledProcessesHaveCountedStays) {
  Counters counters;
  constexpr int kProcesses = 4;
  constexpr int kRequests = 10'000;
  for (int i = 0; i < kProcesses; ++i) {
    if (fork() != 0) continue;
    std::thread other([&] {
      for (int j = 0; j < kRequests; ++j) counters.Count(Sample());
    });
    for (int j = 0; j < kRequests; ++j) counters.Count(Sample());
    other.join();
    kill(getpid(), SIGKILL);
  }
  while (wait(nullptr) > 0) {
  }
  EXPECT_THAT(TextOf(counters), HasSubstr("result=\"WRONG_PASSWORD\"} 80000\n"));
}

}  // namespace
