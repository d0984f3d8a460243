#include "files/NameLookup.h"

#include <dirent.h>
#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <memory>

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

// Whether a short name, read in one way, stands for the item called `linuxName` of an open folder.
bool StandsFor(const ShortNameParts& parts, std::string_view name, const Folder& folder,
               DIR* entries, const char* linuxName) {
  for (std::size_t marks = 1; marks <= parts.marks; ++marks) {
    if (ShortHFSName(linuxName, parts.nodeID, marks) != name) continue;
    const auto status = ReadStatus(dirfd(entries), linuxName);
    return status && NodeIDOf(status->item, *folder.volume->Root()) == parts.nodeID;
  }
  return false;
}

// Goes through the whole folder. An entry whose HFS form is the name counts before one whose short
// form it is; two of a kind are none.
OSErr SearchFolder(const Folder& folder, std::string_view name, bool accented, Place& item) {
  const auto readings = ReadShortHFSName(name);
  if (!accented && readings.empty()) return fnfErr;
  const std::unique_ptr<DIR, CloseFolder> entries(opendir(folder.place.path.c_str()));
  if (!entries) return ErrorOfSystem();
  std::string plain;
  std::string shortened;
  int plainFound = 0;
  int shortenedFound = 0;
  while (const dirent* const entry = readdir(entries.get())) {
    const char* const linuxName = entry->d_name;
    if (accented && PlainHFSName(linuxName, kLongestStr255Name) == name) {
      plain = linuxName;
      ++plainFound;
    } else if (std::any_of(readings.begin(), readings.end(), [&](const ShortNameParts& parts) {
                 return StandsFor(parts, name, folder, entries.get(), linuxName);
               })) {
      shortened = linuxName;
      ++shortenedFound;
    }
  }
  if (plainFound == 1) return LookUp(folder, plain, item);
  if (plainFound == 0 && shortenedFound == 1) return LookUp(folder, shortened, item);
  return fnfErr;
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
    if (IsFoundBy(folder, item, name)) return name;
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
