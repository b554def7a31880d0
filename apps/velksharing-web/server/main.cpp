#include <malloc.h>
#include <sys/resource.h>
#include <syslog.h>

#include <unistd.h>
#include <chrono>
#include <cstdlib>
#include <exception>
#include <iostream>

#include "common/config_file.h"
#include "server/embedded_server.h"
#include "server/fastcgi_server.h"
#include "server/options.h"
#include "server/plain_cgi.h"
#include "server/privileges.h"
#include "server/runtime_folder.h"
#include "server/service.h"
#include "server/sockets.h"
#include "server/supervisor.h"
#include "site/turn.h"

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

/// Serves until told to stop, then finishes what runs.
template <typename Server>
int Work(UniqueFd &socket, const Settings &settings, const std::string &form_secret,
         WorkerSignals &signals) {
  Service service(settings, form_secret);
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
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  const std::string secret = FormSecret(settings.runtime_folder);
  ShareTurns();
  const bool is_fastcgi = options.mode == Mode::FASTCGI;
  syslog(LOG_INFO, "%s on %s", is_fastcgi ? "FastCGI" : "HTTP", AddressOf(socket.get()).c_str());
  const auto work = is_fastcgi ? &Work<FastCgiServer> : &Work<EmbeddedServer>;
  return Supervise(
      settings.workers, std::chrono::seconds(settings.stop_timeout),
      [&](WorkerSignals &signals) { return work(socket, settings, secret, signals); },
      // New visitors are turned away at once, and not left waiting for nobody.
      [&] { socket.Reset(); });
}

/// The command line is left alone: some web servers put words of the address there.
int ServeOne() {
  const Settings settings = ReadSettings(kConfigPath);
  PrepareSignals();
  MakeRuntimeFolder(settings.runtime_folder);
  LimitPrivileges();
  Service service(settings, FormSecret(settings.runtime_folder));
  service.Load();
  return ServePlainCgi(service);
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
