#include "api.h"

namespace webapi {

const char *TypeName(ParameterType type) {
  switch (type) {
    case TEXT:
      return "text";
    case INTEGER:
      return "integer";
    case BOOLEAN:
      return "boolean";
    case CHOICE:
      return "choice";
    case ACCOUNT:
      return "account";
    case ADDRESS:
      return "address";
    case NETWORK:
      return "network";
    case OBJECT:
      return "object";
    case TEXTS:
      return "texts";
    case DESCRIPTOR:
      return "descriptor";
  }
  return "";
}

}  // namespace webapi
