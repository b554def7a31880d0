#include <malloc.h>
#include <sys/resource.h>
#include <syslog.h>

#include <unistd.h>
#include <chrono>
#include <cstdlib>
#include <exception>
#include <iostream>
#include <optional>

#include "common/config_file.h"
#include "server/embedded_server.h"
#include "server/fastcgi_server.h"
#include "server/notebook.h"
#include "server/observer.h"
#include "server/options.h"
#include "server/plain_cgi.h"
#include "server/privileges.h"
#include "server/runtime_folder.h"
#include "server/service.h"
#include "server/sockets.h"
#include "server/supervisor.h"
#include "site/turn.h"
#include "watch/watch.h"

namespace {

using namespace web;

constexpr int kDone = 0;
constexpr int kBadInput = 2;
constexpr int kBroken = 3;

/// Messages go to the system log and to standard error, unless that is the same place.
void OpenLog() {
  const int to_stderr = getenv("JOURNAL_STREAM") == nullptr ? LOG_PERROR : 0;
  openlog("velksharing-web", LOG_PID | to_stderr, LOG_DAEMON);
}

/// A connection takes two descriptors; the usual limit is for programs with fewer.
void RaiseDescriptorLimit() {
  rlimit limit = {};
  if (getrlimit(RLIMIT_NOFILE, &limit) != 0) return;
  limit.rlim_cur = limit.rlim_max;
  setrlimit(RLIMIT_NOFILE, &limit);
}

UniqueFd OpenSocket(const Settings &settings, Mode mode) {
  const SocketAccess access{settings.socket_mode, settings.socket_group};
  if (!settings.listen.empty()) return Listen(settings.listen, access);
  if (!settings.fastcgi.empty()) return Listen(settings.fastcgi, access);
  UniqueFd inherited = InheritedSocket();
  if (inherited.IsOpen()) return inherited;
  if (mode == Mode::FASTCGI)
    throw std::runtime_error("no socket was handed over; name one: --fastcgi SOCKET");
  return Listen(kDefaultListen, access);
}

UniqueFd OpenMetricsSocket(const Settings &settings) {
  if (settings.metrics_listen.empty()) return UniqueFd();
  UniqueFd socket = Listen(settings.metrics_listen, {settings.socket_mode, settings.socket_group});
  syslog(LOG_INFO, "metrics on %s", AddressOf(socket.get()).c_str());
  return socket;
}

/// A question that comes in another way than the setting says gets a no. That is safe, but nobody
/// would see why.
void WarnOfDeafGate(const Settings &settings, Mode mode) {
  const bool is_http = mode == Mode::EMBEDDED;
  if (settings.auth_address == AuthAddress::OFF || IsAskedByHttp(settings.auth_address) == is_http)
    return;
  syslog(LOG_WARNING,
         "auth_address is for questions by %s, and this serves %s: every question gets a no",
         is_http ? "FastCGI" : "HTTP", is_http ? "HTTP" : "FastCGI");
}

/// What all processes of a server have from the time before they were forked.
struct Inheritance {
  const Settings &settings;
  UniqueFd socket;
  UniqueFd metrics_socket;
  std::string form_secret;
  std::optional<watch::Watch> watch;  ///< Nothing where nobody observes.

  watch::AuditChannel *channel() { return watch ? watch->channel() : nullptr; }
};

/// Serves until told to stop, then finishes what runs.
template <typename Server>
int Work(Inheritance &common, WorkerSignals &signals) {
  common.metrics_socket.Reset();
  if (common.channel() != nullptr) common.channel()->CloseReceiver();
  const Settings &settings = common.settings;
  Service service(settings, common.form_secret, common.watch ? &*common.watch : nullptr);
  service.Load();
  Server server(common.socket.get(), settings, service);
  while (signals.Wait() == WorkerSignals::Kind::RELOAD) service.Load();
  service.BeginStop();
  server.StopAccepting();
  common.socket.Reset();
  service.WaitUntilIdle(std::chrono::seconds(settings.stop_timeout));
  return service.ExitStatus();
}

int ObserveWork(Inheritance &common, WorkerSignals &signals) {
  common.socket.Reset();
  return Observe(common.settings, std::move(common.metrics_socket), *common.watch, signals);
}

void CountLost(Inheritance &common, Task task) {
  if (!common.watch) return;
  watch::CounterTable &counters = common.watch->counters().table();
  watch::Add(task == Task::WORK ? counters.replaced_workers : counters.replaced_observers);
}

void BeginStop(Inheritance &common) {
  // New visitors are turned away at once, and not left waiting for nobody.
  common.socket.Reset();
  common.metrics_socket.Reset();
  // So that the observer sees when the last worker has ended.
  if (common.channel() != nullptr) common.channel()->CloseSender();
}

int SuperviseWork(Inheritance &common, Mode mode) {
  Supervision supervision;
  supervision.workers = common.settings.workers;
  supervision.has_observer = common.watch.has_value();
  supervision.stop_timeout = std::chrono::seconds(common.settings.stop_timeout);
  const auto work = mode == Mode::FASTCGI ? &Work<FastCgiServer> : &Work<EmbeddedServer>;
  supervision.work = [&common, work](Task task, WorkerSignals &signals) {
    return task == Task::WORK ? work(common, signals) : ObserveWork(common, signals);
  };
  supervision.lost = [&common](Task task) { CountLost(common, task); };
  supervision.stopping = [&common] { BeginStop(common); };
  return Supervise(supervision);
}

int Serve(const Options &options) {
  const Settings &settings = options.settings;
  PrepareSignals();
  RaiseDescriptorLimit();
  Inheritance common{settings, OpenSocket(settings, options.mode), OpenMetricsSocket(settings), "",
                     std::nullopt};
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  common.form_secret = FormSecret(settings.runtime_folder);
  ShareTurns();
  if (settings.keeps_audit || common.metrics_socket.IsOpen())
    common.watch.emplace(settings.keeps_audit);
  WarnOfDeafGate(settings, options.mode);
  syslog(LOG_INFO, "%s on %s", options.mode == Mode::FASTCGI ? "FastCGI" : "HTTP",
         AddressOf(common.socket.get()).c_str());
  return SuperviseWork(common, options.mode);
}

/// The command line is left alone: some web servers put words of the address there.
int ServeOne() {
  const Settings settings = ReadSettings(kConfigPath);
  PrepareSignals();
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  Notebook notebook;
  Service service(settings, FormSecret(settings.runtime_folder), &notebook);
  service.Load();
  const int status = ServePlainCgi(settings, service);
  if (settings.keeps_audit) notebook.Store(settings);
  return status;
}

/// What only shows when it is used: the site's texts and templates.
int Check(const Settings &settings) {
  Service service(settings, "");
  return service.Load() ? kDone : kBadInput;
}

int Run(int argc, char **argv) {
  OpenLog();
  // Threads come and go; each with memory of its own would make the process large.
  mallopt(M_ARENA_MAX, 2);
  if (IsPlainCgi()) return ServeOne();
  int status = kDone;
  const auto options = ReadOptions(argc, argv, status);
  if (!options) return status;
  return options->only_check ? Check(options->settings) : Serve(*options);
}

}  // namespace

int main(int argc, char **argv) {
  try {
    return Run(argc, argv);
  } catch (const velk::ConfigMistake &mistake) {
    syslog(LOG_ERR, "%s", mistake.what());
    return kBadInput;
  } catch (const std::exception &error) {
    syslog(LOG_ERR, "%s", error.what());
    return kBroken;
  }
}
