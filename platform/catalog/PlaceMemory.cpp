#include "files/PlaceMemory.h"

#include "files/Spread.h"

namespace tallowmere::files {
namespace {

// Some five thousand places with paths of usual length.
constexpr std::size_t kLimitOfThisProcess = 1 << 20;

// What the heap and the two containers add to a place and its path.
constexpr std::size_t kOverhead = 96;

}  // namespace

std::size_t PlaceMemory::HashOfKey::operator()(const Key& key) const noexcept {
  return (key.inode ^ (key.device * kSpread)) * kSpread;
}

PlaceMemory& PlaceMemory::OfThisProcess() {
  static PlaceMemory memory(kLimitOfThisProcess);
  return memory;
}

PlaceMemory::PlaceMemory(std::size_t limit) : mLimit(limit) {}

void PlaceMemory::Remember(const ItemReference& item, std::string_view path) {
  const Key key{item.device, item.inode};
  const auto known = mIndex.find(key);
  if (known != mIndex.end() && known->second->path == path) {
    mPlaces.splice(mPlaces.begin(), mPlaces, known->second);
    return;
  }
  Places fresh;
  fresh.push_back({key, std::string(path)});
  if (known != mIndex.end()) {
    mSize -= SizeOf(*known->second);
    mPlaces.erase(known->second);
    known->second = fresh.begin();
  } else {
    mIndex.emplace(key, fresh.begin());
  }
  mSize += SizeOf(fresh.front());
  mPlaces.splice(mPlaces.begin(), fresh);
  while (mSize > mLimit) ForgetTheOldest();
}

const std::string* PlaceMemory::Recall(const ItemReference& item) {
  const auto known = mIndex.find({item.device, item.inode});
  if (known == mIndex.end()) return nullptr;
  mPlaces.splice(mPlaces.begin(), mPlaces, known->second);
  return &known->second->path;
}

std::string_view PlaceMemory::Latest() const {
  return mPlaces.empty() ? std::string_view() : mPlaces.front().path;
}

std::size_t PlaceMemory::SizeOf(const Place& place) {
  return sizeof(Place) + place.path.capacity() + kOverhead;
}

void PlaceMemory::ForgetTheOldest() {
  mSize -= SizeOf(mPlaces.back());
  mIndex.erase(mPlaces.back().key);
  mPlaces.pop_back();
}

}  // namespace tallowmere::files
