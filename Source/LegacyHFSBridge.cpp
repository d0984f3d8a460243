#include "LegacyHFSBridge.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <optional>
#include <string_view>

#include "CFOwned.h"

namespace {

// The id of a volume's root folder.
constexpr SInt32 kRootFolder = 2;

// The text for a name that cannot be converted at all.
constexpr std::string_view kConversionError = "(str_conversion_err)";

// The longest text of a Pascal string, in bytes.
constexpr std::size_t kLongestPascalText = sizeof(Str255) - 1;

// The most bytes of folder names in a full path.
constexpr std::size_t kLongestFolderPart = 511;

// Replaces the folders that a shortened path leaves out, and the first position of a colon with
// more than that in front of it.
constexpr std::string_view kShortened = "...";
constexpr std::size_t kFirstColonToCutAt = 4;

// --- Names ------------------------------------------------------------------------------------

std::array<CFStringEncoding, 3> NameEncodings() {
  return {CFileRef::mLocalEncoding, kCFStringEncodingMacRoman, CFStringGetSystemEncoding()};
}

void ExchangeSeparators(StringPtr name) {
  for (std::size_t i = 1; i <= name[0]; ++i) {
    if (name[i] == '/') {
      name[i] = ':';
    } else if (name[i] == ':') {
      name[i] = '/';
    }
  }
}

void ConvertWithLoss(CFStringRef name, StringPtr buffer, std::size_t room) {
  CFIndex used = 0;
  const CFIndex converted =
      CFStringGetBytes(name, CFRangeMake(0, CFStringGetLength(name)), kCFStringEncodingMacRoman,
                       '?', false, buffer + 1, static_cast<CFIndex>(room), &used);
  // The error text leaves room for a NUL.
  buffer[0] = static_cast<unsigned char>(
      converted > 0 ? static_cast<std::size_t>(used)
                    : kConversionError.copy(reinterpret_cast<char*>(buffer + 1),
                                            std::max<std::size_t>(room, 1) - 1));
}

bool SameName(ConstStr255Param first, ConstStr255Param second) {
  return std::equal(first, first + 1 + first[0], second, second + 1 + second[0]);
}

// --- Records ----------------------------------------------------------------------------------

// Finds the record's item on the first other mounted volume that has one.
bool FindOnOtherVolumes(FSSpec spec, FSRef* item) {
  const SInt16 ownVolume = spec.vRefNum;
  FSVolumeInfoParam volume = {};
  volume.whichInfo = kFSVolInfoNone;
  for (volume.volumeIndex = 1;; ++volume.volumeIndex) {
    volume.ioVRefNum = 0;
    if (PBGetVolumeInfoSync(&volume) != noErr) return false;
    if (volume.ioVRefNum == ownVolume) continue;
    spec.vRefNum = volume.ioVRefNum;
    if (FSpMakeFSRef(&spec, item) == noErr) return true;
  }
}

// An HFS path as FSMakeFSSpec takes it. Its length byte is the length of the whole text modulo 256;
// no more of the text is kept than that byte can count.
class HFSPath {
 public:
  HFSPath(char const* folderPath, char const* name, bool joinSecond) {
    if (folderPath != nullptr) AppendFolders(folderPath, joinSecond);
    if (name != nullptr) Append(name);
    mText[0] = static_cast<unsigned char>(mLength);
  }

  ConstStr255Param Text() const { return mText; }

 private:
  void AppendFolders(std::string_view first, bool joinSecond) {
    Append(first);
    if (joinSecond) {
      Append(":");
      Append(first.data() + first.size() + 1);
    }
    if (!first.empty() && mLast != ':') Append(":");
  }

  void Append(std::string_view text) {
    const std::size_t kept = std::min(mLength, kLongestPascalText);
    text.copy(reinterpret_cast<char*>(mText + 1 + kept), kLongestPascalText - kept);
    mLength += text.size();
    if (!text.empty()) mLast = text.back();
  }

  Str255 mText;
  std::size_t mLength = 0;
  char mLast = '\0';
};

// --- Full paths -------------------------------------------------------------------------------

// The folders of a full path, written from the innermost one outwards.
class FolderPart {
 public:
  std::size_t Length() const { return kLongestFolderPart - mStart; }
  std::string_view Text() const { return {mText + mStart, Length()}; }

  // Puts a folder in front; returns false when it does not fit.
  bool Prepend(ConstStr255Param name) {
    const std::size_t size = std::size_t{1} + name[0];
    if (size > mStart) return false;
    mStart -= size;
    std::memcpy(mText + mStart, name + 1, name[0]);
    mText[mStart + name[0]] = ':';
    return true;
  }

  // Replaces the outermost folders by "..."; does nothing when there is nothing to replace.
  void Shorten() {
    const std::size_t colon = Text().find(':', kFirstColonToCutAt);
    if (colon == std::string_view::npos) return;
    mStart += colon - kShortened.size();
    kShortened.copy(mText + mStart, kShortened.size());
  }

 private:
  char mText[kLongestFolderPart];
  std::size_t mStart = kLongestFolderPart;
};

// A folder as the catalog knew it at one moment: something could be mounted there between two
// queries, and the id would then be looked up on the wrong volume.
struct FolderNumbers {
  SInt16 volume;
  SInt32 id;
};

// The id is kNoFolder when the folder does not exist.
FolderNumbers NumbersOf(CFileRef const& folder) {
  FSRef const& item = folder;
  FSCatalogInfo about = {};
  const OSErr result = FSGetCatalogInfo(&item, kFSCatInfoVolume | kFSCatInfoNodeID, &about, nullptr,
                                        nullptr, nullptr);
  if (result == noErr) return {about.volume, static_cast<SInt32>(about.nodeID)};
  return {folder.GetVolumeRefNumber(), kNoFolder};
}

// The numbers of the item if it is a folder, else of the folder that holds it, if that is on the
// same volume.
FolderNumbers NumbersOfFolderOf(CFileRef const& ref) {
  if (ref.IsFolder()) return NumbersOf(ref);
  CFileRef folder(ref);
  folder.SetToParent();
  FolderNumbers numbers = {kNoVolume, kNoFolder};
  if (folder.IsFolder()) numbers = NumbersOf(folder);
  const SInt16 volume = ref.GetVolumeRefNumber();
  return numbers.volume == volume ? numbers : FolderNumbers{volume, kNoFolder};
}

// The folders from the one with this id up to the volume's root, excluding the root.
FolderPart FoldersAbove(SInt16 volume, SInt32 folder) {
  FolderPart folders;
  Str255 name;
  CInfoPBRec block = {};
  block.dirInfo.ioNamePtr = name;
  block.dirInfo.ioVRefNum = volume;
  block.dirInfo.ioFDirIndex = -1;
  while (folder != kRootFolder) {
    block.dirInfo.ioDrDirID = folder;
    if (PBGetCatInfoSync(&block) != noErr || !folders.Prepend(name)) break;
    folder = block.dirInfo.ioDrParID;
  }
  return folders;
}

// Reads the name of a volume. Returns false, with the name as it was, for an unknown one.
bool ReadVolumeName(SInt16 volume, StringPtr name) {
  HParamBlockRec block = {};
  block.volumeParam.ioNamePtr = name;
  block.volumeParam.ioVRefNum = volume;
  return PBHGetVInfoSync(&block) == noErr;
}

}  // namespace

// --- Names ------------------------------------------------------------------------------------

bool GetPascalStringFromCFString(CFStringRef name, StringPtr buffer, SInt32 bufferSize) {
  if (bufferSize < 1) return false;
  const auto encodings = NameEncodings();
  const bool isWhole = std::any_of(encodings.begin(), encodings.end(), [&](auto encoding) {
    return CFStringGetPascalString(name, buffer, bufferSize, encoding) != 0;
  });
  if (isWhole) {
    ExchangeSeparators(buffer);
  } else {
    ConvertWithLoss(name, buffer,
                    std::min(static_cast<std::size_t>(bufferSize - 1), kLongestPascalText));
  }
  return isWhole;
}

CFMutableStringRef CreateCFStringFromPascalString(ConstStr255Param pascalName) {
  if (pascalName == nullptr) return nullptr;
  CFOwned<CFStringRef> read;
  for (const CFStringEncoding encoding : NameEncodings()) {
    read = CFOwned(CFStringCreateWithPascalString(kCFAllocatorDefault, pascalName, encoding));
    if (read) break;
  }
  if (!read) {
    CFStringGetListOfAvailableEncodings();
    return nullptr;
  }
  const CFIndex length = CFStringGetLength(read.Get());
  CFOwned<CFMutableStringRef> name(
      CFStringCreateMutableCopy(kCFAllocatorDefault, length, read.Get()));
  if (!name) return nullptr;
  const CFRange whole = CFRangeMake(0, length);
  CFStringFindAndReplace(name.Get(), CFSTR("/"), CFSTR(":"), whole, 0);
  // When memory runs out nothing has been replaced, and a '/' would lead into another folder.
  if (CFStringFindWithOptions(name.Get(), CFSTR("/"), whole, 0, nullptr)) return nullptr;
  return name.Detach();
}

FSSpec BoundedFSSpec(FSSpec const& spec) {
  FSSpec bounded = spec;
  bounded.name[0] = std::min(bounded.name[0], kLongestSpecName);
  return bounded;
}

// --- Records and references -------------------------------------------------------------------

bool CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(CFileRef* ref, FSSpec const* spec,
                                                       bool searchOtherVolumes, bool) {
  if (ref == nullptr) return false;
  // Read before the reference is emptied, as the record may be the reference's own.
  const auto wanted = spec != nullptr ? std::optional(BoundedFSSpec(*spec)) : std::nullopt;
  ref->Invalidate();
  if (!wanted) return false;

  FSRef item = {};
  if (FSpMakeFSRef(&*wanted, &item) == noErr) return ref->Set(&item);
  if (searchOtherVolumes && FindOnOtherVolumes(*wanted, &item)) return ref->Set(&item);

  const bool hasFolder = ref->Set(wanted->vRefNum, wanted->parID, 0, nullptr, true);
  if (!hasFolder && wanted->name[0] == 0) return false;
  const CFOwned<CFMutableStringRef> name(CreateCFStringFromPascalString(wanted->name));
  if (!name) {
    ref->Invalidate();
    return false;
  }
  // The reference names the intended item, even when that has no URL; never the folder.
  if (hasFolder) {
    if (!ref->AddToPath(name.Get(), false)) ref->Invalidate();
  } else {
    ref->Set(name.Get(), kPathStylePOSIX, false);
  }
  return true;
}

bool CFileUtilSetFileRefFromFSSpecData(CFileRef* ref, short vRefNum, long dirID, char const* name,
                                       bool last) {
  Str255 pascalName;
  c2pstrcpy(pascalName, name);
  FSSpec spec = {};
  const OSErr result = FSMakeFSSpec(vRefNum, static_cast<SInt32>(dirID), pascalName, &spec);
  if (result != noErr && result != fnfErr) return false;
  return CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(ref, &spec, true, last);
}

bool CFileUtilGetDeprecatedFSSpecThroughIPC(CFileRef const& ref, FSSpec* spec) {
  *spec = ref;
  return spec->vRefNum != kNoVolume && spec->parID != kNoFolder && spec->name[0] != 0;
}

bool CFileUtilAddHFSName(CFileRef* ref, char const* name, bool flag) {
  if (ref == nullptr || name == nullptr) return false;
  if (!ref->IsFolder()) return ref->AddToPath(name, flag);
  Str255 pascalName;
  c2pstrcpy(pascalName, name);
  FSSpec spec = {};
  const auto [volume, folder] = NumbersOf(*ref);
  if (FSMakeFSSpec(volume, folder, pascalName, &spec) == noErr) {
    *ref = CFileRef(spec, false, false);
    return ref->IsValid();
  }
  const CFOwned<CFMutableStringRef> component(CreateCFStringFromPascalString(pascalName));
  return component && ref->AddToPath(component.Get(), flag);
}

OSErr CFileUtilMakeFSSpecFromPath(FSSpec* spec, char const* hfsFolderPath, char const* name,
                                  unsigned char joinSecond) {
  const HFSPath path(hfsFolderPath, name, joinSecond != 0);
  return FSMakeFSSpec(0, 0, path.Text(), spec);
}

OSErr CFileUtilMakeFileRefFromPath(CFileRef* ref, char const* hfsFolderPath, char const* name,
                                   unsigned char joinSecond) {
  FSSpec spec = {};
  const OSErr result = CFileUtilMakeFSSpecFromPath(&spec, hfsFolderPath, name, joinSecond);
  if (result == noErr) *ref = CFileRef(spec, false, false);
  return result;
}

// --- Full paths and volumes -------------------------------------------------------------------

unsigned short CFileUtilMakeFullPath(CFileRef const& ref, char* path, unsigned short maxLength,
                                     unsigned char keepFolders) {
  const auto [volume, folder] = NumbersOfFolderOf(ref);
  FolderPart folders;
  if (folder != kNoFolder) folders = FoldersAbove(volume, folder);

  Str255 volumeName;
  if (!ReadVolumeName(volume, volumeName)) volumeName[0] = 0;
  const std::size_t volumeLength = std::size_t{1} + volumeName[0];
  const auto fullLength = static_cast<unsigned short>(folders.Length() + volumeLength);
  if (path == nullptr) return fullLength;

  // A path that cannot be made short enough keeps this loop running for ever, as callers are told
  // to expect. Reading a volatile is a side effect; without it the compiler may assume that the
  // loop ends.
  volatile unsigned short length = fullLength;
  while (length >= maxLength) {
    folders.Shorten();
    length = static_cast<unsigned short>(folders.Length() + volumeLength);
  }

  std::memcpy(path, volumeName + 1, volumeName[0]);
  path[volumeName[0]] = keepFolders != 0 ? ':' : '\0';
  path[volumeLength + folders.Text().copy(path + volumeLength, folders.Length())] = '\0';
  return fullLength;
}

short CFileUtilGetVolRefnumByHFSName(char const* volumeName) {
  Str255 wanted;
  c2pstrcpy(wanted, volumeName);
  Str255 name;
  HParamBlockRec block = {};
  for (SInt16 index = 1;; ++index) {
    block.volumeParam.ioNamePtr = name;
    block.volumeParam.ioVRefNum = 0;
    block.volumeParam.ioVolIndex = index;
    if (PBHGetVInfoSync(&block) != noErr) return kNoVolume;
    if (SameName(name, wanted)) return block.volumeParam.ioVRefNum;
  }
}

bool CFileUtilGetHFSVolumeName(short vRefNum, char* volumeName) {
  auto* const name = reinterpret_cast<StringPtr>(volumeName);
  const bool found = ReadVolumeName(vRefNum, name);
  if (found) {
    P2CStr(name);
  } else {
    name[0] = 0;
  }
  return found;
}

bool CFileUtilGetHFSName(CFileRef const& ref, char* name, unsigned short size) {
  if (!ref.Exists() || name == nullptr || size == 0) return false;
  name[0] = '\0';
  FSSpec const& spec = ref;
  if (spec.name[0] == 0 || spec.name[0] >= size) return false;
  p2cstrcpy(name, spec.name);
  return true;
}
