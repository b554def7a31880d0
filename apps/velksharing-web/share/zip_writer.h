#ifndef VELKSHARING_WEB_SHARE_ZIP_WRITER_H
#define VELKSHARING_WEB_SHARE_ZIP_WRITER_H

#include <sys/types.h>

#include <ctime>
#include <memory>
#include <string>
#include <string_view>

struct archive;

namespace web::share {

/// Writes a ZIP archive into memory, from where it is taken away bit by bit. After a false nothing
/// more can be written; the log has the reason. Any thread may go on with it.
class ZipWriter {
 public:
  struct Entry {
    std::string name;  ///< UTF-8 with '/' between its parts and, for a folder, at its end.
    bool is_folder = false;
    bool is_compressed = false;  ///< Whether compressing the content would be of no use.
    off_t size = 0;              ///< In bytes, at most.
    time_t changed = 0;
  };

  ZipWriter();
  ZipWriter(const ZipWriter &) = delete;
  ZipWriter &operator=(const ZipWriter &) = delete;
  ~ZipWriter();

  bool Begin(const Entry &entry);
  /// Adds to the content of the entry that has begun.
  bool Write(std::string_view content);
  /// Ends the entry, if one has begun, and the archive.
  bool Finish();

  /// What has been made and was not taken yet.
  std::string &output() { return output_; }

 private:
  struct Closer {
    void operator()(archive *writer) const;
  };

  bool Open();
  bool Succeeded(int result) const;

  std::string output_;
  std::unique_ptr<archive, Closer> archive_;
};

}  // namespace web::share

#endif
