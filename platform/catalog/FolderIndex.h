// The folders of one volume, learned by reading them: where is the folder with an id, and the pass
// over the volume that answers when nothing shorter does.
//
// What a pass learns about folders is kept, under 64 bytes and the name for each; files are not
// kept. A pass stops as soon as the answer is certain and goes on from there for the next question.
// A folder that was read is read again only when its change time has moved, when something is
// mounted in it, when it could not be read, or when a file is looked for: whoever looks for a file
// reads every folder once. An id that no item had is noted, and the next question for it reads only
// what has changed since. The index never leaves its volume, waits for no server and no
// automounter, unless a folder that it knows has become a link that leads there, and passes over
// what it may not read. Between two questions it has nothing open.
//
// One thread. Everything may throw std::bad_alloc, after which the index is as good as new.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "files/Descriptor.h"
#include "files/ItemReference.h"
#include "files/MountTable.h"

namespace tallowmere::files {

// What a search looks for.
struct SearchedItem {
  std::uint32_t id;                          // its node id on the volume
  const ItemReference* reference = nullptr;  // or this very item alone
  bool folder = false;                       // nothing but a folder
};

class FolderIndex {
 public:
  // REQUIRES: the volume has a root.
  explicit FolderIndex(VolumePointer volume);

  // The most ids that are noted; the oldest goes first.
  static constexpr std::size_t kMostMissing = 1024;

  // The canonical path of the item, verified. None when no folder that can be read holds it, when
  // two items have the id, and when two could have it but not every folder was seen, for a reason
  // other than missing permission. Folders near `start` are read first: it, those below it, those
  // above it. REQUIRES: `start` is the canonical path of a folder.
  std::optional<std::string> Find(const SearchedItem& item, const std::string& start);

  const VolumePointer& OfVolume() const { return mVolume; }

  // How many folders were opened so far, for tests and benchmarks.
  std::uint64_t OpenedFolders() const { return mOpenedFolders; }

  // Bytes in use for what was learned and for what is left to be visited.
  std::size_t Size() const;

 private:
  class Search;

  struct Folder {
    std::uint64_t inode;
    std::int64_t change;   // its change time when it was last read whole; kNotRead
    std::uint32_t id;      // 0: it is gone
    std::uint32_t parent;  // an index; kNone: the name is a whole path
    std::uint32_t name;    // where it begins in mNames
    std::int32_t mount;
    std::uint32_t checked;  // the last search that has seen it as it is
    std::uint32_t read;     // the search that first read it as it is
  };
  struct Waiting {
    std::uint32_t parent;
    std::string name;
  };
  struct OpenFolder {
    std::uint32_t index;
    Descriptor descriptor;
    bool holdsMountPoint;
  };
  struct Missing {
    std::uint32_t id;
    std::uint32_t search;  // the last one that found no item with it
  };
  enum class Reading { kWhole, kStopped, kPartly };
  enum class Kind { kFolder, kOther, kUnknown };

  void Clear();
  void Run(Search& search, const std::string& start);
  void FindKnown(Search& search) const;
  std::vector<std::string> StartsFrom(const std::string& start) const;
  void Walk(const std::string& start, Search& search);
  void PutBack(std::vector<Waiting> left);
  void VisitWaiting(Search& search);
  void Visit(const Waiting& waiting, Search& search);
  void VisitFolder(const Waiting& waiting, int parent, Descriptor descriptor,
                   const ItemStatus& status, Search& search);
  bool OpenAgain(const Waiting& waiting, int parent, const ItemReference& item,
                 Descriptor& descriptor, Search& search);
  Reading Read(std::uint32_t index, std::uint64_t device, const Descriptor& descriptor,
               Search& search);
  Kind LookAt(std::uint32_t index, const Descriptor& descriptor, const char* name, Search& search);
  void MarkAsRead(std::uint32_t index, std::int64_t change, std::int64_t now);
  void MarkAsClosed(std::uint32_t index);
  void Distrust(std::uint32_t index);
  void CheckKnown(Search& search);
  bool CheckUnchanged(std::uint32_t index, Search& search);
  void ForgetIfGone(std::uint32_t index);
  std::uint32_t LastSearchFor(std::uint32_t id) const;
  void NoteMissing(std::uint32_t id);

  std::uint32_t Learn(const ItemReference& item, const Waiting& waiting);
  bool IsOfVolume(const ItemReference& item, const Waiting& waiting) const;
  std::uint32_t Known(std::uint64_t inode, std::uint32_t id) const;
  void Insert(std::uint32_t index);
  std::string_view NameOf(const Folder& folder) const { return mNames.data() + folder.name; }
  std::string PathOf(std::uint32_t index) const;
  std::string PathOf(const Waiting& waiting) const;
  std::optional<ItemStatus> StatusAt(const std::string& path) const;
  void Rename(Folder& folder, const Waiting& waiting);
  std::optional<int> WayTo(const Waiting& waiting, Search& search);
  Descriptor Open(int parent, const std::string& name);
  bool OpenParent(std::uint32_t index, Search& search);
  void KeepOpen(std::uint32_t index, Descriptor descriptor);

  VolumePointer mVolume;
  std::vector<Folder> mFolders;
  std::vector<std::uint32_t> mTable;  // open addressing by id, of indexes into mFolders
  std::string mNames;                 // each with a NUL behind it
  std::vector<Waiting> mWaiting;      // to be visited, the last one first
  std::vector<OpenFolder> mOpen;      // the way to the folder in hand, its last part
  std::vector<Missing> mMissing;      // the one that was noted last is the last
  bool mIsWhole = false;              // every start has been walked from
  bool mCountsSubfolders;             // by the links of each folder
  bool mRenumbersFiles;
  std::size_t mUnusedNames = 0;  // bytes in mNames, of folders that were renamed or are gone
  std::uint32_t mSearches = 0;
  std::uint64_t mOpenedFolders = 0;
};

}  // namespace tallowmere::files
