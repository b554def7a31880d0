#include "operations/json_document.h"

#include <json/reader.h>
#include <json/writer.h>

#include <memory>

#include "operations/failure.h"

namespace operations {
namespace {

/// "* Line 1, Column 2\n  Syntax error…\n" as one line.
std::string OneLine(const std::string &report) {
  std::string line;
  for (const char byte : report) {
    const bool blank = byte == '\n' || byte == ' ' || byte == '*';
    if (!blank)
      line += byte;
    else if (!line.empty() && line.back() != ' ')
      line += ' ';
  }
  if (!line.empty() && line.back() == ' ') line.pop_back();
  return line;
}

bool Parse(const std::string &text, Json::Value &value, std::string &report) {
  Json::CharReaderBuilder builder;
  Json::CharReaderBuilder::strictMode(&builder.settings_);
  builder["stackLimit"] = kJsonDepthLimit;
  const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
  try {
    return reader->parse(text.data(), text.data() + text.size(), &value, &report);
  } catch (const Json::Exception &) {
    report = "it nests deeper than " + std::to_string(kJsonDepthLimit) + " levels";
    return false;
  }
}

}  // namespace

Json::Value ParseJsonObject(const std::string &what, const std::string &text) {
  Json::Value value;
  std::string report;
  if (!Parse(text, value, report))
    throw Failure(Failure::INVALID, what + " is not valid JSON: " + OneLine(report));
  if (!value.isObject()) throw Failure(Failure::INVALID, what + " must be a JSON object");
  return value;
}

std::string JsonLine(const Json::Value &value) {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "";
  builder["emitUTF8"] = true;
  return Json::writeString(builder, value);
}

}  // namespace operations
