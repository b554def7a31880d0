#ifndef VELKSHARING_WEB_SERVER_RUNTIME_FOLDER_H
#define VELKSHARING_WEB_SERVER_RUNTIME_FOLDER_H

#include <string>

namespace web {

/// Makes the folder of locks and of the forms' secret where it is missing, and, as root, gives it
/// to the system account.
/// @throws std::runtime_error.
void MakeRuntimeFolder(const std::string &folder);

/// The secret of the forms, kept in the folder: made by the first process that asks for it, the
/// same for all that come later.
/// @throws std::runtime_error also when others than this process's user may write to the folder.
std::string FormSecret(const std::string &folder);

}  // namespace web

#endif
