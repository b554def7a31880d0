// An application that shares: makes a link for everybody or, with arguments, for the accounts and
// groups named (a group as @NAME), and prints its hash.
#include <velksharing/store.h>

#include <cstdio>

int main(int argc, char **argv) {
  using namespace VELK::sharing;
  std::vector<std::string> users, groups;
  for (int i = 1; i < argc; ++i)
    argv[i][0] == '@' ? groups.push_back(argv[i] + 1) : users.push_back(argv[i]);

  record::Entry link;
  link.set_project_name("photo").set_owner_uid(0).set_app(Json::Value(Json::objectValue));
  if (argc > 1) link.set_protect_type(record::Entry::PROTECT_USER);
  link.set_protect_users(users).set_protect_groups(groups);
  if (!db::EntryDB(db::SharingDB::Instance()).CreateWithHash(link)) return 1;
  std::puts(link.get_hash().c_str());
}
