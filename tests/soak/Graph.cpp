#include "Graph.h"

#include <algorithm>

namespace tallowmere::soak {

// --- Graphs -----------------------------------------------------------------------------------

Graph::Graph(const std::vector<const State*>& states) : mIsOfOneState(states.size() == 1) {
  for (const State* const state : states) {
    for (const Entry& entry : *state) Add(entry);
    if (std::find(mOthers.begin(), mOthers.end(), state->other) == mOthers.end()) {
      mOthers.push_back(state->other);
    }
    mMain = state->main;
  }
  if (mIsOfOneState) return;
  for (const Entry& entry : mEntries) {
    const bool isInAll = std::all_of(states.begin(), states.end(), [&](const State* state) {
      return state->Find(entry.folder, entry.name) != nullptr;
    });
    if (!isInAll) mMissing.insert({entry.folder, entry.name});
  }
}

void Graph::Add(const Entry& entry) {
  if (!mIsOfOneState && std::find(mEntries.begin(), mEntries.end(), entry) != mEntries.end())
    return;
  mEntries.push_back(entry);
}

std::vector<const Entry*> Graph::In(Node folder, NameIndex name) const {
  std::vector<const Entry*> found;
  for (const Entry& entry : mEntries) {
    if (entry.folder == folder && entry.name == name) found.push_back(&entry);
  }
  return found;
}

bool Graph::CanMiss(Node folder, NameIndex name) const {
  return mMissing.contains({folder, name}) || In(folder, name).empty();
}

// --- Walks ------------------------------------------------------------------------------------

Outcome Walk::LookUp(Node folder, NameIndex name) {
  Outcome outcome;
  outcome.canMiss = mGraph.CanMiss(folder, name);
  for (const Entry* const entry : mGraph.In(folder, name)) {
    Note(entry->node);
    if (!IsVolumePlace(*entry)) {
      outcome.items.push_back({entry->node, entry, false});
      continue;
    }
    for (const Volume& other : mGraph.Others()) {
      Note(other.root);
      const bool isMounted = other.root != kNoNode;
      mMeetsOther |= isMounted;
      outcome.items.push_back({isMounted ? other.root : entry->node, entry, isMounted});
    }
  }
  return outcome;
}

Outcome Walk::LookUpHFS(Node folder, std::string_view hfsName) {
  Outcome outcome;
  bool isKnown = false;
  for (NameIndex name = 0; name < kEndOfFiles; ++name) {
    if (hfsName != NameAt(name).hfsName) continue;
    outcome = LookUp(folder, name);
    isKnown = true;
  }
  if (isKnown) return outcome;
  outcome.canMiss = true;
  for (const Entry& entry : mGraph.Entries()) {
    if (entry.folder != folder || !HasShortForm(entry.name)) continue;
    if (ShortForm(entry) != hfsName) continue;
    Note(entry.node);
    outcome.items.push_back({entry.node, &entry, false});
    outcome.canMiss =
        mGraph.CanMiss(folder, entry.name) || mGraph.In(folder, entry.name).size() > 1;
  }
  return outcome;
}

std::vector<Node> Walk::FoldersAt(const Outcome& outcome, bool& always) {
  std::vector<Node> folders;
  if (outcome.canMiss) always = false;
  for (const Item& item : outcome.items) {
    if (item.entry->kind == Kind::kFolder) {
      folders.push_back(item.node);
    } else if (item.entry->kind == Kind::kFile) {
      always = false;
    } else {
      for (const Node node : FoldersAt(TargetOf(*item.entry), always)) folders.push_back(node);
    }
  }
  return folders;
}

Outcome Walk::TargetOf(const Entry& link) {
  Outcome target = LookUp(kMainRoot, link.target);
  if (link.innerTarget == kNoName) return target;
  Outcome inner;
  bool always = true;
  for (const Node folder : FoldersAt(target, always))
    Merge(LookUp(folder, link.innerTarget), inner);
  if (!always) inner.canMiss = true;
  return inner;
}

std::pair<bool, bool> Walk::Leads(const Entry& link) {
  std::pair<bool, bool> leads{false, false};
  const Outcome target = TargetOf(link);
  leads.second = target.canMiss;
  for (const Item& item : target.items) {
    const auto inner =
        item.entry->kind == Kind::kLink ? Leads(*item.entry) : std::pair<bool, bool>{true, false};
    leads.first |= inner.first;
    leads.second |= inner.second;
  }
  return leads;
}

void Walk::Merge(const Outcome& more, Outcome& outcome) {
  outcome.items.insert(outcome.items.end(), more.items.begin(), more.items.end());
  outcome.canMiss |= more.canMiss;
}

Outcome Walk::At(std::span<const NameIndex> names) {
  std::vector<Node> folders{kMainRoot};
  Outcome outcome;
  bool always = true;
  for (std::size_t i = 0; i < names.size(); ++i) {
    outcome = {};
    for (const Node folder : folders) Merge(LookUp(folder, names[i]), outcome);
    if (i + 1 == names.size()) break;
    folders = FoldersAt(outcome, always);
  }
  if (!always) outcome.canMiss = true;
  return outcome;
}

std::vector<Volume> Walk::VolumesOf(Node folder) const {
  if (folder == kMainRoot) return {mGraph.Main()};
  std::vector<Volume> volumes;
  for (const Volume& other : mGraph.Others()) {
    if (other.root == folder) volumes.push_back(other);
  }
  for (const Entry& entry : mGraph.Entries()) {
    if (entry.node != folder) continue;
    for (const Volume& volume : VolumesOf(entry.folder)) volumes.push_back(volume);
  }
  return volumes;
}

std::uint32_t Walk::IDOf(Node folder) const {
  if (folder == kMainRoot) return kRootID;
  for (const Volume& other : mGraph.Others()) {
    if (other.root == folder) return kRootID;
  }
  for (const Entry& entry : mGraph.Entries()) {
    if (entry.node == folder) return static_cast<std::uint32_t>(entry.inode);
  }
  return 0;
}

std::vector<Node> Walk::FoldersWithID(const Volume& volume, std::uint32_t id) {
  if (id == kRootID) return {volume.root};
  std::vector<Node> folders;
  for (const Entry& entry : mGraph.Entries()) {
    if (entry.kind != Kind::kFolder || entry.inode != id) continue;
    const auto volumes = VolumesOf(entry.folder);
    if (std::find(volumes.begin(), volumes.end(), volume) == volumes.end()) continue;
    if (IsVolumePlace(entry) && IsCoveredAlways()) continue;
    Note(entry.node);
    if (std::find(folders.begin(), folders.end(), entry.node) == folders.end()) {
      folders.push_back(entry.node);
    }
  }
  if (mGraph.IsOfOneState() && folders.size() > 1) return {};
  return folders;
}

bool Walk::IsCoveredAlways() const {
  return std::all_of(mGraph.Others().begin(), mGraph.Others().end(),
                     [](const Volume& other) { return other.root != kNoNode; });
}

}  // namespace tallowmere::soak
