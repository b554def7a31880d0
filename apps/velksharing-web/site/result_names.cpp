#include "site/result_names.h"

#include <velksharing/access.h>

namespace web {

const char *LoginResultName(int code) {
  switch (code) {
    case VELK_SHARING_LOGIN_OK:
      return "VELK_SHARING_LOGIN_OK";
    case VELK_SHARING_LOGIN_ACCOUNT_REFUSED:
      return "VELK_SHARING_LOGIN_ACCOUNT_REFUSED";
    case VELK_SHARING_LOGIN_REFUSED:
      return "VELK_SHARING_LOGIN_REFUSED";
    case VELK_SHARING_LOGIN_UNUSABLE:
      return "VELK_SHARING_LOGIN_UNUSABLE";
    case VELK_SHARING_LOGIN_BLOCKED:
      return "VELK_SHARING_LOGIN_BLOCKED";
    case VELK_SHARING_LOGIN_WRONG_PASSWORD:
      return "VELK_SHARING_LOGIN_WRONG_PASSWORD";
    case VELK_SHARING_LOGIN_NOT_PERMITTED:
      return "VELK_SHARING_LOGIN_NOT_PERMITTED";
    case VELK_SHARING_LOGIN_USED_UP:
      return "VELK_SHARING_LOGIN_USED_UP";
  }
  return "";
}

const char *AuthResultName(int code) {
  switch (code) {
    case VELK_SHARING_AUTH_OK:
      return "VELK_SHARING_AUTH_OK";
    case VELK_SHARING_AUTH_LAPSED:
      return "VELK_SHARING_AUTH_LAPSED";
    case VELK_SHARING_AUTH_REFUSED:
      return "VELK_SHARING_AUTH_REFUSED";
    case VELK_SHARING_AUTH_UNUSABLE:
      return "VELK_SHARING_AUTH_UNUSABLE";
    case VELK_SHARING_AUTH_NO_SESSION:
      return "VELK_SHARING_AUTH_NO_SESSION";
    case VELK_SHARING_AUTH_LINK_INVALID:
      return "VELK_SHARING_AUTH_LINK_INVALID";
    case VELK_SHARING_AUTH_NO_GRANT:
      return "VELK_SHARING_AUTH_NO_GRANT";
  }
  return "";
}

}  // namespace web
