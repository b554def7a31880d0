#include <charconv>
#include <exception>
#include <iostream>
#include <string>
#include <string_view>

#include "host.h"
#include "mistake.h"
#include "public_url.h"
#include "settings.h"
#include "velk_paths.h"

namespace {

using namespace sharing_url;

constexpr int kDone = 0;
constexpr int kBadInput = 2;
constexpr int kBroken = 3;

constexpr char kUsage[] = "usage: velksharingurl HASH PORT HTTPS HOST PATH";

constexpr char kHelp[] =
    "\n"
    "Prints the public URL of a sharing link, and on a second line its kind.\n"
    "\n"
    "  HASH    the link\n"
    "  PORT    0 to 65535; 0: the configured one, else the scheme's own\n"
    "  HTTPS   1: https; 0: as configured, else http\n"
    "  HOST    name or address; \"\": the configured one, else the machine's own name\n"
    "  PATH    where the front end lies; \"\": as configured, else /sharing/\n"
    "\n"
    "Kinds: 1 HOST as given, 2 the configured host, 3 the machine's own name.\n"
    "The configuration is " VELK_ROOT
    "/etc/sharing-url.conf (external_host,\n"
    "external_port, https, path); all but its path count only where HOST is \"\".\n"
    "\n"
    "Example:\n"
    "  velksharingurl aB3xK9pQ2 0 1 example.org \"\"\n";

int ParsePort(std::string_view text) {
  int port = 0;
  const char *end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, port);
  if (error != std::errc() || rest != end || text.starts_with('-') || port > 65535)
    throw Mistake("is not a whole number from 0 to 65535");
  return port;
}

bool ParseHttps(std::string_view text) {
  if (text != "0" && text != "1") throw Mistake("is neither 0 nor 1");
  return text == "1";
}

/// What `parse` makes of an argument; a mistake gets the argument's name.
template <typename Parser>
auto Argument(const char *name, Parser parse, const char *text) {
  try {
    return parse(text);
  } catch (const Mistake &mistake) {
    throw Mistake(std::string(name) + " " + mistake.what());
  }
}

Request ParseArguments(const char *const *arguments) {
  const auto unless_empty = [](auto parse) {
    return [parse](const std::string &text) { return text.empty() ? text : parse(text); };
  };
  Request request;
  request.hash = Argument("HASH", HashForUrl, arguments[0]);
  request.port = Argument("PORT", ParsePort, arguments[1]);
  request.https = Argument("HTTPS", ParseHttps, arguments[2]);
  request.host = Argument("HOST", unless_empty(HostForUrl), arguments[3]);
  request.path = Argument("PATH", unless_empty(PathForUrl), arguments[4]);
  return request;
}

int Complain(int status, const std::string &message) {
  std::cerr << "velksharingurl: " << message << '\n';
  return status;
}

int Run(int argc, const char *const *argv) {
  const std::string_view first = argc == 2 ? argv[1] : "";
  if (first == "--help") {
    std::cout << kUsage << '\n' << kHelp;
    return kDone;
  }
  if (first == "--version") {
    std::cout << "velksharingurl " VELKSHARING_VERSION "\n";
    return kDone;
  }
  if (argc != 6)
    return Complain(kBadInput, "exactly five arguments are needed, some may be empty\n" +
                                   std::string(kUsage) + "; see --help");
  const PublicUrl answer = ComposeUrl(ParseArguments(argv + 1), ReadSettings());
  std::cout << answer.url << '\n' << answer.kind << '\n';
  return kDone;
}

}  // namespace

int main(int argc, char **argv) {
  try {
    const int status = Run(argc, argv);
    if (std::cout.flush()) return status;
    return Complain(kBroken, "the output could not be written");
  } catch (const Mistake &mistake) {
    return Complain(kBadInput, mistake.what());
  } catch (const std::exception &exception) {
    return Complain(kBroken, exception.what());
  }
}
