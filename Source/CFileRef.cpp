#include "CFileRef.h"

#include <AppKit/Workspace.h>
#include <locale.h>
#include <pwd.h>
#include <strings.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>
#include <optional>
#include <string_view>

#include "CFOwned.h"
#include "LegacyHFSBridge.h"

namespace {

using Text = std::unique_ptr<char[]>;

// Room for a path or a name, in bytes with the NUL. A longer path is converted on the heap; a
// longer name is refused.
constexpr std::size_t kTextBufferSize = 1024;

// The longest name in an HFSUniStr255, in UTF-16 units.
constexpr CFIndex kLongestUnicodeName = sizeof(HFSUniStr255::unicode) / sizeof(UniChar);

// Room for an extension to compare, with the NUL.
constexpr std::size_t kExtensionBufferSize = 20;

// Parts of st_mode.
constexpr mode_t kTypeMask = 0xF000;
constexpr mode_t kFolderType = 0x4000;
constexpr mode_t kLinkType = 0xA000;
constexpr mode_t kStickyBit = 0x200;

// Other volumes are mounted below this folder, so the root does not contain what begins with it.
constexpr std::string_view kRootPath = "/";
constexpr std::string_view kVolumesPrefix = "/Volumes/";

// What the platform may return as the folder of a bare name.
constexpr std::string_view kThisFolder = ".";
constexpr std::string_view kThisFolderMarked = "./";
constexpr std::string_view kFolderAbove = "..";

// --- Text -------------------------------------------------------------------------------------

// Copies as much of `source` as fits into `size` bytes, NUL-terminated unless `size` is 0. Returns
// the length of `source`.
std::size_t CopyBounded(char* destination, char const* source, std::size_t size) {
  const std::size_t length = std::strlen(source);
  if (size > 0) {
    const std::size_t copied = std::min(length, size - 1);
    std::memcpy(destination, source, copied);
    destination[copied] = '\0';
  }
  return length;
}

// Null when there is not enough memory.
Text AllocateText(std::size_t size) {
  return Text(new (std::nothrow) char[size]);
}

// Null for null, and when there is not enough memory.
Text CopyText(char const* source) {
  const std::size_t size = source != nullptr ? std::strlen(source) + 1 : 0;
  Text copy = source != nullptr ? AllocateText(size) : nullptr;
  if (copy) CopyBounded(copy.get(), source, size);
  return copy;
}

std::size_t LengthWithoutTrailingSlashes(char const* path) {
  std::size_t length = std::strlen(path);
  while (length > 1 && path[length - 1] == '/') --length;
  return length;
}

// Compares as the POSIX locale (also called "C") does, whatever locale the program has set: it
// folds ASCII alone. Obtaining that locale takes no memory, and it need not be freed.
bool EqualIgnoringCase(char const* first, char const* second, std::size_t length) {
  return strncasecmp_l(first, second, length, newlocale(LC_ALL_MASK, "C", nullptr)) == 0;
}

// What follows the last "." of a name. Null when there is none.
char const* ExtensionIn(char const* name) {
  char const* const dot = std::strrchr(name, '.');
  return dot == nullptr ? nullptr : dot + 1;
}

char const* WithoutDot(std::string const& extension) {
  return extension.c_str() + (extension.starts_with('.') ? 1 : 0);
}

// --- Strings and URLs of the platform ---------------------------------------------------------

CFOwned<CFStringRef> JoinPaths(CFStringRef folder, CFStringRef remainder) {
  return CFOwned<CFStringRef>(
      CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, CFSTR("%@/%@"), folder, remainder));
}

CFOwned<CFStringRef> StringOfUTF8(char const* text) {
  return CFOwned<CFStringRef>(
      CFStringCreateWithCString(kCFAllocatorDefault, text, kCFStringEncodingUTF8));
}

CFOwned<CFStringRef> StringOfPath(char const* path) {
  return CFOwned<CFStringRef>(
      CFStringCreateWithFileSystemRepresentation(kCFAllocatorDefault, path));
}

CFOwned<CFStringRef> PathOf(CFURLRef url) {
  return CFOwned<CFStringRef>(CFURLCopyFileSystemPath(url, kCFURLPOSIXPathStyle));
}

CFURLRef CreateURLOfPath(CFStringRef path, bool isDirectory) {
  return CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path, kCFURLPOSIXPathStyle,
                                       isDirectory);
}

CFURLPathStyle PlatformStyle(tPathStyle style) {
  switch (style) {
    case kPathStylePOSIX:
      return kCFURLPOSIXPathStyle;
    case kPathStyleHFS:
      return kCFURLHFSPathStyle;
    default:
      return kCFURLWindowsPathStyle;
  }
}

bool HasAbsolutePath(CFURLRef url) {
  Boolean isAbsolute = true;
  const CFOwned<CFStringRef> path(CFURLCopyStrictPath(url, &isAbsolute));
  return isAbsolute;
}

// The string as a path on the heap, for one that is too long for the buffer on the stack. Null when
// it is not a path or there is not enough memory.
Text LongPathOf(CFStringRef string) {
  const CFIndex size = CFStringGetMaximumSizeOfFileSystemRepresentation(string);
  if (size <= 0) return nullptr;
  Text path = AllocateText(static_cast<std::size_t>(size));
  if (path && !CFStringGetFileSystemRepresentation(string, path.get(), size)) path.reset();
  return path;
}

// The folder and the name with "/" between them; a copy of the folder for a null name, of the name
// for an empty folder. Null when there is not enough memory.
CFOwned<CFMutableStringRef> FolderAndName(CFStringRef folder, CFStringRef name) {
  CFOwned<CFMutableStringRef> joined(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, folder));
  if (!joined || name == nullptr) return joined;
  const CFIndex folderLength = CFStringGetLength(folder);
  if (folderLength > 0) CFStringAppend(joined.Get(), CFSTR("/"));
  CFStringAppend(joined.Get(), name);
  const CFIndex expected = folderLength + (folderLength > 0 ? 1 : 0) + CFStringGetLength(name);
  return CFStringGetLength(joined.Get()) == expected ? std::move(joined)
                                                     : CFOwned<CFMutableStringRef>();
}

// --- "~" --------------------------------------------------------------------------------------

// Aborts with the message of a failed assertion, in every kind of build.
[[noreturn]] void StopForNullPath() {
  std::fputs(
      "Assertion failed: (path != NULL), function CreateURLByExpandingTildePath, "
      "file CFileRef.cpp, line 64.\n",
      stderr);
  std::abort();
}

// Whether there is enough memory to look a user up. glibc 2.36 ends the process when the first
// lookup finds no memory for what it keeps; a block of this size, freed at once, shows that there
// is enough.
bool HasMemoryForUsers() {
  constexpr std::size_t kEnough = 0x4000;  // bytes
  return AllocateText(kEnough) != nullptr;
}

// The user whose name is the `length` units after the "~"; the current user for an empty name. Null
// for an unknown user, and when there is not enough memory.
passwd const* FindUser(CFStringRef tildePath, CFIndex length) {
  const CFIndex size = CFStringGetMaximumSizeForEncoding(length, kCFStringEncodingUTF8);
  const Text name = AllocateText(static_cast<std::size_t>(size) + 1);
  if (!name || !HasMemoryForUsers()) return nullptr;
  CFIndex used = 0;
  CFStringGetBytes(tildePath, CFRangeMake(1, length), kCFStringEncodingUTF8, 0, false,
                   reinterpret_cast<UInt8*>(name.get()), size, &used);
  name[static_cast<std::size_t>(used)] = '\0';
  return used == 0 ? getpwuid(getuid()) : getpwnam(name.get());
}

// What follows the "/" that ends the user's name; empty when there is no "/".
CFOwned<CFStringRef> RemainderBehind(CFStringRef tildePath, CFIndex slash) {
  const CFIndex length = CFStringGetLength(tildePath);
  if (slash == length) {
    return CFOwned<CFStringRef>(CFStringCreateWithCharacters(kCFAllocatorDefault, nullptr, 0));
  }
  return CFOwned<CFStringRef>(CFStringCreateWithSubstring(
      kCFAllocatorDefault, tildePath, CFRangeMake(slash + 1, length - slash - 1)));
}

// The position of the "/" that ends the user's name, or the end of the path.
CFIndex EndOfUserName(CFStringRef tildePath) {
  const CFIndex length = CFStringGetLength(tildePath);
  CFRange found = {};
  const bool hasSlash =
      CFStringFindWithOptions(tildePath, CFSTR("/"), CFRangeMake(1, length - 1), 0, &found);
  return hasSlash ? found.location : length;
}

CFURLRef CreateURLInHomeFolder(CFStringRef tildePath, bool isDirectory) {
  const CFIndex slash = EndOfUserName(tildePath);
  const CFOwned<CFStringRef> remainder = RemainderBehind(tildePath, slash);
  if (!remainder) return nullptr;
  passwd const* const user = FindUser(tildePath, slash - 1);
  if (user == nullptr) return nullptr;
  const CFOwned<CFStringRef> home = StringOfPath(user->pw_dir);
  if (!home) return nullptr;
  if (CFStringGetLength(remainder.Get()) == 0) return CreateURLOfPath(home.Get(), true);
  const CFOwned<CFStringRef> path = JoinPaths(home.Get(), remainder.Get());
  return path ? CreateURLOfPath(path.Get(), isDirectory) : nullptr;
}

// --- Items on disk ----------------------------------------------------------------------------

// Reads the status of the item itself. Returns false when there is none, and for null.
bool ReadStatus(char const* path, struct stat* about) {
  return path != nullptr && lstat(path, about) == 0;
}

bool ReadMode(char const* path, mode_t* mode) {
  struct stat about = {};
  if (!ReadStatus(path, &about)) return false;
  *mode = about.st_mode;
  return true;
}

bool IsFolderMode(mode_t mode) {
  return (mode & kTypeMask) == kFolderType;
}

// Cuts components off an absolute path until the rest exists. Returns false when that never
// happens: a missing item that ends in "." or ".." has only "…/../.." above it, which is missing
// too.
bool CutToExisting(char* path) {
  std::size_t length = std::strlen(path);
  mode_t mode = 0;
  while (!ReadMode(path, &mode)) {
    std::string_view rest(path, length);
    const std::string_view name = rest.substr(rest.rfind('/') + 1);
    if (name.empty() || name == kThisFolder || name == kFolderAbove) return false;
    rest.remove_suffix(name.size());
    while (rest.size() > 1 && rest.back() == '/') rest.remove_suffix(1);
    length = rest.size();
    path[length] = '\0';
  }
  return true;
}

// The text of the link at `path`. Null when it is not a link or cannot be read. The test is a mask,
// not a comparison of types.
Text ReadLink(char const* path) {
  struct stat about = {};
  if (!ReadStatus(path, &about) || (about.st_mode & kLinkType) != kLinkType) return nullptr;
  const auto size = static_cast<std::size_t>(about.st_size);
  Text target = AllocateText(size + 1);
  if (!target) return nullptr;
  const ssize_t length = readlink(path, target.get(), size);
  if (length <= 0) return nullptr;
  target[static_cast<std::size_t>(length)] = '\0';
  return target;
}

// --- Records ----------------------------------------------------------------------------------

// Leaves the bytes after the name as they are.
void Empty(FSSpec* spec) {
  spec->vRefNum = kNoVolume;
  spec->parID = kNoFolder;
  spec->name[0] = 0;
}

// Returns false when the catalog does not tell.
bool ReadCatalog(FSRef const& item, FSCatalogInfoBitmap wanted, FSCatalogInfo* about) {
  return FSGetCatalogInfo(&item, wanted, about, nullptr, nullptr, nullptr) == noErr;
}

short VolumeOf(FSRef const& item) {
  FSCatalogInfo about = {};
  return ReadCatalog(item, kFSCatInfoVolume, &about) ? about.volume : kNoVolume;
}

// An id as an FSSpec holds it; kNoNode becomes kNoFolder.
SInt32 SignedID(unsigned long id) {
  return static_cast<SInt32>(id);
}

// Stores the name in HFS form, cut off where the record ends.
void StoreName(CFStringRef name, FSSpec* spec) {
  Str255 converted;
  GetPascalStringFromCFString(name, converted, sizeof converted);
  converted[0] = std::min<unsigned char>(converted[0], kLongestSpecName);
  std::memcpy(spec->name, converted, std::size_t{1} + converted[0]);
}

// Tries the encodings in another order than for names: Mac Roman has no place of its own in it.
CFOwned<CFStringRef> StringOfHFSPath(char const* path) {
  for (const CFStringEncoding encoding : {CFileRef::mLocalEncoding, CFStringGetSystemEncoding(),
                                          CFStringEncoding{kCFStringEncodingUnicode}}) {
    CFOwned<CFStringRef> string(CFStringCreateWithCString(kCFAllocatorDefault, path, encoding));
    if (string) return string;
  }
  return {};
}

}  // namespace

// --- Life -------------------------------------------------------------------------------------

const CFileRef CFileRef::None;
CFStringEncoding CFileRef::mLocalEncoding = kCFStringEncodingMacRoman;

CFileRef::CFileRef() {
  Init();
}

CFileRef::CFileRef(CFileRef const& source) : CFileRef() {
  if (source.IsValid()) Set(source.mURL);
}

CFileRef& CFileRef::operator=(CFileRef const& source) {
  if (this == &source) return *this;
  ReInit();
  if (source.IsValid()) Set(source.mURL);
  return *this;
}

CFileRef::~CFileRef() {
  ReInit();
}

void CFileRef::Init() {
  mValid = 0;
  mURL = nullptr;
  mPath = nullptr;
  mFSRef = FSRef{};
  Empty(&mFSSpec);
}

void CFileRef::ReInit() {
  if (mURL != nullptr) CFRelease(mURL);
  delete[] mPath;
  Init();
}

void CFileRef::Invalidate() {
  ReInit();
}

bool CFileRef::IsValid() const {
  return (mValid & 1) != 0;
}

bool CFileRef::UpdateInternalFSRef() const {
  if (!IsValid()) return false;
  if (CFURLGetFSRef(mURL, &mFSRef)) return true;
  mFSRef = FSRef{};
  return false;
}

bool CFileRef::GetFSRef(FSRef* item) const {
  char const* const path = GetPath();
  if (path == nullptr || path[0] == '.') return false;
  return CFURLGetFSRef(mURL, item);
}

CFileRef::operator FSRef const&() const {
  UpdateInternalFSRef();
  return mFSRef;
}

CFileRef::operator FSRef const*() const {
  return &static_cast<FSRef const&>(*this);
}

// --- Setting ----------------------------------------------------------------------------------

bool CFileRef::Hold(CFURLRef url) {
  mURL = url;
  mValid = url != nullptr ? 1 : 0;
  return url != nullptr;
}

bool CFileRef::HoldPathOf(CFURLRef url, bool isDirectory) {
  const CFOwned<CFStringRef> path = PathOf(url);
  return path && Hold(CreateURLOfPath(path.Get(), isDirectory));
}

CFileRef::CFileRef(char const* path, bool isDirectory) : CFileRef() {
  Set(path, isDirectory);
}

// Reads the path before the reference is emptied, as it may be the reference's own.
bool CFileRef::Set(char const* path, bool isDirectory) {
  const auto string = path != nullptr ? StringOfPath(path) : CFOwned<CFStringRef>();
  ReInit();
  return string && Hold(CreateURLByExpandingTildePath(string.Get(), isDirectory));
}

CFileRef::CFileRef(CFStringRef path, tPathStyle style, bool isDirectory) : CFileRef() {
  Set(path, style, isDirectory);
}

bool CFileRef::Set(CFStringRef path, tPathStyle style, bool isDirectory) {
  ReInit();
  if (path == nullptr) return false;
  if (style == kPathStylePOSIX) return Hold(CreateURLByExpandingTildePath(path, isDirectory));
  return Hold(
      CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path, PlatformStyle(style), isDirectory));
}

CFileRef::CFileRef(CFStringRef folder, CFStringRef name) : CFileRef() {
  Set(folder, name);
}

bool CFileRef::Set(CFStringRef folder, CFStringRef name) {
  const CFOwned<CFMutableStringRef> path = FolderAndName(folder, name);
  ReInit();
  return path && Hold(CreateURLByExpandingTildePath(path.Get(), name == nullptr));
}

bool CFileRef::SetFromURLString(std::string const& url) {
  ReInit();
  const CFOwned<CFURLRef> made(
      CFURLCreateWithBytes(kCFAllocatorDefault, reinterpret_cast<UInt8 const*>(url.data()),
                           static_cast<CFIndex>(url.size()), kCFStringEncodingUTF8, nullptr));
  return Set(made.Get());
}

CFileRef::CFileRef(CFURLRef url) : CFileRef() {
  Set(url);
}

bool CFileRef::Set(CFURLRef url) {
  ReInit();
  return url != nullptr && Hold(static_cast<CFURLRef>(CFRetain(url)));
}

bool CFileRef::Set(CFURLRef url, bool isDirectory) {
  ReInit();
  return url != nullptr && HoldPathOf(url, isDirectory);
}

CFileRef::CFileRef(FSRef const* item) : CFileRef() {
  Set(item);
}

bool CFileRef::Set(FSRef const* item) {
  ReInit();
  return item != nullptr && Hold(CFURLCreateFromFSRef(kCFAllocatorDefault, item));
}

bool CFileRef::Set(CFileRef const& source, bool isDirectory) {
  return Set(source.mURL, isDirectory);
}

// --- Path and state ---------------------------------------------------------------------------

CFStringRef CFileRef::CopyFileSystemPath(tPathStyle style) const {
  return IsValid() ? CFURLCopyFileSystemPath(mURL, PlatformStyle(style)) : nullptr;
}

char const* CFileRef::GetPath() const {
  if (!IsValid()) return nullptr;
  if (mPath != nullptr) return mPath;
  if (!HasAbsolutePath(mURL)) return nullptr;
  const CFOwned<CFStringRef> string = PathOf(mURL);
  if (!string) return nullptr;

  char buffer[kTextBufferSize];
  buffer[0] = '\0';
  Text longPath;
  if (!CFStringGetFileSystemRepresentation(string.Get(), buffer, sizeof buffer)) {
    longPath = LongPathOf(string.Get());
  }
  char const* const path = longPath ? longPath.get() : buffer;
  if (!longPath && buffer[0] == '\0') return nullptr;

  const std::size_t size = LengthWithoutTrailingSlashes(path) + 1;
  mPath = AllocateText(size).release();
  if (mPath != nullptr) CopyBounded(mPath, path, size);
  return mPath;
}

CFileRef::operator char const*() const {
  return GetPath();
}

bool CFileRef::GetPath(char* buffer, unsigned long size) const {
  buffer[0] = '\0';
  char const* const path = GetPath();
  return path != nullptr && CopyBounded(buffer, path, size) < size;
}

CFileRef::operator std::string() const {
  return GetPath();
}

bool CFileRef::Exists() const {
  char const* const path = GetPath();
  mode_t mode = 0;
  if (!ReadMode(path, &mode)) return false;
  if ((mode & kTypeMask) != kLinkType || (mode & kStickyBit) != 0) return true;
  struct stat target = {};
  return stat(path, &target) == 0;
}

bool CFileRef::IsFolder() const {
  mode_t mode = 0;
  return ReadMode(GetPath(), &mode) && IsFolderMode(mode);
}

bool CFileRef::IsFile() const {
  mode_t mode = 0;
  return ReadMode(GetPath(), &mode) && !IsFolderMode(mode);
}

bool CFileRef::operator==(CFileRef const& other) const {
  if (IsValid() != other.IsValid()) return false;
  if (!IsValid()) return true;
  if (UpdateInternalFSRef() && other.UpdateInternalFSRef()) {
    return FSCompareFSRefs(&mFSRef, &other.mFSRef) == noErr;
  }
  return CFEqual(mURL, other.mURL);
}

bool CFileRef::operator!=(CFileRef const& other) const {
  return !(*this == other);
}

bool CFileRef::PathContains(CFileRef const& other) const {
  char const* const path = GetPath();
  char const* const otherPath = other.GetPath();
  if (path == nullptr || otherPath == nullptr) return false;
  const std::size_t length = std::strlen(path);
  const std::size_t otherLength = std::strlen(otherPath);
  if (length > otherLength) return false;
  if (path == kRootPath &&
      EqualIgnoringCase(otherPath, kVolumesPrefix.data(), kVolumesPrefix.size())) {
    return false;
  }
  if (!EqualIgnoringCase(path, otherPath, length)) return false;
  return length == otherLength || otherPath[length] == '/';
}

bool CFileRef::IsExistingPackage() const {
  if (!IsValid()) return false;
  const CFOwned<CFStringRef> path = PathOf(mURL);
  return Workspace::IsFilePackageAtPath(path.Get());
}

// --- Names and extensions ---------------------------------------------------------------------

CFStringRef CFileRef::CopyFileName() const {
  return IsValid() ? CFURLCopyLastPathComponent(mURL) : nullptr;
}

bool CFileRef::GetFileName(char* name, long size) const {
  const CFOwned<CFStringRef> component(CopyFileName());
  if (!component) return false;
  char text[kTextBufferSize];
  if (!CFStringGetFileSystemRepresentation(component.Get(), text, sizeof text)) return false;
  const auto room = static_cast<std::size_t>(std::max(size, 0L));
  // Without room the caller's text stays, except for the "/" at its end. With room the name
  // overwrites it, and the caller's buffer need not hold text at all.
  if (room == 0 && name != nullptr) {
    for (std::size_t end = std::strlen(name); end > 0 && name[end - 1] == '/'; --end) {
      name[end - 1] = '\0';
    }
  }
  return CopyBounded(name, text, room) <= room;
}

bool CFileRef::HasValidName() const {
  char name[kTextBufferSize];
  return GetFileName(name, sizeof name);
}

CFStringRef CFileRef::CopyFileExtension() const {
  return IsValid() ? CFURLCopyPathExtension(mURL) : nullptr;
}

bool CFileRef::GetExtension(char* extension, unsigned long size) const {
  char name[kTextBufferSize];
  if (extension == nullptr || !GetFileName(name, sizeof name)) return false;
  char const* const found = ExtensionIn(name);
  if (found == nullptr || std::strlen(found) >= size) return false;
  std::strncpy(extension, found, size);
  return true;
}

bool CFileRef::GetExtension(std::string& extension) const {
  char name[kTextBufferSize];
  if (!GetFileName(name, sizeof name)) return false;
  char const* const found = ExtensionIn(name);
  if (found == nullptr) return false;
  extension = found;
  return true;
}

// Compares only the length of the name's extension, so an empty one matches everything.
bool CFileRef::HasExtension(std::string const& extension) const {
  char name[kTextBufferSize];
  if (extension.empty() || !GetFileName(name, sizeof name)) return false;
  char const* const found = ExtensionIn(name);
  if (found == nullptr) return false;
  const std::size_t length = std::strlen(found);
  return length < kExtensionBufferSize && EqualIgnoringCase(found, WithoutDot(extension), length);
}

void CFileRef::ReplaceExtensionBy(std::string const& extension) {
  char name[kTextBufferSize];
  if (!GetFileName(name, sizeof name)) return;
  std::string replaced = name;
  const std::size_t dot = replaced.rfind('.');
  if (dot != std::string::npos) {
    replaced.resize(extension.empty() ? dot : dot + 1);
  } else {
    replaced += '.';
  }
  replaced += WithoutDot(extension);
  ReplaceName(replaced.c_str(), false);
}

// --- Editing ----------------------------------------------------------------------------------

bool CFileRef::AddToPath(CFStringRef component, bool isDirectory) {
  if (!IsValid()) return Set(component, kPathStylePOSIX, isDirectory);
  const CFOwned<CFStringRef> path = PathOf(mURL);
  if (!path) return false;
  const CFOwned<CFStringRef> joined = JoinPaths(path.Get(), component);
  if (!joined) return false;
  return Set(joined.Get(), kPathStylePOSIX, isDirectory);
}

bool CFileRef::AddToPath(CFileRef const& other) {
  if (!IsValid() || !other.IsValid()) return false;
  const CFOwned<CFStringRef> component(other.CopyFileName());
  return component && AddToPath(component.Get(), CFURLHasDirectoryPath(other.mURL));
}

bool CFileRef::AddToPath(char const* component, bool isDirectory) {
  if (component == nullptr) return false;
  const CFOwned<CFStringRef> string = StringOfUTF8(component);
  return string && AddToPath(string.Get(), isDirectory);
}

// Made from the path of the appended URL, so that the new URL is a plain file URL.
bool CFileRef::ReplaceName(CFStringRef name, bool isDirectory) {
  if (!IsValid()) return !isDirectory && Set(name, kPathStylePOSIX, false);
  const CFOwned<CFURLRef> folder(
      CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, mURL));
  if (!folder) return false;
  const CFOwned<CFURLRef> renamed(
      CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, folder.Get(), name, isDirectory));
  if (!renamed) return false;
  return Set(renamed.Get(), isDirectory);
}

bool CFileRef::ReplaceName(CFileRef const& other) {
  const CFOwned<CFStringRef> name(other.CopyFileName());
  return name && ReplaceName(name.Get(), CFURLHasDirectoryPath(other.mURL));
}

bool CFileRef::ReplaceName(char const* name, bool isDirectory) {
  if (name == nullptr) return false;
  const CFOwned<CFStringRef> string = StringOfUTF8(name);
  return string && ReplaceName(string.Get(), isDirectory);
}

void CFileRef::SetToParent() {
  if (!IsValid()) return;
  const CFOwned<CFURLRef> folder(
      CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, mURL));
  Set(folder.Get(), true);
  char const* const path = GetPath();
  if (path == nullptr || path == kThisFolderMarked || path == kThisFolder) ReInit();
}

bool CFileRef::ResolveAlias(bool allowInteraction) {
  if (!UpdateInternalFSRef()) return false;
  FSRef target = mFSRef;
  Boolean targetIsFolder = false;
  Boolean wasAliased = false;
  unsigned long flags = 0;
  if (!allowInteraction) flags |= kResolveAliasFileNoUI;
  const OSErr result =
      FSResolveAliasFileWithMountFlags(&target, true, &targetIsFolder, &wasAliased, flags);
  return result == noErr && wasAliased ? Set(&target) : FollowLink();
}

// A relative link text is looked up from the current folder, as it is then used; a target that
// cannot be looked up counts as a file, and so does a link.
bool CFileRef::FollowLink() {
  const Text target = ReadLink(GetPath());
  if (!target) return false;
  mode_t mode = kTypeMask;
  ReadMode(target.get(), &mode);
  return Set(target.get(), IsFolderMode(mode));
}

// --- Volume and folder ------------------------------------------------------------------------

// Climbs to the top, not just to the nearest existing folder. A folder that cannot be examined
// could be the top, with another volume above it.
short CFileRef::GetVolumeRefNumber() const {
  if (!IsValid()) return kNoVolume;
  FSRef item = {};
  if (CFURLGetFSRef(mURL, &item)) return VolumeOf(item);
  CFileRef root(*this);
  if (root.GetPath() == nullptr) {
    // Without a path, it may still be in a folder that has one, unless only memory was missing.
    root.SetToParent();
    if (GetPath() != nullptr) return kNoVolume;
  }
  while (root.ClimbToExisting()) {
    const std::optional<bool> isRoot = root.ReadIsRoot();
    if (!isRoot) return kNoVolume;
    if (*isRoot) break;
    root.SetToParent();
  }
  return root.IsValid() && CFURLGetFSRef(root.mURL, &item) ? VolumeOf(item) : kNoVolume;
}

// Skips all that is missing at once, as a path can have tens of thousands of components.
bool CFileRef::ClimbToExisting() {
  if (IsFolder()) return true;
  const Text existing = CopyText(GetPath());
  if (existing && CutToExisting(existing.get())) return Set(existing.get(), true);
  ReInit();
  return false;
}

long CFileRef::GetParentID() const {
  CFileRef folder(*this);
  folder.SetToParent();
  return folder.IsFolder() ? SignedID(folder.GetNodeID()) : kNoFolder;
}

long CFileRef::GetDirectoryID() const {
  return IsFolder() ? SignedID(GetNodeID()) : GetParentID();
}

unsigned long CFileRef::GetNodeID() const {
  FSCatalogInfo about = {};
  const bool known = UpdateInternalFSRef() && ReadCatalog(mFSRef, kFSCatInfoNodeID, &about);
  return known ? about.nodeID : kNoNode;
}

bool CFileRef::IsRoot() const {
  return ReadIsRoot().value_or(false);
}

std::optional<bool> CFileRef::ReadIsRoot() const {
  struct stat about = {};
  if (!ReadStatus(GetPath(), &about)) return std::nullopt;
  CFileRef folder(*this);
  folder.SetToParent();
  struct stat aboutFolder = {};
  if (!ReadStatus(folder.GetPath(), &aboutFolder)) return std::nullopt;
  return about.st_dev != aboutFolder.st_dev || about.st_ino == aboutFolder.st_ino;
}

bool CFileRef::UnicodeFileName(HFSUniStr255* name) const {
  if (!IsValid()) return false;
  if (UpdateInternalFSRef()) {
    return FSGetCatalogInfo(&mFSRef, kFSCatInfoNone, nullptr, name, nullptr, nullptr) == noErr;
  }
  const CFOwned<CFStringRef> component(CopyFileName());
  const CFIndex length = component ? CFStringGetLength(component.Get()) : kCFNotFound;
  if (length == kCFNotFound || length > kLongestUnicodeName) return false;
  name->length = static_cast<UInt16>(length);
  CFStringGetCharacters(component.Get(), CFRangeMake(0, length), name->unicode);
  return true;
}

// --- FSSpec -----------------------------------------------------------------------------------

bool CFileRef::GetFSSpec(FSSpec* spec) const {
  if (!IsValid()) return false;
  Empty(spec);
  if (UpdateInternalFSRef()) {
    return FSGetCatalogInfo(&mFSRef, kFSCatInfoNone, nullptr, nullptr, spec, nullptr) == noErr;
  }
  // It exists all the same, so it is not a new item: its record may have another name or folder.
  mode_t mode = 0;
  if (ReadMode(GetPath(), &mode) && !IsOfNoFile()) return false;
  CFileRef folder(*this);
  folder.SetToParent();
  FSCatalogInfo about = {};
  if (folder.UpdateInternalFSRef() &&
      ReadCatalog(folder.mFSRef, kFSCatInfoVolume | kFSCatInfoNodeID, &about)) {
    spec->vRefNum = about.volume;
    spec->parID = SignedID(about.nodeID);
  }
  const CFOwned<CFStringRef> name(CopyFileName());
  if (!name) return false;
  StoreName(name.Get(), spec);
  return true;
}

// Looks a second time, as the first look may have lacked something that it needs, such as memory.
bool CFileRef::IsOfNoFile() const {
  CFileRef file;
  file.Set(mURL, false);
  return file.UpdateInternalFSRef() && !UpdateInternalFSRef();
}

CFileRef::operator FSSpec const&() const {
  Empty(&mFSSpec);
  GetFSSpec(&mFSSpec);
  return mFSSpec;
}

CFileRef::operator FSSpec const*() const {
  return &static_cast<FSSpec const&>(*this);
}

CFileRef::CFileRef(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
                   bool last)
    : CFileRef() {
  Set(vRefNum, dirID, nameLength, name, last);
}

bool CFileRef::Set(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
                   bool) {
  FSRef folder = {};
  if (FSResolveNodeID(vRefNum, static_cast<UInt32>(dirID), &folder) != noErr) return false;
  if (nameLength > 0) {
    FSRef child = {};
    return FSMakeFSRefUnicode(&folder, nameLength, name, 0, &child) == noErr && Set(&child);
  }
  // By now, a folder may have taken the place of another item.
  const bool isFolder = Set(&folder) && CFURLHasDirectoryPath(mURL) && IsFolder();
  if (!isFolder) ReInit();
  return isFolder;
}

// Reads the path before the reference is emptied, as it may be the reference's own.
bool CFileRef::SetFromHFSPath(char const* hfsPath, bool isFolder) {
  const auto path = hfsPath != nullptr ? StringOfHFSPath(hfsPath) : CFOwned<CFStringRef>();
  return Set(path.Get(), kPathStyleHFS, isFolder);
}

CFileRef::CFileRef(FSSpec const* spec, bool searchOtherVolumes, bool last) : CFileRef() {
  SetFromFSSpec(spec, searchOtherVolumes, last);
}

CFileRef::CFileRef(FSSpec const& spec, bool searchOtherVolumes, bool last)
    : CFileRef(&spec, searchOtherVolumes, last) {}

// An alias with a missing target is kept as it is.
CFileRef::CFileRef(FSSpec* spec, bool searchOtherVolumes, bool last) : CFileRef() {
  if (spec == nullptr) return;
  const FSSpec wanted = BoundedFSSpec(*spec);
  FSRef item = {};
  if (FSpMakeFSRef(&wanted, &item) != noErr) {
    SetFromFSSpec(&wanted, searchOtherVolumes, last);
    return;
  }
  Boolean targetIsFolder = false;
  Boolean wasAliased = false;
  FSResolveAliasFile(&item, true, &targetIsFolder, &wasAliased);
  Set(&item);
}

bool CFileRef::SetFromFSSpec(FSSpec const* spec, bool searchOtherVolumes, bool last) {
  return CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(this, spec, searchOtherVolumes, last);
}

// --- "~" --------------------------------------------------------------------------------------

CFURLRef CreateURLByExpandingTildePath(CFStringRef path, bool isDirectory) {
  if (path == nullptr) StopForNullPath();
  if (CFStringHasPrefix(path, CFSTR("~"))) return CreateURLInHomeFolder(path, isDirectory);
  const CFOwned<CFStringRef> copy(CFStringCreateCopy(kCFAllocatorDefault, path));
  return copy ? CreateURLOfPath(copy.Get(), isDirectory) : nullptr;
}
