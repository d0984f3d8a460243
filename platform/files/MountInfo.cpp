#include "files/MountInfo.h"

#include <sys/sysmacros.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <map>
#include <unordered_map>
#include <utility>

namespace tallowmere::files {
namespace {

// Sorted. A file system that is missing here is taken for one that holds files.
constexpr auto kKernelInterfaces = std::to_array<std::string_view>({
    "anon_inodefs", "apparmorfs", "autofs",     "bdev",       "binder",     "binfmt_misc",
    "bpf",          "cgroup",     "cgroup2",    "configfs",   "cpuset",     "debugfs",
    "devpts",       "devtmpfs",   "dlmfs",      "efivarfs",   "functionfs", "fusectl",
    "gadgetfs",     "hugetlbfs",  "ibmasmfs",   "mqueue",     "nfsd",       "nsfs",
    "ocfs2_dlmfs",  "openpromfs", "oprofilefs", "pidfs",      "pipefs",     "proc",
    "pstore",       "resctrl",    "rpc_pipefs", "securityfs", "selinuxfs",  "smackfs",
    "sockfs",       "spufs",      "sysfs",      "tracefs",    "usbdevfs",   "usbfs",
    "xenfs",
});
static_assert(std::is_sorted(kKernelInterfaces.begin(), kKernelInterfaces.end()));

// Sorted; FUSE has many names of its own, all beginning so.
constexpr auto kServed = std::to_array<std::string_view>({
    "9p",
    "afs",
    "beegfs",
    "ceph",
    "cifs",
    "coda",
    "gfs2",
    "lustre",
    "ncpfs",
    "nfs",
    "nfs4",
    "ocfs2",
    "orangefs",
    "smb3",
    "smbfs",
    "vboxsf",
    "virtiofs",
    "vmhgfs",
});
static_assert(std::is_sorted(kServed.begin(), kServed.end()));

// Takes the text up to the next `separator` off the front of `rest`.
std::string_view TakeUntil(std::string_view& rest, char separator) {
  const std::size_t end = rest.find(separator);
  const std::string_view taken = rest.substr(0, end);
  rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
  return taken;
}

template <class Number>
std::optional<Number> ParseNumber(std::string_view text) {
  Number number{};
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc{} || end != text.data() + text.size()) return std::nullopt;
  return number;
}

bool IsOctalDigit(char c) {
  return c >= '0' && c <= '7';
}

// The kernel writes space, tab, newline, backslash and '#' as \ and three octal digits.
std::string Unescape(std::string_view text) {
  std::string plain;
  plain.reserve(text.size());
  for (std::size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && text.size() - i > 3 && IsOctalDigit(text[i + 1]) &&
        IsOctalDigit(text[i + 2]) && IsOctalDigit(text[i + 3])) {
      const int code = (text[i + 1] - '0') * 64 + (text[i + 2] - '0') * 8 + (text[i + 3] - '0');
      plain.push_back(static_cast<char>(code));
      i += 3;
    } else {
      plain.push_back(text[i]);
    }
  }
  return plain;
}

std::optional<dev_t> ParseDevice(std::string_view text) {
  const auto majorNumber = ParseNumber<unsigned>(TakeUntil(text, ':'));
  const auto minorNumber = ParseNumber<unsigned>(text);
  if (!majorNumber || !minorNumber) return std::nullopt;
  return makedev(*majorNumber, *minorNumber);
}

// "36 35 98:0 /mnt1 /mnt2 rw,noatime master:1 - ext3 /dev/root rw,errors=continue": between the
// mount options and the lone "-" stand any number of optional fields.
std::optional<Mount> ParseLine(std::string_view line) {
  const auto id = ParseNumber<int>(TakeUntil(line, ' '));
  const auto parent = ParseNumber<int>(TakeUntil(line, ' '));
  const auto device = ParseDevice(TakeUntil(line, ' '));
  const std::string_view root = TakeUntil(line, ' ');
  const std::string_view mountPoint = TakeUntil(line, ' ');
  TakeUntil(line, ' ');  // mount options
  while (!line.empty() && TakeUntil(line, ' ') != "-") {
  }
  const std::string_view type = TakeUntil(line, ' ');
  if (!id || !parent || !device || root.empty() || !mountPoint.starts_with('/') || type.empty()) {
    return std::nullopt;
  }
  return Mount{*id, *parent, *device, Unescape(root), Unescape(mountPoint), Unescape(type)};
}

// Which mounts stand on which, for asking what a path comes upon.
class Ways {
 public:
  Ways(const std::vector<Mount>& mounts, int rootID)
      : mMounts(mounts), mRootID(rootID), mState(mounts.size(), State::kUnknown) {
    for (std::size_t i = 0; i < mounts.size(); ++i) {
      mByID.emplace(mounts[i].id, i);
      if (mounts[i].mountPoint == "/") continue;
      // Of two mounts on one place of one parent the kernel finds the later one.
      mByPlace.insert_or_assign({mounts[i].parent, mounts[i].mountPoint}, i);
    }
  }

  bool IsRoot(std::size_t index) const { return mMounts[index].id == mRootID; }

  bool IsReachable(std::size_t index) {
    return IsOnTheWay(index) && !mByPlace.contains({mMounts[index].id, mMounts[index].mountPoint});
  }

  // Whether a server has to answer on the way to the mount or at its end. REQUIRES: the mount is
  // reachable; the way to one that is not need not have an end.
  bool NeedsServer(std::size_t index) const {
    while (!NeedsAServer(mMounts[index].type)) {
      const auto parent = mByID.find(mMounts[index].parent);
      if (IsRoot(index) || parent == mByID.end()) return false;
      index = parent->second;
    }
    return true;
  }

 private:
  enum class State : char { kUnknown, kOnTheWay, kHidden };

  // Whether the way from the parent's mount point to this mount's own leads to this mount, and the
  // same for each mount further up. Parents that are missing from the table are taken for
  // reachable.
  bool IsOnTheWay(std::size_t index) {
    std::vector<std::size_t> chain;
    bool onTheWay = true;
    while (true) {
      if (mState[index] != State::kUnknown) {
        onTheWay = mState[index] == State::kOnTheWay;
        break;
      }
      mState[index] = State::kHidden;  // ends the walk where mounts are each other's ancestors
      chain.push_back(index);
      const auto parent = mByID.find(mMounts[index].parent);
      if (IsRoot(index) || parent == mByID.end()) break;
      index = parent->second;
    }
    for (auto step = chain.rbegin(); step != chain.rend(); ++step) {
      onTheWay = IsRoot(*step) || (onTheWay && !IsCovered(*step));
      mState[*step] = onTheWay ? State::kOnTheWay : State::kHidden;
    }
    return onTheWay;
  }

  // Whether the parent's way to the mount comes upon another mount first, at the mount point itself
  // or further up. A mount over the root is come upon by nobody.
  bool IsCovered(std::size_t index) const {
    const Mount& mount = mMounts[index];
    for (std::string path = mount.mountPoint; path != "/";) {
      const auto found = mByPlace.find({mount.parent, path});
      if (found != mByPlace.end() && found->second != index) return true;
      path.resize(std::max<std::size_t>(path.rfind('/'), 1));
    }
    return mount.mountPoint == "/";
  }

  const std::vector<Mount>& mMounts;
  int mRootID;
  std::vector<State> mState;
  std::unordered_map<int, std::size_t> mByID;
  std::map<std::pair<int, std::string>, std::size_t> mByPlace;
};

}  // namespace

std::vector<Mount> ParseMountInfo(std::string_view text) {
  std::vector<Mount> mounts;
  while (!text.empty()) {
    if (auto mount = ParseLine(TakeUntil(text, '\n'))) mounts.push_back(*std::move(mount));
  }
  return mounts;
}

bool HoldsFiles(std::string_view fileSystemType) {
  return !std::binary_search(kKernelInterfaces.begin(), kKernelInterfaces.end(), fileSystemType);
}

bool NeedsAServer(std::string_view fileSystemType) {
  return fileSystemType.starts_with("fuse") ||
         std::binary_search(kServed.begin(), kServed.end(), fileSystemType);
}

std::vector<std::vector<std::size_t>> GroupIntoVolumes(
    const std::vector<Mount>& mounts, int rootID,
    const std::function<bool(const Mount&)>& isFolder) {
  Ways ways(mounts, rootID);
  std::map<dev_t, std::vector<std::size_t>> fileSystems;
  for (std::size_t i = 0; i < mounts.size(); ++i) {
    const bool counts = ways.IsRoot(i) || HoldsFiles(mounts[i].type);
    if (counts && ways.IsReachable(i)) fileSystems[mounts[i].device].push_back(i);
  }

  const auto isRoot = [&](std::size_t i) { return ways.IsRoot(i); };
  const auto showsRootFolder = [&](std::size_t i) { return mounts[i].root == "/"; };
  const auto showsFolder = [&](std::size_t i) {
    return ways.NeedsServer(i) || isFolder(mounts[i]);
  };
  std::vector<std::vector<std::size_t>> volumes;
  for (auto& [device, indexes] : fileSystems) {
    auto place = std::find_if(indexes.begin(), indexes.end(), isRoot);
    if (place == indexes.end()) {
      place = std::find_if(indexes.begin(), indexes.end(), showsRootFolder);
    }
    if (place == indexes.end()) place = std::find_if(indexes.begin(), indexes.end(), showsFolder);
    if (place == indexes.end()) continue;
    std::rotate(indexes.begin(), place, place + 1);
    volumes.push_back(std::move(indexes));
  }
  std::sort(volumes.begin(), volumes.end(), [&](const auto& a, const auto& b) {
    if (isRoot(a.front()) != isRoot(b.front())) return isRoot(a.front());
    return a.front() < b.front();
  });
  return volumes;
}

}  // namespace tallowmere::files
