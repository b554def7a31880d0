#include "view.h"

#include <utility>

#include "common/no_throw.h"
#include "parameters.h"
#include "request.h"
#include "velk/velkcgi.h"
#include "velk/velksdk.h"

using velk::NoThrow;

int VelkCgiInit(VelkCgi **cgi, const char *) {
  if (cgi == nullptr) return 0;
  *cgi = NoThrow(static_cast<VelkCgi *>(nullptr), [] { return new VelkCgi; });
  return *cgi != nullptr ? 1 : 0;
}

int VelkCgiLoadInCookies(VelkCgi *cgi) {
  if (cgi == nullptr) return 0;
  return NoThrow(0, [&] {
    const char *header = velk::RequestVariable("HTTP_COOKIE");
    if (header != nullptr) cgi->cookies.Load(header);
    return 1;
  });
}

const char *VelkCgiGetRequestParam(VelkCgi *cgi, const char *name, const char *fallback) {
  if (cgi == nullptr || name == nullptr) return fallback;
  return NoThrow(fallback, [&] {
    auto value = velk::RequestParameter(name);
    return value ? cgi->given.emplace_back(std::move(*value)).c_str() : fallback;
  });
}

const char *VelkCgiGetCookie(VelkCgi *cgi, const char *name) {
  return cgi == nullptr || name == nullptr ? nullptr : cgi->cookies.Find(name);
}

int VelkCgiSetCookies(VelkCgi *cgi, const char *name, const char *value, long, const char *,
                      const char *, int) {
  if (cgi == nullptr || name == nullptr || value == nullptr) return 0;
  return NoThrow(0, [&] { return cgi->cookies.Set(name, value) ? 1 : 0; });
}

int VelkCgiGetRemoteIP(char *out, size_t capacity) {
  return VELKAddressNormalize(velk::RequestVariable("REMOTE_ADDR"), out, capacity);
}

int VelkCgiIsDeniedIP(const char *ip) {
  return VELKAutoBlockIsDenied(ip) == 1 ? 1 : 0;
}

void VelkCgiFree(VelkCgi *cgi) {
  delete cgi;
}
