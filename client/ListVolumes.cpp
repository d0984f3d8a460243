#include <tallowmere/Volumes.h>

#include <algorithm>
#include <utility>

#include "client/Mounts.h"

namespace tallowmere {
namespace {

// The parent id of every volume's root folder, and of nothing else.
constexpr std::int32_t kParentOfRoots = 1;

constexpr const char* kRoot = "/";

}  // namespace

Result<std::vector<Volume>> ListVolumes(Client& client) {
  std::vector<Volume> volumes;
  for (std::string& mountPoint : ReadMountPoints()) {
    auto record = client.GetFSSpec(mountPoint);
    if (!record && mountPoint == kRoot) return record.Failure();
    if (!record) return Error{mountPoint + ": " + record.Failure().message};
    if (!*record || (*record)->parID != kParentOfRoots) continue;
    FSSpec& root = **record;
    const bool isKnown = std::any_of(volumes.begin(), volumes.end(),
                                     [&](const Volume& one) { return one.number == root.vRefNum; });
    if (!isKnown) volumes.push_back({root.vRefNum, std::move(root.name), std::move(mountPoint)});
  }
  return volumes;
}

}  // namespace tallowmere
