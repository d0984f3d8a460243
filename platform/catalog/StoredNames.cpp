#include "catalog/StoredNames.h"

#include <algorithm>
#include <array>
#include <optional>
#include <string_view>

#include "foundation/PathText.h"
#include "kernel/FolderReader.h"
#include "kernel/Paths.h"
#include "text/FileNameText.h"
#include "text/MacRoman.h"
#include "text/Utf16.h"

namespace tallowmere::catalog {
namespace {

// A name with the differences of letter case and normal form removed that Mac Roman letters have.
std::u16string Folded(std::string_view name) {
  std::u16string text = text::DecomposeMacRoman(text::TextOfFileName(name));
  for (char16_t& letter : text) {
    if (letter >= u'A' && letter <= u'Z') letter = static_cast<char16_t>(letter - u'A' + u'a');
  }
  return text;
}

// The entries of a folder that are alike in one way: only a single one tells anything.
class Alike {
 public:
  void Offer(const char* name) {
    if (mCount++ == 0) mName = name;
  }
  const std::string* Only() const { return mCount == 1 ? &mName : nullptr; }

 private:
  std::string mName;
  int mCount = 0;
};

enum class By { kNumber, kLetters };

// The name of the entry of a folder by which the kernel found an item: the very name, else the only
// one that is alike in number, or but for letter case.
std::optional<std::string> NameOfEntry(FolderListings& listings, const Look& item, By by) {
  const std::string_view asked = item.Name();
  const std::u16string folded = by == By::kLetters ? Folded(asked) : std::u16string();
  Alike alike;
  bool isAsked = false;
  const bool isRead = listings.Visit(item.Folder(), [&](const kernel::Entry& entry) {
    isAsked = entry.name == asked;
    const bool isAlike =
        by == By::kLetters ? Folded(entry.name) == folded : entry.inode == item.Item().inode;
    if (isAlike) alike.Offer(entry.name);
    return !isAsked;
  });
  if (isAsked) return std::string(asked);
  return isRead && alike.Only() != nullptr ? std::optional(*alike.Only()) : std::nullopt;
}

// Entries of hard links on hfsplus have numbers of their own: their letters tell them.
std::optional<std::string> StoredNameOf(FolderListings& listings, const Look& item) {
  auto name = NameOfEntry(listings, item, By::kNumber);
  return name ? name : NameOfEntry(listings, item, By::kLetters);
}

Look UnderStoredName(Moment& moment, const Look& item) {
  const auto name = StoredNameOf(moment.Knowledge().Listings(), item);
  if (!name || *name == item.Name()) return item;
  const auto stored = moment.LookUp(item.Folder(), *name);
  const bool isIt = stored && AreSame(*item.Folder().Volume(), stored->Seen(), item.Seen());
  return isIt ? *stored : item;
}

bool HasLetters(std::string_view name) {
  return std::any_of(name.begin(), name.end(), [](char byte) {
    const auto letter = static_cast<unsigned char>(byte);
    return !text::IsAscii(letter) || (letter >= 'A' && letter <= 'Z') ||
           (letter >= 'a' && letter <= 'z');
  });
}

// The mount point on a path of a volume; empty for a path that is not below any.
std::string_view MountPointOn(const volumes::Volume& volume, const std::string& path) {
  std::string_view longest;
  for (const std::string& place : volume.Listed().MountPoints()) {
    if (foundation::IsWithin(path, place) && place.size() > longest.size()) longest = place;
  }
  return longest;
}

}  // namespace

Look AsStored(Moment& moment, const Look& item) {
  const bool ignoresCase = item.Folder().Volume()->Kind().ignoresCase;
  return ignoresCase && HasLetters(item.Name()) ? UnderStoredName(moment, item) : item;
}

Look AsStoredByFolder(Moment& moment, const Look& item) {
  if (!HasLetters(item.Name())) return item;
  const bool ignoresCase =
      item.Folder().Volume()->Kind().ignoresCase || kernel::HasCasefold(item.Folder().SpotOf("."));
  return ignoresCase ? UnderStoredName(moment, item) : item;
}

std::string StoredPath(Moment& moment, const kernel::Item& reference, const std::string& path) {
  const auto listed = moment.LastVolumes()->WithMount(reference.mount);
  const auto volume =
      listed ? listed->Enter() : kernel::Result<volumes::VolumePointer>(kernel::kNoVolume);
  if (!volume || !(*volume)->Kind().ignoresCase) return path;
  const std::string_view top = MountPointOn(**volume, path);
  if (top.empty()) return path;
  std::string stored(top);
  std::optional<kernel::Item> last;
  for (std::size_t at = top.size(); at < path.size();) {
    const std::size_t end = std::min(path.find('/', at + 1), path.size());
    const auto folder = moment.HoldFolder(stored);
    const auto look = folder ? moment.LookUp(*folder, path.substr(at + 1, end - at - 1))
                             : kernel::Result<Look>(folder.Error());
    if (!look) return path;
    const Look found = AsStored(moment, *look);
    stored = found.Path();
    last = found.Item();
    at = end;
  }
  return last && kernel::HaveSameNumbers(*last, reference) ? stored : path;
}

}  // namespace tallowmere::catalog
