// What a soak's tree looks like: two volumes of a few dozen items, as plain data that is copied
// with each change, and the paths, records and answers that hold in it.
#pragma once

#include <array>
#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere::soak {

// --- Names ------------------------------------------------------------------------------------

struct Name {
  const char* linuxName;
  const char* hfsName;  // whole; a record has a short form of what is too long for it
  const char* newName;  // what a new item by that HFS name is called on Linux
};

using NameIndex = std::uint8_t;

// In the main volume's root folder. A link stands only where a name before its own is its target,
// so that no links go round in a circle.
inline constexpr NameIndex kVolumePlace = 0;  // the folder at which the other volume is mounted
inline constexpr NameIndex kFirstSlot = 1;
inline constexpr NameIndex kEndOfSlots = 7;
// In folders.
inline constexpr NameIndex kSubfolder = 7;
inline constexpr NameIndex kInnerLink = 8;
inline constexpr NameIndex kFirstFile = 9;
inline constexpr NameIndex kEndOfFiles = 15;
inline constexpr NameIndex kNoName = 255;

const Name& NameAt(NameIndex index);

// --- Items ------------------------------------------------------------------------------------

// Items are numbered as they are made; a number is never given to another item.
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
  NameIndex target;       // of a link: a name in the main volume's root folder
  NameIndex innerTarget;  // and one in that, or kNoName

  bool operator==(const Entry&) const = default;
};

inline constexpr int kUnknownVolume = 32767;

struct Volume {
  Node root;   // kNoNode when it is not mounted
  int number;  // the last one
  bool operator==(const Volume&) const = default;
};

struct State {
  std::array<Entry, 96> entries;
  std::size_t count = 0;
  Volume main{kMainRoot, 0};
  Volume other{kNoNode, kUnknownVolume};

  const Entry* begin() const { return entries.data(); }
  const Entry* end() const { return entries.data() + count; }
  const Entry* Find(Node folder, NameIndex name) const;
};

// --- Requests ---------------------------------------------------------------------------------

// Names from the main volume's root folder on.
struct Path {
  std::array<NameIndex, 3> names{};
  std::size_t count = 0;

  Path Parent() const;
  bool operator==(const Path&) const = default;
};

struct Request {
  unsigned code;
  Path path;       // of codes 1, 2, 5, 6, 7
  int volume = 0;  // of codes 4, 8, 9
  std::uint32_t folder = 0;
  std::string hfsName;   // of codes 6, 8, 9
  bool search = false;   // of code 9
  bool byOther = false;  // of code 2: the first name is the other volume's
};

// Where the main volume is mounted and what it is called.
struct Place {
  std::string path;
  std::string name;
};

// The request as bytes.
std::string BytesOf(const Request& request, const Place& place);

// --- Answers ----------------------------------------------------------------------------------

// What is true of the tree in one state, or what was true in several.
class Graph {
 public:
  explicit Graph(const std::vector<const State*>& states);

  const std::vector<Entry>& Entries() const { return mEntries; }
  const Volume& Main() const { return mMain; }
  const std::vector<Volume>& Others() const { return mOthers; }
  bool IsOfOneState() const { return mIsOfOneState; }

  std::vector<const Entry*> In(Node folder, NameIndex name) const;

  // Whether the folder is without the name, in one of the states.
  bool CanMiss(Node folder, NameIndex name) const;

 private:
  void Add(const Entry& entry);

  bool mIsOfOneState;
  std::vector<Entry> mEntries;
  std::set<std::pair<Node, NameIndex>> mMissing;
  Volume mMain{};
  std::vector<Volume> mOthers;
};

struct Truth {
  std::set<std::string> responses;
  std::set<std::string> nowhere;  // for several states: those that lead to no item in any of them
  std::string trace;              // of the items that were met: differs when any of them is another
};

// What is to be answered while the tree is like that: one response for one state. For several,
// every response of which each step was true in one of them, though perhaps not in the same: the
// item was moved while it was asked for.
Truth Answers(const Graph& graph, const Place& place, const Request& request);

// The answers that say that there is none, or that it cannot be told.
std::set<std::string> HonestErrors(const Place& place, const Request& request);

// The HFS name that a record has for the entry.
std::string RecordName(const Entry& entry);

std::string TextOf(const Request& request, const Place& place);
std::string TextOf(const Entry& entry);
std::string TextOf(const Volume& volume);

}  // namespace tallowmere::soak
