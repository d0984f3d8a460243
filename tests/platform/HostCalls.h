// Makes records and references of real items through the host's own calls, to test these.
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

// Returns a reference to the item at a path. A link is the item itself.
inline FSRef ReferenceTo(const std::string& path) {
  FSRef item{};
  EXPECT_TRUE(CFURLGetFSRef(foundation::test::MakeUrl(path, false).Get(), &item)) << path;
  return item;
}

// Returns the item's current path, or nullopt when it is gone.
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

// Returns a copy: the field is not aligned, so no reference may bind to it.
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

// Returns the path that FSpMakeFSRef finds, or the result code in brackets.
inline std::string ItemOf(const FSSpec& spec) {
  FSRef reference{};
  const OSErr error = FSpMakeFSRef(&spec, &reference);
  return error == noErr ? PathOf(reference) : "(" + std::to_string(error) + ")";
}

// Returns the path that FSResolveNodeID finds, or the result code in brackets.
inline std::string ItemWithID(SInt16 volume, std::uint32_t id) {
  FSRef reference{};
  const OSErr error = FSResolveNodeID(volume, id, &reference);
  return error == noErr ? PathOf(reference) : "(" + std::to_string(error) + ")";
}

// Returns the path of the folder with an id, found by FSMakeFSSpec, or the result code in brackets.
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

// A volume's number and name. VolumeAt takes an index from 1 and gives 0 past the last volume.
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

// Returns the number of the last volume with this name, or 0.
inline SInt16 VolumeNamed(std::string_view name) {
  SInt16 number = 0;
  SInt16 index = 1;
  for (VolumeAtIndex volume; (volume = VolumeAt(index)).number != 0; ++index) {
    if (volume.name == name) number = volume.number;
  }
  return number;
}

// Returns the inode number of the item at a path, from lstat(2).
inline std::uint64_t InodeOf(const std::string& path) {
  struct stat about {};
  EXPECT_EQ(lstat(path.c_str(), &about), 0) << path;
  return about.st_ino;
}

}  // namespace tallowmere::test
