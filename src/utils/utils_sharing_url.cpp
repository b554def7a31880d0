#include <cstdlib>

#include "internal/log.h"
#include "internal/popen.h"
#include "velk_paths.h"
#include "velksharing/utils.h"

namespace VELK::sharing {
namespace {

using internal::LogError;
using internal::LogFailedCondition;
using internal::PipeReader;

constexpr char kSource[] = "utils_sharing_url";
constexpr char kProgram[] = VELK_ROOT "/bin/velksharingurl";

constexpr size_t kUrlLineLimit = 4095;
constexpr size_t kTypeLineLimit = 3;

// Part of the messages, whatever does the reading.
constexpr char kNoUrlLine[] = "NULL == fgets(szUrl, BUF_SIZE_, file.file)";
constexpr char kNoTypeLine[] = "NULL == fgets(szType, TYPE_BUF_SIZE_, file.file)";

bool ReadLine(PipeReader &file, size_t limit, const char *failure, std::string &line) {
  if (file.ReadLine(limit, line)) return true;
  LogFailedCondition(kSource, failure);
  return false;
}

}  // namespace

bool GetSharingURL(const std::string &arg_text, int arg_number, bool arg_flag,
                   const std::string &arg_text2, const std::string &arg_text3, std::string &url,
                   _tag_SHARING_URL_TYPE &type) {
  PipeReader file(kProgram, {"velksharingurl", arg_text, ToString(arg_number), ToString(arg_flag),
                             arg_text2, arg_text3});
  if (file.file == nullptr) {
    LogError(kSource, "%s:%d (%u) popen failed\n\n");
    return false;
  }
  std::string line;
  if (!ReadLine(file, kUrlLineLimit, kNoUrlLine, line)) return false;
  line.pop_back();     // taken for the newline, without a look
  url = line.c_str();  // a text: it ends at a zero byte
  if (!ReadLine(file, kTypeLineLimit, kNoTypeLine, line)) return false;
  type = static_cast<_tag_SHARING_URL_TYPE>(strtol(line.c_str(), nullptr, 10));
  return true;
}

bool GetSharingURL(const std::string &arg_text, int arg_number, bool arg_flag,
                   const std::string &arg_text3, std::string &url, _tag_SHARING_URL_TYPE &type) {
  return GetSharingURL(arg_text, arg_number, arg_flag, "", arg_text3, url, type);
}

}  // namespace VELK::sharing
