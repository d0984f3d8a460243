#include "catalog/PlaceMemory.h"

#include "catalog/Spread.h"

namespace tallowmere::catalog {
namespace {

// In bytes: what the heap and the two containers add to a place and its path.
constexpr std::size_t kOverhead = 96;

}  // namespace

std::size_t PlaceMemory::HashOfKey::operator()(const PlaceKey& key) const noexcept {
  return static_cast<std::size_t>((key.number ^ (key.space * kSpread)) * kSpread);
}

PlaceMemory::PlaceMemory(std::size_t limit) : mLimit(limit) {}

void PlaceMemory::Remember(const PlaceKey& item, std::string_view path) {
  const auto known = mIndex.find(item);
  if (known != mIndex.end() && known->second->place.path == path) {
    mEntries.splice(mEntries.begin(), mEntries, known->second);
    return;
  }
  Entries fresh;
  fresh.push_back({item, {std::string(path), 0}});
  if (known != mIndex.end()) {
    mSize -= SizeOf(*known->second);
    mEntries.erase(known->second);
    known->second = fresh.begin();
  } else {
    mIndex.emplace(item, fresh.begin());
  }
  mSize += SizeOf(fresh.front());
  mEntries.splice(mEntries.begin(), fresh);
  while (mSize > mLimit) ForgetTheOldest();
}

void PlaceMemory::RememberParent(const PlaceKey& item, std::string_view path,
                                 std::uint32_t parent) {
  const auto known = mIndex.find(item);
  if (known != mIndex.end() && known->second->place.path == path) {
    known->second->place.parent = parent;
  }
}

const PlaceMemory::Place* PlaceMemory::Recall(const PlaceKey& item) {
  const auto known = mIndex.find(item);
  if (known == mIndex.end()) return nullptr;
  mEntries.splice(mEntries.begin(), mEntries, known->second);
  return &known->second->place;
}

std::string_view PlaceMemory::Latest() const {
  return mEntries.empty() ? std::string_view() : mEntries.front().place.path;
}

std::size_t PlaceMemory::SizeOf(const Entry& entry) {
  return sizeof(Entry) + entry.place.path.capacity() + kOverhead;
}

void PlaceMemory::ForgetTheOldest() {
  mSize -= SizeOf(mEntries.back());
  mIndex.erase(mEntries.back().key);
  mEntries.pop_back();
}

}  // namespace tallowmere::catalog
