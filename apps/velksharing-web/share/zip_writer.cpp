#include "share/zip_writer.h"

#include <archive.h>
#include <archive_entry.h>
#include <locale.h>
#include <sys/stat.h>
#include <syslog.h>

namespace web::share {
namespace {

constexpr mode_t kFileMode = 0644;
constexpr mode_t kFolderMode = 0755;

// libarchive marks names as UTF-8 where the thread's locale says that they are.
class Utf8Scope {
 public:
  Utf8Scope() : previous_(uselocale(Utf8())) {}
  Utf8Scope(const Utf8Scope &) = delete;
  Utf8Scope &operator=(const Utf8Scope &) = delete;
  ~Utf8Scope() { uselocale(previous_); }

 private:
  static locale_t Utf8() {
    static const locale_t utf8 = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
    return utf8;
  }

  locale_t previous_;
};

la_ssize_t Collect(archive *, void *output, const void *bytes, size_t length) {
  static_cast<std::string *>(output)->append(static_cast<const char *>(bytes), length);
  return static_cast<la_ssize_t>(length);
}

struct EntryCloser {
  void operator()(archive_entry *entry) const { archive_entry_free(entry); }
};

}  // namespace

void ZipWriter::Closer::operator()(archive *writer) const {
  const Utf8Scope utf8;
  // Ends what has been begun, too, into the output that nobody takes any more: otherwise the
  // library forgets to give back what it compresses with.
  archive_write_free(writer);
}

ZipWriter::ZipWriter() : archive_(archive_write_new()) {
  if (!Open()) archive_.reset();
}

ZipWriter::~ZipWriter() = default;

bool ZipWriter::Open() {
  const Utf8Scope utf8;
  archive *const writer = archive_.get();
  return writer != nullptr && Succeeded(archive_write_set_format_zip(writer)) &&
         Succeeded(archive_write_set_bytes_per_block(writer, 0)) &&
         Succeeded(archive_write_open(writer, &output_, nullptr, Collect, nullptr));
}

bool ZipWriter::Succeeded(int result) const {
  if (result == ARCHIVE_OK || result == ARCHIVE_WARN) return true;
  syslog(LOG_ERR, "cannot go on with a ZIP archive: %s", archive_error_string(archive_.get()));
  return false;
}

bool ZipWriter::Begin(const Entry &entry) {
  if (!archive_) return false;
  const Utf8Scope utf8;
  const std::unique_ptr<archive_entry, EntryCloser> header(archive_entry_new());
  if (!header) return false;
  archive_entry_set_pathname(header.get(), entry.name.c_str());
  archive_entry_set_filetype(header.get(), entry.is_folder ? AE_IFDIR : AE_IFREG);
  archive_entry_set_perm(header.get(), entry.is_folder ? kFolderMode : kFileMode);
  archive_entry_set_uid(header.get(), 0);
  archive_entry_set_gid(header.get(), 0);
  archive_entry_set_size(header.get(), entry.size);
  archive_entry_set_mtime(header.get(), entry.changed, 0);
  const int compression = entry.is_compressed || entry.size == 0
                              ? archive_write_zip_set_compression_store(archive_.get())
                              : archive_write_zip_set_compression_deflate(archive_.get());
  return Succeeded(compression) && Succeeded(archive_write_header(archive_.get(), header.get()));
}

bool ZipWriter::Write(std::string_view content) {
  if (!archive_) return false;
  const Utf8Scope utf8;
  const la_ssize_t written = archive_write_data(archive_.get(), content.data(), content.size());
  return Succeeded(written < 0 ? static_cast<int>(written) : ARCHIVE_OK);
}

bool ZipWriter::Finish() {
  if (!archive_) return false;
  const Utf8Scope utf8;
  return Succeeded(archive_write_close(archive_.get()));
}

}  // namespace web::share
