#ifndef OPERATIONS_MAINTENANCE_H
#define OPERATIONS_MAINTENANCE_H

#include <array>
#include <string>
#include <vector>

#include "operations/database.h"
#include "operations/link_state.h"

/// Looking after the database file. Every function throws Failure DATABASE or SYSTEM.

namespace operations {

/// Sizes of the database's files in bytes; 0 for one that does not exist.
struct FileSizes {
  long database = 0;
  long log = 0;  ///< Committed changes that are not in the database file yet.
};

FileSizes DatabaseSizes();

struct DatabaseStatus {
  std::string path;
  int version = 0;  ///< Of the schema.
  std::string journal_mode;
  FileSizes sizes;
  int links = 0;
  std::array<int, kLinkStates.size()> links_by_state = {};  ///< In the order of kLinkStates.
  int live_sessions = 0;
  int lapsed_sessions = 0;
  int live_grants = 0;
  int lapsed_grants = 0;
};

DatabaseStatus Status(BaseDB &db);

/// A row of a link that the library cannot load, and which visitors therefore cannot use.
struct DamagedLink {
  int id = 0;
  std::string hash;
};

struct CheckReport {
  std::vector<std::string> problems;  ///< What SQLite found wrong with the file.
  std::vector<DamagedLink> damaged_links;
  int links = 0;  ///< Rows of links looked at.
};

/// Checks the file's integrity and tries to load every link.
CheckReport CheckDatabase(BaseDB &db);

/// Rebuilds the file without its free pages and writes the log into it.
void Vacuum(BaseDB &db);

/// Copies the sharing database to a new file of mode 0600, consistent at one moment while others
/// write, and flushed to disk. The file appears under its name only when it is complete.
/// @throws Failure REFUSED when `target` exists, SYSTEM or DATABASE when it could not be written;
///         nothing is left behind then.
void BackUp(const std::string &target);

}  // namespace operations

#endif
