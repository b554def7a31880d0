#ifndef VELKSHARING_WEB_PAGES_ADDRESSES_H
#define VELKSHARING_WEB_PAGES_ADDRESSES_H

#include <string>
#include <string_view>
#include <vector>

namespace web {

/// Where things lie, as the pages refer to them: absolute paths, percent-encoded byte by byte, so
/// that a name of any bytes comes back as it is. They still need HTML's escapes.
class Addresses {
 public:
  /// @param base_path as it stands in addresses, without a slash at its end.
  explicit Addresses(std::string base_path);

  /// What is shared itself.
  std::string Link(std::string_view hash) const;
  /// Where a login form is posted.
  /// @param return_to path and query that the visitor goes on to; "" for none.
  std::string Login(std::string_view hash, std::string_view return_to) const;
  std::string Logout(std::string_view hash) const;
  /// A folder below the shared one, with a slash at its end; the link for an empty path.
  std::string Folder(std::string_view hash, const std::vector<std::string> &path) const;
  /// A file below the shared folder; the link for an empty path.
  std::string File(std::string_view hash, const std::vector<std::string> &path) const;
  std::string Asset(std::string_view name) const;

 private:
  std::string base_path_;
};

/// `address` when it is an http(s) address without blanks, control characters and quotes; "" when
/// it is anything else.
std::string_view WebAddressOnly(std::string_view address);

}  // namespace web

#endif
