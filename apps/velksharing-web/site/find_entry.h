#ifndef VELKSHARING_WEB_SITE_FIND_ENTRY_H
#define VELKSHARING_WEB_SITE_FIND_ENTRY_H

#include <velksharing/record.h>

#include <memory>
#include <string>

namespace web {

/// A link as it is stored. It is handed around as a pointer, for a record that is moved copies what
/// the application keeps in it.
using EntryPointer = std::unique_ptr<const VELK::sharing::record::Entry>;

/// The link with a hash, from the database of this process.
/// @return null for one that is not there, or cannot be read.
EntryPointer FindEntry(const std::string &hash);

}  // namespace web

#endif
