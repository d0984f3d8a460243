#include "Answers.h"

#include <algorithm>
#include <string_view>
#include <utility>
#include <vector>

#include "support/EveryRequest.h"
#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

using namespace tallowmere::test;

// Returns the name in a new item's record.
std::string NameOfNew(NameIndex name) {
  return std::string(NameAt(name).hfsName).substr(0, kLongestRecordName);
}

class Evaluation : private Walk {
 public:
  Evaluation(const Graph& graph, const Place& place, const Request& request)
      : Walk(graph), mPlace(place), mRequest(request) {}

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
    if (!mGraph.IsOfOneState()) mTruth.honestErrors = HonestErrors();
    mTruth.trace = std::move(mTrace);
    return std::move(mTruth);
  }

 private:
  void Say(std::string response) { mTruth.responses.insert(std::move(response)); }

  // --- Places

  struct FolderPlace {
    std::string path;
    std::string hfsPath;
  };

  // A folder is in more than one place only when it was moved.
  std::vector<FolderPlace> PlacesOf(Node folder) {
    if (folder == kMainRoot) return {{mPlace.path, mPlace.name + ":"}};
    std::vector<FolderPlace> places;
    bool isUncovered = false;
    for (const Volume& other : mGraph.Others()) {
      isUncovered |= other.root == kNoNode;
      if (folder != other.root) continue;
      const Name& name = NameAt(kVolumePlace);
      places.push_back({mPlace.path + "/" + name.linuxName, std::string(name.hfsName) + ":"});
    }
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node != folder || (IsVolumePlace(entry) && !isUncovered)) continue;
      for (const FolderPlace& above : PlacesOf(entry.folder)) {
        const Name& name = NameAt(entry.name);
        places.push_back({above.path + "/" + name.linuxName, above.hfsPath + name.hfsName + ":"});
        mTrace += places.back().path;
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

  // Returns the names that an answer may use for an item. In one state, that is the name by which
  // it was reached.
  std::vector<const Entry*> EntriesOf(const Item& item) const {
    if (mGraph.IsOfOneState() || item.isRoot) return {item.entry};
    std::vector<const Entry*> entries;
    for (const Entry& entry : mGraph.Entries()) {
      if (entry.node == item.node) entries.push_back(&entry);
    }
    return entries;
  }

  // --- Answers that lead nowhere

  // Returns names that an item may have been given, whatever its current name is.
  std::set<std::string> NamesGiven(const std::vector<Item>& items) const {
    std::set<std::string> names;
    for (const Item& item : items) {
      for (const Entry* const entry : EntriesOf(item)) {
        names.insert(RecordName(*entry));
        for (std::size_t marks = 1; marks <= kMostMarks; ++marks) {
          names.insert(ShortForm(*entry, marks));
        }
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

  void NoteRecordsByMadeUpID(const std::set<std::string>& names) {
    std::vector<Volume> volumes{mGraph.Main()};
    for (const Volume& other : mGraph.Others()) {
      if (other.root != kNoNode) volumes.push_back(other);
    }
    for (const std::string& name : names) {
      for (const Volume& volume : volumes)
        mTruth.byMadeUpID.insert(RecordResponse(1, Record(volume.number, 0, name)));
    }
  }

  // Notes records with the items' names in folders that have no such item.
  void NoteRecordsOfNothing(const Outcome& outcome, std::vector<Node> folders) {
    if (mGraph.IsOfOneState()) return;
    for (const Item& item : outcome.items) {
      for (const Entry* const entry : EntriesOf(item)) folders.push_back(entry->folder);
    }
    const auto names = NamesGiven(outcome.items);
    NoteRecordsByMadeUpID(names);
    // An item that was missing at first is reported as a new one with the requested name.
    if (outcome.canMiss) NoteRecordsByMadeUpID({NameOfNew(mRequest.path.Last())});
    for (const std::string& name : names) {
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
    return mRequest.code == 2 ? name == mRequest.path.Last()
                              : mRequest.hfsName == NameAt(name).hfsName;
  }

  // Notes paths of new items in the folder, with names of items that are or were in it.
  void NotePathsOfNothing(Node folder, const Outcome& outcome) {
    if (mGraph.IsOfOneState()) return;
    auto names = NamesGiven(outcome.items);
    for (const Entry& entry : mGraph.Entries()) {
      if (!IsAskedFor(entry.name)) continue;
      names.insert(RecordName(entry));
      names.insert(ShortForm(entry));
    }
    names.insert(mRequest.code == 2 ? NameAt(mRequest.path.Last()).hfsName : mRequest.hfsName);
    for (const std::string& name : names) {
      const std::string newName = NewName(name);
      const bool isThere =
          std::any_of(mGraph.Entries().begin(), mGraph.Entries().end(), [&](const Entry& entry) {
            return entry.folder == folder && newName == NameAt(entry.name).linuxName;
          });
      const std::string asAsked = TextOf(mRequest.path, mPlace) + "/" + newName;
      // The item itself, by the requested path: at one step the folder could not be identified.
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
    return FoldersAt(At(path.Parent().Names()), always);
  }

  // --- Full paths

  std::string FullPathResponse(const std::string& path) const {
    std::string text = mRequest.room == 0 ? "" : Shortened(path);
    text.resize(mRequest.room);
    return U16(static_cast<unsigned>(path.size())) + text.append(kTrailer);
  }

  // Omitting the outermost folder makes every path of this tree fit.
  std::string Shortened(const std::string& path) const {
    const std::size_t volumeEnd = path.find(':');
    if (!mRequest.flag) return path.substr(0, volumeEnd);
    if (path.size() < mRequest.room) return path;
    const std::size_t folderEnd = path.find(':', volumeEnd + 1);
    return path.substr(0, volumeEnd + 1).append(kAnyFolders).append(path, folderEnd);
  }

  // --- Errors

  // Returns whether the path leads onto the other volume, which was mounted or unmounted meanwhile.
  bool CanLoseVolume() const { return mMeetsOther && mGraph.Others().size() > 1; }

  std::set<std::string> HonestErrors() const {
    const std::string nameOfNew = NameOfNew(mRequest.path.count == 0 ? 0 : mRequest.path.Last());
    std::set<std::string> errors;
    switch (mRequest.code) {
      case 1:
        // A lone colon means no volume and no folder: the item vanished before its volume was
        // looked up.
        errors = {FullPathResponse(":"), FullPathResponse(mPlace.name + ":")};
        if (mMeetsOther)
          errors.insert(FullPathResponse(std::string(NameAt(kVolumePlace).hfsName) + ":"));
        return errors;
      case 2:
        // The result of the look-up. When the item vanished before its path was looked up, result 0
        // comes without a path.
        return {ResultResponse(0), ResultResponse(kResultNoItem), ResultResponse(kResultNoFolder),
                ResultResponse(kResultNoVolume), ResultResponse(kResultImpossibleName)};
      case 5:
        return {kNoVolumeNameResponse, NameResponse(1, nameOfNew)};
      case 7:
        return {RecordResponse(0, kEmptyRecord),
                RecordResponse(0, Record(kUnknownVolume, -1, nameOfNew))};
      case 6:
      case 8:
      case 9:
        return {kNoPathResponse, kNoItemResponse};
      default:
        return errors;
    }
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
    const Outcome outcome = At(mRequest.path.Names());
    NoteRecordsOfNothing(outcome, FoldersAbove(mRequest.path));
    for (const Item& item : outcome.items) {
      for (const Named& named : RecordsOf(item)) Say(RecordResponse(1, named.record));
    }
    if (!outcome.canMiss) return;
    const std::string name = NameOfNew(mRequest.path.Last());
    const Path parent = mRequest.path.Parent();
    if (parent.count == 0)
      return Say(RecordResponse(1, Record(mGraph.Main().number, kRootID, name)));
    const Outcome above = At(parent.Names());
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
    const Outcome outcome = At(mRequest.path.Names());
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

  // Notes shorter paths: the climb from a folder ends at one that is being moved, which omits the
  // folders above it; a volume that is unmounted before its name is looked up has no name.
  void NoteCutPaths(const std::string& hfsPath) {
    if (mGraph.IsOfOneState()) return;
    const std::size_t volumeEnd = hfsPath.find(':') + 1;
    if (CanLoseVolume()) mTruth.nowhere.insert(FullPathResponse(hfsPath.substr(volumeEnd - 1)));
    for (std::size_t at = hfsPath.find(':', volumeEnd); at < hfsPath.size() - 1;
         at = hfsPath.find(':', at + 1)) {
      mTruth.nowhere.insert(
          FullPathResponse(hfsPath.substr(0, volumeEnd) + hfsPath.substr(at + 1)));
    }
  }

  void FullPath() {
    const Outcome outcome = At(mRequest.path.Names());
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
    const Outcome above = At(parent.Names());
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
        SayFullPath(VolumeName(volume, mPlace) + ":");
    }
    if (!outcome.canMiss) return;
    for (const Volume& other : mGraph.Others()) {
      const bool isBelow = mRequest.path.names[0] == kVolumePlace && other.root != kNoNode;
      SayFullPath(VolumeName(isBelow ? other : mGraph.Main(), mPlace) + ":");
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
          Say(ResultResponse(kResultNoVolume));
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
    if (!always) Say(ResultResponse(kResultNoFolder));
    for (const Node folder : folders) {
      const Outcome outcome = LookUp(folder, path.names[i]);
      NotePathsOfNothing(folder, outcome);
      if (outcome.canMiss)
        Say(ResultResponse(HasShortForm(path.names[i]) ? kResultImpossibleName : kResultNoItem));
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
    const std::string path = TextOf(mRequest.path, mPlace);
    const Outcome outcome = At(mRequest.path.Names());
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

  // Returns whether the item was certainly found on the volume.
  bool SayItemsOn(const Volume& volume) {
    if (mRequest.folder == kParentOfRoots) {
      SayRoot(volume);
      return mRequest.hfsName == VolumeName(volume, mPlace);
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
    if (folders.empty() || !mGraph.IsOfOneState()) Say(kNoItemResponse);
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
    if (mRequest.hfsName != VolumeName(volume, mPlace)) return;
    for (const FolderPlace& place : PlacesOf(volume.root)) Say(PathResponse(place.path));
  }

  const Place& mPlace;
  const Request& mRequest;
  Truth mTruth;
};

}  // namespace

Truth Answers(const Graph& graph, const Place& place, const Request& request) {
  return Evaluation(graph, place, request).Run();
}

}  // namespace tallowmere::soak
