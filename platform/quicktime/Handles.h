// Memory handles: blocks of bytes, each known by the address of the pointer to its bytes.
#pragma once

#include <QuickTime/QuickTime.h>

#include <cstddef>
#include <string>
#include <utility>

#include "quicktime/Slots.h"

namespace tallowmere::quicktime {

class Handles {
 public:
  // A new block with these bytes.
  Handle Make(std::string bytes) { return &mBlocks.Add(std::move(bytes)).bytes; }

  // Does nothing for null and for a handle that is not a block's.
  void Dispose(Handle handle) noexcept { mBlocks.Remove(handle); }

  // 0 for null and for a handle that is not a block's.
  Size SizeOf(Handle handle) {
    const Block* const block = mBlocks.Find(handle);
    return block == nullptr ? 0 : static_cast<Size>(block->memory.size());
  }

  // The number of blocks that have not been disposed of.
  std::size_t Live() const { return mBlocks.Count(); }

 private:
  // A block's handle is the address of its first member.
  struct Block {
    explicit Block(std::string&& content) : memory(std::move(content)) { bytes = memory.data(); }

    char* bytes = nullptr;  // the handle's owner can change this
    std::string memory;
  };

  Slots<Block> mBlocks;
};

}  // namespace tallowmere::quicktime
