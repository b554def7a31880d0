#ifndef TESTS_WEB_SHARE_SUPPORT_H
#define TESTS_WEB_SHARE_SUPPORT_H

#include <sys/types.h>

#include <optional>
#include <string>
#include <vector>

#include "share/item.h"
#include "share/shared_tree.h"
#include "support/temp_dir.h"

namespace web_test {

/// Who shares in these tests: whoever runs them; for root "nobody", for root does not share.
uid_t Sharer();

/// An id that is no account's.
uid_t IdOfNobodyAtAll();

/// A folder of its sharer, within an outer one that is not shared.
class SharedFolder {
 public:
  SharedFolder();

  const std::string &path() const { return path_; }
  /// The path of `name` in the shared folder, and beside it.
  std::string File(const std::string &name) const { return path_ + "/" + name; }
  std::string Beside(const std::string &name) const { return outer_.File(name); }

  /// Adds a file, a folder, a symbolic link. The file and the folder are the sharer's.
  void AddFile(const std::string &name, const std::string &content = "content") const;
  void AddFolder(const std::string &name) const;
  void AddLink(const std::string &name, const std::string &target) const;

  web::share::SharedTree Tree() const;
  /// An item that has to be there.
  web::share::Item Find(const std::vector<std::string> &parts) const;
  bool Has(const std::vector<std::string> &parts) const { return Tree().Find(parts).has_value(); }

 private:
  velk_test::TempDir outer_;
  std::string path_;
};

/// What an item has inside, from its beginning.
std::string ContentOf(const web::share::Item &item);

}  // namespace web_test

#endif
