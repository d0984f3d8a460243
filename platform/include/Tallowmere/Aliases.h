// What alias records, alias files and bookmarks say, and which item of this machine they mean now.
//
// One thread at a time, as the host's calls.
#pragma once

#include <MacTypes.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::alias {

enum class Form : std::uint8_t { kRecordOfVersion2, kRecordOfVersion3, kBookmark };

// What the record or bookmark was in.
enum class Container : std::uint8_t {
  kNone,
  kAliasFile,  // a file with its Finder flags and forks, or the data of one with a bookmark
  kResourceFork,
  kAppleDouble,
  kMacBinary,
};

struct Date {
  std::int64_t seconds;  // since 1970
  bool isInUTC;          // else in UTC or in the writer's time zone
};

// Texts are in UTF-8; one that is not there is empty, a number that is not known is nullopt.
struct Description {
  Form form;
  Container container;
  bool isFolder;  // the target; false where that is not known

  std::string volumeName;  // in HFS form
  std::string fileSystem;  // its code: "H+", "BDcu", ...; of records alone
  std::optional<Date> volumeCreation;
  std::string mountPoint;  // on the writer's machine
  bool isOnDiskImage;

  std::string name;  // in HFS form
  std::optional<std::uint64_t> id;
  std::optional<std::uint64_t> parentID;
  std::optional<Date> creation;
  std::string type;  // four characters, as creator; of records of version 2 alone
  std::string creator;

  // Levels from the alias file's folder up and down to the target; 1 and 1 is the same folder.
  std::optional<int> levelsUp;
  std::optional<int> levelsDown;
  std::string posixPath;  // within the volume; of bookmarks from the writer's "/"
  std::string hfsPath;    // with the volume's name

  // The ways to the target from its volume's root folder, by names of Linux: one for each reading
  // of the names, none where the path is not known.
  std::vector<std::vector<std::string>> waysOnVolume;

  std::string server;
  std::string user;
};

// By which rule of docs/platform.md an item was found.
enum class Found : std::uint8_t { kNot, kByLevels, kByPath, kByID };

struct Answer {
  // noErr, or a code of FSResolveAliasFile; paramErr, too, for what is no alias.
  OSErr result;
  std::optional<Description> description;  // nullopt when it is none, or broken
  Found found;
  std::string path;  // where the item is now, absolute; empty when it is not found
  bool isFolder;     // that item
};

// Of bytes: a record or bookmark alone, a resource fork, an AppleDouble or MacBinary file, the data
// of an alias file with a bookmark; told apart by their content. Nothing there is relative to a
// file.
Answer LookAtBytes(std::string_view bytes) noexcept;

// Of the file at an absolute path, not followed when it is a link. If it is no alias file, its
// content as above. One step: a target that is an alias file itself is not followed.
Answer LookAtFile(const std::string& path) noexcept;

}  // namespace tallowmere::alias
