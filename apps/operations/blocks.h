#ifndef OPERATIONS_BLOCKS_H
#define OPERATIONS_BLOCKS_H

#include <string>
#include <vector>

/// The addresses that the automatic blocking remembers. Every function throws Failure: INVALID
/// for a text that is no address, NOT_FOUND, and SYSTEM when the block file is unusable.

namespace operations {

/// An address that has failed or is blocked. Times are seconds since the Unix epoch.
struct Block {
  std::string address;
  std::string category;
  int attempts = 0;
  long last_failure = 0;
  bool blocked = false;
  long blocked_until = 0;  ///< 0 = for ever. Meaningful only when blocked.
};

/// @param with_failing also the addresses that have failed but are not blocked.
std::vector<Block> ListBlocks(bool with_failing);

/// Blocks an address by hand; `address` as ParseBlockAddress() takes it.
/// @param seconds how long from now; 0 = for ever.
void AddBlock(const std::string &address, long seconds);

/// Forgets an address, given as to AddBlock(): its block and its failures.
void RemoveBlock(const std::string &address);

}  // namespace operations

#endif
