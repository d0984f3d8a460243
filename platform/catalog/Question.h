// What a search over a volume looks for, what it has found of it, and when it is settled.
//
//   numbers of the volume    looked for                   a find is    settled by
//   ---------------------------------------------------------------------------------------------
//   tell items apart         a reference, a certain id    that item    the first
//   tell items apart         another id                   an item      two, or all being seen
//   do not tell them         an id, or numbers            a place      two, or all being seen
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "catalog/FolderTree.h"
#include "kernel/Item.h"
#include "kernel/Result.h"
#include "volumes/Volume.h"

namespace tallowmere::catalog {

// What a search looks for.
struct SearchedItem {
  std::uint32_t id;                         // its node id on the volume
  const kernel::Item* reference = nullptr;  // or this very item alone
  bool foldersOnly = false;
};

class Question {
 public:
  // `lastMissed` is the last walk that looked for files too and met no item with the id. REQUIRES:
  // item and volume outlive the question.
  Question(const SearchedItem& item, const volumes::Volume& volume, WalkNumber lastMissed);

  std::uint32_t ID() const { return mItem.id; }
  bool WantsFoldersOnly() const { return mItem.foldersOnly; }

  // Whether one find settles it.
  bool IsCertain() const;

  // Whether nothing that could still be found changes the answer.
  bool IsSettled() const { return mIsSettled; }

  // Whether files have to be looked for in a folder that a walk was the first to read as it is; and
  // whether in all folders, then.
  bool HasToRead(WalkNumber read) const { return !mItem.foldersOnly && read > mLastMissed; }
  bool HasToReadAll() const { return HasToRead(kNoWalk + 1); }

  // Whether an entry of a folder is worth a look at its item.
  bool IsWorthALook(std::uint64_t inode, const kernel::Item& folder, bool isFolder) const;

  // Takes an item that was just seen at a spot, if it is one that is looked for. `path` tells its
  // canonical path.
  template <class Path>
  void Offer(const kernel::Item& item, std::uint32_t id, const kernel::Spot& spot,
             const Path& path) {
    if (IsMeant(item, id, spot)) Take(item, path());
  }

  // Takes note of what could not be seen: for an error; because something is mounted there, or what
  // was there is no more.
  void NoteError(kernel::Error error);
  void NoteHidden();
  bool HasSeenAll() const { return !mIsHidden; }

  // Whether no item with the id was met, files included.
  bool IsMissed() const { return !mItem.foldersOnly && !mHasMet; }

  // Where the item is that is the answer. REQUIRES: it is settled, or all was seen that can be.
  std::optional<std::string> Answer() const;

 private:
  struct Found {
    kernel::Item item;
    std::string path;
  };

  bool IsMeant(const kernel::Item& item, std::uint32_t id, const kernel::Spot& spot);
  bool IsReferred(const kernel::Item& item, const kernel::Spot& spot) const;
  void Take(const kernel::Item& item, std::string path);
  bool AreSame(const Found& first, const Found& second) const;
  bool ShowsAt(const Found& found, const std::string& path) const;

  const SearchedItem& mItem;
  const volumes::Volume& mVolume;
  WalkNumber mLastMissed;
  bool mIsSettled = false;
  bool mHasMet = false;
  bool mIsHidden = false;
  std::vector<Found> mFound;  // different ones
};

}  // namespace tallowmere::catalog
