// Where referenced items were last seen: paths by device and inode number, in bounded memory. Asks
// nothing of the disk; who uses a place verifies it first.
//
// Of an item with several names, the place is the one last remembered.
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <string>
#include <string_view>
#include <unordered_map>

#include "files/ItemReference.h"

namespace tallowmere::files {

class PlaceMemory {
 public:
  static PlaceMemory& OfThisProcess();

  // `limit` is in bytes, for everything remembered; about 200 a place. A limit below what one place
  // takes remembers none.
  explicit PlaceMemory(std::size_t limit);

  // The item's place is `path` from now on. Forgets the places least recently used when the limit
  // is passed. Without memory the exception leaves everything as it was.
  void Remember(const ItemReference& item, std::string_view path);

  // The item's place, which counts as a use; null when none is remembered. Valid until the next
  // Remember.
  const std::string* Recall(const ItemReference& item);

  // The path last remembered or recalled, empty when there is none.
  std::string_view Latest() const;

  // Bytes in use, never above the limit.
  std::size_t Size() const { return mSize; }

 private:
  struct Key {
    std::uint64_t device;
    std::uint64_t inode;
    bool operator==(const Key&) const = default;
  };
  struct HashOfKey {
    std::size_t operator()(const Key& key) const noexcept;
  };
  struct Place {
    Key key;
    std::string path;
  };
  using Places = std::list<Place>;

  static std::size_t SizeOf(const Place& place);
  void ForgetTheOldest();

  std::size_t mLimit;
  std::size_t mSize = 0;
  Places mPlaces;  // the most recently used first
  std::unordered_map<Key, Places::iterator, HashOfKey> mIndex;
};

}  // namespace tallowmere::files
