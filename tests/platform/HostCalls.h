// Records and references of real items by the host's own calls, for the tests of what those
// promise.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "names/PascalNames.h"
#include "platform/foundation/TestStrings.h"

namespace tallowmere::test {

struct Str255Of {
  explicit Str255Of(std::string_view text) { names::CopyToPascal(text, bytes); }
  Str255 bytes = {};
};

// A reference to what is at a path, a link itself.
inline FSRef ReferenceTo(const std::string& path) {
  FSRef item{};
  EXPECT_TRUE(CFURLGetFSRef(foundation::test::MakeUrl(path, false).Get(), &item)) << path;
  return item;
}

// Where the item is now; none when it is gone.
inline std::optional<std::string> PlaceOf(const FSRef& item) {
  const CFOwned url(CFURLCreateFromFSRef(kCFAllocatorDefault, &item));
  return url ? foundation::test::PathOf(url) : std::nullopt;
}
inline std::string PathOf(const FSRef& item) {
  return PlaceOf(item).value_or("(none)");
}

inline FSSpec SpecOf(const std::string& path) {
  const FSRef reference = ReferenceTo(path);
  FSSpec spec{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoNone, nullptr, nullptr, &spec, nullptr), noErr)
      << path;
  return spec;
}

inline std::string NameOf(const FSSpec& spec) {
  return std::string(names::TextOfPascal(spec.name));
}

// By value: the field is not aligned, so no reference may be bound to it.
inline std::uint32_t ParentOf(const FSSpec& spec) {
  return static_cast<std::uint32_t>(spec.parID);
}

inline FSCatalogInfo InfoOf(const std::string& path) {
  const FSRef reference = ReferenceTo(path);
  FSCatalogInfo info{};
  EXPECT_EQ(FSGetCatalogInfo(&reference, kFSCatInfoVolume | kFSCatInfoNodeID, &info, nullptr,
                             nullptr, nullptr),
            noErr)
      << path;
  return info;
}

inline std::uint32_t IDOf(const std::string& path) {
  return InfoOf(path).nodeID;
}

// What FSpMakeFSRef finds: a path, or the result code in brackets.
inline std::string ItemOf(const FSSpec& spec) {
  FSRef reference{};
  const OSErr error = FSpMakeFSRef(&spec, &reference);
  return error == noErr ? PathOf(reference) : "(" + std::to_string(error) + ")";
}

// What FSResolveNodeID finds, likewise.
inline std::string ItemWithID(SInt16 volume, std::uint32_t id) {
  FSRef reference{};
  const OSErr error = FSResolveNodeID(volume, id, &reference);
  return error == noErr ? PathOf(reference) : "(" + std::to_string(error) + ")";
}

// The folder with an id as the start of an HFS path, likewise.
inline std::string FolderWithID(SInt16 volume, std::uint32_t id) {
  FSSpec spec{};
  const OSErr error = FSMakeFSSpec(volume, static_cast<SInt32>(id), Str255Of("").bytes, &spec);
  return error == noErr ? ItemOf(spec) : "(" + std::to_string(error) + ")";
}

inline FSSpec MakeRecord(SInt16 volume, std::uint32_t parent, std::string_view name) {
  FSSpec spec{};
  spec.vRefNum = volume;
  spec.parID = static_cast<SInt32>(parent);
  names::CopyToPascal(name, spec.name);
  return spec;
}

// The number of the volume with an index from 1, and its name; 0 past the last.
struct VolumeAtIndex {
  SInt16 number;
  std::string name;
};
inline VolumeAtIndex VolumeAt(SInt16 index) {
  Str255 name = {};
  HParamBlockRec block{};
  block.volumeParam.ioNamePtr = name;
  block.volumeParam.ioVolIndex = index;
  if (PBHGetVInfoSync(&block) != noErr) return {};
  return {block.volumeParam.ioVRefNum, std::string(names::TextOfPascal(name))};
}

// The number of the last volume with a name; 0 when there is none.
inline SInt16 VolumeNamed(std::string_view name) {
  SInt16 number = 0;
  SInt16 index = 1;
  for (VolumeAtIndex volume; (volume = VolumeAt(index)).number != 0; ++index) {
    if (volume.name == name) number = volume.number;
  }
  return number;
}

// The inode number of what is at a path, as lstat(2) tells it.
inline std::uint64_t InodeOf(const std::string& path) {
  struct stat about {};
  EXPECT_EQ(lstat(path.c_str(), &about), 0) << path;
  return about.st_ino;
}

}  // namespace tallowmere::test
