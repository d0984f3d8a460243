#include "quicktime/Handles.h"

#include <algorithm>
#include <memory>
#include <unordered_map>

#include "foundation/NoThrow.h"

namespace tallowmere::quicktime {
namespace {

// A block's handle is the address of its `bytes`.
struct Block {
  explicit Block(std::size_t length)
      : memory(std::make_unique<char[]>(length)), bytes(memory.get()), size(length) {}

  std::unique_ptr<char[]> memory;
  char* bytes;  // the handle's owner can change this
  std::size_t size;
};

using Blocks = std::unordered_map<Handle, std::unique_ptr<Block>>;

Blocks& LiveBlocks() {
  // Never destroyed: exit handlers may still ask.
  static Blocks& blocks = *new Blocks;
  return blocks;
}

Handle NewBlock(std::size_t size) {
  auto block = std::make_unique<Block>(size);
  const Handle handle = &block->bytes;
  LiveBlocks().emplace(handle, std::move(block));
  return handle;
}

}  // namespace

std::size_t LiveHandles() {
  return LiveBlocks().size();
}

Handle NewHandleWith(std::string_view bytes) {
  const Handle handle = NewHandleClear(static_cast<Size>(bytes.size()));
  if (handle != nullptr) std::copy(bytes.begin(), bytes.end(), *handle);
  return handle;
}

}  // namespace tallowmere::quicktime

using namespace tallowmere::quicktime;

Handle NewHandleClear(Size byteCount) {
  if (byteCount < 0) return nullptr;
  return tallowmere::foundation::OrZero(
      [byteCount] { return NewBlock(static_cast<std::size_t>(byteCount)); });
}

void DisposeHandle(Handle handle) {
  LiveBlocks().erase(handle);
}

Size GetHandleSize(Handle handle) {
  const auto found = LiveBlocks().find(handle);
  return found == LiveBlocks().end() ? 0 : static_cast<Size>(found->second->size);
}
