#include <memory>

#include "command.h"
#include "operations/address.h"
#include "operations/visit.h"
#include "output.h"
#include "password_input.h"
#include "session_option.h"
#include "text_option.h"

namespace command_line {
namespace {

using namespace operations;

struct VisitOptions {
  std::string hash;
  std::string address = "127.0.0.1";
  TextOption account;
  bool no_password = false;
  bool keep_block_state = false;
  PasswordSource password;
  SessionOption session;
};

void AddVisitor(CLI::App &command, VisitOptions &options) {
  command.add_option("HASH", options.hash, "The link")->required();
  command.add_option("--ip", options.address, "The visitor's address; 127.0.0.1 when not given")
      ->type_name("ADDRESS");
  options.session.AddTo(command);
}

void AddCredentials(CLI::App &command, VisitOptions &options) {
  options.account.AddTo(command, "--as", "USER", "Account that the visitor names");
  options.password.AddTo(command);
  command.add_flag("--no-password", options.no_password, "Present no password and ask for none")
      ->excludes(options.password.from_input())
      ->excludes(options.password.from_file());
}

Visit ToVisit(const VisitOptions &options) {
  Visit visit;
  visit.hash = options.hash;
  visit.address = ParseAddress(options.address);
  visit.session_id = options.session.Read();
  visit.keep_block_state = options.keep_block_state;
  visit.account = options.account.value();
  return visit;
}

/// The password from where the options say, else asked for.
std::optional<Secret> ReadPassword(const VisitOptions &options, const std::string &question) {
  if (options.no_password) return std::nullopt;
  std::optional<Secret> password = options.password.Read();
  return password ? std::move(password) : AskSecret(question);
}

void AddAccountPassword(const VisitOptions &options, Visit &visit) {
  if (visit.account)
    visit.account_password = ReadPassword(options, "Password of " + SafeText(*visit.account));
}

void PrintResult(const VisitResult &result, const Secret *session_id, const Request &request) {
  if (request.json) {
    Json::Value json(Json::objectValue);
    json["code"] = result.code;
    json["name"] = result.name;
    json["meaning"] = result.meaning;
    if (session_id != nullptr) json["session_id"] = session_id->c_str();
    return PrintJson(json);
  }
  PrintLine(std::to_string(result.code) + " " + result.name + ": " + result.meaning);
  if (session_id != nullptr) PrintLine(std::string("session ") + session_id->c_str());
}

ExitStatus StatusOf(const VisitResult &result) {
  return result.code == 1 ? EXIT_DONE : EXIT_REFUSED;
}

ExitStatus RunLogin(const VisitOptions &options, const Request &request) {
  SharingDB &db = SharingDatabase();
  Visit visit = ToVisit(options);
  const Credential asked = CredentialOf(db, visit.hash);
  if (asked == LINK_PASSWORD) visit.link_password = ReadPassword(options, "Password of the link");
  if (asked == ACCOUNT && !visit.account && !options.no_password)
    throw Failure(Failure::INVALID, "this link asks for an account: name it with --as");
  if (asked == ACCOUNT) AddAccountPassword(options, visit);
  Secret session_id;
  const VisitResult result = LogIn(visit, session_id);
  PrintResult(result, result.code == 1 ? &session_id : nullptr, request);
  return StatusOf(result);
}

ExitStatus RunCheck(const VisitOptions &options, const Request &request) {
  SharingDB &db = SharingDatabase();
  Visit visit = ToVisit(options);
  if (CredentialOf(db, visit.hash) == ACCOUNT) AddAccountPassword(options, visit);
  const VisitResult result = Check(visit);
  PrintResult(result, nullptr, request);
  return StatusOf(result);
}

ExitStatus RunLogout(const VisitOptions &options, const Request &request) {
  SharingDatabase();
  const VisitResult result = LogOut(ToVisit(options));
  PrintResult(result, nullptr, request);
  return StatusOf(result);
}

void AddLogin(CLI::App &group, Request &request) {
  auto options = std::make_shared<VisitOptions>();
  CLI::App *command =
      AddCommand(group, request, "login", "Log in to a link and print the session's identifier",
                 "visit login aB3xK9pQ2 --ip 203.0.113.7",
                 [options, &request] { return RunLogin(*options, request); });
  AddVisitor(*command, *options);
  AddCredentials(*command, *options);
  command->add_flag("--keep-block-state", options->keep_block_state,
                    "Report no account that is not permitted, forget no failure on success");
}

void AddCheck(CLI::App &group, Request &request) {
  auto options = std::make_shared<VisitOptions>();
  CLI::App *command =
      AddCommand(group, request, "check", "Ask whether a session may still use a link",
                 "visit check aB3xK9pQ2 --session-file session.txt",
                 [options, &request] { return RunCheck(*options, request); });
  AddVisitor(*command, *options);
  AddCredentials(*command, *options);
  options->session.Require();
}

void AddLogout(CLI::App &group, Request &request) {
  auto options = std::make_shared<VisitOptions>();
  CLI::App *command = AddCommand(group, request, "logout", "Take a session's grant on a link away",
                                 "visit logout aB3xK9pQ2 --session-file session.txt",
                                 [options, &request] { return RunLogout(*options, request); });
  AddVisitor(*command, *options);
  options->session.Require();
}

}  // namespace

void AddVisitCommands(CLI::App &program, Request &request) {
  CLI::App *group = AddGroup(program, "visit", "Act as a visitor through the access API",
                             "visit login aB3xK9pQ2");
  AddLogin(*group, request);
  AddCheck(*group, request);
  AddLogout(*group, request);
}

}  // namespace command_line
