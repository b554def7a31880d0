#ifndef TESTS_WEB_SITE_OPEN_REDIRECTS_H
#define TESTS_WEB_SITE_OPEN_REDIRECTS_H

#include <string>
#include <vector>

namespace velk_test {

/// Addresses that lead somewhere else than they seem to, or that no header may hold: beginnings
/// that browsers, proxies and careless parsers disagree about, in front of a host of somebody else.
/// More than 300.
std::vector<std::string> OpenRedirects();

}  // namespace velk_test

#endif
