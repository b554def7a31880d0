#ifndef VELKSHARING_WEB_PAGES_LANGUAGE_CHOICE_H
#define VELKSHARING_WEB_PAGES_LANGUAGE_CHOICE_H

#include <string>
#include <string_view>
#include <vector>

namespace web {

/// The language that an Accept-Language field wants most.
///
/// "de-CH" is content with "de", and "pt" with "pt-BR". Of two that are wanted alike the first in
/// the field wins. Parts of the field that make no sense are passed over.
/// @param offered tags in the order of preference for whoever takes anything ("*"), not empty.
/// @return one of `offered`; the first when none is wanted.
const std::string &ChooseAmong(const std::vector<std::string> &offered,
                               std::string_view accept_language);

}  // namespace web

#endif
