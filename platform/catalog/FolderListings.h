// The entries of the folders that were read last, for questions that need all of them. A listing is
// used again until its folder's change time moves, on volumes where that is proof.
//
// One thread. Everything may throw std::bad_alloc, after which the listings are as before.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "catalog/Sighting.h"
#include "kernel/Clock.h"
#include "kernel/FolderReader.h"

namespace tallowmere::catalog {

class FolderListings {
 public:
  // `limit` is in bytes, for all listings; one that is larger is not kept.
  explicit FolderListings(std::size_t limit) : mLimit(limit) {}

  // Returns whether to go on.
  using Visitor = std::function<bool(const kernel::Entry&)>;

  // Visits the entries of a folder. Returns false when they cannot all be read.
  bool Visit(const HeldFolder& folder, const Visitor& visit);

  // Bytes in use, never above the limit.
  std::size_t Size() const;

 private:
  struct Entry {
    std::uint64_t inode;
    kernel::Entry::Kind kind;
    std::uint32_t name;  // its offset in the names
  };
  struct Listing {
    std::uint64_t device;
    std::uint64_t inode;
    kernel::Nanoseconds change;
    std::vector<Entry> entries;
    std::string names;  // each followed by a NUL

    void Add(const kernel::Entry& entry);
    std::size_t Size() const;
  };

  bool Read(const HeldFolder& folder, const Visitor& visit, Listing* listing);
  const Listing* Recall(const kernel::Item& folder, kernel::Nanoseconds change);
  void Keep(Listing listing);

  std::size_t mLimit;
  std::vector<Listing> mListings;  // the one used last is the last
};

}  // namespace tallowmere::catalog
