// Remembers where items were last seen, in bounded memory. Its answers are leads, which the caller
// verifies. Never touches the disk.
//
// An item with several names has the place last remembered.
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <string>
#include <string_view>
#include <unordered_map>

namespace tallowmere::catalog {

// The key under which an item is remembered.
struct PlaceKey {
  std::uint64_t space;   // a volume, or a device whose items are on no volume
  std::uint64_t number;  // of the item in that space

  bool operator==(const PlaceKey&) const = default;
};

class PlaceMemory {
 public:
  // `limit` is in bytes, for everything remembered; a place takes about 200. A limit too small for
  // one place remembers none.
  explicit PlaceMemory(std::size_t limit);

  struct Place {
    std::string path;
    std::uint32_t parent;  // node id of the folder that held it; 0: not known
  };

  // Sets the item's place; a different path also clears its parent. Drops the least recently used
  // places beyond the limit. Strong exception guarantee.
  void Remember(const PlaceKey& item, std::string_view path);

  // Adds the parent to a place if that is still remembered.
  void RememberParent(const PlaceKey& item, std::string_view path, std::uint32_t parent);

  // The item's place, or null. Counts as a use. Valid until the next Remember.
  const Place* Recall(const PlaceKey& item);

  // The path most recently remembered or recalled; empty when there is none.
  std::string_view Latest() const;

  // Bytes in use, never above the limit.
  std::size_t Size() const { return mSize; }

 private:
  struct HashOfKey {
    std::size_t operator()(const PlaceKey& key) const noexcept;
  };
  struct Entry {
    PlaceKey key;
    Place place;
  };
  using Entries = std::list<Entry>;

  static std::size_t SizeOf(const Entry& entry);
  void ForgetTheOldest();

  std::size_t mLimit;
  std::size_t mSize = 0;
  Entries mEntries;  // the most recently used first
  std::unordered_map<PlaceKey, Entries::iterator, HashOfKey> mIndex;
};

}  // namespace tallowmere::catalog
