#include "files/FolderIndex.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <ctime>
#include <iterator>
#include <limits>
#include <utility>

#include "files/FileSystems.h"
#include "files/NodeID.h"
#include "files/Spread.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

constexpr std::uint32_t kNone = 0xFFFFFFFF;
constexpr std::int64_t kNotRead = std::numeric_limits<std::int64_t>::min();

// A change this recent may be followed by another with the same time: file systems count in ticks,
// of two seconds at the coarsest.
constexpr std::uint64_t kCoarsestTick = 2'000'000'000;

// The most components that a path can have: a "/" and one byte each.
constexpr std::size_t kMostComponents = PATH_MAX / 2;

constexpr std::size_t kMostOpenFolders = 16;
constexpr std::size_t kSmallestTable = 64;

// Of no search.
constexpr std::uint32_t kNever = 0;

std::int64_t Now() {
  timespec now{};
  clock_gettime(CLOCK_REALTIME, &now);
  return Nanoseconds(now.tv_sec, now.tv_nsec);
}

bool IsThisOrParent(const char* name) {
  return name[0] == '.' && (name[1] == '\0' || (name[1] == '.' && name[2] == '\0'));
}

constexpr std::uint32_t kLinksWithoutSubfolders = 2;

// Containers double when they are full. These hold something for every folder of a volume.
template <class Container>
void ReserveFor(Container& container, std::size_t more) {
  const std::size_t size = container.size() + more;
  if (size > container.capacity()) container.reserve(size + size / 4);
}

// Whether an error hides what could be found: what is gone cannot, nor what this process may not
// read, nor what has no path.
bool HidesSomething(int error) {
  return !MeansGone(error) && error != EACCES && error != ENAMETOOLONG;
}

}  // namespace

// One question on its way through the folders.
class FolderIndex::Search {
 public:
  // `lastSearch` for files too found no item with the id; kNever.
  Search(const SearchedItem& item, const Volume& volume, std::uint32_t lastSearch)
      : mItem(item),
        mLastSearch(lastSearch),
        mRoot(*volume.Root()),
        mUntrueEntries(HasUntrueEntries(volume.Type())),
        mCertain(item.reference != nullptr || IsInodeNumber(item.id)) {}

  std::uint32_t ID() const { return mItem.id; }
  bool WantsFolder() const { return mItem.folder; }

  // Whether one find settles it. Else every folder has to be seen, or two finds.
  bool IsCertain() const { return mCertain; }
  bool IsSettled() const { return mFound.size() > (mCertain ? 0 : 1); }

  // Whether the entries have to be looked at of a folder that a search was the first to read as it
  // is; and whether of all folders, then.
  bool HasToRead(std::uint32_t read) const { return !mItem.folder && read > mLastSearch; }
  bool HasToReadAll() const { return HasToRead(kNever + 1); }

  // Takes note of what could not be looked at.
  void NoteError(int error) { mIsHidden = mIsHidden || HidesSomething(error); }
  bool HasSeenAll() const { return !mIsHidden; }

  // Whether no item with the id was in any folder that a search for files too, which came to its
  // end, has seen.
  bool IsMissing() const { return !mItem.folder && !mHasMet; }

  // The one item that was found.
  std::optional<std::string> Answer() const {
    if (mFound.size() != 1 || (!mCertain && mIsHidden)) return std::nullopt;
    return mFound.front().path;
  }

  // Whether an entry is worth a look at its item.
  bool MayBe(std::uint64_t inode, std::uint64_t device, bool folder) const {
    if (mItem.folder && !folder) return false;
    if (mUntrueEntries && !folder) return true;
    return NodeIDOf(inode, device, mRoot) == mItem.id;
  }

  // Takes the item at `name` in `folder`, with the status that was read there, if it is the one.
  template <class Path>
  void Offer(const ItemReference& item, int folder, const char* name, const Path& path) {
    if (NodeIDOf(item, mRoot) != mItem.id) return;
    mHasMet = true;
    if (mItem.folder && !S_ISDIR(item.type)) return;
    if (mItem.reference != nullptr && !IsAt(*mItem.reference, folder, name)) return;
    const bool known = std::any_of(mFound.begin(), mFound.end(),
                                   [&](const Found& found) { return AreEqual(found.item, item); });
    if (!known) mFound.push_back({item, path()});
  }

 private:
  struct Found {
    ItemReference item;
    std::string path;
  };

  const SearchedItem& mItem;
  std::uint32_t mLastSearch;
  const ItemReference& mRoot;
  bool mUntrueEntries;
  bool mCertain;
  bool mHasMet = false;  // an item with the id
  bool mIsHidden = false;
  std::vector<Found> mFound;  // different items
};

FolderIndex::FolderIndex(VolumePointer volume)
    : mVolume(std::move(volume)),
      mCountsSubfolders(CountsSubfolders(mVolume->Type())),
      mRenumbersFiles(RenumbersFiles(mVolume->Type())) {}

std::optional<std::string> FolderIndex::Find(const SearchedItem& item, const std::string& start) {
  const bool isLast = mSearches == std::numeric_limits<std::uint32_t>::max();
  if (mUnusedNames > mNames.size() / 2 || isLast) Clear();
  ++mSearches;
  Search search(item, *mVolume, LastSearchFor(item.id));
  try {
    Run(search, start);
  } catch (...) {
    Clear();
    throw;
  }
  mOpen.clear();
  if (mWaiting.empty()) mWaiting = {};
  return search.Answer();
}

void FolderIndex::Run(Search& search, const std::string& start) {
  if (!MountTable::OfThisProcess().WithNumber(mVolume->Number())) return;
  if (search.IsCertain()) FindKnown(search);
  if (search.IsSettled()) return;
  if (!mIsWhole || !mWaiting.empty() || search.HasToReadAll()) Walk(start, search);
  CheckKnown(search);
  if (!search.IsSettled() && search.IsMissing()) NoteMissing(search.ID());
}

std::size_t FolderIndex::Size() const {
  std::size_t size = mFolders.capacity() * sizeof(Folder) + mTable.capacity() * sizeof(mTable[0]) +
                     mNames.capacity() + mWaiting.capacity() * sizeof(Waiting) +
                     mMissing.capacity() * sizeof(Missing);
  for (const Waiting& waiting : mWaiting) size += waiting.name.capacity();
  return size;
}

// Gives the memory back, too.
void FolderIndex::Clear() {
  mFolders = {};
  mTable = {};
  mNames = {};
  mWaiting = {};
  mMissing = {};
  mOpen.clear();
  mIsWhole = false;
  mUnusedNames = 0;
  mSearches = kNever;
}

void FolderIndex::FindKnown(Search& search) const {
  if (mTable.empty()) return;
  const std::size_t mask = mTable.size() - 1;
  for (std::size_t slot = FirstSlot(search.ID(), mTable.size()); mTable[slot] != kNone;
       slot = (slot + 1) & mask) {
    const Folder& folder = mFolders[mTable[slot]];
    if (folder.id != search.ID()) continue;
    const std::string path = PathOf(mTable[slot]);
    const auto status = StatusAt(path);
    if (!status) continue;
    search.Offer(status->item, AT_FDCWD, path.c_str(),
                 [&path]() -> const std::string& { return path; });
  }
}

// `start`, the folders above it, and the volume's places.
std::vector<std::string> FolderIndex::StartsFrom(const std::string& start) const {
  const auto& mountPoints = mVolume->MountPoints();
  const auto isMountPoint = [&](const std::string& path) {
    return std::find(mountPoints.begin(), mountPoints.end(), path) != mountPoints.end();
  };
  std::vector<std::string> starts;
  for (std::string path = start;; path = foundation::FolderOf(path)) {
    starts.push_back(path);
    if (path == "/" || isMountPoint(path)) break;
  }
  starts.insert(starts.end(), mountPoints.begin(), mountPoints.end());
  return starts;
}

// Folders near `start` first, then those that earlier walks have left, then the rest of the volume.
void FolderIndex::Walk(const std::string& start, Search& search) {
  std::vector<Waiting> left = std::exchange(mWaiting, {});
  for (const std::string& path : StartsFrom(start)) {
    Visit({kNone, path}, search);
    VisitWaiting(search);
    if (search.IsSettled()) return PutBack(std::move(left));
  }
  mWaiting = std::move(left);
  VisitWaiting(search);
  if (!search.IsSettled() && search.HasSeenAll()) mIsWhole = true;
}

// After a walk that stopped: what was left before still waits, and what was found in folders that
// were read anew, once. The rest is known.
void FolderIndex::PutBack(std::vector<Waiting> left) {
  const auto isNews = [this](const Waiting& waiting) {
    return waiting.parent != kNone && mFolders[waiting.parent].read == mSearches;
  };
  std::erase_if(left, isNews);
  std::erase_if(mWaiting, [&](const Waiting& waiting) { return !isNews(waiting); });
  if (left.empty()) return;
  ReserveFor(left, mWaiting.size());
  std::move(mWaiting.begin(), mWaiting.end(), std::back_inserter(left));
  mWaiting = std::move(left);
}

void FolderIndex::VisitWaiting(Search& search) {
  while (!mWaiting.empty() && !search.IsSettled()) {
    const Waiting next = std::move(mWaiting.back());
    mWaiting.pop_back();
    Visit(next, search);
  }
}

void FolderIndex::Visit(const Waiting& waiting, Search& search) {
  const auto parent = WayTo(waiting, search);
  if (!parent) return Distrust(waiting.parent);
  Descriptor descriptor;
  if (!mCountsSubfolders) descriptor = Open(*parent, waiting.name);
  const auto status = descriptor.IsOpen() ? ReadStatus(descriptor.Get(), "")
                                          : ReadStatus(*parent, waiting.name.c_str());
  if (!status) {
    search.NoteError(errno);
    return Distrust(waiting.parent);
  }
  if (!S_ISDIR(status->item.type)) return;
  if (!IsOfVolume(status->item, waiting)) return Distrust(waiting.parent);
  VisitFolder(waiting, *parent, std::move(descriptor), *status, search);
}

// `descriptor` is open, or the folder still has to be.
void FolderIndex::VisitFolder(const Waiting& waiting, int parent, Descriptor descriptor,
                              const ItemStatus& status, Search& search) {
  const std::int64_t now = Now();
  const std::uint32_t index = Learn(status.item, waiting);
  search.Offer(status.item, parent, waiting.name.c_str(), [&] { return PathOf(index); });
  Folder& folder = mFolders[index];
  if (folder.checked == mSearches) return;
  const bool isUnchanged = folder.change == status.change;
  if (isUnchanged && !search.HasToRead(folder.read)) {
    folder.checked = mSearches;
    return;
  }
  if (!isUnchanged) folder.change = kNotRead;
  if (search.IsSettled()) {
    mWaiting.push_back(waiting);
    return;
  }
  const bool isLeaf = mCountsSubfolders && status.links == kLinksWithoutSubfolders;
  if (isLeaf && search.WantsFolder()) return MarkAsRead(index, status.change, now);

  if (!descriptor.IsOpen() && !OpenAgain(waiting, parent, status.item, descriptor, search)) {
    if (errno == EACCES) MarkAsClosed(index);
    return;
  }
  const std::size_t before = mWaiting.size();
  const Reading reading = Read(index, status.item.device, descriptor, search);
  if (reading == Reading::kStopped) {
    mWaiting.resize(before);
    mWaiting.push_back(waiting);
    return;
  }
  MarkAsRead(index, status.change, now);
  if (reading == Reading::kPartly) Distrust(index);
  if (mWaiting.size() > before) KeepOpen(index, std::move(descriptor));
}

// Opens the folder that was seen there. When it cannot be opened, errno says why; another folder
// may have come in the meantime.
bool FolderIndex::OpenAgain(const Waiting& waiting, int parent, const ItemReference& item,
                            Descriptor& descriptor, Search& search) {
  descriptor = Open(parent, waiting.name);
  const auto opened = descriptor.IsOpen() ? ReadStatus(descriptor.Get(), "") : std::nullopt;
  if (!opened) search.NoteError(errno);
  if (opened && !AreEqual(opened->item, item)) errno = ENOENT;
  return opened && AreEqual(opened->item, item);
}

// `change` and `now` as they were before it was read.
void FolderIndex::MarkAsRead(std::uint32_t index, std::int64_t change, std::int64_t now) {
  Folder& folder = mFolders[index];
  folder.checked = mSearches;
  if (folder.change == change) return;
  folder.read = mSearches;
  const std::uint64_t age = static_cast<std::uint64_t>(now) - static_cast<std::uint64_t>(change);
  const bool mayChangeUnseen = now <= change || age <= kCoarsestTick;
  folder.change = mayChangeUnseen ? kNotRead : change;
}

// The folder may not be read now. Another server, or a new ticket, can let it be read without a
// change.
void FolderIndex::MarkAsClosed(std::uint32_t index) {
  mFolders[index].change = kNotRead;
  mFolders[index].checked = mSearches;
}

// Something in the folder was not seen that may be seen later though the folder does not change.
void FolderIndex::Distrust(std::uint32_t index) {
  if (index == kNone) return;
  mFolders[index].change = kNotRead;
  mFolders[index].checked = kNever;  // at another mount more of it may be seen
}

// Stops when the search is settled.
FolderIndex::Reading FolderIndex::Read(std::uint32_t index, std::uint64_t device,
                                       const Descriptor& descriptor, Search& search) {
  struct Entry {  // struct linux_dirent64 of getdents(2)
    std::uint64_t inode;
    std::int64_t offset;
    std::uint16_t size;
    std::uint8_t type;
    char name[1];
  };
  const bool isNew = mFolders[index].change == kNotRead || search.HasToReadAll();
  Reading reading = Reading::kWhole;
  alignas(Entry) std::array<char, 32768> buffer;
  while (true) {
    const ssize_t got = getdents64(descriptor.Get(), buffer.data(), buffer.size());
    if (got < 0) search.NoteError(errno);
    if (got <= 0) return got < 0 ? Reading::kPartly : reading;
    for (ssize_t at = 0; at < got;) {
      const auto* const entry = reinterpret_cast<const Entry*>(buffer.data() + at);
      const char* const name = buffer.data() + at + offsetof(Entry, name);
      at += entry->size;
      if (IsThisOrParent(name)) continue;
      Kind kind = entry->type == DT_DIR ? Kind::kFolder : Kind::kOther;
      if (entry->type == DT_UNKNOWN || search.MayBe(entry->inode, device, kind == Kind::kFolder)) {
        kind = LookAt(index, descriptor, name, search);
        if (search.IsSettled()) return Reading::kStopped;
      }
      if (kind == Kind::kUnknown) reading = Reading::kPartly;
      // What an earlier reading found is known or waits already.
      if (kind == Kind::kFolder && isNew) mWaiting.push_back({index, name});
    }
  }
}

// Offers the item at an entry of an open folder. Unknown when something covers it and when it
// cannot be looked at.
FolderIndex::Kind FolderIndex::LookAt(std::uint32_t index, const Descriptor& descriptor,
                                      const char* name, Search& search) {
  const std::string path = foundation::JoinPath(PathOf(index), name);
  if (MountTable::OfThisProcess().IsMountPoint(path)) return Kind::kUnknown;
  const auto status = ReadStatus(descriptor.Get(), name);
  if (!status) search.NoteError(errno);
  if (!status || status->item.mount != mFolders[index].mount) return Kind::kUnknown;
  search.Offer(status->item, descriptor.Get(), name,
               [&path]() -> const std::string& { return path; });
  return S_ISDIR(status->item.type) ? Kind::kFolder : Kind::kOther;
}

// Looks at every folder that this search has not seen: folders that have changed are read again,
// and those that have moved are found where they are now. A folder is gone when it is not there
// even after all others have been looked at.
void FolderIndex::CheckKnown(Search& search) {
  for (const bool last : {false, true}) {
    for (std::uint32_t index = 0; index < mFolders.size() && !search.IsSettled(); ++index) {
      if (mFolders[index].id == 0 || mFolders[index].checked == mSearches) continue;
      if (CheckUnchanged(index, search)) continue;
      const Folder& folder = mFolders[index];
      if (folder.parent == kNone || OpenParent(folder.parent, search)) {
        Visit({folder.parent, std::string(NameOf(folder))}, search);
        VisitWaiting(search);
      }
      const bool isSeen = mFolders[index].checked == mSearches;
      if (last && !isSeen && !search.IsSettled()) ForgetIfGone(index);
    }
  }
}

// Whether the folder is where it is known to be, as it was when it was read, and need not be read
// for this search. It then counts as seen.
bool FolderIndex::CheckUnchanged(std::uint32_t index, Search& search) {
  const std::string path = PathOf(index);
  const auto status = StatusAt(path);
  Folder& folder = mFolders[index];
  if (!status || status->item.inode != folder.inode || status->change != folder.change) {
    return false;
  }
  search.Offer(status->item, AT_FDCWD, path.c_str(),
               [&path]() -> const std::string& { return path; });
  if (search.HasToRead(folder.read)) return false;
  folder.checked = mSearches;
  return true;
}

// A folder that no search can see. One that is merely covered, or not to be looked at, may come
// back without a change.
void FolderIndex::ForgetIfGone(std::uint32_t index) {
  Folder& folder = mFolders[index];
  folder.change = kNotRead;
  const std::string path = PathOf(index);
  if (!path.empty()) {
    if (!MountTable::OfThisProcess().IsReachable(*mVolume, path)) return;
    const auto status = ReadStatus(AT_FDCWD, path.c_str());
    const bool isThere = status ? status->item.inode == folder.inode : !MeansGone(errno);
    if (isThere) return;
  }
  mUnusedNames += NameOf(folder).size() + 1;
  folder.id = 0;
}

// The last search for files too that found no item with the id; kNever.
std::uint32_t FolderIndex::LastSearchFor(std::uint32_t id) const {
  const auto noted = std::find_if(mMissing.begin(), mMissing.end(),
                                  [id](const Missing& missing) { return missing.id == id; });
  return noted == mMissing.end() ? kNever : noted->search;
}

// What the search did not see is kNotRead. Nothing is noted where a file can get the id without a
// change of its folder.
void FolderIndex::NoteMissing(std::uint32_t id) {
  if (mRenumbersFiles) return;
  std::erase_if(mMissing, [id](const Missing& missing) { return missing.id == id; });
  if (mMissing.size() == kMostMissing) mMissing.erase(mMissing.begin());
  mMissing.push_back({id, mSearches});
}

// The folder's index. One that was known may have moved.
std::uint32_t FolderIndex::Learn(const ItemReference& item, const Waiting& waiting) {
  const std::uint32_t id = NodeIDOf(item, *mVolume->Root());
  std::uint32_t index = Known(item.inode, id);
  if (index == kNone) {
    index = static_cast<std::uint32_t>(mFolders.size());
    ReserveFor(mFolders, 1);
    mFolders.push_back({item.inode, kNotRead, id, kNone, 0, item.mount, kNever, kNever});
    Rename(mFolders.back(), waiting);
    Insert(index);
    return index;
  }
  Folder& folder = mFolders[index];
  // A folder under its parent is told by one step, which follows when the parent moves; unless it
  // has moved itself.
  const bool isKnownThere =
      waiting.parent == kNone && folder.parent != kNone && PathOf(index) == waiting.name;
  if (folder.mount == item.mount && isKnownThere) return index;
  if (folder.parent != waiting.parent || NameOf(folder) != waiting.name) {
    mUnusedNames += NameOf(folder).size() + 1;
    Rename(folder, waiting);
  }
  folder.mount = item.mount;
  return index;
}

void FolderIndex::Rename(Folder& folder, const Waiting& waiting) {
  ReserveFor(mNames, waiting.name.size() + 1);
  folder.name = static_cast<std::uint32_t>(mNames.size());
  mNames.append(waiting.name).push_back('\0');
  folder.parent = waiting.parent;
}

// Whether a folder that was come upon belongs to the walk: at a start it is on the volume, further
// down on the mount of its parent. What is mounted on the way has starts of its own.
bool FolderIndex::IsOfVolume(const ItemReference& item, const Waiting& waiting) const {
  if (waiting.parent != kNone) {
    if (item.mount == kNoMount) return item.device == mVolume->Root()->device;
    return item.mount == mFolders[waiting.parent].mount;
  }
  const auto volume = MountTable::OfThisProcess().OfItem(item, waiting.name);
  return volume && volume->Number() == mVolume->Number();
}

std::uint32_t FolderIndex::Known(std::uint64_t inode, std::uint32_t id) const {
  if (mTable.empty()) return kNone;
  const std::size_t mask = mTable.size() - 1;
  for (std::size_t slot = FirstSlot(id, mTable.size()); mTable[slot] != kNone;
       slot = (slot + 1) & mask) {
    const Folder& folder = mFolders[mTable[slot]];
    if (folder.id == id && folder.inode == inode) return mTable[slot];
  }
  return kNone;
}

void FolderIndex::Insert(std::uint32_t index) {
  const auto put = [this](std::uint32_t entry) {
    const std::size_t mask = mTable.size() - 1;
    std::size_t slot = FirstSlot(mFolders[entry].id, mTable.size());
    while (mTable[slot] != kNone) slot = (slot + 1) & mask;
    mTable[slot] = entry;
  };
  // Three quarters full at the most. A folder that is gone keeps its slot until then.
  if (mFolders.size() * 4 > mTable.size() * 3) {
    mTable.assign(std::max(kSmallestTable, mTable.size() * 2), kNone);
    for (std::uint32_t known = 0; known <= index; ++known) put(known);
  } else {
    put(index);
  }
}

std::string FolderIndex::PathOf(std::uint32_t index) const {
  std::vector<std::string_view> names;
  for (; index != kNone; index = mFolders[index].parent) {
    names.push_back(NameOf(mFolders[index]));
    // Folders that changed places, half of it noticed, can seem to hold each other.
    if (names.size() > kMostComponents) return {};
  }
  std::string path(names.back());
  for (auto name = names.rbegin() + 1; name != names.rend(); ++name) {
    if (path.back() != '/') path.push_back('/');
    path.append(*name);
  }
  return path;
}

std::string FolderIndex::PathOf(const Waiting& waiting) const {
  if (waiting.parent == kNone) return waiting.name;
  return foundation::JoinPath(PathOf(waiting.parent), waiting.name);
}

// None also where it cannot be asked for without waiting.
std::optional<ItemStatus> FolderIndex::StatusAt(const std::string& path) const {
  if (path.empty() || !MountTable::OfThisProcess().IsReachable(*mVolume, path)) return std::nullopt;
  return ReadStatus(AT_FDCWD, path.c_str());
}

// The open folder in which to look for the name, as in openat(2). None where something is mounted,
// and where the parent cannot be opened.
std::optional<int> FolderIndex::WayTo(const Waiting& waiting, Search& search) {
  if (waiting.parent == kNone) return AT_FDCWD;
  if (!OpenParent(waiting.parent, search)) return std::nullopt;
  const OpenFolder& parent = mOpen.back();
  if (parent.holdsMountPoint && MountTable::OfThisProcess().IsMountPoint(PathOf(waiting))) {
    return std::nullopt;
  }
  return parent.descriptor.Get();
}

Descriptor FolderIndex::Open(int parent, const std::string& name) {
  ++mOpenedFolders;
  return Descriptor(openat(parent, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
}

// Makes a folder the last of the open ones. False when it cannot be opened, and when another is in
// its place.
bool FolderIndex::OpenParent(std::uint32_t index, Search& search) {
  while (!mOpen.empty() && mOpen.back().index != index) mOpen.pop_back();
  if (!mOpen.empty()) return true;
  const std::string path = PathOf(index);
  if (path.empty() || !MountTable::OfThisProcess().IsReachable(*mVolume, path)) return false;
  Descriptor descriptor(open(path.c_str(), O_PATH | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  const auto opened = descriptor.IsOpen() ? ReadStatus(descriptor.Get(), "") : std::nullopt;
  if (!opened) search.NoteError(errno);
  if (!opened || opened->item.inode != mFolders[index].inode) return false;
  KeepOpen(index, std::move(descriptor));
  return true;
}

void FolderIndex::KeepOpen(std::uint32_t index, Descriptor descriptor) {
  if (mOpen.size() == kMostOpenFolders) mOpen.erase(mOpen.begin());
  const bool holds = MountTable::OfThisProcess().HoldsMountPoint(PathOf(index));
  mOpen.push_back({index, std::move(descriptor), holds});
}

}  // namespace tallowmere::files
