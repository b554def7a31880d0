#ifndef VELKCGI_VIEW_H
#define VELKCGI_VIEW_H

#include <set>
#include <string>

#include "cookies.h"

/// What one caller has seen of a request.
struct VelkCgi_tag {
  ~VelkCgi_tag();

  velk::Cookies cookies;
  std::set<std::string> given;  ///< Parameter values that the caller holds pointers to.
};

#endif
