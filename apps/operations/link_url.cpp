#include "operations/link_url.h"

#include <unistd.h>

#include "operations/links.h"
#include "velk_paths.h"
#include "velksharing/utils.h"

namespace operations {
namespace {

constexpr char kProgram[] = VELK_ROOT "/bin/velksharingurl";

Failure NotToBeHad() {
  if (access(kProgram, X_OK) != 0)
    return SystemFailure(std::string("the URL cannot be had: ") + kProgram);
  return Failure(Failure::SYSTEM, std::string("the URL cannot be had; ") + kProgram +
                                      " tells why on standard error");
}

}  // namespace

LinkUrl UrlOfLink(BaseDB &db, const std::string &hash) {
  LinkUrl link;
  link.hash = FindLink(db, hash).get_hash();
  VELK::sharing::_tag_SHARING_URL_TYPE type{};
  if (!VELK::sharing::GetSharingURL(link.hash, 0, false, "", link.url, type)) throw NotToBeHad();
  link.type = static_cast<int>(type);
  return link;
}

}  // namespace operations
