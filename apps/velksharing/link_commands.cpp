#include <unistd.h>

#include <memory>

#include "command.h"
#include "link_options.h"
#include "operations/accounts.h"
#include "operations/address.h"
#include "operations/json_document.h"
#include "operations/json_form.h"
#include "operations/link_url.h"
#include "operations/links.h"
#include "operations/moment.h"
#include "operations/permissions.h"
#include "operations/unfinished_file.h"
#include "operations/verdict.h"
#include "output.h"
#include "qr_code.h"
#include "session_option.h"
#include "text_option.h"

namespace command_line {
namespace {

using namespace operations;

std::string Joined(const std::vector<std::string> &names) {
  std::string text;
  for (const std::string &name : names) text += (text.empty() ? "" : ", ") + name;
  return text;
}

std::string NeverCounted(const Permissions &permissions) {
  std::vector<std::string> names = permissions.unknown_users;
  names.insert(names.end(), permissions.unknown_groups.begin(), permissions.unknown_groups.end());
  return Joined(names);
}

std::string UsesText(const Entry &link) {
  const std::string count = std::to_string(link.get_use_count());
  if (link.get_expire_times() <= 0) return count;
  return count + " of " + std::to_string(link.get_expire_times());
}

std::string LimitText(long moment, const char *unset) {
  return moment > 0 ? MomentText(moment) : unset;
}

const char *YesNo(bool yes) {
  return yes ? "yes" : "no";
}

void PrintLink(const Entry &link) {
  const Permissions permissions = StoredPermissions(link);
  PrintDetails({
      {"hash", link.get_hash()},
      {"id", std::to_string(link.get_id())},
      {"state", LinkStateName(StateOf(link, Now()))},
      {"project", link.get_project_name()},
      {"owner", AccountText(link.get_owner_uid())},
      {"protection", ProtectTypeName(link.get_protect_type())},
      {"title", link.get_protect_title()},
      {"accounts", Joined(link.get_protect_users())},
      {"groups", Joined(link.get_protect_groups())},
      {"never counted", NeverCounted(permissions)},
      {"starts", LimitText(link.get_start_at(), "at once")},
      {"expires", LimitText(link.get_expire_at(), "never")},
      {"uses", UsesText(link)},
      {"address bound", YesNo(link.get_enable_match_ip())},
      {"removed when expired", YesNo(link.get_auto_gc())},
      {"redirect", RedirectTypeName(link.get_redirect_type())},
      {"redirect target", link.get_redirect_uri()},
      {"app", JsonLine(link.get_app())},
      {"private data", JsonLine(link.get_private_data())},
  });
}

ExitStatus Create(const LinkOptions &options, const Request &request) {
  LinkChange change = options.ToChange();
  if (!change.owner_uid) change.owner_uid = getuid();
  SharingDB &db = SharingDatabase();
  change.password = options.ReadPassword();
  const Entry link = CreateLink(db, change);
  if (request.json)
    PrintJson(ToJson(link));
  else
    PrintLine(link.get_hash());
  return EXIT_DONE;
}

void AddCreate(CLI::App &group, Request &request) {
  auto options = std::make_shared<LinkOptions>();
  CLI::App *command =
      AddCommand(group, request, "create", "Make a link and print its hash",
                 "link create --project files --path /srv/photos --password --expire +7d --uses 5",
                 [options, &request] { return Create(*options, request); });
  options->AddTo(*command);
  options->project()->required();
}

ExitStatus Change(const std::string &hash, const LinkOptions &options, const Request &request) {
  LinkChange change = options.ToChange();
  SharingDB &db = SharingDatabase();
  FindLink(db, hash);  // Nobody shall type a password for a link that cannot be changed.
  change.password = options.ReadPassword();
  const Entry link = ChangeLink(db, hash, change);
  if (request.json)
    PrintJson(ToJson(link));
  else
    PrintLink(link);
  return EXIT_DONE;
}

void AddSet(CLI::App &group, Request &request) {
  auto hash = std::make_shared<std::string>();
  auto options = std::make_shared<LinkOptions>();
  CLI::App *command =
      AddCommand(group, request, "set", "Change a link; what is not named stays as it is",
                 "link set aB3xK9pQ2 --expire never --uses 10",
                 [hash, options, &request] { return Change(*hash, *options, request); });
  command->add_option("HASH", *hash, "The link")->required();
  options->AddTo(*command);
  options->AddClearingTo(*command);
}

ExitStatus Show(const std::string &hash, const Request &request) {
  const Entry link = FindLink(SharingDatabase(), hash);
  if (request.json)
    PrintJson(ToJson(link));
  else
    PrintLink(link);
  return EXIT_DONE;
}

void AddShow(CLI::App &group, Request &request) {
  auto hash = std::make_shared<std::string>();
  CLI::App *command =
      AddCommand(group, request, "show", "Show all that is known of a link", "link show aB3xK9pQ2",
                 [hash, &request] { return Show(*hash, request); });
  command->add_option("HASH", *hash, "The link")->required();
}

struct ListOptions {
  TextOption project, owner;
  std::string state;
  std::string order = "id";
  bool descending = false;
  PageOptions page;
};

const std::map<std::string, LinkOrder> kOrders = {
    {"id", BY_ID},
    {"hash", BY_HASH},
    {"project", BY_PROJECT},
    {"owner", BY_OWNER},
    {"start", BY_START},
    {"expire", BY_EXPIRY},
    {"uses", BY_USES_ALLOWED},
    {"use-count", BY_USE_COUNT},
};

LinkQuery ToQuery(const ListOptions &options) {
  LinkQuery query;
  query.project = options.project.value();
  if (options.owner.given()) query.owner_uid = ResolveAccount(*options.owner.value());
  query.state = LinkStateFromName(options.state);
  query.order = kOrders.at(options.order);
  query.descending = options.descending;
  query.page = options.page.ToPage();
  return query;
}

void PrintLinks(const LinkList &list) {
  const long now = Now();
  Table table({"HASH", "PROJECT", "OWNER", "PROTECTION", "STATE", "EXPIRES", "USES", "TITLE"});
  for (const Entry &link : list.links) {
    table.AddRow({link.get_hash(), link.get_project_name(), AccountText(link.get_owner_uid()),
                  ProtectTypeName(link.get_protect_type()), LinkStateName(StateOf(link, now)),
                  LimitText(link.get_expire_at(), "never"), UsesText(link),
                  link.get_protect_title()});
  }
  table.Print();
  PrintLine(std::to_string(list.links.size()) + " of " + Counted(list.total, "link"));
}

ExitStatus List(const ListOptions &options, const Request &request) {
  const LinkQuery query = ToQuery(options);
  const LinkList list = ListLinks(SharingDatabase(), query);
  if (request.json)
    PrintJson(ToJson(list, query.page));
  else
    PrintLinks(list);
  if (list.damaged != 0) {
    PrintError(Counted(list.damaged, "link") +
               " of this page cannot be loaded; “velksharing db check” names them");
  }
  return EXIT_DONE;
}

void AddList(CLI::App &group, Request &request) {
  auto options = std::make_shared<ListOptions>();
  CLI::App *command =
      AddCommand(group, request, "list", "List links", "link list --state expired --sort expire",
                 [options, &request] { return List(*options, request); });
  options->project.AddTo(*command, "--project", "NAME", "Only this application's");
  options->owner.AddTo(*command, "--owner", "USER", "Only this account's");
  command->add_option("--state", options->state, "Only links in this state")
      ->check(CLI::IsMember({"active", "pending", "used-up", "expired", "disabled"}));
  command->add_option("--sort", options->order, "Order by this field; id when not given")
      ->check(CLI::IsMember(kOrders));
  command->add_flag("--desc", options->descending, "Largest first");
  options->page.AddTo(*command);
}

ExitStatus Enable(const std::vector<std::string> &hashes, bool enabled, const Request &request) {
  LinkChange change;
  change.enabled = enabled;
  SharingDB &db = SharingDatabase();
  return ForEach(hashes, request, [&](const std::string &hash) {
    const Entry link = ChangeLink(db, hash, change);
    return Done{ToJson(link), hash + (enabled ? " enabled" : " disabled")};
  });
}

ExitStatus Delete(const std::vector<std::string> &hashes, const Request &request) {
  SharingDB &db = SharingDatabase();
  return ForEach(hashes, request, [&](const std::string &hash) {
    const int grants = DeleteLink(db, hash);
    return Done{DeletedLinkToJson(hash, grants),
                hash + " deleted with " + Counted(grants, "grant")};
  });
}

void AddForHashes(
    CLI::App &group, Request &request, const std::string &name, const std::string &description,
    std::function<ExitStatus(const std::vector<std::string> &, const Request &)> action) {
  auto hashes = std::make_shared<std::vector<std::string>>();
  CLI::App *command = AddCommand(group, request, name, description, "link " + name + " aB3xK9pQ2",
                                 [hashes, action, &request] { return action(*hashes, request); });
  command->add_option("HASH", *hashes, "The links")->required();
}

struct PurgeOptions {
  TextOption owner, project;
  bool automatic = false;
};

ExitStatus Purge(const PurgeOptions &options, const Request &request) {
  std::optional<unsigned int> owner_uid;
  if (options.owner.given()) owner_uid = ResolveAccount(*options.owner.value());
  SharingDB &db = SharingDatabase();
  const Removal removal = options.automatic ? PurgeLinksAutomatically(db)
                                            : PurgeLinks(db, owner_uid, options.project.value());
  PrintRemoval(removal, "link", request.json);
  return EXIT_DONE;
}

void AddPurge(CLI::App &group, Request &request) {
  auto options = std::make_shared<PurgeOptions>();
  CLI::App *command = AddCommand(
      group, request, "purge", "Remove expired and used-up links, kept ones too",
      "link purge --owner ann", [options, &request] { return Purge(*options, request); });
  CLI::Option *owner = options->owner.AddTo(*command, "--owner", "USER", "Only this account's");
  CLI::Option *project =
      options->project.AddTo(*command, "--project", "NAME", "Only this application's");
  command->add_flag("--automatic", options->automatic, "Only those that were not made with --keep")
      ->excludes(owner)
      ->excludes(project);
}

struct UrlOptions {
  std::string hash;
  bool qr = false;
  TextOption qr_svg;
};

ExitStatus Url(const UrlOptions &options, const Request &request) {
  const LinkUrl link = UrlOfLink(SharingDatabase(), options.hash);
  if (options.qr_svg.given()) {
    UnfinishedFile file(*options.qr_svg.value());
    file.Write(QrCodeSvg(QrCode(link.url)));
    file.Publish();
  }
  if (request.json) {
    PrintJson(ToJson(link));
    return EXIT_DONE;
  }
  PrintLine(link.url);
  if (options.qr) PrintQrCode(QrCode(link.url));
  return EXIT_DONE;
}

void AddUrl(CLI::App &group, Request &request) {
  auto options = std::make_shared<UrlOptions>();
  CLI::App *command =
      AddCommand(group, request, "url", "Print the URL under which visitors reach a link",
                 "link url aB3xK9pQ2 --qr", [options, &request] { return Url(*options, request); });
  command->add_option("HASH", options->hash, "The link")->required();
  command->add_flag("--qr", options->qr, "Also as a QR code, to be read from the screen")
      ->excludes(command->get_option("--json"));
  options->qr_svg.AddTo(*command, "--qr-svg", "FILE", "Write a QR code to a new SVG file");
}

struct WhyOptions {
  std::string hash;
  TextOption address;
  SessionOption session;
};

ExitStatus Why(const WhyOptions &options, const Request &request) {
  const std::string address = options.address.given() ? ParseAddress(*options.address.value()) : "";
  const std::optional<Secret> session = options.session.Read();
  const std::unique_ptr<BaseDB> db = OpenForReading();
  const Verdict verdict = session ? JudgeSession(*db, options.hash, *session, address)
                                  : JudgeLogin(*db, options.hash, address);
  if (request.json)
    PrintJson(ToJson(verdict));
  else
    PrintLine(verdict.sentence);
  return verdict.let_in ? EXIT_DONE : EXIT_REFUSED;
}

void AddWhy(CLI::App &group, Request &request) {
  auto options = std::make_shared<WhyOptions>();
  CLI::App *command =
      AddCommand(group, request, "why", "Tell why a visitor would be refused now; writes nothing",
                 "link why aB3xK9pQ2 --ip 203.0.113.7",
                 [options, &request] { return Why(*options, request); });
  command->add_option("HASH", options->hash, "The link")->required();
  options->address.AddTo(*command, "--ip", "ADDRESS", "The visitor's address");
  options->session.AddTo(*command);
}

}  // namespace

void AddLinkCommands(CLI::App &program, Request &request) {
  CLI::App *group = AddGroup(program, "link", "Links", "link list");
  AddCreate(*group, request);
  AddList(*group, request);
  AddShow(*group, request);
  AddSet(*group, request);
  AddForHashes(
      *group, request, "enable", "Switch links on",
      [](const auto &hashes, const Request &asked) { return Enable(hashes, true, asked); });
  AddForHashes(
      *group, request, "disable", "Switch links off",
      [](const auto &hashes, const Request &asked) { return Enable(hashes, false, asked); });
  AddForHashes(*group, request, "delete", "Delete links and the grants on them", Delete);
  AddPurge(*group, request);
  AddUrl(*group, request);
  AddWhy(*group, request);
  AddLinkLogCommand(*group, request);
}

}  // namespace command_line
