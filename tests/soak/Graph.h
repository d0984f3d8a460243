// What the tree looks like in one or more states, and what names and paths lead to in it.
#pragma once

#include <cstdint>
#include <set>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Model.h"

namespace tallowmere::soak {

inline constexpr std::uint32_t kRootID = 2;
inline constexpr std::uint32_t kParentOfRoots = 1;

// The tree as it is in one state, or everything that was true in several.
class Graph {
 public:
  explicit Graph(const std::vector<const State*>& states);

  const std::vector<Entry>& Entries() const { return mEntries; }
  const Volume& Main() const { return mMain; }
  const std::vector<Volume>& Others() const { return mOthers; }
  bool IsOfOneState() const { return mIsOfOneState; }

  std::vector<const Entry*> In(Node folder, NameIndex name) const;

  // Returns whether the folder lacks the name in at least one of the states.
  bool CanMiss(Node folder, NameIndex name) const;

 private:
  void Add(const Entry& entry);

  bool mIsOfOneState;
  std::vector<Entry> mEntries;
  std::set<std::pair<Node, NameIndex>> mMissing;
  Volume mMain{};
  std::vector<Volume> mOthers;
};

struct Item {
  Node node;
  const Entry* entry;
  bool isRoot;  // of the other volume
};

// What a name or a path leads to. In one state, that is one item or none.
struct Outcome {
  std::vector<Item> items;
  bool canMiss = false;  // the item or its folder is missing in some state
};

// Looks up names and ids in a graph, and records what it visits.
class Walk {
 public:
  // REQUIRES: the graph outlives the walk and its outcomes.
  explicit Walk(const Graph& graph) : mGraph(graph) {}

  Outcome LookUp(Node folder, NameIndex name);
  Outcome LookUpHFS(Node folder, std::string_view hfsName);

  // Does not follow a link in the last component. Returns nothing for an empty path.
  Outcome At(std::span<const NameIndex> names);

  // Returns the folders that an item is or links to. Clears `always` when it may link to none.
  std::vector<Node> FoldersAt(const Outcome& outcome, bool& always);

  // Returns whether a link can lead somewhere, and whether it can lead nowhere.
  std::pair<bool, bool> Leads(const Entry& link);

  // In one state, an id that several folders share belongs to none of them.
  std::vector<Node> FoldersWithID(const Volume& volume, std::uint32_t id);
  std::uint32_t IDOf(Node folder) const;
  std::vector<Volume> VolumesOf(Node folder) const;

 protected:
  void Note(std::uint64_t what) { mTrace += std::to_string(what) + ' '; }

  static void Merge(const Outcome& more, Outcome& outcome);

  const Graph& mGraph;
  bool mMeetsOther = false;  // whether the root folder of the other volume was visited
  std::string mTrace;        // differs whenever a visited item differs

 private:
  Outcome TargetOf(const Entry& link);
  bool IsCoveredAlways() const;
};

}  // namespace tallowmere::soak
