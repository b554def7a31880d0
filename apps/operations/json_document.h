#ifndef OPERATIONS_JSON_DOCUMENT_H
#define OPERATIONS_JSON_DOCUMENT_H

#include <json/value.h>

#include <string>
#include <vector>

namespace operations {

/// How deep a document from outside may nest. A link keeps it inside a document of its own, and
/// what the library writes it must be able to read again.
constexpr int kJsonDepthLimit = 500;

/// Parses a JSON object, strictly: no comments, no trailing commas, no name twice, nothing behind
/// it.
/// @param what names the document in the failure's message.
/// @throws Failure INVALID.
Json::Value ParseJsonObject(const std::string &what, const std::string &text);

/// Parses a JSON array of texts, as strictly.
/// @throws Failure INVALID.
std::vector<std::string> ParseJsonTexts(const std::string &what, const std::string &text);

/// A document as one line of text.
std::string JsonLine(const Json::Value &value);

}  // namespace operations

#endif
