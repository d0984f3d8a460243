// The tree of a soak: two volumes with a few dozen items, as plain data that each change copies.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

namespace tallowmere::soak {

// --- Names ------------------------------------------------------------------------------------

struct Name {
  const char* linuxName;
  const char* hfsName;  // in full; a record has a short form when it is too long
  const char* newName;  // the Linux name of a new item with this HFS name
};

using NameIndex = std::uint8_t;

// Names in the main volume's root folder. A link's target is always an earlier name than its own,
// so that no links form a cycle.
inline constexpr NameIndex kVolumePlace = 0;  // the mount point of the other volume
inline constexpr NameIndex kFirstSlot = 1;
inline constexpr NameIndex kEndOfSlots = 7;
// Names in folders.
inline constexpr NameIndex kSubfolder = 7;
inline constexpr NameIndex kInnerLink = 8;
inline constexpr NameIndex kFirstFile = 9;
inline constexpr NameIndex kEndOfFiles = 15;
inline constexpr NameIndex kNoName = 255;

const Name& NameAt(NameIndex index);

// Returns the Linux name of a new item with an HFS name, which may be a short form.
std::string NewName(std::string_view hfsName);

// The longest name in a record, in bytes.
inline constexpr std::size_t kLongestRecordName = 63;

// Returns whether a record has to use a short form of the name.
bool HasShortForm(NameIndex name);

// --- Items ------------------------------------------------------------------------------------

// Items are numbered in the order of their creation. Numbers are never reused.
using Node = std::uint32_t;
inline constexpr Node kNoNode = 0;
inline constexpr Node kMainRoot = 1;

enum class Kind : std::uint8_t { kFolder, kFile, kLink };

// One name of an item.
struct Entry {
  Node folder;
  Node node;
  std::uint64_t inode;
  Kind kind;
  NameIndex name;
  NameIndex target;       // of a link: the first name on its path, in the main volume's root folder
  NameIndex innerTarget;  // the second name, or kNoName

  bool operator==(const Entry&) const = default;
};

// Returns whether the entry is the mount point of the other volume.
bool IsVolumePlace(const Entry& entry);

// The service uses more marks when fewer did not lead back to the item, as while it moves.
std::string ShortForm(const Entry& entry, std::size_t marks = 1);
inline constexpr std::size_t kMostMarks = 16;

// Returns the entry's HFS name as in a record.
std::string RecordName(const Entry& entry);

std::string TextOf(const Entry& entry);

inline constexpr int kUnknownVolume = 32767;

struct Volume {
  Node root;   // kNoNode when not mounted
  int number;  // the most recent one
  bool operator==(const Volume&) const = default;
};

std::string TextOf(const Volume& volume);

struct State {
  std::array<Entry, 96> entries;
  std::size_t count = 0;
  Volume main{kMainRoot, 0};
  Volume other{kNoNode, kUnknownVolume};

  const Entry* begin() const { return entries.data(); }
  const Entry* end() const { return entries.data() + count; }
  const Entry* Find(Node folder, NameIndex name) const;
};

}  // namespace tallowmere::soak
