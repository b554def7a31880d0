// Any bytes as the reply of velkwebapi: the answer must be what the JSON reader makes of the same
// bytes, and no exception may leave the call.

#include <json/reader.h>
#include <velksharing/utils.h>

#include <cstdint>
#include <cstdlib>
#include <string>

#include "played_program.h"

namespace {

#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"
bool Read(const std::string &text, Json::Value &value) {
  try {
    return Json::Reader().parse(text, value, false);
  } catch (const Json::Exception &) {  // nested too deep
    return false;
  }
}
#pragma GCC diagnostic pop

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
  const std::string reply(reinterpret_cast<const char *>(data), size);
  velk_test::PlayProgram(reply);
  Json::Value answer;
  const bool done = VELK::sharing::SendWebapi(answer, "api", 1, "method", Json::Value());

  Json::Value expected;
  if (done != Read(reply, expected)) abort();
  if (done && answer != expected) abort();
  return 0;
}
