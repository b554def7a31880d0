#include "operations/json_document.h"

#include <json/reader.h>
#include <json/writer.h>

#include <algorithm>
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

bool ReadStrictly(const std::string &text, Json::Value &value, std::string &report) {
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

Json::Value Parse(const std::string &what, const std::string &text) {
  Json::Value value;
  std::string report;
  if (!ReadStrictly(text, value, report))
    throw Failure(Failure::INVALID, what + " is not valid JSON: " + OneLine(report));
  return value;
}

}  // namespace

Json::Value ParseJsonObject(const std::string &what, const std::string &text) {
  Json::Value value = Parse(what, text);
  if (!value.isObject()) throw Failure(Failure::INVALID, what + " must be a JSON object");
  return value;
}

std::vector<std::string> ParseJsonTexts(const std::string &what, const std::string &text) {
  const Json::Value value = Parse(what, text);
  const auto is_text = [](const Json::Value &item) { return item.isString(); };
  if (!value.isArray() || !std::all_of(value.begin(), value.end(), is_text))
    throw Failure(Failure::INVALID, what + " must be a JSON array of texts");
  std::vector<std::string> texts;
  for (const Json::Value &item : value) texts.push_back(item.asString());
  return texts;
}

std::string JsonLine(const Json::Value &value) {
  Json::StreamWriterBuilder builder;
  builder["indentation"] = "";
  builder["emitUTF8"] = true;
  return Json::writeString(builder, value);
}

}  // namespace operations
