#include "pages/addresses.h"

#include <algorithm>
#include <utility>

#include "http/percent.h"
#include "http/text.h"

namespace web {
namespace {

bool StartsWith(std::string_view text, std::string_view start) {
  return text.size() > start.size() && IsSameText(text.substr(0, start.size()), start);
}

}  // namespace

std::string_view WebAddressOnly(std::string_view address) {
  if (!StartsWith(address, "https://") && !StartsWith(address, "http://")) return {};
  const bool is_plain = std::all_of(address.begin(), address.end(), [](unsigned char byte) {
    return byte > ' ' && byte != 0x7F && byte != '"' && byte != '\'' && byte != '<' && byte != '>';
  });
  return is_plain ? address : std::string_view();
}

Addresses::Addresses(std::string base_path) : base_path_(std::move(base_path)) {}

std::string Addresses::Link(std::string_view hash) const {
  return base_path_ + "/" + PercentEncode(hash);
}

std::string Addresses::Login(std::string_view hash, std::string_view return_to) const {
  return return_to.empty() ? Link(hash) : Link(hash) + "?return=" + PercentEncode(return_to);
}

std::string Addresses::Logout(std::string_view hash) const {
  return Link(hash) + "/logout";
}

std::string Addresses::Folder(std::string_view hash, const std::vector<std::string> &path) const {
  return path.empty() ? Link(hash) : File(hash, path) + "/";
}

std::string Addresses::File(std::string_view hash, const std::vector<std::string> &path) const {
  std::string address = Link(hash);
  for (const std::string &component : path) address += "/" + PercentEncode(component);
  return address;
}

std::string Addresses::Asset(std::string_view name) const {
  return base_path_ + "/-/" + std::string(name);
}

}  // namespace web
