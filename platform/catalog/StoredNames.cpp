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

// The name of the entry by which the kernel found an item: the very name; else the only one that is
// alike but for letter case; else the only one with the item's number. Hard links can have several
// names in one folder, and on hfsplus their entries have numbers of their own.
std::optional<std::string> NameOfEntry(const Look& item) {
  const auto open = kernel::OpenForReading(item.Folder().SpotOf("."));
  if (!open) return std::nullopt;
  const std::string_view asked = item.Name();
  const std::u16string folded = Folded(asked);
  Alike inLetters;
  Alike inNumber;
  kernel::FolderReader reader(*open);
  while (const kernel::Entry* const entry = reader.Next()) {
    if (entry->name == asked) return std::string(asked);
    if (Folded(entry->name) == folded) inLetters.Offer(entry->name);
    if (entry->inode == item.Item().inode) inNumber.Offer(entry->name);
  }
  if (reader.FailedBy().number != 0) return std::nullopt;
  for (const Alike* const alike : {&inLetters, &inNumber}) {
    if (alike->Only() != nullptr) return *alike->Only();
  }
  return std::nullopt;
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
  const volumes::Volume& volume = *item.Folder().Volume();
  if (!volume.Kind().ignoresCase || !HasLetters(item.Name())) return item;
  const auto name = NameOfEntry(item);
  if (!name || *name == item.Name()) return item;
  const auto stored = moment.LookUp(item.Folder(), *name);
  return stored && AreSame(volume, stored->Seen(), item.Seen()) ? *stored : item;
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
