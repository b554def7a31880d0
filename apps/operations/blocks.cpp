#include "operations/blocks.h"

#include <algorithm>
#include <exception>

#include "operations/address.h"
#include "operations/failure.h"
#include "velk/velksdk.h"
#include "velk_paths.h"

namespace operations {
namespace {

constexpr char kCategory[] = "manual";

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

bool IsRemembered(const std::string &key) {
  const std::vector<Block> blocks = ListBlocks(true);
  return std::any_of(blocks.begin(), blocks.end(),
                     [&](const Block &block) { return block.address == key; });
}

}  // namespace

std::vector<Block> ListBlocks(bool with_failing) {
  std::vector<Block> blocks;
  if (VELKAutoBlockList(Collect, &blocks) != 0) throw Unusable();
  if (!with_failing) std::erase_if(blocks, [](const Block &block) { return !block.blocked; });
  return blocks;
}

void AddBlock(const std::string &address, long seconds) {
  const std::string key = ParseBlockAddress(address);
  if (VELKAutoBlockAdd(key.c_str(), kCategory, seconds) != 0) throw Unusable();
}

void RemoveBlock(const std::string &address) {
  const std::string key = ParseBlockAddress(address);
  if (!IsRemembered(key))
    throw Failure(Failure::NOT_FOUND, "address " + key + " is not remembered");
  if (VELKAutoBlockResetByIP(key.c_str()) != 0) throw Unusable();
}

}  // namespace operations
