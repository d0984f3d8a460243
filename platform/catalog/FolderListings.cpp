#include "catalog/FolderListings.h"

#include <algorithm>
#include <numeric>
#include <utility>

#include "catalog/ChangeTimes.h"
#include "kernel/Item.h"
#include "kernel/Paths.h"

namespace tallowmere::catalog {

bool FolderListings::Visit(const HeldFolder& folder, const Visitor& visit) {
  const kernel::Nanoseconds now = kernel::Now();  // before the folder is read
  const auto status = kernel::ReadStatus(folder.OwnSpot());
  if (!status) return false;
  if (!HoldsUntilChange(*folder.Volume())) return Read(folder, visit, nullptr);
  if (const Listing* const listing = Recall(status->item, status->change)) {
    for (const Entry& entry : listing->entries) {
      if (!visit({entry.inode, entry.kind, listing->names.c_str() + entry.name})) break;
    }
    return true;
  }
  if (MayChangeUnseen(status->change, now)) return Read(folder, visit, nullptr);
  Listing listing{status->item.device, status->item.inode, status->change, {}, {}};
  return Read(folder, visit, &listing);
}

// Keeps the whole listing unless it is null or becomes too large.
bool FolderListings::Read(const HeldFolder& folder, const Visitor& visit, Listing* listing) {
  const auto open = kernel::OpenForReading(folder.SpotOf("."));
  if (!open) return false;
  bool isVisiting = true;
  kernel::FolderReader reader(*open);
  while (const kernel::Entry* const entry = reader.Next()) {
    if (listing != nullptr) {
      listing->Add(*entry);
      if (listing->Size() > mLimit) listing = nullptr;
    }
    if (isVisiting) isVisiting = visit(*entry);
    if (!isVisiting && listing == nullptr) return true;
  }
  const bool isWhole = reader.FailedBy().number == 0;
  if (isWhole && listing != nullptr) Keep(std::move(*listing));
  return isWhole || !isVisiting;
}

void FolderListings::Listing::Add(const kernel::Entry& entry) {
  entries.push_back({entry.inode, entry.kind, static_cast<std::uint32_t>(names.size())});
  names.append(entry.name).push_back('\0');
}

std::size_t FolderListings::Listing::Size() const {
  return entries.capacity() * sizeof(Entry) + names.capacity();
}

const FolderListings::Listing* FolderListings::Recall(const kernel::Item& folder,
                                                      kernel::Nanoseconds change) {
  const auto found = std::find_if(mListings.begin(), mListings.end(), [&](const Listing& listing) {
    return listing.device == folder.device && listing.inode == folder.inode;
  });
  if (found == mListings.end()) return nullptr;
  if (found->change != change) {
    mListings.erase(found);
    return nullptr;
  }
  std::rotate(found, found + 1, mListings.end());
  return &mListings.back();
}

void FolderListings::Keep(Listing listing) {
  while (!mListings.empty() && Size() + listing.Size() > mLimit) mListings.erase(mListings.begin());
  mListings.push_back(std::move(listing));
}

std::size_t FolderListings::Size() const {
  return std::accumulate(
      mListings.begin(), mListings.end(), std::size_t{0},
      [](std::size_t size, const Listing& listing) { return size + listing.Size(); });
}

}  // namespace tallowmere::catalog
