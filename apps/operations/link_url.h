#ifndef OPERATIONS_LINK_URL_H
#define OPERATIONS_LINK_URL_H

#include <string>

#include "operations/database.h"

namespace operations {

/// Where visitors reach a link.
struct LinkUrl {
  std::string hash;
  std::string url;
  int type = 0;  ///< Its kind, a number of the program that made it.
};

/// The public URL of a link, as the machine is configured.
/// @throws Failure as FindLink(); SYSTEM when the URL is not to be had.
LinkUrl UrlOfLink(BaseDB &db, const std::string &hash);

}  // namespace operations

#endif
