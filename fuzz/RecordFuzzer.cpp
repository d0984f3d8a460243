// HFS paths to records and back, over a small tree: arbitrary bytes as a path from any folder.
#include <CFileRef.h>
#include <CoreServices/CoreServices.h>
#include <LegacyHFSBridge.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <string>

#include "fuzz/Check.h"
#include "fuzz/SmallTree.h"
#include "names/PascalNames.h"

namespace tallowmere::fuzz {
namespace {

bool IsSame(const FSSpec& a, const FSSpec& b) {
  return a.vRefNum == b.vRefNum && a.parID == b.parID &&
         names::TextOfPascal(a.name) == names::TextOfPascal(b.name);
}

OSErr MakeSpec(SInt16 volume, SInt32 folder, std::string_view path, FSSpec& spec) {
  Str255 pascal;
  names::CopyToPascal(path, pascal);
  return FSMakeFSSpec(volume, folder, pascal, &spec);
}

// An item's record is that of the item it leads to, and so is the item's full path.
void CheckItem(const FSSpec& spec) {
  FSRef item;
  Check(FSpMakeFSRef(&spec, &item) == noErr);
  FSSpec again;
  Check(FSGetCatalogInfo(&item, kFSCatInfoNone, nullptr, nullptr, &again, nullptr) == noErr);
  Check(IsSame(again, spec));
  Check(MakeSpec(spec.vRefNum, spec.parID, names::TextOfPascal(spec.name), again) == noErr);
  Check(IsSame(again, spec));

  const CFileRef reference(&item);
  std::array<char, 1024> buffer;
  const std::size_t length = CFileUtilMakeFullPath(reference, buffer.data(), buffer.size(), 1);
  Check(length == std::strlen(buffer.data()));
  // A path that omits folders or does not fit is not the item's.
  std::string path(buffer.data());
  if (!reference.IsFolder()) path += names::TextOfPascal(spec.name);
  if (path.size() > sizeof(Str255) - 1) return;
  Check(MakeSpec(0, 0, path, again) == noErr);
  Check(IsSame(again, spec));
}

// The record of a missing item leads nowhere, and is its own record.
void CheckNewItem(const FSSpec& spec) {
  FSRef item;
  Check(FSpMakeFSRef(&spec, &item) == fnfErr);
  FSSpec again;
  Check(MakeSpec(spec.vRefNum, spec.parID, names::TextOfPascal(spec.name), again) == fnfErr);
  Check(IsSame(again, spec));
}

void CheckPath(SInt16 volume, SInt32 folder, std::string_view path) {
  FSSpec spec = {};
  const OSErr result = MakeSpec(volume, folder, path, spec);
  constexpr std::array kResults{noErr, nsvErr, ioErr, bdNamErr, fnfErr, dirNFErr};
  Check(std::find(kResults.begin(), kResults.end(), result) != kResults.end());
  if (result == noErr) CheckItem(spec);
  if (result == fnfErr) CheckNewItem(spec);
}

}  // namespace
}  // namespace tallowmere::fuzz

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  tallowmere::fuzz::MakeSmallTree();
  return 0;
}

// The input: the volume, the folder's id, then the path.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  const auto volume = static_cast<std::int16_t>(input.TakeTwoBytes());
  const std::uint32_t folder = input.TakeTwoBytes() | input.TakeTwoBytes() << 16;
  const std::string_view path = input.Rest().substr(0, sizeof(Str255) - 1);
  const InsideSmallTree inside;
  CheckPath(VolumeNumberHere(volume), static_cast<SInt32>(folder), path);
  return 0;
}
