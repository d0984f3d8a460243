// What a search over a volume looks for, what it has found so far, and when it is settled.
//
//   the volume's numbers    sought                       a match is    settled by
//   ---------------------------------------------------------------------------------------------
//   identify items          a reference, a certain id    that item     the first match
//   identify items          another id                   an item       two matches, or the end
//   do not                  an id, or numbers            a place       two matches, or the end
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
  const kernel::Item* reference = nullptr;  // if given, only this very item
  bool foldersOnly = false;
};

class Question {
 public:
  // `lastMissed` is the latest walk that looked for files too and met no item with the id.
  // REQUIRES: item and volume outlive the question.
  Question(const SearchedItem& item, const volumes::Volume& volume, WalkNumber lastMissed);

  std::uint32_t ID() const { return mItem.id; }
  bool WantsFoldersOnly() const { return mItem.foldersOnly; }

  // Whether the first match settles it.
  bool IsCertain() const;

  // Whether no further match could change the answer.
  bool IsSettled() const { return mIsSettled; }

  // Whether a folder first read in its present state by walk `read` has to be searched for files;
  // HasToReadAll: whether every folder has to be.
  bool HasToRead(WalkNumber read) const { return !mItem.foldersOnly && read > mLastMissed; }
  bool HasToReadAll() const { return HasToRead(kNoWalk + 1); }

  // Whether a folder's entry could be the sought item, judged by its inode number.
  bool IsWorthALook(std::uint64_t inode, const kernel::Item& folder, bool isFolder) const;

  // Records an item just seen at a spot if it is a match. `path` returns its canonical path.
  template <class Path>
  void Offer(const kernel::Item& item, std::uint32_t id, const kernel::Spot& spot,
             const Path& path) {
    if (IsMeant(item, id, spot)) Take(item, path());
  }

  // Record what could not be seen: because of an error; because something is mounted over it, or it
  // has gone.
  void NoteError(kernel::Error error);
  void NoteHidden();
  bool HasSeenAll() const { return !mIsHidden; }

  // Whether no item with the id was met and files were searched too.
  bool IsMissed() const { return !mItem.foldersOnly && !mHasMet; }

  // The path of the sought item. REQUIRES: the question is settled, or the walk has ended.
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
  std::vector<Found> mFound;  // no two the same
};

}  // namespace tallowmere::catalog
