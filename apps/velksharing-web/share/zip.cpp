#include "share/zip.h"

#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <memory>
#include <utility>

#include "share/content_disposition.h"
#include "share/media_type.h"
#include "share/readable.h"
#include "share/zip_walk.h"
#include "share/zip_writer.h"

namespace web::share {
namespace {

constexpr size_t kChunk = 64 * 1024;
constexpr char kNameOfNameless[] = "files";

// A backslash parts folders for some who unpack: "..\x" would leave the folder.
std::string NameInArchive(const std::string &name) {
  std::string readable = Readable(name);
  std::replace(readable.begin(), readable.end(), '\\', '_');
  return readable;
}

/// Makes the archive as it is read.
class ZipBody : public StreamBody {
 public:
  ZipBody(SharedTree tree, const Item &folder, std::vector<std::string> names)
      : walk_(std::move(tree), folder.parts, std::move(names), kMaxZipEntries),
        depth_(folder.parts.size()) {}

  ssize_t Read(char *buffer, size_t capacity) override {
    while (Untaken() == 0 && !is_finished_) {
      if (!Proceed()) return -1;
    }
    return static_cast<ssize_t>(Take(buffer, capacity));
  }

 private:
  // Makes a bit more of the archive.
  bool Proceed() {
    if (file_.file.IsOpen()) return CopyChunk();
    std::optional<Item> item = walk_.Next();
    if (walk_.HasFailed()) return false;
    if (item) return Begin(std::move(*item));
    is_finished_ = true;
    return writer_.Finish();
  }

  bool Begin(Item item) {
    ZipWriter::Entry entry;
    entry.name = PathInArchive(item);
    entry.is_folder = item.is_folder;
    entry.is_compressed = IsCompressed(MediaTypeByName(item.name));
    entry.size = item.size;
    entry.changed = item.changed.tv_sec;
    if (!item.is_folder) {
      file_ = std::move(item);
      copied_ = 0;
    }
    return writer_.Begin(entry);
  }

  std::string PathInArchive(const Item &item) const {
    std::string path;
    for (size_t index = depth_; index < item.parts.size(); ++index) {
      if (index > depth_) path += '/';
      path += NameInArchive(item.parts[index]);
    }
    return item.is_folder ? path + "/" : path;
  }

  bool CopyChunk() {
    const off_t left = file_.size - copied_;
    const size_t wanted = static_cast<size_t>(std::min<off_t>(left, kChunk));
    const ssize_t count = wanted == 0 ? 0 : ReadFile(wanted);
    if (count < 0) {
      syslog(LOG_ERR, "cannot read “%s” for a ZIP archive: %s", Readable(file_.name).c_str(),
             strerror(errno));
      return false;
    }
    if (count == 0) {
      file_.file.Reset();
      return true;
    }
    copied_ += count;
    return writer_.Write({chunk_.data(), static_cast<size_t>(count)});
  }

  ssize_t ReadFile(size_t wanted) {
    ssize_t count = 0;
    do {
      count = pread(file_.file.get(), chunk_.data(), wanted, copied_);
    } while (count < 0 && errno == EINTR);
    return count;
  }

  size_t Untaken() { return writer_.output().size() - taken_; }

  size_t Take(char *buffer, size_t capacity) {
    const size_t count = std::min(capacity, Untaken());
    std::copy_n(writer_.output().data() + taken_, count, buffer);
    taken_ += count;
    if (Untaken() == 0) {
      writer_.output().clear();
      taken_ = 0;
    }
    return count;
  }

  ZipWalk walk_;
  size_t depth_;  ///< Of the folder that is packed, in the tree.
  ZipWriter writer_;
  size_t taken_ = 0;  ///< Bytes at the beginning of the output that are sent.
  Item file_;         ///< The one that is copied; its descriptor is closed when there is none.
  off_t copied_ = 0;
  std::array<char, kChunk> chunk_;
  bool is_finished_ = false;
};

bool AreAllThere(const SharedTree &tree, const Item &folder,
                 const std::vector<std::string> &names) {
  return std::all_of(names.begin(), names.end(), [&](const std::string &name) {
    std::vector<std::string> parts = folder.parts;
    parts.push_back(name);
    return tree.Find(parts).has_value();
  });
}

std::vector<std::string> WithoutDoubles(std::vector<std::string> names) {
  std::sort(names.begin(), names.end());
  names.erase(std::unique(names.begin(), names.end()), names.end());
  return names;
}

}  // namespace

std::optional<Response> MakeZip(const SharedTree &tree, const Item &folder,
                                const std::vector<std::string> &names) {
  if (!folder.is_folder) return std::nullopt;
  std::vector<std::string> selection = WithoutDoubles(names);
  if (!AreAllThere(tree, folder, selection)) return std::nullopt;

  const std::string &name = folder.name.empty() ? kNameOfNameless : folder.name;
  Response response;
  response.headers.Add("Content-Type", "application/zip");
  response.headers.Add("Content-Disposition", ContentDisposition("attachment", name + ".zip"));
  response.headers.Add("Cache-Control", "no-store");
  response.body = std::make_unique<ZipBody>(tree, folder, std::move(selection));
  return response;
}

}  // namespace web::share
