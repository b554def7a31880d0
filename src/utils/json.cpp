#include "internal/json.h"

#include <json/reader.h>
#include <json/writer.h>

#include <memory>
#include <sstream>

namespace VELK::sharing::internal {
namespace {

Json::StreamWriterBuilder CompactStyle() {
  Json::StreamWriterBuilder style;
  style["commentStyle"] = "None";
  style["indentation"] = "";
  style["emitUTF8"] = true;  // otherwise bytes that are not UTF-8 would be replaced
  return style;
}

}  // namespace

// The older reader: it is stricter than its successor's default (no trailing commas), and its
// forms are what stored links were written for.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
bool ParseJson(const std::string &text, Json::Value &value, bool collect_comments) {
  try {
    // From where it lies: given the string itself, the reader copies it.
    return Json::Reader().parse(text.data(), text.data() + text.size(), value, collect_comments);
  } catch (const Json::Exception &) {  // nested past the reader's limit
    return false;
  }
}
#pragma GCC diagnostic pop

std::string CompactJson(const Json::Value &value) {
  static const Json::StreamWriterBuilder style = CompactStyle();
  std::ostringstream out;
  std::unique_ptr<Json::StreamWriter>(style.newStreamWriter())->write(value, &out);
  return out.str();
}

}  // namespace VELK::sharing::internal
