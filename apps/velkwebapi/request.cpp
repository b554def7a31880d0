#include "request.h"

#include <algorithm>
#include <map>

namespace webapi {
namespace {

using Pair = std::pair<std::string, std::string>;

constexpr std::size_t kHeadings = 3;

/// @param position the argument's, counted from 1, to name it by.
Pair SplitPair(const std::string &argument, std::size_t position) {
  const std::size_t sign = argument.find('=');
  if (sign == 0 || sign == std::string::npos) {
    throw UsageMistake("argument " + std::to_string(position) +
                       " is not of the form key=value; a password is never an argument");
  }
  return {argument.substr(0, sign), argument.substr(sign + 1)};
}

bool IsWholeNumber(const std::string &text) {
  const std::size_t begin = text.starts_with('-') ? 1 : 0;
  return text.size() > begin && std::all_of(text.begin() + begin, text.end(),
                                            [](char byte) { return byte >= '0' && byte <= '9'; });
}

std::string Heading(const std::map<std::string, std::string> &headings, const std::string &name) {
  const auto heading = headings.find(name);
  if (heading == headings.end() || heading->second.empty())
    throw UsageMistake(name + "=… is missing; it stands before all parameters");
  return heading->second;
}

}  // namespace

Request ParseRequest(const std::vector<std::string> &arguments) {
  if (arguments.empty() || arguments[0] != "--exec")
    throw UsageMistake("the first argument must be --exec");
  std::vector<Pair> pairs;
  for (std::size_t i = 1; i < arguments.size(); ++i)
    pairs.push_back(SplitPair(arguments[i], i + 1));
  const auto parameters = pairs.begin() + std::min(kHeadings, pairs.size());

  const std::map<std::string, std::string> headings(pairs.begin(), parameters);
  Request request;
  request.api = Heading(headings, "api");
  request.version = Heading(headings, "version");
  request.method = Heading(headings, "method");
  if (!IsWholeNumber(request.version)) throw UsageMistake("version=… must be a whole number");
  request.parameters.assign(parameters, pairs.end());
  return request;
}

}  // namespace webapi
