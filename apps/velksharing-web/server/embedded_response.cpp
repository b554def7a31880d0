#include "server/embedded_response.h"

#include <syslog.h>

#include <string>

#include "server/answer_head.h"
#include "server/limits.h"
#include "server/printable.h"

namespace web {
namespace {

struct Stream {
  std::unique_ptr<StreamBody> body;
  uint64_t &bytes;
};

ssize_t ReadStream(void *context, uint64_t, char *buffer, size_t capacity) {
  const auto *stream = static_cast<Stream *>(context);
  const ssize_t got = stream->body->Read(buffer, capacity);
  if (got == 0) return MHD_CONTENT_READER_END_OF_STREAM;
  if (got < 0) return MHD_CONTENT_READER_END_WITH_ERROR;
  stream->bytes += static_cast<uint64_t>(got);
  return got;
}

void FreeStream(void *context) {
  delete static_cast<Stream *>(context);
}

MHD_Response *WithText(std::string text) {
  return MHD_create_response_from_buffer(text.size(), text.data(), MHD_RESPMEM_MUST_COPY);
}

MHD_Response *WithFile(FileBody &body) {
  if (body.length == 0) return WithText("");
  MHD_Response *response = MHD_create_response_from_fd_at_offset64(
      static_cast<uint64_t>(body.length), body.file.get(), static_cast<uint64_t>(body.offset));
  if (response != nullptr) body.file.Release();
  return response;
}

MHD_Response *WithStream(std::unique_ptr<StreamBody> body, uint64_t &bytes) {
  auto stream = std::make_unique<Stream>(Stream{std::move(body), bytes});
  MHD_Response *response = MHD_create_response_from_callback(MHD_SIZE_UNKNOWN, kPiece, &ReadStream,
                                                             stream.get(), &FreeStream);
  if (response != nullptr) stream.release();
  return response;
}

/// An empty text would get the length 0, which 304 would tell of what the visitor has already. A
/// body of unknown length would get its last chunk although there is no body: the visitor would
/// take that for the beginning of the next answer. So the connection ends with this one.
MHD_Response *WithoutBody() {
  const auto nothing = [](void *, uint64_t, char *, size_t) -> ssize_t {
    return MHD_CONTENT_READER_END_OF_STREAM;
  };
  MHD_Response *response =
      MHD_create_response_from_callback(MHD_SIZE_UNKNOWN, 1, nothing, nullptr, nullptr);
  if (response != nullptr)
    MHD_set_response_options(response, MHD_RF_HTTP_1_0_COMPATIBLE_STRICT, MHD_RO_END);
  return response;
}

/// Whether there is neither a body nor a length of one to be told. The library knows by itself that
/// 204 has neither.
bool IsHeadAlone(const Response &response, const std::string &method) {
  return response.status == 304 || (!HasBody(response, method) && !BodyLength(response));
}

MHD_Response *WithBody(Response &response, const std::string &method, uint64_t &bytes) {
  if (IsHeadAlone(response, method)) return WithoutBody();
  if (auto *text = std::get_if<std::string>(&response.body)) return WithText(std::move(*text));
  if (auto *file = std::get_if<FileBody>(&response.body)) return WithFile(*file);
  return WithStream(std::move(std::get<std::unique_ptr<StreamBody>>(response.body)), bytes);
}

}  // namespace

EmbeddedResponse MakeEmbeddedResponse(Response &response, const std::string &method,
                                      uint64_t &bytes) {
  EmbeddedResponse embedded(WithBody(response, method, bytes), &MHD_destroy_response);
  if (embedded == nullptr) return embedded;
  for (const auto &[name, value] : response.headers) {
    if (MHD_add_response_header(embedded.get(), name.c_str(), value.c_str()) != MHD_YES)
      syslog(LOG_ERR, "left out of an answer: the broken field %s", Printable(name).c_str());
  }
  return embedded;
}

}  // namespace web
