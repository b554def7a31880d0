#include "share_support.h"

#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <stdexcept>

namespace web_test {
namespace {

constexpr uid_t kNobody = 65534;

void GiveToSharer(const std::string &path) {
  if (chown(path.c_str(), Sharer(), static_cast<gid_t>(-1)) != 0) {
    throw std::runtime_error("cannot give away " + path);
  }
}

}  // namespace

uid_t Sharer() {
  return geteuid() == 0 ? kNobody : geteuid();
}

uid_t IdOfNobodyAtAll() {
  uid_t uid = 3'999'999'999;
  while (getpwuid(uid) != nullptr) --uid;
  return uid;
}

SharedFolder::SharedFolder() : path_(outer_.File("shared")) {
  chmod(outer_.path().c_str(), 0755);
  mkdir(path_.c_str(), 0755);
  GiveToSharer(path_);
}

void SharedFolder::AddFile(const std::string &name, const std::string &content) const {
  velk_test::WriteFile(File(name), content);
  GiveToSharer(File(name));
}

void SharedFolder::AddFolder(const std::string &name) const {
  if (mkdir(File(name).c_str(), 0755) != 0) throw std::runtime_error("cannot make " + name);
  GiveToSharer(File(name));
}

void SharedFolder::AddLink(const std::string &name, const std::string &target) const {
  if (symlink(target.c_str(), File(name).c_str()) != 0) {
    throw std::runtime_error("cannot link " + name);
  }
}

web::share::SharedTree SharedFolder::Tree() const {
  return web::share::SharedTree::Open(path_, Sharer()).value();
}

web::share::Item SharedFolder::Find(const std::vector<std::string> &parts) const {
  return Tree().Find(parts).value();
}

std::string ContentOf(const web::share::Item &item) {
  std::string content(static_cast<size_t>(item.size), '\0');
  const ssize_t count = pread(item.file.get(), content.data(), content.size(), 0);
  content.resize(count < 0 ? 0 : static_cast<size_t>(count));
  return content;
}

}  // namespace web_test
