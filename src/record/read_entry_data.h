#ifndef VELKSHARING_RECORD_READ_ENTRY_DATA_H
#define VELKSHARING_RECORD_READ_ENTRY_DATA_H

#include <string>

#include "record/entry_data.h"

namespace VELK::sharing::record {

/// Takes what a link's column `data` says. A few texts that come again and again stay parsed, for a
/// visitor's page loads the same link many times, and parsing is most of the work of loading it.
/// That is never stale: the same text says the same. From any thread.
/// @return as EntryData::Parse().
bool ReadEntryData(const std::string &text, EntryData &data);

}  // namespace VELK::sharing::record

#endif
