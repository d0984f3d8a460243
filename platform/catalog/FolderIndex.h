// The folders of one volume, learned by reading them: where is the folder with an id, and the walk
// over the volume that answers when nothing shorter does.
//
// What a walk learns about folders is kept, under 64 bytes and the name for each; files are not
// kept. A walk stops as soon as the question is settled, and the next one goes on from there. A
// folder that was read is read again only when its change time has moved, when something is mounted
// in it, when it could not be read, or when a file is looked for: whoever looks for a file reads
// every folder once. An id that no item had is noted, and the next question for it reads only what
// has changed since. Between two questions nothing is open.
//
// Where numbers do not tell items apart, a question is answered when one place of the whole volume
// has the id: every folder was read, nothing was mounted on the volume or closed to this process,
// and nothing changed from the first look to the last. On kinds whose change times promise nothing
// either, nothing is kept.
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

  // The most ids that are noted; the oldest goes first.
  static constexpr std::size_t kMostMissing = 1024;

  // A lead to the item: the path at which it was just seen, canonical unless something moved in
  // between. Nullopt when no folder that can be read holds it, when two items have the id, and when
  // two could have it but not every folder was seen; missing permission is no reason where numbers
  // tell items apart. Folders near `start` are read first: it, those
  // below it, those above it. REQUIRES: `start` is the canonical path of a folder; `volumes` lists
  // the volume's mounts as the index was made for.
  std::optional<std::string> Find(const SearchedItem& item, const std::string& start,
                                  const volumes::Volumes& volumes);

  const volumes::VolumePointer& OfVolume() const { return mVolume; }

  // How many folders were opened so far, for tests and benchmarks.
  std::uint64_t OpenedFolders() const { return mKnown.opened; }

  // Bytes in use for what was learned and for what is left to be visited.
  std::size_t Size() const;

 private:
  struct Missing {
    std::uint32_t id;
    WalkNumber walk;  // the last one that met no item with it
  };

  void Clear();
  bool Run(Question& question, const std::string& start, const volumes::Volumes& volumes);
  WalkNumber LastMissed(std::uint32_t id) const;
  void NoteMissing(std::uint32_t id);

  volumes::VolumePointer mVolume;
  KnownFolders mKnown;
  std::vector<Missing> mMissing;  // the one that was noted last is the last
};

}  // namespace tallowmere::catalog
