// An index of one volume's folders by id. It is learned by walking the volume, the last resort when
// nothing cheaper finds an item.
//
// The index keeps folders, less than 64 bytes plus the name each, but no files. A walk stops as
// soon as its question is settled; the next one resumes there. A folder is read again only when its
// change time has moved, when something is mounted in it, when it could not be read, or when a file
// is sought: each search for a file reads every folder once. Ids that no item had are noted, and
// the next question about one reads only what has changed since. Nothing stays open between
// questions.
//
// Where numbers do not identify items, an id is resolved only if exactly one place on the volume
// has it: every folder was read, nothing was mounted on the volume or unreadable, and nothing
// changed during the walk. Shortly after a change, when another one can have the same time, two
// walks have to agree. Where change times are not reliable either, nothing is kept.
//
// One thread. Everything may throw std::bad_alloc, after which the index is as good as new.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "catalog/Question.h"
#include "catalog/VolumeWalk.h"
#include "volumes/Volumes.h"

namespace tallowmere::catalog {

class FolderIndex {
 public:
  explicit FolderIndex(volumes::VolumePointer volume);

  // How many missing ids are noted; the oldest is dropped first.
  static constexpr std::size_t kMostMissing = 1024;

  // Returns a lead to the item: the path at which it was just seen, canonical unless something
  // moved meanwhile. Nullopt when no readable folder holds it, when two items have the id, and when
  // two could have it but not every folder was seen (where numbers identify items, unreadable
  // folders do not count). Reads `start`, the folders below it and those above it first. REQUIRES:
  // `start` is the canonical path of a folder; `volumes` lists the same mounts of the volume as
  // when the index was made.
  std::optional<std::string> Find(const SearchedItem& item, const std::string& start,
                                  const volumes::Volumes& volumes);

  const volumes::VolumePointer& OfVolume() const { return mVolume; }

  // The number of folders opened so far, for tests and benchmarks.
  std::uint64_t OpenedFolders() const { return mKnown.opened; }

  // Bytes used by the known folders and those still to be visited.
  std::size_t Size() const;

 private:
  struct Missing {
    std::uint32_t id;
    WalkNumber walk;  // the last one that met no item with it
  };

  // How sure the answer of one walk is.
  enum class Proof {
    kNone,    // the volume changed meanwhile
    kLikely,  // it may have: two walks have to agree
    kCertain,
  };

  void Clear();
  Proof Run(Question& question, const std::string& start, const volumes::Volumes& volumes);
  WalkNumber LastMissed(std::uint32_t id) const;
  void NoteMissing(std::uint32_t id);

  volumes::VolumePointer mVolume;
  KnownFolders mKnown;
  std::vector<Missing> mMissing;  // the one that was noted last is the last
};

}  // namespace tallowmere::catalog
