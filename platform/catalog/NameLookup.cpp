#include "files/NameLookup.h"

#include <dirent.h>
#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <memory>

#include "files/Catalog.h"
#include "files/FileSystems.h"
#include "files/HFSNames.h"
#include "files/NodeID.h"
#include "foundation/PathText.h"

namespace tallowmere::files {
namespace {

struct CloseFolder {
  void operator()(DIR* folder) const { closedir(folder); }
};

using Entries = std::unique_ptr<DIR, CloseFolder>;

// Null, and errno tells, when the folder cannot be read.
Entries EntriesOf(const OpenFolder& folder) {
  Descriptor descriptor(openat(folder.descriptor->Get(), ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!descriptor.IsOpen()) return nullptr;
  Entries entries(fdopendir(descriptor.Get()));
  if (entries) descriptor.Release();
  return entries;
}

// The next entry; null with errno 0 at the end, and with another one on an error.
const dirent* NextEntry(DIR* folder) {
  errno = 0;
  return readdir(folder);
}

OSErr LookUp(const Folder& folder, const std::string& linuxName, Place& item) {
  std::string path = foundation::JoinPath(folder.place.path, linuxName);
  // Nobody could be told where the item is.
  if (path.size() >= PATH_MAX) {
    errno = ENAMETOOLONG;
    return ErrorOfSystem();
  }
  const auto found = ReadStatus(folder.descriptor->Get(), linuxName.c_str());
  if (!found) return ErrorOfSystem();
  item = {std::move(path), found->item};
  return noErr;
}

// The one entry of a folder whose HFS form is `name`.
OSErr FindByForm(const Folder& folder, std::string_view name, Place& item) {
  const Entries entries = EntriesOf(folder);
  if (!entries) return ErrorOfSystem();
  std::optional<std::string> found;
  while (const dirent* const entry = NextEntry(entries.get())) {
    if (PlainHFSName(entry->d_name, kLongestStr255Name) != name) continue;
    if (found) return fnfErr;
    found = entry->d_name;
  }
  if (errno != 0) return ErrorOfSystem();
  return found ? LookUp(folder, *found, item) : static_cast<OSErr>(fnfErr);
}

// The item that a name is that of, not only a stand-in.
OSErr FindByOwnName(const Folder& folder, std::string_view name, Place& item) {
  const SpelledNames names = SpellHFSName(name);
  if (names.precomposed.empty()) return fnfErr;
  OSErr result = LookUp(folder, names.precomposed, item);
  const bool isAccented = !names.decomposed.empty();
  if (result == fnfErr && isAccented) result = LookUp(folder, names.decomposed, item);
  if (result == fnfErr && isAccented) result = FindByForm(folder, name, item);
  return result;
}

// Whether an item has a name of its own that finds it in the folder.
bool HasOwnName(const Folder& folder, std::string_view linuxName, const ItemReference& item,
                std::size_t limit) {
  const auto name = PlainHFSName(linuxName, limit);
  Place found;
  return name && FindByOwnName(folder, *name, found) == noErr && AreEqual(found.item, item);
}

// Whether the volume shows each of its folders at one place, known without a look there.
bool HasOneView(const Folder& folder) {
  return folder.volume->MountPoints().size() == 1;
}

// The folder by the path by which the table of mounts knows it: links can have come on its way
// since it was reached.
Folder ByCanonicalPath(const Folder& folder) {
  auto place = PlaceAt(folder.place.path);
  const bool isStillThere = place && AreEqual(place->item, folder.place.item) &&
                            place->item.mount == folder.place.item.mount;
  return isStillThere ? Folder{{*std::move(place), folder.descriptor}, folder.volume} : folder;
}

// The folder at all its places on the volume, when in one of them something is mounted, so that one
// name can be that of several items. The names of their own count in the first place, where every
// process sees the folder alike; what cannot be seen there has short forms.
std::vector<Folder> ViewsOf(const Folder& reached) {
  if (HasOneView(reached)) return {reached};
  const Folder folder = ByCanonicalPath(reached);
  std::vector<Folder> views;
  const MountTable& table = MountTable::OfThisProcess();
  const auto paths = folder.volume->PathsOf(folder.place.path, folder.place.item.mount);
  const bool hidesSomething = std::any_of(
      paths.begin(), paths.end(), [&](const auto& path) { return table.HoldsMountPoint(path); });
  if (paths.size() > 1 && hidesSomething) {
    for (const std::string& path : paths) {
      const auto place = PlaceAt(path);
      if (!place || !AreEqual(place->item, folder.place.item)) continue;
      if (auto view = Open(*place)) views.push_back({*std::move(view), folder.volume});
    }
  }
  if (views.empty()) views.push_back(folder);
  return views;
}

// --- Short forms ------------------------------------------------------------------------------

// Whether a short form, read in one way, stands for an item that is called `linuxName`.
bool StandsFor(const ShortNameParts& parts, std::string_view name, const char* linuxName) {
  for (std::size_t marks = 1; marks <= parts.marks; ++marks) {
    if (ShortHFSName(linuxName, parts.nodeID, marks) == name) return true;
  }
  return false;
}

// Whether an entry can be the item with an id, without a look at the item. Folders and what stands
// at a mount point can have another number than their entry says.
bool MayHaveID(const Folder& folder, const dirent& entry, std::uint32_t id, bool untrueEntries) {
  if (untrueEntries || entry.d_type == DT_DIR || entry.d_type == DT_UNKNOWN) return true;
  return NodeIDOf(entry.d_ino, folder.place.item.device, *folder.volume->Root()) == id;
}

// One look-up of a short form.
class ShortFormSearch {
 public:
  ShortFormSearch(const std::vector<Folder>& views, std::string_view name)
      : mViews(views), mName(name), mReadings(ReadShortHFSName(name)) {}

  OSErr Find(Place& item) {
    if (mReadings.empty() || !CanStandForOne()) return fnfErr;
    if (mReadings.size() == 1 && FindByNumber(mReadings.front(), item)) return noErr;
    for (const Folder& view : mViews) {
      if (const OSErr error = SearchFolder(view)) return error;
    }
    if (mIsHidden) return ioErr;
    if (mFound.size() != 1) return fnfErr;
    item = mFound.front();
    return noErr;
  }

 private:
  // Only what has no name of its own has a short form.
  bool CanStandForOne() const {
    return mViews.size() > 1 || CanBeShortForm(mName) || !SpellHFSName(mName).decomposed.empty();
  }

  bool IsShortFormOf(const ShortNameParts& parts, const char* linuxName,
                     const ItemReference& item) {
    return StandsFor(parts, mName, linuxName) &&
           !HasOwnName(mViews.front(), linuxName, item, kLongestSpecName);
  }

  // Without going through the folder.
  bool FindByNumber(const ShortNameParts& parts, Place& item) {
    const auto place = FindItemAtOnce(mViews.front().volume, parts.nodeID);
    if (!place) return false;
    const std::string linuxName(*foundation::LastComponent(place->path));
    const bool isHere = std::any_of(mViews.begin(), mViews.end(), [&](const Folder& view) {
      return LookUp(view, linuxName, item) == noErr && AreEqual(item.item, place->item);
    });
    return isHere && IsShortFormOf(parts, linuxName.c_str(), item.item);
  }

  OSErr SearchFolder(const Folder& view) {
    const Entries entries = EntriesOf(view);
    if (!entries) return ErrorOfSystem();
    const std::string path = ByCanonicalPath(view).place.path;
    const bool untrueEntries =
        HasUntrueEntries(view.volume->Type()) || MountTable::OfThisProcess().HoldsMountPoint(path);
    while (const dirent* const entry = NextEntry(entries.get())) {
      for (const ShortNameParts& parts : mReadings) {
        if (!MayHaveID(view, *entry, parts.nodeID, untrueEntries)) continue;
        if (StandsFor(parts, mName, entry->d_name)) Offer(view, parts, entry->d_name);
      }
    }
    return errno == 0 ? static_cast<OSErr>(noErr) : ErrorOfSystem();
  }

  void Offer(const Folder& view, const ShortNameParts& parts, const char* linuxName) {
    Place item;
    if (LookUp(view, linuxName, item) != noErr) {
      mIsHidden = mIsHidden || errno != ENOENT;
      return;
    }
    if (NodeIDOf(item.item, *view.volume->Root()) != parts.nodeID) return;
    const bool isKnown = std::any_of(mFound.begin(), mFound.end(), [&](const Place& found) {
      return AreEqual(found.item, item.item);
    });
    if (!isKnown && IsShortFormOf(parts, linuxName, item.item)) mFound.push_back(std::move(item));
  }

  const std::vector<Folder>& mViews;
  std::string_view mName;
  std::vector<ShortNameParts> mReadings;
  std::vector<Place> mFound;  // different items
  bool mIsHidden = false;     // whether an entry that could be the item cannot be looked at
};

OSErr LookUpInViews(const std::vector<Folder>& views, std::string_view name, Place& item) {
  const OSErr result = FindByOwnName(views.front(), name, item);
  return result == fnfErr ? ShortFormSearch(views, name).Find(item) : result;
}

// Whether a short form can be no other item's, so that it need not be looked up: no two items have
// the id, and nothing is really called so.
bool IsItsAlone(const std::vector<Folder>& views, std::uint32_t id, std::string_view shortForm) {
  if (views.size() > 1 || !IsInodeNumber(id)) return false;
  const SpelledNames names = SpellHFSName(shortForm);
  Place other;
  return names.decomposed.empty() && LookUp(views.front(), names.precomposed, other) == fnfErr;
}

}  // namespace

std::uint32_t Folder::ID() const {
  return NodeIDOf(place.item, *volume->Root());
}

OSErr LookUpHFSName(const Folder& folder, std::string_view name, Place& item) {
  if (!HasOneView(folder)) return LookUpInViews(ViewsOf(folder), name, item);
  const OSErr result = FindByOwnName(folder, name, item);
  if (result != fnfErr || ReadShortHFSName(name).empty()) return result;
  const std::vector<Folder> views{folder};
  return ShortFormSearch(views, name).Find(item);
}

std::optional<std::string> HFSNameOf(const Folder& folder, const Place& item, std::size_t limit) {
  const std::string linuxName(*foundation::LastComponent(item.path));
  auto plain = PlainHFSName(linuxName, limit);
  const bool isUnmistakable = plain && SpellHFSName(*plain).precomposed == linuxName;
  if (isUnmistakable && HasOneView(folder)) return plain;
  const std::vector<Folder> views = ViewsOf(folder);
  if (isUnmistakable && views.size() == 1) return plain;
  if (plain && HasOwnName(views.front(), linuxName, item.item, limit)) return plain;
  const std::uint32_t id = NodeIDOf(item.item, *folder.volume->Root());
  for (std::size_t marks = 1; marks <= kMostMarks; ++marks) {
    std::string name = ShortHFSName(linuxName, id, marks);
    if (IsItsAlone(views, id, name)) return name;
    Place found;
    const OSErr result = LookUpInViews(views, name, found);
    if (result == noErr && AreEqual(found.item, item.item)) return name;
    // Another short form would be one for now.
    if (result != noErr && result != fnfErr) return std::nullopt;
  }
  return std::nullopt;
}

OSErr ErrorOfSystem() {
  if (MeansGone(errno) || errno == ENAMETOOLONG) return fnfErr;
  return errno == EACCES || errno == EPERM ? afpAccessDenied : ioErr;
}

}  // namespace tallowmere::files
