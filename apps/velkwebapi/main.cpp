#include <exception>
#include <iostream>
#include <string>
#include <vector>

#include "apis.h"
#include "reply.h"
#include "request.h"

namespace {

using namespace webapi;

constexpr int kUnderstood = 0;
constexpr int kUsageMistake = 2;
constexpr int kBroken = 3;

constexpr char kUsage[] = "usage: velkwebapi --exec api=NAME version=N method=NAME [key=value ...]";

void PrintHelp() {
  std::cout << kUsage
            << "\n\n"
               "Does one request of the web API and prints one JSON document: {\"success\": true,\n"
               "\"data\": ...} or {\"success\": false, \"error\": {\"code\": N, \"message\": "
               "...}}.\n";
  for (const Api &api : Apis()) {
    std::cout << "\n" << api.name << ", version " << api.version << ":\n";
    for (const Method &method : api.methods)
      std::cout << "  " << method.name << std::string(9 - method.name.size(), ' ')
                << method.description << '\n';
  }
  std::cout << "\nThe parameters of each:\n"
               "  velkwebapi --exec api=VELK.API.Info version=1 method=query\n"
               "\nExample:\n"
               "  velkwebapi --exec api=VELK.Sharing.Link version=1 method=list state=expired\n";
}

int Complain(int status, const std::string &message) {
  std::cerr << "velkwebapi: " << message << '\n';
  return status;
}

int Run(const std::vector<std::string> &arguments) {
  if (arguments == std::vector<std::string>{"--help"}) {
    PrintHelp();
    return kUnderstood;
  }
  if (arguments == std::vector<std::string>{"--version"}) {
    std::cout << "velkwebapi " VELKSHARING_VERSION "\n";
    return kUnderstood;
  }
  std::cout << ReplyText(Answer(ParseRequest(arguments))) << '\n';
  return kUnderstood;
}

}  // namespace

int main(int argc, char **argv) {
  try {
    const int status = Run({argv + 1, argv + argc});
    if (std::cout.flush()) return status;
    return Complain(kBroken, "the answer could not be written");
  } catch (const UsageMistake &mistake) {
    return Complain(kUsageMistake, std::string(mistake.what()) + "\n" + kUsage + "; see --help");
  } catch (const std::exception &exception) {
    return Complain(kBroken, exception.what());
  }
}
