#ifndef OPERATIONS_ACCOUNTS_H
#define OPERATIONS_ACCOUNTS_H

#include <string>
#include <vector>

namespace operations {

/// The user id of an account given by name, or by number where no account has that name.
/// @throws Failure NOT_FOUND when it is neither.
unsigned int ResolveAccount(const std::string &text);

/// The account's name, or its number where it has none; "" for UID_ERR, no account.
std::string AccountText(unsigned int uid);

/// @return those of `names` that are no account (or no group) of this machine.
std::vector<std::string> UnknownAccounts(const std::vector<std::string> &names);
std::vector<std::string> UnknownGroups(const std::vector<std::string> &names);

}  // namespace operations

#endif
