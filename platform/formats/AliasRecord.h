// Alias records, versions 2 and 3: what somebody once knew of a file or folder, for finding it
// again. Inside Macintosh: Files, "Alias Manager", has the calls and keeps the record private; its
// fields are known from public descriptions by those who read records. Big-endian.
//
// A head (version 2: 150 bytes, version 3: 58), then tags: number (16 bits), length (16), so many
// bytes, and one more where that makes their number even. Number 0xFFFF with length 0, or the end
// of the record, ends them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::formats {

// Seconds times 65536 since 1904-01-01, in UTC.
using PreciseDate = std::uint64_t;

struct AliasRecord {
  static constexpr std::uint32_t kNoID = 0xFFFFFFFF;  // like 0: not known
  static constexpr std::int16_t kNoLevel = -1;

  std::uint32_t userType = 0;
  std::uint16_t version = 0;  // 2 or 3
  bool isFolder = false;

  // The volume.
  std::uint16_t signature = 0;     // 'RW', 'BD', 'H+', 'HX'; 'BD' also for foreign file systems
  std::uint16_t fileSystemID = 0;  // 0 for MFS, HFS and HFS+
  std::uint16_t diskType = 0;      // 0 fixed, 1 network, 2 to 4 floppy disks, 5 ejectable
  std::uint32_t volumeAttributes = 0;

  // The target.
  std::uint32_t parentID = 0;  // of the folder that holds it
  std::uint32_t targetID = 0;
  // To its common folder with the alias file and down from there; 1 and 1 is the same folder.
  std::int16_t levelsUp = kNoLevel;
  std::int16_t levelsDown = kNoLevel;

  // Of version 2 alone, names in the writer's 8-bit encoding, dates in seconds since 1904 in UTC or
  // in the writer's time, 0 for none. Two writers swap type and creator.
  std::string shortVolumeName;  // at most 27 bytes
  std::string shortTargetName;  // at most 63 bytes
  std::uint32_t volumeCreation = 0;
  std::uint32_t targetCreation = 0;
  std::uint32_t type = 0;
  std::uint32_t creator = 0;

  // Of version 3 and tags 16 and 17; 0 for none.
  PreciseDate preciseVolumeCreation = 0;
  PreciseDate preciseTargetCreation = 0;

  // Tags, with their numbers; nullopt for one that is not there.
  std::optional<std::string> folderName;              // 0, 8-bit
  std::optional<std::vector<std::uint32_t>> folders;  // 1, ids, innermost first
  std::optional<std::string> hfsPath;                 // 2, 8-bit, "Volume:folder:name", without NUL
  std::optional<std::string> zone;                    // 3
  std::optional<std::string> server;                  // 4
  std::optional<std::string> user;                    // 5
  std::optional<std::string> driver;                  // 6
  std::optional<std::u16string> targetName;           // 14, in HFS form
  std::optional<std::u16string> volumeName;           // 15, in HFS form
  std::optional<std::string> posixPath;               // 18, UTF-8, within the volume
  std::optional<std::string> mountPoint;              // 19, of the writer
  std::optional<std::string> diskImage;               // 20, an alias record
  std::optional<std::uint16_t> homeComponents;        // 21, of posixPath
};

// The record that the bytes begin with; what follows it is not the record's. Nullopt for anything
// that does not fit: a size beyond the bytes, another version, a name or a tag that is too long.
std::optional<AliasRecord> ReadAliasRecord(std::string_view bytes);

}  // namespace tallowmere::formats
