// Where items were last seen, in bounded memory: leads, which whoever uses one verifies first. Asks
// nothing of the disk.
//
// Of an item with several names, the place is the one last remembered.
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <string>
#include <string_view>
#include <unordered_map>

namespace tallowmere::catalog {

// What an item is remembered by.
struct PlaceKey {
  std::uint64_t space;   // a volume, or the items of one device that are on none
  std::uint64_t number;  // the item's in that space

  bool operator==(const PlaceKey&) const = default;
};

class PlaceMemory {
 public:
  // `limit` is in bytes, for everything remembered; about 200 a place. A limit below what one place
  // takes remembers none.
  explicit PlaceMemory(std::size_t limit);

  struct Place {
    std::string path;
    std::uint32_t parent;  // node id of the folder that held it there; 0: not known
  };

  // The item's place is `path` from now on; its parent is forgotten if the path is another one.
  // Forgets the places least recently used when the limit is passed. Without memory the exception
  // leaves everything as it was.
  void Remember(const PlaceKey& item, std::string_view path);

  // Adds the parent to a place, if it is still remembered.
  void RememberParent(const PlaceKey& item, std::string_view path, std::uint32_t parent);

  // The item's place, which counts as a use; null when none is remembered. Valid until the next
  // Remember.
  const Place* Recall(const PlaceKey& item);

  // The path last remembered or recalled, empty when there is none.
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
