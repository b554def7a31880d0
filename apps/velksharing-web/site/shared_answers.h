#ifndef VELKSHARING_WEB_SITE_SHARED_ANSWERS_H
#define VELKSHARING_WEB_SITE_SHARED_ANSWERS_H

#include <optional>
#include <string>
#include <vector>

#include "http/form.h"
#include "http/request.h"
#include "http/response.h"
#include "pages/pages.h"
#include "share/item.h"
#include "share/listing.h"
#include "share/shared_tree.h"
#include "site/answers.h"
#include "site/site.h"

namespace web {

/// What an authorised visitor asks a link for.
struct SharedRequest {
  const Request &request;
  const Form &query;
  std::vector<std::string> parts;  ///< Names below what is shared.
  bool ends_with_slash = false;
  bool is_logout = false;  ///< Whether it is the address by which visitors leave.

  /// Whether the answer is no page of ours, but a file, an image or an archive.
  bool AsksForBytes() const;
};

/// How a link shows what it shares.
struct SharedView {
  LinkView link;
  Reader reader;
  std::string address;  ///< Of the link, without a slash at its end: "/sharing/aB3xK9pQ2".
  bool can_download = true;
};

/// Answers those who may see what a link shares: folders and files as pages or JSON, downloads,
/// archives, small images.
class SharedAnswers {
 public:
  /// Everything must outlive this.
  SharedAnswers(const Answers &answers, const Pages &pages, const SharedView &view,
                const share::SharedTree &tree);

  /// @param item what is asked for; nothing when it is not there.
  /// @param note its route is set.
  Response Answer(const SharedRequest &wanted, std::optional<share::Item> item,
                  AccessNote &note) const;

 private:
  Response Folder(const SharedRequest &wanted, const share::Item &folder, AccessNote &note) const;
  Response FolderPage(const SharedRequest &wanted, const share::Item &folder) const;
  Response Zip(const SharedRequest &wanted, const share::Item &folder) const;
  Response File(const SharedRequest &wanted, share::Item file, AccessNote &note) const;
  Response FilePage(const share::Item &file) const;
  Response Download(const SharedRequest &wanted, share::Item file) const;
  Response View(const SharedRequest &wanted, share::Item file) const;
  Response Thumbnail(const SharedRequest &wanted, const share::Item &file) const;
  void AddText(const share::Item &file, FileView &view) const;
  void AddNeighbours(const share::Item &file, FileView &view) const;
  Json::Value FolderDocument(const SharedRequest &wanted, const share::Listing &listing) const;
  Json::Value FileDocument(const share::Item &file) const;
  Json::Value Document() const;

  const Answers &answers_;
  const Pages &pages_;
  const SharedView &view_;
  const share::SharedTree &tree_;
};

}  // namespace web

#endif
