#ifndef VELKSHARINGURL_MISTAKE_H
#define VELKSHARINGURL_MISTAKE_H

#include <stdexcept>

namespace sharing_url {

/// What is wrong with an argument or a setting: "is not a host name". Who catches it knows which.
class Mistake : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

}  // namespace sharing_url

#endif
