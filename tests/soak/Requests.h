// The requests of a soak and their encoding.
#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "Model.h"

namespace tallowmere::soak {

// A path as names, relative to the main volume's root folder.
struct Path {
  std::array<NameIndex, 3> names{};
  std::size_t count = 0;

  Path Parent() const;
  std::span<const NameIndex> Names() const { return {names.data(), count}; }
  NameIndex Last() const { return names.at(count - 1); }
  bool operator==(const Path&) const = default;
};

// The largest buffer for a full path that may be requested, in bytes including the NUL.
inline constexpr std::uint16_t kMostRoom = 1024;
// The smallest buffer but 0 that this tree allows: the longest name of a volume and six more bytes.
inline constexpr std::uint16_t kLeastRoom = 17;

struct Request {
  unsigned code;
  Path path;       // of codes 1, 2, 5, 6, 7
  int volume = 0;  // of codes 4, 8, 9
  std::uint32_t folder = 0;
  std::string hfsName;             // of codes 6, 8, 9
  bool search = false;             // of code 9
  bool byOther = false;            // of code 2: the first name is the other volume's
  std::uint16_t room = kMostRoom;  // of code 1: 0, or at least kLeastRoom
  bool flag = false;               // the last field of codes 1, 2, 6, 8, 9
};

// The mount point and the name of the main volume.
struct Place {
  std::string path;
  std::string name;
};

std::string VolumeName(const Volume& volume, const Place& place);

// Replaces the folders that do not fit into a full path (code 1).
inline constexpr std::string_view kAnyFolders = "...";

// Returns the Linux path.
std::string TextOf(const Path& path, const Place& place);

// Returns the bytes of a request.
std::string BytesOf(const Request& request, const Place& place);

std::string TextOf(const Request& request);

}  // namespace tallowmere::soak
