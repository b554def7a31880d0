#ifndef VELKSHARING_WEB_SITE_ACCEPT_H
#define VELKSHARING_WEB_SITE_ACCEPT_H

#include <string_view>

namespace web {

/// Whether a client would rather have JSON than a page.
/// @param accept the field Accept. JSON must be named in it: who takes anything gets a page. So
///        does who names both and wants them equally.
bool PrefersJson(std::string_view accept);

}  // namespace web

#endif
