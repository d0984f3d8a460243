// The kernel's mount table: arbitrary text, parsed and grouped into volumes.
#include <sys/sysmacros.h>

#include <algorithm>
#include <string>
#include <vector>

#include "fuzz/Check.h"
#include "kernel/FileSystemKinds.h"
#include "volumes/MountTree.h"

namespace tallowmere::fuzz {
namespace {

using volumes::Mount;

// Escapes a field as the kernel does.
void AppendEscaped(std::string& line, std::string_view field) {
  for (const char c : field) {
    if (std::string_view(" \t\n\\#").find(c) == std::string_view::npos) {
      line.push_back(c);
      continue;
    }
    const auto byte = static_cast<unsigned char>(c);
    line.push_back('\\');
    for (const int shift : {6, 3, 0}) line.push_back(static_cast<char>('0' + (byte >> shift & 7)));
  }
  line.push_back(' ');
}

void AppendLine(std::string& table, const Mount& mount) {
  table += std::to_string(mount.id) + ' ' + std::to_string(mount.parent) + ' ' +
           std::to_string(major(mount.device)) + ':' + std::to_string(minor(mount.device)) + ' ';
  AppendEscaped(table, mount.root);
  AppendEscaped(table, mount.mountPoint);
  table += "rw shared:1 - ";
  AppendEscaped(table, mount.type);
  table += "none rw\n";
}

bool IsSame(const Mount& a, const Mount& b) {
  return a.id == b.id && a.parent == b.parent && a.device == b.device && a.root == b.root &&
         a.mountPoint == b.mountPoint && a.type == b.type;
}

// Checks that each mount is read back from its line.
void CheckLinesOf(const std::vector<Mount>& mounts) {
  std::string table;
  for (const Mount& mount : mounts) AppendLine(table, mount);
  const std::vector<Mount> again = volumes::ParseMountInfo(table);
  Check(std::equal(mounts.begin(), mounts.end(), again.begin(), again.end(), IsSame));
}

void CheckMounts(const std::vector<Mount>& mounts) {
  for (const Mount& mount : mounts) {
    Check(mount.mountPoint.starts_with('/') && !mount.root.empty() && !mount.type.empty());
  }
  CheckLinesOf(mounts);
}

// Checks that two mounts whose mount points contain the text are read, if the kernel could report
// them.
void CheckMountsAt(std::string_view text) {
  const std::string path = "/" + std::string(text.substr(0, text.find('\0')));
  CheckLinesOf(
      {{1, 2, makedev(8, 1), path, path, "ext4"}, {3, 1, makedev(0, 44), "/", path, "tmpfs"}});
}

void CheckVolumes(const std::vector<Mount>& mounts, std::size_t root) {
  const int rootID = mounts[root].id;
  const auto isFolder = [](const Mount& mount) { return !mount.mountPoint.ends_with('f'); };
  const auto volumes = volumes::MountTree(mounts, rootID).GroupIntoVolumes(isFolder);

  std::vector<bool> isTaken(mounts.size());
  std::size_t lastPlace = 0;
  for (std::size_t v = 0; v < volumes.size(); ++v) {
    Check(!volumes[v].empty());
    const std::size_t place = volumes[v].front();
    const bool isRoot = mounts[place].id == rootID;
    Check(!isRoot || v == 0 || mounts[volumes[0].front()].id == rootID);
    Check(isRoot || v == 0 || place > lastPlace || mounts[lastPlace].id == rootID);
    lastPlace = place;
    for (const std::size_t index : volumes[v]) {
      Check(index < mounts.size() && !isTaken[index]);
      isTaken[index] = true;
      Check(mounts[index].device == mounts[place].device);
      Check(kernel::HoldsFiles(mounts[index].type) || mounts[index].id == rootID);
    }
  }
}

}  // namespace
}  // namespace tallowmere::fuzz

// The input: the mount that contains the process's root, then the table.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using namespace tallowmere::fuzz;
  Input input(data, size);
  const std::size_t root = input.TakeByte();
  const std::string_view text = input.Rest();
  const auto mounts = tallowmere::volumes::ParseMountInfo(text);
  CheckMounts(mounts);
  CheckMountsAt(text);
  if (!mounts.empty()) CheckVolumes(mounts, root % mounts.size());
  return 0;
}
