#ifndef VELKSHARING_WEB_SERVER_SETTINGS_H
#define VELKSHARING_WEB_SERVER_SETTINGS_H

#include <sys/types.h>

#include <chrono>
#include <string>
#include <string_view>
#include <vector>

#include "gate/guarded_prefix.h"
#include "velk_paths.h"
#include "watch/shortened_address.h"

namespace web {

/// How the bytes of files reach the visitor under FastCGI.
enum class FileDelivery {
  COPY,              ///< Through this program.
  X_ACCEL_REDIRECT,  ///< The web server reads them, told by an internal address (nginx).
  X_SENDFILE,        ///< The web server reads them, told by a path (lighttpd, Apache).
};

/// Where a web server that asks whether a visitor may see something names what that is.
enum class AuthAddress {
  OFF,             ///< Nowhere: no visitor may see anything.
  PARAMETER,       ///< FastCGI parameter VELK_SHARING_AUTH.
  AUTHORIZER,      ///< In the variables of a FastCGI authorizer: its own view of the request.
  X_FORWARDED,     ///< Header fields X-Forwarded-Proto, X-Forwarded-Host, X-Forwarded-Uri.
  X_ORIGINAL_URL,  ///< Header field X-Original-URL.
};

/// What VELK_ROOT/etc/sharing-web.conf and the command line decide. docs/man/velksharing-web.8
/// tells what each key means; here they have their names, checked, with their defaults.
struct Settings {
  std::string listen;   ///< "" where neither `listen` nor `fastcgi` is given: the default address.
  std::string fastcgi;  ///< Path or loopback address of the FastCGI socket; "" for none.
  mode_t socket_mode = 0660;
  std::string socket_group;  ///< Name of an existing group; "" for this program's own.
  int workers = 4;
  int connections = 256;                     ///< Of one worker, embedded.
  int threads = 64;                          ///< Of one worker, FastCGI.
  int stop_timeout = 30;                     ///< In seconds.
  std::vector<std::string> trusted_proxies;  ///< Addresses as the C library prints them, "unix".

  std::string path = "/sharing";
  std::string site_folder;
  std::string product_name;
  std::string runtime_folder = VELK_ROOT "/etc/private/sharing-web";
  long retry_after = 600;  ///< In seconds.

  AuthAddress auth_address = AuthAddress::OFF;
  std::vector<gate::GuardedPrefix> guarded;  ///< Key "protect".

  std::string access_log = "stderr";  ///< "off", "stderr", "syslog" or an absolute path.

  std::string metrics_listen;  ///< A loopback address or a path, as Listen() takes it; "" for none.
  bool keeps_audit = false;
  int audit_retention = 90;  ///< In days.
  watch::AddressForm audit_address = watch::AddressForm::NETWORK;

  FileDelivery file_delivery = FileDelivery::COPY;
  std::vector<std::string> file_folders;  ///< Absolute, without a slash at the end.
  std::string accel_location = "/velk-files";
};

/// The file that is read where the command line names no other.
inline constexpr char kConfigPath[] = VELK_ROOT "/etc/sharing-web.conf";

/// Where visitors are waited for when nothing else is said.
inline constexpr char kDefaultListen[] = "127.0.0.1:8080";

/// Puts one setting in.
/// @throws velk::ConfigMistake naming the key.
void Apply(std::string_view key, std::string_view value, Settings &settings);

/// Settings of a file; a missing one leaves everything at its default.
/// @throws velk::ConfigMistake naming file, line and key.
Settings ReadSettings(const std::string &file);

/// Whether the address that a question is about comes by HTTP; if not, it comes by FastCGI.
bool IsAskedByHttp(AuthAddress address);

/// How long records of the audit trail are kept.
std::chrono::hours AuditRetention(const Settings &settings);

/// What only shows when all settings are known.
/// @throws velk::ConfigMistake.
void CheckTogether(const Settings &settings);

}  // namespace web

#endif
