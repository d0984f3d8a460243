// Values that stay where they are and are recognised by their address, for tables whose entries are
// given out as pointers: any other pointer may be asked about. One thread at a time.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace tallowmere::quicktime {

template <class Value>
class Slots {
 public:
  // A new value. Changes nothing that can be seen when it throws.
  template <class... Arguments>
  Value& Add(Arguments&&... arguments) {
    if (mFree.empty()) mFree.push_back(&NewSlot());
    Slot& slot = *mFree.back();
    slot.emplace(std::forward<Arguments>(arguments)...);
    mFree.pop_back();
    return *slot;
  }

  // The value at this address. Null when none is there.
  Value* Find(const void* address) {
    Slot* const slot = SlotAt(address);
    return slot == nullptr ? nullptr : &**slot;
  }

  // Returns whether a value was at this address.
  bool Remove(const void* address) noexcept {
    Slot* const slot = SlotAt(address);
    if (slot == nullptr) return false;
    slot->reset();
    mFree.push_back(slot);  // has the room: see Grow
    return true;
  }

  std::size_t Count() const {
    std::size_t slots = 0;
    for (const Chunk& chunk : mChunks) slots += chunk.size();
    return slots - mFree.size();
  }

 private:
  using Slot = std::optional<Value>;
  using Chunk = std::vector<Slot>;  // never larger than its first capacity, so that none moves

  static constexpr std::size_t kFirstChunk = 16;

  Slot& NewSlot() {
    if (mChunks.empty() || mChunks.back().size() == mChunks.back().capacity()) Grow();
    return mChunks.back().emplace_back();
  }

  // Each chunk is twice as large as the one before, so there are few.
  void Grow() {
    const std::size_t size = mChunks.empty() ? kFirstChunk : 2 * mChunks.back().capacity();
    Chunk chunk;
    chunk.reserve(size);
    mFree.reserve(2 * size);  // more than all slots together
    mChunks.push_back(std::move(chunk));
  }

  // Looks into the newest chunk first, which has as many slots as all others together.
  Slot* SlotAt(const void* address) {
    for (auto chunk = mChunks.rbegin(); chunk != mChunks.rend(); ++chunk) {
      const auto offset = reinterpret_cast<std::uintptr_t>(address) -
                          reinterpret_cast<std::uintptr_t>(chunk->data());
      if (offset >= chunk->size() * sizeof(Slot)) continue;
      Slot& slot = (*chunk)[offset / sizeof(Slot)];
      return slot && &*slot == address ? &slot : nullptr;
    }
    return nullptr;
  }

  std::vector<Chunk> mChunks;
  std::vector<Slot*> mFree;
};

}  // namespace tallowmere::quicktime
