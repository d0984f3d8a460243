#include "Model.h"

#include <algorithm>
#include <cstdio>

#include "support/EveryRequest.h"
#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

using namespace tallowmere::test;

constexpr std::uint32_t kRootID = 2;
constexpr std::uint32_t kParentOfRoots = 1;
constexpr std::size_t kLongestRecordName = 63;
constexpr std::size_t kLongestShortForm = 31;

constexpr int kNoItem = -43;
constexpr int kNoFolder = -120;
constexpr int kNoVolume = -35;
constexpr int kImpossibleName = -37;

#define LONG_STEM                                                      \
  "a track with a name of more than the sixty-three bytes that there " \
  "is room for"

constexpr std::array<Name, kEndOfFiles> kNames{{
    {"soak volume", "soak volume", "soak volume"},
    {"soak A", "soak A", "soak A"},
    {"soak B", "soak B", "soak B"},
    {"soak C", "soak C", "soak C"},
    {"soak D", "soak D", "soak D"},
    {"soak E", "soak E", "soak E"},
    {"soak F", "soak F", "soak F"},
    {"sub", "sub", "sub"},
    {"link", "link", "link"},
    {"track 1.aif", "track 1.aif", "track 1.aif"},
    {"track 2.aif", "track 2.aif", "track 2.aif"},
    {"caf\xC3\xA9", "caf\x8E", "caf\xC3\xA9"},
    {"the\xCC\x81", "th\x8E", "th\xC3\xA9"},
    {"1:2", "1/2", "1:2"},
    {LONG_STEM ".aif", LONG_STEM ".aif", LONG_STEM ".aif"},
}};

// --- Questions --------------------------------------------------------------------------------

std::string Hexadecimal(std::uint64_t number) {
  std::array<char, 20> text{};
  const int size =
      std::snprintf(text.data(), text.size(), "%llX", static_cast<unsigned long long>(number));
  return {text.data(), static_cast<std::size_t>(size)};
}

std::string ShortForm(const Entry& entry) {
  const std::string name = NameAt(entry.name).hfsName;
  const std::size_t dot = std::min(name.rfind('.'), name.size());
  const std::string tail = "#" + Hexadecimal(entry.inode) + name.substr(dot);
  return name.substr(0, std::min(dot, kLongestShortForm - tail.size())) + tail;
}

bool HasShortForm(NameIndex name) {
  return std::string_view(NameAt(name).hfsName).size() > kLongestRecordName;
}

// What a new item by an HFS name is called.
std::string NewName(std::string_view hfsName) {
  for (const Name& name : kNames) {
    if (name.hfsName == hfsName) return name.newName;
  }
  std::string name(hfsName);  // a short form, with the one accent that there is
  const std::size_t accented = name.find('\x8E');
  if (accented != std::string::npos) name.replace(accented, 1, "\xC3\xA9");
  return name;
}

bool IsVolumePlace(const Entry& entry) {
  return entry.folder == kMainRoot && entry.name == kVolumePlace;
}

std::string TextOfPath(const Path& path, const Place& place) {
  std::string text = place.path;
  for (std::size_t i = 0; i < path.count; ++i) {
    text.append("/").append(NameAt(path.names[i]).linuxName);
  }
  return text;
}

// The flag without a path: there is a name, and no folder.
const std::string kNoPathWithName = (Flag(1) + U16(0)).append(kTrailer);

std::string FullPathResponse(std::string path) {
  const std::string length = U16(static_cast<unsigned>(path.size()));
  path.resize(kRoomForAFullPath);
  return length + path.append(kTrailer);
}

NameIndex LastNameOf(const Path& path) {
  return path.names.at(path.count - 1);
}

// The name that the record of a new item has.
std::string NameOfNew(NameIndex name) {
  return std::string(NameAt(name).hfsName).substr(0, kLongestRecordName);
}

struct Item {
  Node node;
  const Entry* entry;
  bool isRoot;  // of the other volume
};

struct Outcome {
  std::vector<Item> items;
  bool canMiss = false;  // also where the folder is missing
};

class Evaluation {
 public:
  Evaluation(const Graph& graph, const Place& place, const Request& request)
      : mGraph(graph), mPlace(place), mRequest(request) {}

  Truth Run() {
    switch (mRequest.code) {
      case 1:
        FullPath();
        break;
      case 2:
        PathOfHFSPath();
        break;
      case 3:
        NumberOfVolume();
        break;
      case 4:
        NameOfVolume();
        break;
      case 5:
        HFSName();
        break;
      case 6:
        AddName();
        break;
      case 7:
        RecordOfItem();
        break;
      default:
        PathOfRecord();
        break;
    }
    return std::move(mTruth);
  }

 private:
  void Say(std::string response) { mTruth.responses.insert(std::move(response)); }
  void Note(std::uint64_t what) { mTruth.trace += std::to_string(what) + ' '; }

  // --- Items

  Outcome LookUp(Node folder, NameIndex name) {
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
        outcome.items.push_back({isMounted ? other.root : entry->node, entry, isMounted});
      }
    }
    return outcome;
  }

  Outcome LookUpHFS(Node folder, std::string_view hfsName) {
    Outcome outcome;
    bool isKnown = false;
    for (NameIndex name = 0; name < kEndOfFiles; ++name) {
      if (hfsName != kNames[name].hfsName) continue;
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

  // The folders that an item is or leads to. False in `always` when it can be none.
  std::vector<Node> FoldersAt(const Outcome& outcome, bool& always) {
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

  Outcome TargetOf(const Entry& link) {
    Outcome target = LookUp(kMainRoot, link.target);
    if (link.innerTarget == kNoName) return target;
    Outcome inner;
    bool always = true;
    for (const Node folder : FoldersAt(target, always))
      Merge(LookUp(folder, link.innerTarget), inner);
    if (!always) inner.canMiss = true;
    return inner;
  }

  // Whether a link can lead somewhere, and nowhere.
  std::pair<bool, bool> Leads(const Entry& link) {
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

  static void Merge(Outcome more, Outcome& outcome) {
    outcome.items.insert(outcome.items.end(), more.items.begin(), more.items.end());
    outcome.canMiss |= more.canMiss;
  }

  // A link in the last place is not followed. REQUIRES: the path has a name.
  Outcome At(const Path& path) {
    std::vector<Node> folders{kMainRoot};
    Outcome outcome;
    bool always = true;
    for (std::size_t i = 0; i < path.count; ++i) {
      outcome = {};
      for (const Node folder : folders) Merge(LookUp(folder, path.names[i]), outcome);
      if (i + 1 == path.count) break;
      folders = FoldersAt(outcome, always);
    }
    if (!always) outcome.canMiss = true;
    return outcome;
  }

  // --- Places

  struct FolderPlace {
    std::string path;
    std::string hfsPath;
  };

  // A folder is at several only when it was moved.
  std::vector<FolderPlace> PlacesOf(Node folder, int depth = 0) {
    if (folder == kMainRoot) return {{mPlace.path, mPlace.name + ":"}};
    std::vector<FolderPlace> places;
    bool isUncovered = false;
    for (const Volume& other : mGraph.Others()) {
      isUncovered |= other.root == kNoNode;
      if (folder != other.root) continue;
      const Name& name = NameAt(kVolumePlace);
      places.push_back({mPlace.path + "/" + name.linuxName, std::string(name.hfsName) + ":"});
    }
    if (depth > 4) return places;
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node != folder || (IsVolumePlace(entry) && !isUncovered)) continue;
      for (const FolderPlace& above : PlacesOf(entry.folder, depth + 1)) {
        const Name& name = NameAt(entry.name);
        places.push_back({above.path + "/" + name.linuxName, above.hfsPath + name.hfsName + ":"});
        mTruth.trace += places.back().path;
      }
    }
    return places;
  }

  std::vector<std::string> PathsOf(const Item& item) {
    std::vector<std::string> paths;
    for (const Entry* const entry : EntriesOf(item)) {
      for (const FolderPlace& folder : PlacesOf(entry->folder)) {
        paths.push_back(folder.path + "/" + NameAt(entry->name).linuxName);
      }
    }
    return paths;
  }

  // The names under which an item may be told: in one state the one by which it was reached.
  std::vector<const Entry*> EntriesOf(const Item& item) const {
    if (mGraph.IsOfOneState() || item.isRoot) return {item.entry};
    std::vector<const Entry*> entries;
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node == item.node) entries.push_back(&entry);
    }
    return entries;
  }

  std::vector<Volume> VolumesOf(Node folder, int depth = 0) const {
    if (folder == kMainRoot) return {mGraph.Main()};
    std::vector<Volume> volumes;
    for (const Volume& other : mGraph.Others()) {
      if (other.root == folder) volumes.push_back(other);
    }
    if (depth > 4) return volumes;
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node != folder) continue;
      for (const Volume& volume : VolumesOf(entry.folder, depth + 1)) volumes.push_back(volume);
    }
    return volumes;
  }

  std::string VolumeName(const Volume& volume) const {
    return volume.root == kMainRoot ? mPlace.name : NameAt(kVolumePlace).hfsName;
  }

  std::uint32_t IDOf(Node folder) const {
    if (folder == kMainRoot) return kRootID;
    for (const Volume& other : mGraph.Others()) {
      if (other.root == folder) return kRootID;
    }
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node == folder) return static_cast<std::uint32_t>(entry.inode);
    }
    return 0;
  }

  // --- Answers that lead nowhere

  // Names that an item can have been given, whatever it is called at last.
  std::set<std::string> NamesGiven(const std::vector<Item>& items) const {
    std::set<std::string> names;
    for (const Item& item : items) {
      for (const Entry* const entry : EntriesOf(item)) {
        names.insert(RecordName(*entry));
        names.insert(ShortForm(*entry));
      }
    }
    return names;
  }

  bool IsNamed(Node folder, std::string_view hfsName) const {
    return std::any_of(mGraph.Entries().begin(), mGraph.Entries().end(), [&](const Entry& entry) {
      return entry.folder == folder &&
             (hfsName == NameAt(entry.name).hfsName || hfsName == RecordName(entry));
    });
  }

  // The records of the items in those folders that have no such items.
  void NoteRecordsOfNothing(const Outcome& outcome, std::vector<Node> folders) {
    if (mGraph.IsOfOneState()) return;
    for (const Item& item : outcome.items) {
      for (const Entry* const entry : EntriesOf(item)) folders.push_back(entry->folder);
    }
    for (const std::string& name : NamesGiven(outcome.items)) {
      for (const Node folder : folders) {
        if (IsNamed(folder, name)) continue;
        mTruth.nowhere.insert(NameResponse(1, name));
        for (const Volume& volume : VolumesOf(folder)) {
          const auto id = static_cast<std::int32_t>(IDOf(folder));
          mTruth.nowhere.insert(RecordResponse(1, Record(volume.number, id, name)));
        }
      }
    }
  }

  bool IsAskedFor(NameIndex name) const {
    return mRequest.code == 2 ? name == LastNameOf(mRequest.path)
                              : mRequest.hfsName == NameAt(name).hfsName;
  }

  // The paths of new items in the folder, called like those that are or were there.
  void NotePathsOfNothing(Node folder, const Outcome& outcome) {
    if (mGraph.IsOfOneState()) return;
    auto names = NamesGiven(outcome.items);
    for (const Entry& entry : mGraph.Entries()) {
      if (!IsAskedFor(entry.name)) continue;
      names.insert(RecordName(entry));
      names.insert(ShortForm(entry));
    }
    names.insert(mRequest.code == 2 ? NameAt(LastNameOf(mRequest.path)).hfsName : mRequest.hfsName);
    for (const std::string& name : names) {
      const std::string newName = NewName(name);
      const bool isThere =
          std::any_of(mGraph.Entries().begin(), mGraph.Entries().end(), [&](const Entry& entry) {
            return entry.folder == folder && newName == NameAt(entry.name).linuxName;
          });
      const std::string asAsked = TextOfPath(mRequest.path, mPlace) + "/" + newName;
      // The item itself, by the path that was given: the folder could not be told at one step.
      if (isThere && mRequest.code == 6 && name == mRequest.hfsName) {
        mTruth.responses.insert(PathResponse(asAsked));
      }
      if (isThere) continue;
      for (const FolderPlace& place : PlacesOf(folder)) {
        const std::string path = place.path + "/" + newName;
        mTruth.nowhere.insert(mRequest.code == 2 ? ResultResponse(0, path) : PathResponse(path));
      }
      if (mRequest.code == 6) mTruth.nowhere.insert(PathResponse(asAsked));
    }
  }

  std::vector<Node> FoldersAbove(const Path& path) {
    if (path.count == 1) return {kMainRoot};
    bool always = true;
    return FoldersAt(At(path.Parent()), always);
  }

  // --- Requests

  struct Named {
    std::string record;
    std::string name;
  };

  std::vector<Named> RecordsOf(const Item& item) {
    std::vector<Named> records;
    if (item.isRoot) {
      const std::string name = NameAt(kVolumePlace).hfsName;
      for (const Volume& other : mGraph.Others()) {
        if (other.root == item.node)
          records.push_back({Record(other.number, kParentOfRoots, name), name});
      }
      return records;
    }
    for (const Entry* const entry : EntriesOf(item)) {
      const std::string name = RecordName(*entry);
      for (const Volume& volume : VolumesOf(entry->folder)) {
        records.push_back(
            {Record(volume.number, static_cast<std::int32_t>(IDOf(entry->folder)), name), name});
      }
    }
    return records;
  }

  void RecordOfItem() {
    const Outcome outcome = At(mRequest.path);
    NoteRecordsOfNothing(outcome, FoldersAbove(mRequest.path));
    for (const Item& item : outcome.items) {
      for (const Named& named : RecordsOf(item)) Say(RecordResponse(1, named.record));
    }
    if (!outcome.canMiss) return;
    const std::string name = NameOfNew(LastNameOf(mRequest.path));
    const Path parent = mRequest.path.Parent();
    if (parent.count == 0)
      return Say(RecordResponse(1, Record(mGraph.Main().number, kRootID, name)));
    const Outcome above = At(parent);
    if (above.canMiss) Say(RecordResponse(0, Record(kUnknownVolume, -1, name)));
    for (const Item& item : above.items) {
      const Node volumeOf = item.isRoot ? item.node : item.entry->folder;
      const std::uint32_t id =
          item.isRoot ? kRootID : static_cast<std::uint32_t>(item.entry->inode);
      for (const Volume& volume : VolumesOf(volumeOf)) {
        Say(RecordResponse(1, Record(volume.number, static_cast<std::int32_t>(id), name)));
      }
    }
  }

  void HFSName() {
    const Outcome outcome = At(mRequest.path);
    NoteRecordsOfNothing(outcome, FoldersAbove(mRequest.path));
    if (outcome.canMiss) Say(kNoVolumeNameResponse);
    for (const Item& item : outcome.items) {
      auto leads = std::pair<bool, bool>{true, false};
      if (item.entry->kind == Kind::kLink) leads = Leads(*item.entry);
      if (leads.second) Say(kNoVolumeNameResponse);
      if (!leads.first) continue;
      for (const Named& named : RecordsOf(item)) Say(NameResponse(1, named.name));
    }
  }

  void SayFullPath(const std::string& path) { Say(FullPathResponse(path)); }
  void SayFolder(Node folder) {
    for (const FolderPlace& place : PlacesOf(folder)) {
      SayFullPath(place.hfsPath);
      NoteCutPaths(place.hfsPath);
    }
  }

  // The climb from a folder ends at one that is being moved, and what is above that is left out.
  void NoteCutPaths(const std::string& hfsPath) {
    if (mGraph.IsOfOneState()) return;
    const std::size_t volumeEnd = hfsPath.find(':') + 1;
    for (std::size_t at = hfsPath.find(':', volumeEnd); at < hfsPath.size() - 1;
         at = hfsPath.find(':', at + 1)) {
      const std::string rest = hfsPath.substr(at + 1);
      if (IsNamed(kMainRoot, rest.substr(0, rest.find(':')))) continue;
      mTruth.nowhere.insert(FullPathResponse(hfsPath.substr(0, volumeEnd) + rest));
    }
  }

  void FullPath() {
    const Outcome outcome = At(mRequest.path);
    bool canBeNoFolder = outcome.canMiss;
    for (const Item& item : outcome.items) {
      if (item.entry->kind == Kind::kFolder) {
        SayFolder(item.node);
      } else {
        canBeNoFolder = true;
      }
    }
    if (!canBeNoFolder) return;
    const Path parent = mRequest.path.Parent();
    if (parent.count == 0) return SayFolder(kMainRoot);
    const Outcome above = At(parent);
    bool isAlwaysFolder = !above.canMiss;
    for (const Item& item : above.items) {
      if (item.entry->kind == Kind::kFolder) {
        SayFolder(item.node);
      } else {
        isAlwaysFolder = false;
      }
    }
    if (!isAlwaysFolder) NearestVolume(outcome);
  }

  void NearestVolume(const Outcome& outcome) {
    for (const Item& item : outcome.items) {
      for (const Volume& volume : VolumesOf(item.entry->folder))
        SayFullPath(VolumeName(volume) + ":");
    }
    if (!outcome.canMiss) return;
    for (const Volume& other : mGraph.Others()) {
      const bool isBelow = mRequest.path.names[0] == kVolumePlace && other.root != kNoNode;
      SayFullPath(VolumeName(isBelow ? other : mGraph.Main()) + ":");
    }
  }

  void PathOfHFSPath() {
    const Path& path = mRequest.path;
    std::vector<Node> folders{kMainRoot};
    std::size_t i = 0;
    if (mRequest.byOther) {
      folders.clear();
      for (const Volume& other : mGraph.Others()) {
        Note(other.root);
        if (other.root == kNoNode) {
          Say(ResultResponse(kNoVolume));
        } else {
          folders.push_back(other.root);
        }
      }
      i = 1;
    }
    bool always = true;
    for (; i + 1 < path.count; ++i) {
      Outcome outcome;
      for (const Node folder : folders) Merge(LookUp(folder, path.names[i]), outcome);
      folders = FoldersAt(outcome, always);
    }
    if (!always) Say(ResultResponse(kNoFolder));
    for (const Node folder : folders) {
      const Outcome outcome = LookUp(folder, path.names[i]);
      NotePathsOfNothing(folder, outcome);
      if (outcome.canMiss)
        Say(ResultResponse(HasShortForm(path.names[i]) ? kImpossibleName : kNoItem));
      for (const Item& item : outcome.items) {
        for (const std::string& found : PathsOf(item)) Say(ResultResponse(0, found));
      }
    }
  }

  void NumberOfVolume() {
    for (const Volume& other : mGraph.Others()) {
      Say(VolumeNumberResponse(other.root == kNoNode ? kUnknownVolume : other.number));
    }
  }

  void NameOfVolume() {
    if (mRequest.volume == mGraph.Main().number) Say(VolumeNameResponse(mPlace.name));
    for (const Volume& other : mGraph.Others()) {
      if (mRequest.volume == mGraph.Main().number) continue;
      const bool isIt = other.root != kNoNode && other.number == mRequest.volume;
      Say(isIt ? VolumeNameResponse(NameAt(kVolumePlace).hfsName) : kNoVolumeNameResponse);
    }
  }

  void AddName() {
    const std::string path = TextOfPath(mRequest.path, mPlace);
    const Outcome outcome = At(mRequest.path);
    bool canBeNoFolder = outcome.canMiss;
    for (const Item& folder : outcome.items) {
      if (folder.entry->kind != Kind::kFolder) {
        canBeNoFolder = true;
        continue;
      }
      const Outcome inside = LookUpHFS(folder.node, mRequest.hfsName);
      NotePathsOfNothing(folder.node, inside);
      if (inside.canMiss) Say(PathResponse(path + "/" + NewName(mRequest.hfsName)));
      for (const Item& item : inside.items) {
        for (const std::string& found : PathsOf(item)) Say(PathResponse(found));
      }
    }
    if (!canBeNoFolder) return;
    if (!mGraph.IsOfOneState()) {
      mTruth.nowhere.insert(PathResponse(path + "/" + NewName(mRequest.hfsName)));
    }
    const bool isUTF8 = mRequest.hfsName.find('\x8E') == std::string::npos;
    Say(isUTF8 ? PathResponse(path + "/" + mRequest.hfsName)
               : (Flag(0) + CString(path)).append(kTrailer));
  }

  std::vector<Volume> VolumesWithNumber() {
    std::vector<Volume> volumes;
    if (mRequest.volume == mGraph.Main().number) return {mGraph.Main()};
    for (const Volume& other : mGraph.Others()) {
      Note(other.root);
      if (other.root != kNoNode && other.number == mRequest.volume) volumes.push_back(other);
    }
    return volumes;
  }

  std::vector<Node> FoldersWithID(const Volume& volume, std::uint32_t id) {
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
    return folders;
  }

  bool IsCoveredAlways() const {
    return std::all_of(mGraph.Others().begin(), mGraph.Others().end(),
                       [](const Volume& other) { return other.root != kNoNode; });
  }

  // Whether the item was found for certain on the volume.
  bool SayItemsOn(const Volume& volume) {
    if (mRequest.folder == kParentOfRoots) {
      SayRoot(volume);
      return mRequest.hfsName == VolumeName(volume);
    }
    bool always = false;
    for (const Node folder : FoldersWithID(volume, mRequest.folder)) {
      const Outcome outcome = LookUpHFS(folder, mRequest.hfsName);
      NotePathsOfNothing(folder, outcome);
      always = !outcome.canMiss;
      for (const Item& item : outcome.items) {
        for (const std::string& path : PathsOf(item)) Say(PathResponse(path));
      }
    }
    return always && mGraph.IsOfOneState();
  }

  void SayMissing(const Volume& volume) {
    const bool searches = mRequest.code == 8 || mRequest.search;
    bool isElsewhere = false;
    if (searches && volume.root != kMainRoot) isElsewhere |= SayItemsOn(mGraph.Main());
    for (const Volume& other : mGraph.Others()) {
      if (searches && other.root != kNoNode && other.root != volume.root) {
        isElsewhere |= SayItemsOn(other);
      }
    }
    if (isElsewhere) return;
    const auto folders =
        volume.root == kNoNode ? std::vector<Node>{} : FoldersWithID(volume, mRequest.folder);
    for (const Node folder : folders) {
      for (const FolderPlace& place : PlacesOf(folder)) {
        Say(PathResponse(place.path + "/" + NewName(mRequest.hfsName)));
      }
    }
    if (folders.empty() || !mGraph.IsOfOneState()) Say(kNoPathWithName);
  }

  void PathOfRecord() {
    const auto volumes = VolumesWithNumber();
    const bool isWhole = mRequest.hfsName.size() <= kLongestRecordName;
    if (volumes.empty() || !mGraph.IsOfOneState()) {
      if (mRequest.code == 8) Say(kNoPathResponse);
      if (mRequest.code == 9) SayMissing({kNoNode, mRequest.volume});
    }
    for (const Volume& volume : volumes) {
      if (!SayItemsOn(volume)) {
        const bool hasFolder = !FoldersWithID(volume, mRequest.folder).empty();
        if (mRequest.code == 8 && (!hasFolder || !isWhole || !mGraph.IsOfOneState())) {
          Say(kNoPathResponse);
        }
        if (mRequest.code == 9 || (hasFolder && isWhole)) SayMissing(volume);
      }
    }
  }

  void SayRoot(const Volume& volume) {
    Note(volume.root);
    if (mRequest.hfsName != VolumeName(volume)) return;
    for (const FolderPlace& place : PlacesOf(volume.root)) Say(PathResponse(place.path));
  }

  const Graph& mGraph;
  const Place& mPlace;
  const Request& mRequest;
  Truth mTruth;
};

}  // namespace

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

// --- The model --------------------------------------------------------------------------------

const Name& NameAt(NameIndex index) {
  return kNames.at(index);
}

const Entry* State::Find(Node folder, NameIndex name) const {
  const Entry* const found = std::find_if(begin(), end(), [&](const Entry& entry) {
    return entry.folder == folder && entry.name == name;
  });
  return found == end() ? nullptr : found;
}

Path Path::Parent() const {
  Path parent = *this;
  parent.names[--parent.count] = 0;
  return parent;
}

std::string RecordName(const Entry& entry) {
  return HasShortForm(entry.name) ? ShortForm(entry) : NameAt(entry.name).hfsName;
}

Truth Answers(const Graph& graph, const Place& place, const Request& request) {
  return Evaluation(graph, place, request).Run();
}

std::set<std::string> HonestErrors(const Place& place, const Request& request) {
  switch (request.code) {
    case 1:
      return {FullPathResponse(":"), FullPathResponse(place.name + ":"),
              FullPathResponse(std::string(NameAt(kVolumePlace).hfsName) + ":")};
    case 2:
      return {ResultResponse(kNoItem), ResultResponse(kNoFolder), ResultResponse(kNoVolume),
              ResultResponse(kImpossibleName), ResultResponse(0)};
    case 5:
      return {kNoVolumeNameResponse, NameResponse(1, NameOfNew(LastNameOf(request.path)))};
    case 6:
      return {kNoPathResponse, kNoPathWithName};
    case 7: {
      const std::string name = NameOfNew(LastNameOf(request.path));
      return {RecordResponse(0, kEmptyRecord), RecordResponse(0, Record(kUnknownVolume, -1, name))};
    }
    case 8:
    case 9:
      return {kNoPathResponse, kNoPathWithName};
    default:
      return {};
  }
}

std::string BytesOf(const Request& request, const Place& place) {
  const std::string path = TextOfPath(request.path, place);
  switch (request.code) {
    case 1:
      return FullPathRequest(path, kRoomForAFullPath, 1);
    case 2: {
      std::string folder = request.byOther ? "" : place.name + ":";
      std::size_t i = 0;
      for (; i + 1 < request.path.count; ++i)
        folder += std::string(NameAt(request.path.names[i]).hfsName) + ":";
      return PathOfHFSPathRequest(folder + '\0',
                                  std::string(NameAt(request.path.names[i]).hfsName) + '\0', 0);
    }
    case 3:
      return VolumeNumberRequest(NameAt(kVolumePlace).hfsName);
    case 4:
      return VolumeNameRequest(request.volume);
    case 5:
      return HFSNameRequest(path, kRoomForAName);
    case 6:
      return AddNameRequest(path, request.hfsName, 0);
    case 7:
      return RecordRequest(path);
    case 8:
      return PathOfPartsRequest(request.volume, static_cast<std::int32_t>(request.folder),
                                request.hfsName, 0);
    case 9:
      return PathOfRecordRequest(
          Record(request.volume, static_cast<std::int32_t>(request.folder), request.hfsName),
          request.search, 0);
    default:
      return ExportSettingsRequest(kRateOfACD, 16, 2, "twos");
  }
}

std::string TextOf(const Request& request, const Place& place) {
  std::string text = "code " + std::to_string(request.code) + " path";
  for (std::size_t i = 0; i < request.path.count; ++i)
    text += "/" + std::string(NameAt(request.path.names[i]).linuxName);
  text += " volume " + std::to_string(request.volume) + " folder " +
          std::to_string(request.folder) + " name '" + request.hfsName + "'" +
          (request.search ? " search" : "") +
          (request.byOther ? " by the other volume's name" : "");
  static_cast<void>(place);
  return text;
}

std::string TextOf(const Entry& entry) {
  static constexpr std::array<const char*, 3> kKinds{"folder", "file", "link"};
  std::string text = "in " + std::to_string(entry.folder) + " '" + NameAt(entry.name).linuxName +
                     "' " + kKinds.at(static_cast<std::size_t>(entry.kind)) + " " +
                     std::to_string(entry.node) + " inode " + std::to_string(entry.inode);
  if (entry.kind != Kind::kLink) return text;
  text += std::string(" to ") + NameAt(entry.target).linuxName;
  if (entry.innerTarget != kNoName) text += std::string("/") + NameAt(entry.innerTarget).linuxName;
  return text;
}

std::string TextOf(const Volume& volume) {
  return "root " + std::to_string(volume.root) + ", number " + std::to_string(volume.number);
}

}  // namespace tallowmere::soak
