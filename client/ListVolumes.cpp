#include <tallowmere/Volumes.h>

#include <algorithm>
#include <utility>

#include "client/Mounts.h"
#include "client/ParentIDs.h"
#include "client/Places.h"
#include "client/Quoted.h"

namespace tallowmere {
namespace {

constexpr const char* kRoot = "/";

// Whether a text is never taken for a volume's name.
bool IsCertainlyPath(std::string_view text) {
  return text == "." || text == ".." || text.starts_with('/') || text.starts_with("./") ||
         text.starts_with("../");
}

Result<Volume> VolumeCalled(Client& client, std::string_view text) {
  const auto name = HFSNameOfUtf8(text);
  if (!name) return Error{Outcome::kNotAVolume, "no volume is called " + Quoted(text)};
  auto volumes = ListVolumes(client);
  return volumes ? VolumeWithName(*volumes, *name) : volumes.Failure();
}

}  // namespace

Result<std::vector<Volume>> ListVolumes(Client& client) {
  std::vector<Volume> volumes;
  for (std::string& mountPoint : ReadMountPoints()) {
    auto record = client.GetFSSpec(mountPoint);
    if (!record && mountPoint == kRoot) return record.Failure();
    if (!record) {
      return Error{record.Failure().outcome, mountPoint + ": " + record.Failure().message};
    }
    if (!*record || (*record)->parID != kParentOfRoots) continue;
    FSSpec& root = **record;
    const bool isKnown = std::any_of(volumes.begin(), volumes.end(),
                                     [&](const Volume& one) { return one.number == root.vRefNum; });
    if (!isKnown) volumes.push_back({root.vRefNum, std::move(root.name), std::move(mountPoint)});
  }
  return volumes;
}

Result<Volume> VolumeWithName(const std::vector<Volume>& volumes, std::string_view name) {
  const auto hasName = [name](const Volume& volume) { return volume.name == name; };
  const auto first = std::find_if(volumes.begin(), volumes.end(), hasName);
  const std::string text = Quoted(Utf8OfHFSName(name));
  if (first == volumes.end()) return Error{Outcome::kNotAVolume, "no volume is called " + text};
  const auto second = std::find_if(first + 1, volumes.end(), hasName);
  if (second == volumes.end()) return *first;
  return Error{Outcome::kAmbiguous, "several volumes are called " + text + ", at " +
                                        first->mountPoint + " and " + second->mountPoint};
}

Result<Volume> VolumeAt(Client& client, PathView mountPoint) {
  std::string path(mountPoint.Text());
  auto folder = Places(true).FindFolder(path);
  if (!folder && folder.Failure().outcome == Outcome::kRefused) return folder.Failure();
  if (folder) path = (*folder)->PathOrRoot();
  auto record = client.RecordOf(path);
  if (!record) return record.Failure();
  FSSpec& root = record->value;
  if (record->outcome == Outcome::kFound && root.parID == kParentOfRoots) {
    return Volume{root.vRefNum, std::move(root.name), std::move(path)};
  }
  return Error{Outcome::kNotAVolume, "no volume is mounted at " + Quoted(path)};
}

Result<Volume> FindVolume(Client& client, std::string_view mountPointOrName) {
  if (IsCertainlyPath(mountPointOrName)) return VolumeAt(client, mountPointOrName);
  auto byName = VolumeCalled(client, mountPointOrName);
  if (!byName && byName.Failure().outcome != Outcome::kNotAVolume) return byName;
  auto byPath = VolumeAt(client, mountPointOrName);
  if (!byPath && byPath.Failure().outcome == Outcome::kServiceFailed) return byPath;
  if (!byPath) return !byName && byPath.Failure().outcome == Outcome::kRefused ? byPath : byName;
  if (!byName || byName->number == byPath->number) return byPath;
  return Error{Outcome::kAmbiguous, "the volume at " + byName->mountPoint + " is called " +
                                        Quoted(mountPointOrName) + ", and that is the path of " +
                                        byPath->mountPoint};
}

}  // namespace tallowmere
