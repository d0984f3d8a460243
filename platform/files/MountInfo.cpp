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

// Which mounts stand on which, for asking what covers a path.
class Coverings {
 public:
  explicit Coverings(const std::vector<Mount>& mounts) : mMounts(mounts) {
    for (std::size_t i = 0; i < mounts.size(); ++i) {
      mByID.emplace(mounts[i].id, i);
      if (IsItsOwnParent(mounts[i])) continue;
      // Of two mounts on one place of one parent the kernel finds the later one.
      mByPlace.insert_or_assign({mounts[i].parent, mounts[i].mountPoint}, i);
    }
  }

  bool Reachable(std::size_t index) { return OnTheWay(index) && !CoveredAtItsRoot(index); }

 private:
  // Whether the way from the parent's mount point to this mount's own leads to this mount, and the
  // same for each mount further up.
  bool OnTheWay(std::size_t index) {
    const auto known = mOnTheWay.find(index);
    if (known != mOnTheWay.end()) return known->second;
    mOnTheWay[index] = true;  // ends the walk in a table where mounts are each other's ancestors
    const bool result =
        IsItsOwnParent(mMounts[index]) || (!CoveredFurtherUp(index) && ParentOnTheWay(index));
    mOnTheWay[index] = result;
    return result;
  }

  // Whether another mount stands on this one's own root.
  bool CoveredAtItsRoot(std::size_t index) const {
    const auto cover = mByPlace.find({mMounts[index].id, mMounts[index].mountPoint});
    return cover != mByPlace.end() && cover->second != index;
  }

  // As the first mount of a system is.
  static bool IsItsOwnParent(const Mount& mount) { return mount.parent == mount.id; }

  bool ParentOnTheWay(std::size_t index) {
    const auto parent = mByID.find(mMounts[index].parent);
    return parent == mByID.end() || OnTheWay(parent->second);
  }

  bool CoveredFurtherUp(std::size_t index) const {
    const Mount& mount = mMounts[index];
    std::string path = mount.mountPoint;
    while (true) {
      const auto found = mByPlace.find({mount.parent, path});
      if (found != mByPlace.end() && found->second != index) return true;
      if (path == "/") return false;
      const std::size_t slash = path.rfind('/');
      path.resize(std::max<std::size_t>(slash, 1));
    }
  }

  const std::vector<Mount>& mMounts;
  std::unordered_map<int, std::size_t> mByID;
  std::map<std::pair<int, std::string>, std::size_t> mByPlace;
  std::unordered_map<std::size_t, bool> mOnTheWay;
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

std::vector<std::vector<std::size_t>> GroupIntoVolumes(
    const std::vector<Mount>& mounts, const std::function<bool(const Mount&)>& isFolder) {
  Coverings coverings(mounts);
  std::map<dev_t, std::vector<std::size_t>> fileSystems;
  std::optional<dev_t> rootDevice;
  for (std::size_t i = 0; i < mounts.size(); ++i) {
    if (!coverings.Reachable(i)) continue;
    const bool isRoot = mounts[i].mountPoint == "/";
    if (isRoot) rootDevice = mounts[i].device;
    if (isRoot || HoldsFiles(mounts[i].type)) fileSystems[mounts[i].device].push_back(i);
  }

  std::vector<std::vector<std::size_t>> volumes;
  for (auto& [device, indexes] : fileSystems) {
    auto place = std::find_if(indexes.begin(), indexes.end(),
                              [&](std::size_t i) { return mounts[i].root == "/"; });
    if (place == indexes.end()) {
      place = std::find_if(indexes.begin(), indexes.end(), [&](std::size_t i) {
        return mounts[i].mountPoint == "/" || isFolder(mounts[i]);
      });
    }
    if (place == indexes.end()) continue;
    std::rotate(indexes.begin(), place, place + 1);
    volumes.push_back(std::move(indexes));
  }
  std::sort(volumes.begin(), volumes.end(), [&](const auto& a, const auto& b) {
    const bool aHasRoot = mounts[a.front()].device == rootDevice;
    const bool bHasRoot = mounts[b.front()].device == rootDevice;
    return aHasRoot != bHasRoot ? aHasRoot : a.front() < b.front();
  });
  return volumes;
}

}  // namespace tallowmere::files
