#include <fcntl.h>
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
#include "server/observer.h"
#include "server/options.h"
#include "server/plain_cgi.h"
#include "server/privileges.h"
#include "server/runtime_folder.h"
#include "server/service.h"
#include "server/sockets.h"
#include "server/supervisor.h"
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

/// By paths, only this program's own account may read metrics.
UniqueFd OpenMetricsSocket(const Settings &settings) {
  if (settings.metrics_listen.empty()) return UniqueFd();
  UniqueFd socket = Listen(settings.metrics_listen, {settings.socket_mode, settings.socket_group});
  syslog(LOG_INFO, "metrics on %s", AddressOf(socket.get()).c_str());
  return socket;
}

/// Serves until told to stop, then finishes what runs.
template <typename Server>
int Work(UniqueFd &socket, const Settings &settings, const std::string &form_secret,
         watch::Witness *witness, WorkerSignals &signals) {
  Service service(settings, form_secret, witness);
  service.Load();
  Server server(socket.get(), settings, service);
  while (signals.Wait() == WorkerSignals::Kind::RELOAD) service.Load();
  service.BeginStop();
  server.StopAccepting();
  socket.Reset();
  service.WaitUntilIdle(std::chrono::seconds(settings.stop_timeout));
  return service.ExitStatus();
}

int Serve(const Options &options) {
  const Settings &settings = options.settings;
  PrepareSignals();
  RaiseDescriptorLimit();
  UniqueFd socket = OpenSocket(settings, options.mode);
  UniqueFd metrics_socket = OpenMetricsSocket(settings);
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  const std::string secret = FormSecret(settings.runtime_folder);
  const bool is_fastcgi = options.mode == Mode::FASTCGI;
  syslog(LOG_INFO, "%s on %s", is_fastcgi ? "FastCGI" : "HTTP", AddressOf(socket.get()).c_str());
  const auto work = is_fastcgi ? &Work<FastCgiServer> : &Work<EmbeddedServer>;
  std::optional<watch::Watch> watch;
  if (settings.keeps_audit || metrics_socket.IsOpen()) watch.emplace(settings.keeps_audit);
  watch::AuditChannel *const channel = watch ? watch->channel() : nullptr;

  Supervision supervision;
  supervision.workers = settings.workers;
  supervision.has_observer = watch.has_value();
  supervision.stop_timeout = std::chrono::seconds(settings.stop_timeout);
  supervision.work = [&](Task task, WorkerSignals &signals) {
    if (task == Task::OBSERVE) {
      socket.Reset();
      return Observe(settings, std::move(metrics_socket), *watch, signals);
    }
    metrics_socket.Reset();
    if (channel != nullptr) channel->CloseReceiver();
    return work(socket, settings, secret, watch ? &*watch : nullptr, signals);
  };
  supervision.lost = [&](Task task) {
    if (!watch) return;
    watch::CounterTable &counters = watch->counters().table();
    watch::Add(task == Task::WORK ? counters.replaced_workers : counters.replaced_observers);
  };
  supervision.stopping = [&] {
    // New visitors are turned away at once, and not left waiting for nobody.
    socket.Reset();
    metrics_socket.Reset();
    // So that the observer sees when the last worker has ended.
    if (channel != nullptr) channel->CloseSender();
  };
  return Supervise(supervision);
}

/// What one request by CGI had to say, until its visitor has the answer.
class Notebook : public watch::Witness {
 public:
  void Keep(const audit::Record &record) override { records_.push_back(record); }
  void Count(const watch::Finished &) override {}

  const std::vector<audit::Record> &records() const { return records_; }

 private:
  std::vector<audit::Record> records_;
};

/// The web server takes the answer for whole when the process's output ends.
void CloseOutput() {
  const UniqueFd nothing(open("/dev/null", O_WRONLY | O_CLOEXEC));
  dup2(nothing.get(), STDOUT_FILENO);
}

/// The command line is left alone: some web servers put words of the address there.
int ServeOne() {
  const Settings settings = ReadSettings(kConfigPath);
  PrepareSignals();
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  Notebook notebook;
  Service service(settings, FormSecret(settings.runtime_folder),
                  settings.keeps_audit ? &notebook : nullptr);
  service.Load();
  const int status = ServePlainCgi(service);
  CloseOutput();
  StoreAuditRecords(settings, notebook.records());
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
