#include "server/body_copy.h"

#include <algorithm>
#include <cerrno>
#include <string>
#include <vector>

#include "server/limits.h"

namespace web {
namespace {

Copied CopyText(const std::string &text, const Sink &sink) {
  const bool is_whole = text.empty() || sink(text.data(), text.size());
  return {is_whole ? text.size() : 0, is_whole};
}

ssize_t ReadAt(int fd, char *buffer, size_t size, off_t offset) {
  ssize_t got = 0;
  do {
    got = pread(fd, buffer, size, offset);
  } while (got < 0 && errno == EINTR);
  return got;
}

Copied CopyFile(const FileBody &body, const Sink &sink) {
  std::vector<char> piece(static_cast<size_t>(std::min<off_t>(body.length, kPiece)));
  off_t done = 0;
  while (done < body.length) {
    const auto wanted = std::min<off_t>(body.length - done, static_cast<off_t>(piece.size()));
    const ssize_t got =
        ReadAt(body.file.get(), piece.data(), static_cast<size_t>(wanted), body.offset + done);
    if (got <= 0 || !sink(piece.data(), static_cast<size_t>(got))) break;
    done += got;
  }
  return {static_cast<uint64_t>(done), done == body.length};
}

Copied CopyStream(StreamBody &body, const Sink &sink) {
  std::vector<char> piece(kPiece);
  Copied copied;
  while (true) {
    const ssize_t got = body.Read(piece.data(), piece.size());
    if (got == 0) copied.is_whole = true;
    if (got <= 0 || !sink(piece.data(), static_cast<size_t>(got))) return copied;
    copied.bytes += static_cast<uint64_t>(got);
  }
}

}  // namespace

Copied CopyBody(Response &response, const Sink &sink) {
  if (const auto *text = std::get_if<std::string>(&response.body)) return CopyText(*text, sink);
  if (const auto *file = std::get_if<FileBody>(&response.body)) return CopyFile(*file, sink);
  return CopyStream(*std::get<std::unique_ptr<StreamBody>>(response.body), sink);
}

void TakeSmallFileIn(Response &response) {
  const auto *file = std::get_if<FileBody>(&response.body);
  if (file == nullptr || file->length > static_cast<off_t>(kPiece)) return;
  std::string bytes(static_cast<size_t>(file->length), '\0');
  if (ReadAt(file->file.get(), bytes.data(), bytes.size(), file->offset) == file->length)
    response.body = std::move(bytes);
}

}  // namespace web
