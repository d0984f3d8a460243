// One walk over the folders of a volume for one question. It goes on where the last one stopped,
// and reads again only what has changed since.
//
// It never leaves its volume, waits for no server and no automounter, and passes over what it may
// not read. When it ends, nothing is open.
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

// What the walks over a volume have learned so far.
struct KnownFolders {
  FolderTree tree;
  std::vector<FolderPlace> waiting;  // to be visited, the last one first
  bool isWhole = false;              // every start has been walked from
  WalkNumber walks = kNoWalk;        // how many there were
  std::uint64_t opened = 0;          // how many folders they opened
};

class VolumeWalk {
 public:
  // REQUIRES: all outlive the walk. After an exception `known` is of no use any more.
  VolumeWalk(const volumes::Volume& volume, const volumes::Volumes& volumes, KnownFolders& known,
             Question& question);

  // Looks at the known folders that have the id.
  void LookAtKnown();

  // Visits folders near `start` first, then those that earlier walks have left, then the rest of
  // the volume.
  void Walk(const std::string& start);

  // Looks at every known folder that this walk has not seen: those that have changed are read
  // again, and those that have moved are found where they are now.
  void CheckKnown();

  // Whether every folder still is as this walk has seen it, by its change time: all of it was so at
  // one time, when the walk ended, and nothing moved from where it had not looked to where it had.
  bool IsSteady() const;

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
  std::vector<OpenFolder> mOpen;  // the way to the folder in hand, its last part
};

}  // namespace tallowmere::catalog
