#include "operations/blocks.h"

#include <exception>

#include "operations/address.h"
#include "operations/failure.h"
#include "velk/velksdk.h"

namespace operations {
namespace {

constexpr const char *CATEGORY = "manual";

Failure Unusable() {
  return Failure(Failure::SYSTEM, "the file of blocked addresses " VELK_ROOT
                                  "/etc/private/autoblock.db cannot be used; the system log "
                                  "tells why");
}

/// Called through C: an exception must not leave it.
int Collect(const VELKAutoBlockRecord *record, void *data) {
  try {
    static_cast<std::vector<Block> *>(data)->push_back(
        {record->address, record->category, record->attempts, record->last_failure,
         record->blocked == 1, record->blocked_until});
    return 0;
  } catch (const std::exception &) {
    return -1;
  }
}

}  // namespace

std::vector<Block> ListBlocks(bool with_failing) {
  std::vector<Block> blocks;
  if (VELKAutoBlockList(Collect, &blocks) != 0) throw Unusable();
  if (!with_failing) std::erase_if(blocks, [](const Block &block) { return !block.blocked; });
  return blocks;
}

void AddBlock(const std::string &address, long seconds) {
  if (VELKAutoBlockAdd(ParseAddress(address).c_str(), CATEGORY, seconds) != 0) throw Unusable();
}

void RemoveBlock(const std::string &address) {
  const std::string parsed = ParseAddress(address);
  const std::size_t before = ListBlocks(true).size();
  if (VELKAutoBlockResetByIP(parsed.c_str()) != 0) throw Unusable();
  if (ListBlocks(true).size() == before)
    throw Failure(Failure::NOT_FOUND, "address " + parsed + " is not remembered");
}

}  // namespace operations
