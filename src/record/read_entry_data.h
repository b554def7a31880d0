#ifndef VELKSHARING_RECORD_READ_ENTRY_DATA_H
#define VELKSHARING_RECORD_READ_ENTRY_DATA_H

#include <memory>
#include <string>

#include "record/entry_data.h"

namespace VELK::sharing::record {

/// What a link's column `data` says. The last few different texts stay parsed, for a visitor's page
/// loads the same link many times, and parsing is most of the work of loading it. That is never
/// stale: the same text says the same. From any thread.
/// @return null when the text cannot be used.
std::shared_ptr<const EntryData> ReadEntryData(const std::string &text);

}  // namespace VELK::sharing::record

#endif
