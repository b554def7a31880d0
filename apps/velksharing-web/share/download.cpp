#include "share/download.h"

#include <ctime>
#include <string>
#include <utility>

#include "share/byte_range.h"
#include "share/conditions.h"
#include "share/content_disposition.h"
#include "share/http_date.h"
#include "share/media_type.h"
#include "share/preview.h"

namespace web::share {
namespace {

constexpr char kUnknownType[] = "application/octet-stream";
constexpr char kPlainText[] = "text/plain";
constexpr char kPdf[] = "application/pdf";
constexpr size_t kSniffed = 4096;

// What is shown by itself gets no script, no form, nothing from elsewhere, and an origin of its
// own. Viewers of PDF, which keep scripts to themselves, do not start in a sandbox; our own page
// may show one in a frame.
constexpr char kPolicy[] =
    "default-src 'none'; img-src 'self'; media-src 'self'; style-src 'unsafe-inline'; "
    "frame-ancestors 'none'; sandbox";
constexpr char kPdfPolicy[] =
    "default-src 'none'; object-src 'self'; style-src 'unsafe-inline'; frame-ancestors 'self'";

std::string ContentType(const Item &file) {
  const std::string &type = MediaTypeByName(file.name);
  if (type.empty()) return kUnknownType;
  if (type != kPlainText) return type;
  return ReadText(file, kSniffed) ? type + "; charset=utf-8" : type;
}

void AddDescription(const Item &file, Purpose purpose, Fields &headers) {
  const std::string &type = MediaTypeByName(file.name);
  const bool is_shown = purpose == Purpose::VIEW && IsShownInline(type);
  headers.Add("Content-Type", ContentType(file));
  headers.Add("Content-Disposition",
              ContentDisposition(is_shown ? "inline" : "attachment", file.name));
  headers.Add("Content-Security-Policy", is_shown && type == kPdf ? kPdfPolicy : kPolicy);
}

void AddValidators(const Validators &validators, time_t now, Fields &headers) {
  headers.Add("ETag", validators.tag);
  // A clock that went wrong must not make a date that no answer may bear.
  if (validators.modified <= now) {
    headers.Add("Last-Modified", FormatHttpDate(validators.modified));
  }
  // Asked for again each time: the link may end, and a session too.
  headers.Add("Cache-Control", "private, no-cache");
}

ByteRange WantedRange(const Request &request, const Item &file, const Validators &validators,
                      time_t now) {
  const bool is_given = request.method == "GET" && request.headers.Count("Range") == 1;
  if (!is_given || !MayHoldRange(request.headers, validators, now)) return {};
  return ParseRange(request.headers.Get("Range"), file.size);
}

Response RangeNotSatisfiable(off_t size, Response response) {
  response.status = 416;
  response.headers.Add("Content-Range", "bytes */" + std::to_string(size));
  return response;
}

Response Send(Item file, Purpose purpose, const ByteRange &range, Response response) {
  AddDescription(file, purpose, response.headers);
  FileBody body{UniqueFd(), 0, file.size};
  if (range.kind == ByteRange::Kind::PART) {
    response.status = 206;
    response.headers.Add("Content-Range", "bytes " + std::to_string(range.offset) + "-" +
                                              std::to_string(range.offset + range.length - 1) +
                                              "/" + std::to_string(file.size));
    body.offset = range.offset;
    body.length = range.length;
  }
  body.file = std::move(file.file);
  response.body = std::move(body);
  return response;
}

}  // namespace

Response Download(Item file, const Request &request, Purpose purpose) {
  const time_t now = time(nullptr);
  const Validators validators = ValidatorsOf(file);
  Response response;
  const Verdict verdict = Weigh(request.headers, validators);
  if (verdict == Verdict::FAILED) {
    response.status = 412;
    return response;
  }
  AddValidators(validators, now, response.headers);
  if (verdict == Verdict::NOT_MODIFIED) {
    response.status = 304;
    return response;
  }
  response.headers.Add("Accept-Ranges", "bytes");
  const ByteRange range = WantedRange(request, file, validators, now);
  if (range.kind == ByteRange::Kind::UNSATISFIABLE) {
    return RangeNotSatisfiable(file.size, std::move(response));
  }
  return Send(std::move(file), purpose, range, std::move(response));
}

}  // namespace web::share
