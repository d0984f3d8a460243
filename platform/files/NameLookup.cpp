#include "files/NameLookup.h"

#include <dirent.h>
#include <fcntl.h>

#include <algorithm>
#include <cerrno>
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

OSErr LookUp(const Folder& folder, const std::string& linuxName, Place& item) {
  std::string path = foundation::JoinPath(folder.place.path, linuxName);
  const auto found = ReadItem(AT_FDCWD, path.c_str());
  if (!found) return ErrorOfSystem();
  item = {std::move(path), *found};
  return noErr;
}

// Whether a short name, read in one way, stands for an item of that id that is called `linuxName`.
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

// The item that a short name stands for, without going through the folder. It has to be sure that
// no entry has the name for its HFS form.
std::optional<Place> FindByNumber(const Folder& folder, std::string_view name,
                                  const ShortNameParts& parts) {
  auto place = FindItemAtOnce(folder.volume, parts.nodeID, false);
  if (!place || FolderOf(place->path) != folder.place.path) return std::nullopt;
  const std::string linuxName(*foundation::LastComponent(place->path));
  if (!StandsFor(parts, name, linuxName.c_str())) return std::nullopt;
  return place;
}

// Goes through the whole folder. An entry whose HFS form is the name counts before one whose short
// form it is; two of a kind are none, unless they are names of one item.
OSErr SearchFolder(const Folder& folder, std::string_view name, bool accented, Place& item) {
  const auto readings = ReadShortHFSName(name);
  if (!accented && readings.empty()) return fnfErr;
  if (!accented && readings.size() == 1) {
    if (auto found = FindByNumber(folder, name, readings.front())) {
      item = *std::move(found);
      return noErr;
    }
  }
  const std::unique_ptr<DIR, CloseFolder> entries(opendir(folder.place.path.c_str()));
  if (!entries) return ErrorOfSystem();
  const bool untrueEntries = HasUntrueEntries(folder.volume->Type()) ||
                             MountTable::OfThisProcess().HoldsMountPoint(folder.place.path);
  std::string plain;
  std::string shortened;
  std::optional<ItemReference> shortenedItem;
  int plainFound = 0;
  int shortenedFound = 0;
  while (const dirent* const entry = readdir(entries.get())) {
    const char* const linuxName = entry->d_name;
    if (accented && PlainHFSName(linuxName, kLongestStr255Name) == name) {
      plain = linuxName;
      ++plainFound;
      continue;
    }
    for (const ShortNameParts& parts : readings) {
      if (!MayHaveID(folder, *entry, parts.nodeID, untrueEntries)) continue;
      if (!StandsFor(parts, name, linuxName)) continue;
      const auto status = ReadStatus(dirfd(entries.get()), linuxName);
      if (!status || NodeIDOf(status->item, *folder.volume->Root()) != parts.nodeID) continue;
      if (shortenedItem && AreEqual(*shortenedItem, status->item)) continue;
      shortenedItem = status->item;
      shortened = linuxName;
      ++shortenedFound;
    }
  }
  if (plainFound == 1) return LookUp(folder, plain, item);
  if (plainFound == 0 && shortenedFound == 1) return LookUp(folder, shortened, item);
  return fnfErr;
}

// Whether a short name can be no other item's, so that it need not be looked up: no two items have
// the id, and nothing is really called so.
bool IsItsAlone(const Folder& folder, std::uint32_t id, std::string_view shortName) {
  const SpelledNames names = SpellHFSName(shortName);
  Place other;
  return IsInodeNumber(id) && names.decomposed.empty() &&
         LookUp(folder, names.precomposed, other) == fnfErr;
}

bool IsFoundBy(const Folder& folder, const Place& item, std::string_view name) {
  Place found;
  return LookUpHFSName(folder, name, found) == noErr && AreEqual(found.item, item.item);
}

}  // namespace

std::uint32_t Folder::ID() const {
  return NodeIDOf(place.item, *volume->Root());
}

OSErr LookUpHFSName(const Folder& folder, std::string_view name, Place& item) {
  const SpelledNames names = SpellHFSName(name);
  if (names.precomposed.empty()) return fnfErr;
  OSErr result = LookUp(folder, names.precomposed, item);
  const bool accented = !names.decomposed.empty();
  if (result == fnfErr && accented) result = LookUp(folder, names.decomposed, item);
  if (result == fnfErr) result = SearchFolder(folder, name, accented, item);
  return result;
}

std::optional<std::string> HFSNameOf(const Folder& folder, const Place& item, std::size_t limit) {
  const std::string linuxName(*foundation::LastComponent(item.path));
  auto plain = PlainHFSName(linuxName, limit);
  if (plain && (SpellHFSName(*plain).precomposed == linuxName || IsFoundBy(folder, item, *plain))) {
    return plain;
  }
  const std::uint32_t id = NodeIDOf(item.item, *folder.volume->Root());
  for (std::size_t marks = 1; marks <= kMostMarks; ++marks) {
    std::string name = ShortHFSName(linuxName, id, marks);
    if (IsItsAlone(folder, id, name) || IsFoundBy(folder, item, name)) return name;
  }
  return std::nullopt;
}

OSErr ErrorOfSystem() {
  switch (errno) {
    case ENOENT:
    case ENOTDIR:
    case ENAMETOOLONG:
      return fnfErr;
    case EACCES:
    case EPERM:
      return afpAccessDenied;
    default:
      return ioErr;
  }
}

}  // namespace tallowmere::files
