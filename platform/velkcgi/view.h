#ifndef VELKCGI_VIEW_H
#define VELKCGI_VIEW_H

#include <list>

#include "cookies.h"
#include "secret.h"

/// What one caller has seen of a request.
struct VelkCgi_tag {
  velk::Cookies cookies;
  std::list<velk::Secret> given;  ///< Parameter values that the caller holds pointers to.
};

#endif
