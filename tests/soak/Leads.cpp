#include "Leads.h"

#include <cstring>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "support/Wire.h"

namespace tallowmere::soak {
namespace {

using namespace tallowmere::test;

std::vector<std::string_view> Split(std::string_view text, char separator) {
  std::vector<std::string_view> parts;
  for (std::size_t end = 0; (end = text.find(separator)) != std::string_view::npos;) {
    parts.push_back(text.substr(0, end));
    text.remove_prefix(end + 1);
  }
  parts.push_back(text);
  return parts;
}

std::optional<NameIndex> IndexOf(std::string_view linuxName) {
  for (NameIndex name = 0; name < kEndOfFiles; ++name) {
    if (linuxName == NameAt(name).linuxName) return name;
  }
  return std::nullopt;
}

// Returns 0 when the bytes are too few.
template <class Integer>
Integer ReadAt(std::string_view bytes, std::size_t offset) {
  Integer value = 0;
  if (offset + sizeof value <= bytes.size())
    std::memcpy(&value, bytes.data() + offset, sizeof value);
  return value;
}

std::string_view TextAt(std::string_view bytes, std::size_t offset) {
  if (offset >= bytes.size()) return {};
  bytes.remove_prefix(offset);
  return bytes.substr(0, bytes.find('\0'));
}

class Resolution : private Walk {
 public:
  Resolution(const Graph& graph, const Place& place) : Walk(graph), mPlace(place) {}

  std::set<Node> OfPath(std::string_view path) {
    if (path == mPlace.path) return {kMainRoot};
    if (!path.starts_with(mPlace.path + "/")) return {};
    std::vector<NameIndex> names;
    for (const std::string_view part : Split(path.substr(mPlace.path.size()), '/')) {
      if (part.empty()) continue;
      const auto name = IndexOf(part);
      if (!name) return {};
      names.push_back(*name);
    }
    return NodesOf(At(names));
  }

  std::set<Node> OfRecord(int number, std::uint32_t id, std::string_view name) {
    std::set<Node> nodes;
    for (const Volume& volume : MountedVolumes()) {
      if (volume.number != number) continue;
      if (id == kParentOfRoots && name == VolumeName(volume, mPlace)) nodes.insert(volume.root);
      for (const Node folder : FoldersWithID(volume, id))
        nodes.merge(NodesOf(LookUpHFS(folder, name)));
    }
    return nodes;
  }

  std::set<Node> OfFullPath(std::string_view fullPath) {
    auto names = Split(fullPath, ':');
    if (!names.back().empty()) return {};  // no trailing colon
    names.pop_back();
    std::vector<Node> folders;
    for (const Volume& volume : MountedVolumes()) {
      if (!names.empty() && names.front() == VolumeName(volume, mPlace))
        folders.push_back(volume.root);
    }
    for (std::size_t i = 1; i < names.size(); ++i) folders = FoldersIn(folders, names[i]);
    return {folders.begin(), folders.end()};
  }

 private:
  std::vector<Node> FoldersIn(const std::vector<Node>& folders, std::string_view hfsName) {
    Outcome inside;
    for (const Node folder : folders) {
      for (NameIndex name = 0; name < kEndOfFiles; ++name) {
        if (hfsName == kAnyFolders || hfsName == NameAt(name).hfsName)
          Merge(LookUp(folder, name), inside);
      }
    }
    bool always = true;
    return FoldersAt(inside, always);
  }

  std::vector<Volume> MountedVolumes() const {
    std::vector<Volume> volumes{mGraph.Main()};
    for (const Volume& other : mGraph.Others()) {
      if (other.root != kNoNode) volumes.push_back(other);
    }
    return volumes;
  }

  static std::set<Node> NodesOf(const Outcome& outcome) {
    std::set<Node> nodes;
    for (const Item& item : outcome.items) nodes.insert(item.node);
    return nodes;
  }

  const Place& mPlace;
};

// Looks up each name in the state in which the previous one was looked up, or in a later one.
void Follow(std::span<const State* const> states, Node folder, const std::vector<NameIndex>& names,
            std::set<Node>& reached) {
  if (names.empty()) {
    reached.insert(folder);
    return;
  }
  for (; !states.empty(); states = states.subspan(1)) {
    const State& state = *states.front();
    const Entry* const entry = state.Find(folder, names.front());
    if (entry == nullptr) continue;
    std::vector<NameIndex> rest(names.begin() + 1, names.end());
    if (entry->kind == Kind::kLink && !rest.empty()) {
      if (entry->innerTarget != kNoName) rest.insert(rest.begin(), entry->innerTarget);
      rest.insert(rest.begin(), entry->target);
      Follow(states, kMainRoot, rest, reached);
    } else {
      const bool isCovered = IsVolumePlace(*entry) && state.other.root != kNoNode;
      Follow(states, isCovered ? state.other.root : entry->node, rest, reached);
    }
  }
}

}  // namespace

std::set<Node> LedToInPassing(const std::vector<const State*>& states, const Request& request) {
  if (request.path.count == 0) return {};
  const auto given = request.path.Names();
  std::vector<NameIndex> names(given.begin(), given.end());
  std::set<Node> reached;
  if (request.code == 1) Follow(states, kMainRoot, {names.begin(), names.end() - 1}, reached);
  if (request.code != 6) {
    Follow(states, kMainRoot, names, reached);
    return reached;
  }
  names.push_back(0);
  for (NameIndex name = 0; name < kEndOfFiles; ++name) {
    names.back() = name;
    if (request.hfsName == NameAt(name).hfsName) Follow(states, kMainRoot, names, reached);
  }
  return reached;
}

std::set<Node> LeadsTo(const Graph& graph, const Place& place, unsigned code,
                       std::string_view response) {
  Resolution resolution(graph, place);
  response.remove_suffix(kTrailer.size());
  constexpr std::size_t kVolume = 1;
  constexpr std::size_t kID = kVolume + sizeof(std::int16_t);
  constexpr std::size_t kNameLength = kID + sizeof(std::uint32_t);
  switch (code) {
    case 1:
      return resolution.OfFullPath(TextAt(response, sizeof(std::uint16_t)));
    case 2:
      return resolution.OfPath(TextAt(response, sizeof(std::int16_t) + sizeof(std::uint16_t)));
    case 6:
    case 8:
    case 9:
      return resolution.OfPath(TextAt(response, 1 + sizeof(std::uint16_t)));
    case 7:
      return resolution.OfRecord(
          ReadAt<std::int16_t>(response, kVolume), ReadAt<std::uint32_t>(response, kID),
          response.substr(kNameLength + 1, ReadAt<std::uint8_t>(response, kNameLength)));
    default:
      return {};
  }
}

}  // namespace tallowmere::soak
