#include <clocale>
#include <exception>
#include <iostream>
#include <memory>
#include <optional>
#include <string_view>

#include "command.h"
#include "output.h"

namespace {

using namespace command_line;

/// The options that nobody knows. Other surplus texts are not repeated here: one may be a password
/// that was not meant to be an argument.
std::string UnknownOptions(const CLI::App &program) {
  std::string text;
  for (const std::string &argument : program.remaining(true))
    if (argument.starts_with("-")) text += " " + argument.substr(0, argument.find('='));
  return text;
}

/// The innermost group or command that was named.
const CLI::App &Named(const CLI::App &program) {
  const CLI::App *app = &program;
  while (!app->get_subcommands().empty()) app = app->get_subcommands().front();
  return *app;
}

bool IsGroup(const CLI::App &app) {
  return !app.get_subcommands([](const CLI::App *) { return true; }).empty();
}

/// Flags are the only ones without a check of their own that tells what they take.
std::string ConversionMessage(const std::string &message) {
  constexpr std::string_view kBefore = "Could not convert: ";
  if (!message.starts_with(kBefore)) return "an option has a value that it cannot take";
  // What follows the name may be a secret.
  return message.substr(kBefore.size(), message.find(" = ") - kBefore.size()) + " takes no value";
}

std::string MismatchMessage(const std::string &message) {
  const std::string name = message.substr(0, message.find(':'));
  return name + (message.ends_with(" missing") ? " needs a value" : " is given more than once");
}

std::string UsageMessage(const CLI::App &program, const CLI::ParseError &error) {
  const std::string message = error.what();
  if (dynamic_cast<const CLI::ConversionError *>(&error) != nullptr)
    return ConversionMessage(message);
  if (dynamic_cast<const CLI::ArgumentMismatch *>(&error) != nullptr)
    return MismatchMessage(message);
  const bool missing = dynamic_cast<const CLI::RequiredError *>(&error) != nullptr;
  const bool surplus = dynamic_cast<const CLI::ExtrasError *>(&error) != nullptr;
  if (!missing && !surplus) return message;
  // What is missing may be there under a mistyped name.
  const std::string unknown = UnknownOptions(program);
  if (!unknown.empty()) return "unknown option:" + unknown;
  if (surplus) return "an argument too many; a password is never an argument";
  if (!IsGroup(Named(program))) return message;
  return program.remaining(true).empty() ? "a command is needed" : "there is no such command";
}

/// Help without the lists of options that exclude each other: the refusal names them.
class HelpFormatter : public CLI::Formatter {
 public:
  std::string make_option_opts(const CLI::Option *option) const override {
    const bool flag = option->get_type_size() == 0;
    return flag || option->get_positional() ? "" : " " + option->get_type_name();
  }
};

/// A group's or command's name with all names before it.
std::string FullName(const CLI::App &app) {
  if (app.get_parent() == nullptr) return app.get_name();
  return FullName(*app.get_parent()) + " " + app.get_name();
}

/// @return what the program ends with when there is nothing to do.
std::optional<ExitStatus> Parse(CLI::App &program, int argc, char **argv) {
  try {
    program.parse(argc, argv);
    return std::nullopt;
  } catch (const CLI::Success &help) {
    program.exit(help);
    return EXIT_DONE;
  } catch (const CLI::ParseError &error) {
    PrintError(UsageMessage(program, error) + "; see " + FullName(Named(program)) + " --help");
    return EXIT_USAGE;
  }
}

ExitStatus Run(const Request &request) {
  try {
    return request.action();
  } catch (const operations::Failure &failure) {
    return Report(failure);
  } catch (const std::exception &exception) {
    PrintError(exception.what());
    return EXIT_BROKEN;
  }
}

}  // namespace

int main(int argc, char **argv) {
  // Only the characters: numbers and messages stay the same everywhere.
  std::setlocale(LC_CTYPE, "C.UTF-8");

  CLI::App program("Manages sharing links, visitors' sessions and the sharing database.",
                   "velksharing");
  program.formatter(std::make_shared<HelpFormatter>());
  program.set_version_flag("--version", "velksharing " VELKSHARING_VERSION);
  program.footer("Example:\n  velksharing link create --project files --path /srv/photos");
  program.require_subcommand(1);
  Request request;
  AddLinkCommands(program, request);
  AddSessionCommands(program, request);
  AddTokenCommands(program, request);
  AddBlockCommands(program, request);
  AddVisitCommands(program, request);
  AddDatabaseCommands(program, request);

  const std::optional<ExitStatus> parsed = Parse(program, argc, argv);
  const ExitStatus status = parsed ? *parsed : Run(request);
  if (std::cout.flush()) return status;
  std::cerr << "velksharing: the output could not be written\n";
  return EXIT_BROKEN;
}
