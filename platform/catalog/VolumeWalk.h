// One walk over the folders of a volume, for one question. It resumes where the last walk stopped,
// and rereads only what has changed since.
//
// A walk never leaves its volume, triggers no automounter, waits for no other volume's server, and
// skips what it may not read. Nothing stays open when it ends.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "catalog/FolderTree.h"
#include "catalog/Question.h"
#include "kernel/Descriptor.h"
#include "kernel/FolderReader.h"
#include "volumes/Volume.h"
#include "volumes/Volumes.h"

namespace tallowmere::catalog {

// What the walks over a volume have learned.
struct KnownFolders {
  FolderTree tree;
  std::vector<FolderPlace> waiting;  // to be visited, from the back
  bool isWhole = false;              // walked from every start
  WalkNumber walks = kNoWalk;        // number of the latest
  std::uint64_t opened = 0;          // folders opened so far
};

class VolumeWalk {
 public:
  // REQUIRES: all outlive the walk. After an exception, `known` is unusable.
  VolumeWalk(const volumes::Volume& volume, const volumes::Volumes& volumes, KnownFolders& known,
             Question& question);

  // Checks the known folders with the id.
  void CheckKnownWithID();

  // Visits folders near `start` first, then those left by earlier walks, then the rest of the
  // volume.
  void Walk(const std::string& start);

  // Checks every known folder that this walk has not seen: rereads those that have changed, and
  // finds those that have moved.
  void CheckKnown();

  // Whether every folder still has the change time that this walk saw. If so, the whole volume was
  // in that state when the walk ended, and nothing moved from a folder not yet read into one
  // already read.
  bool IsSteady() const;

  // Whether a folder had changed so shortly before the walk that it may have changed again with the
  // same time.
  bool MayHaveMissedChanges() const;

 private:
  struct OpenFolder {
    FolderNumber number;
    kernel::Descriptor descriptor;
    bool holdsMountPoint;
  };
  struct HeldItem {
    kernel::Descriptor descriptor;
    kernel::Item item;
  };
  // A folder that is being visited.
  struct Visited {
    const FolderPlace& place;
    kernel::Spot spot;
    kernel::Descriptor descriptor;  // open, or still to be opened
    kernel::Status status;
  };
  enum class Reading { kWhole, kStopped, kPartly };
  enum class Seen { kFolder, kOther, kHidden };

  std::vector<std::string> StartsFrom(const std::string& start) const;
  void PutBack(std::vector<FolderPlace> left);
  void VisitWaiting();
  void Visit(const FolderPlace& place);
  std::optional<kernel::Spot> SpotOf(const FolderPlace& place);
  bool IsOfVolume(const kernel::Item& item, const FolderPlace& place) const;
  void VisitFolder(Visited visited);
  void ReadFolder(FolderNumber folder, Visited visited);
  kernel::Result<kernel::Descriptor> OpenAgain(const Visited& visited);
  Reading ReadEntries(FolderNumber folder, const kernel::Descriptor& descriptor);
  Seen SeeEntry(FolderNumber folder, const kernel::Spot& spot);
  bool CheckUnchanged(FolderNumber number);
  void ForgetIfGone(FolderNumber folder);

  std::optional<std::uint32_t> IDOf(kernel::Item& item, FolderNumber parent,
                                    const kernel::Spot& spot) const;
  bool IsSeen(FolderNumber folder) const { return mTree[folder].checked == mKnown.walks; }
  void MarkAsSeen(FolderNumber folder) { mTree[folder].checked = mKnown.walks; }
  void MarkAsRead(FolderNumber number, kernel::Nanoseconds change, kernel::Nanoseconds now);
  void Invalidate(FolderNumber folder);

  kernel::Result<kernel::Descriptor> OpenToRead(const kernel::Spot& spot);
  kernel::Result<HeldItem> HoldAt(const std::string& path) const;
  bool EnterFolder(FolderNumber folder);
  void KeepOpen(FolderNumber folder, kernel::Descriptor descriptor);

  const volumes::Volume& mVolume;
  const volumes::Volumes& mVolumes;
  KnownFolders& mKnown;
  FolderTree& mTree;
  Question& mQuestion;
  kernel::Nanoseconds mBegan;
  bool mHasMissedStart = false;
  std::vector<OpenFolder> mOpen;  // the innermost folders on the way to the current one
};

}  // namespace tallowmere::catalog
