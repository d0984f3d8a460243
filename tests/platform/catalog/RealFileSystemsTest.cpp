// The platform's promises on real file systems: identity, and the round trip from path to record to
// path in another process.
#include <Tallowmere/Process.h>
#include <fcntl.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <map>
#include <optional>
#include <vector>

#include "kernel/Descriptor.h"
#include "platform/HostCalls.h"
#include "support/ChildProgram.h"
#include "support/FileSystemImage.h"
#include "support/OtherKernel.h"
#include "support/OwnMountNamespace.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

constexpr std::uintmax_t kMegabyte = 1 << 20;

std::string FromHexadecimal(std::string_view digits) {
  std::string bytes;
  for (std::size_t i = 0; i + 1 < digits.size(); i += 2) {
    bytes.push_back(static_cast<char>(std::stoi(std::string(digits.substr(i, 2)), nullptr, 16)));
  }
  return bytes;
}

// Returns the folder and every item below it. Follows no links and enters no other mounts.
std::vector<std::string> ItemsBelow(const std::string& top) {
  std::vector<std::string> paths{top};
  for (const auto& entry : std::filesystem::recursive_directory_iterator(top)) {
    paths.push_back(entry.path());
  }
  return paths;
}

// Makes folders, files, links and, if the file system accepts any bytes, hostile names.
void MakeItems(const std::string& top, bool anyName) {
  const auto write = [](const std::string& path) { std::ofstream(path) << path; };
  for (int i = 0; i < 4; ++i) {
    const std::string folder = top + "/folder " + std::to_string(i);
    std::filesystem::create_directories(folder + "/below/deeper");
    write(folder + "/file.aif");
    write(folder + "/below/file");
    write(folder +
          "/below/deeper/a rather long name that does not fit into a record of 63 bytes.aif");
  }
  if (!anyName) return;
  for (const char* name : {"caf\xC3\xA9", "cafe\xCC\x81", "a:b", "x#10.aif", "line\nfeed",
                           "\xFF.c#", "\xE6\x97\xA5\xE6\x9C\xAC"}) {
    write(top + "/folder 0/" + name);
    std::filesystem::create_directory(top + "/folder 1/" + name);
    write(top + "/folder 1/" + name + "/x");
  }
  ASSERT_EQ(symlink("folder 0", (top + "/link").c_str()), 0);
  ASSERT_EQ(symlink("nowhere", (top + "/dangling").c_str()), 0);
  ASSERT_EQ(mkfifo((top + "/pipe").c_str(), 0644), 0);
}

// Checks that another process resolves the records of all items to their paths.
void ExpectRoundTrip(const std::string& top, const std::vector<std::string>& arguments) {
  ChildProgram resolve(TALLOWMERE_RESOLVE_SPEC, arguments);
  for (const std::string& path : ItemsBelow(top)) {
    const FSSpec spec = SpecOf(path);
    resolve.Write({reinterpret_cast<const char*>(&spec), sizeof spec});
    std::string line;
    for (std::string byte; (byte = resolve.Read(1)) != "\n" && !byte.empty();) line += byte;
    ASSERT_TRUE(line.starts_with("0 ")) << path << ": " << line;
    const std::string found = FromHexadecimal(std::string_view(line).substr(2));
    EXPECT_EQ(found, path);
  }
}

using IDs = std::map<std::string, std::pair<std::uint32_t, std::uint32_t>>;

IDs IDsBelow(const std::string& top) {
  IDs ids;
  for (const std::string& path : ItemsBelow(top)) ids[path] = {IDOf(path), ParentOf(SpecOf(path))};
  return ids;
}

class ARealFileSystem : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  }

  void MakeImage(const std::string& type, const std::vector<std::string>& command,
                 std::uintmax_t bytes, const std::string& options = "") {
    if (!KernelHas(type)) GTEST_SKIP() << "this kernel has no " << type;
    mImage.emplace(type, command, bytes);
    if (!mImage->IsMade()) GTEST_SKIP() << "no " << command.front() << " here";
    chmod(mImage->Path().parent_path().c_str(), 0755);
    if (!mImage->Mount(options)) GTEST_SKIP() << "an image cannot be mounted here";
  }

  static void ExpectPromises(const std::string& top) {
    EXPECT_EQ(IDOf(top), 2u);
    EXPECT_EQ(ParentOf(SpecOf(top)), 1U);
    ExpectRoundTrip(top, {});
    if (geteuid() == 0) ExpectRoundTrip(top, {"unprivileged"});
  }
  void ExpectTheSameIDsAfterMountingAgain(const std::string& options = "") {
    const std::string top = mImage->Path();
    const IDs before = IDsBelow(top);
    mImage->Unmount();
    ASSERT_TRUE(mImage->Mount(options));
    EXPECT_EQ(IDsBelow(top), before);
    ExpectPromises(top);
  }

  std::optional<FileSystemImage> mImage;
};

TEST_F(ARealFileSystem, Ext4KeepsThePromises) {
  MakeImage("ext4", {"mkfs.ext4", "-q", "-F"}, 32 * kMegabyte);
  if (IsSkipped()) return;
  // Unprivileged processes may not read it.
  std::filesystem::remove(mImage->Path() / "lost+found");
  MakeItems(mImage->Path(), true);
  ExpectPromises(mImage->Path());
  ExpectTheSameIDsAfterMountingAgain();
}

// An item with two names, one of which has a short form, is known by either. It is not new, so both
// names are recognised as the same item's.
TEST_F(ARealFileSystem, Ext4AnswersWithTheNameThatIsMeant) {
  MakeImage("ext4", {"mkfs.ext4", "-q", "-F"}, 32 * kMegabyte);
  if (IsSkipped()) return;
  const std::string plain = mImage->Path() / "plain.aif";
  const std::string longer = mImage->Path() / (std::string(70, 'x') + ".aif");
  std::ofstream(plain) << "item";
  std::filesystem::create_hard_link(plain, longer);
  const OtherTime later(std::chrono::hours(1));
  for (const std::string& meant : {plain, longer}) {
    const FSSpec spec = SpecOf(meant);
    for (const std::string& known : {plain, longer}) {
      ReferenceTo(known);
      const process::MomentScope moment;
      FSRef item{};
      ASSERT_EQ(FSpMakeFSRef(&spec, &item), noErr);
      EXPECT_EQ(PathOf(item), meant) << "known as " << known;
    }
  }
}

TEST_F(ARealFileSystem, XfsKeepsThePromises) {
  MakeImage("xfs", {"mkfs.xfs", "-q", "-f"}, 320 * kMegabyte);
  if (IsSkipped()) return;
  MakeItems(mImage->Path(), true);
  ExpectPromises(mImage->Path());
  ExpectTheSameIDsAfterMountingAgain();
}

TEST_F(ARealFileSystem, BtrfsKeepsThePromises) {
  MakeImage("btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 * kMegabyte);
  if (IsSkipped()) return;
  MakeItems(mImage->Path(), true);
  ExpectPromises(mImage->Path());
  ExpectTheSameIDsAfterMountingAgain();
}

TEST_F(ARealFileSystem, BtrfsKeepsThePromisesInSubvolumes) {
  MakeImage("btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 * kMegabyte);
  if (IsSkipped()) return;
  const std::string top = mImage->Path();
  for (const char* name : {"/one", "/two", "/one/inner"}) {
    ASSERT_TRUE(RunTool({"btrfs", "subvolume", "create", top + name}));
    MakeItems(top + name, true);
  }
  ExpectPromises(top);
  // Also found by id alone.
  for (const std::string& path :
       {top + "/one", top + "/two/folder 3", top + "/two/folder 3/file.aif",
        top + "/one/inner/folder 0/below/file"}) {
    const FSCatalogInfo info = InfoOf(path);
    EXPECT_GE(info.nodeID, 0x80000000u);
    EXPECT_TRUE(HoldsForNobody([&] {
      FSRef found{};
      return FSResolveNodeID(info.volume, info.nodeID, &found) == noErr && PathOf(found) == path;
    })) << path;
  }
  ExpectTheSameIDsAfterMountingAgain();
}

// The first subvolume made has the number 256, and so has the first item in each.
TEST_F(ARealFileSystem, BtrfsIDsIncludeTheSubvolume) {
  MakeImage("btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 * kMegabyte);
  if (IsSkipped()) return;
  const std::string top = mImage->Path();
  for (const char* name : {"/one", "/two"}) {
    ASSERT_TRUE(RunTool({"btrfs", "subvolume", "create", top + name}));
    std::filesystem::create_directory(top + name + "/folder");
  }
  EXPECT_EQ(IDOf(top + "/one"), 0x80000000 + 256);
  EXPECT_EQ(IDOf(top + "/one/folder"), 0x80000000 + 257);
  EXPECT_EQ(IDOf(top + "/two"), 0x80000000 + (1 << 22) + 256);
  EXPECT_EQ(IDOf(top + "/two/folder"), 0x80000000 + (1 << 22) + 257);
}

// A tmpfs on a plain folder, one inside a subvolume, a bind mount and a kernel interface.
TEST_F(ARealFileSystem, BtrfsShowsMountsOnItsFolders) {
  MakeImage("btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 * kMegabyte);
  if (IsSkipped()) return;
  const std::string top = mImage->Path();
  ASSERT_TRUE(RunTool({"btrfs", "subvolume", "create", top + "/subvolume"}));
  for (const std::string name : {"/memory", "/below", "/kernel", "/again"}) {
    std::filesystem::create_directory(top + name);
  }
  MakeItems(top + "/subvolume", true);
  const ScopedMount memory("memory", top + "/memory", "tmpfs");
  const ScopedMount below("below", top + "/subvolume/folder 0", "tmpfs");
  const ScopedMount again(top + "/subvolume", top + "/again", "", MS_BIND);
  for (const ScopedMount* const mounted : {&memory, &below, &again}) {
    ASSERT_TRUE(mounted->IsMounted());
  }
  for (const std::string name : {"/memory", "/subvolume/folder 0"}) {
    const std::string path = top + name;
    EXPECT_EQ(IDOf(path), 2u);
    EXPECT_EQ(ParentOf(SpecOf(path)), 1u) << path;
    ExpectRoundTrip(path, {});
  }
  EXPECT_EQ(IDOf(top + "/again"), IDOf(top + "/subvolume"));
  const ScopedMount kernel("none", top + "/kernel", "proc");
  ASSERT_TRUE(kernel.IsMounted());
  EXPECT_EQ(IDOf(top + "/kernel"), 3u);
}

TEST_F(ARealFileSystem, ASubvolumeMountedAloneKeepsThePromises) {
  MakeImage("btrfs", {"mkfs.btrfs", "-q", "-f"}, 128 * kMegabyte);
  if (IsSkipped()) return;
  ASSERT_TRUE(RunTool({"btrfs", "subvolume", "create", mImage->Path() / "one"}));
  MakeItems(mImage->Path() / "one", true);
  mImage->Unmount();
  ASSERT_TRUE(mImage->Mount("subvol=one"));
  ExpectPromises(mImage->Path());
}

TEST_F(ARealFileSystem, TmpfsKeepsThePromises) {
  const TemporaryFolder folder;
  chmod(folder.Path().c_str(), 0755);
  const ScopedMount tmpfs("tmpfs", folder.MakeFolder("volume"), "tmpfs");
  MakeItems(folder.Path() / "volume", true);
  ExpectPromises(folder.Path() / "volume");
}

TEST_F(ARealFileSystem, SquashfsKeepsThePromises) {
  const TemporaryFolder source;
  chmod(source.Path().c_str(), 0755);
  MakeItems(source.Path(), true);
  MakeImage("squashfs",
            {"sh", "-c", "mksquashfs '" + source.Path().string() + "' \"$0\" -noappend -quiet"},
            kMegabyte);
  if (IsSkipped()) return;
  ExpectPromises(mImage->Path());
  ExpectTheSameIDsAfterMountingAgain();
}

TEST_F(ARealFileSystem, VfatKeepsThePromisesWhileItIsMounted) {
  MakeImage("vfat", {"mkfs.vfat"}, 16 * kMegabyte);
  if (IsSkipped()) return;
  MakeItems(mImage->Path(), false);
  ExpectPromises(mImage->Path());
}

// A handle straight from name_to_handle_at(2).
struct RawHandle {
  file_handle* Get() { return reinterpret_cast<file_handle*>(bytes); }
  bool Read(const std::string& path, int flags) {
    int mount = 0;
    Get()->handle_bytes = MAX_HANDLE_SZ;
    return name_to_handle_at(AT_FDCWD, path.c_str(), Get(), &mount, flags) == 0;
  }

  alignas(file_handle) char bytes[sizeof(file_handle) + MAX_HANDLE_SZ] = {};
};

bool MayOpenByHandle(const std::string& path) {
  RawHandle handle;
  const kernel::Descriptor volume(open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!handle.Read(path, 0)) return false;
  return kernel::Descriptor(open_by_handle_at(volume.Get(), handle.Get(), O_PATH | O_CLOEXEC))
      .IsOpen();
}

bool HasHandleToIdentify(const std::string& path) {
  constexpr int kOnlyToIdentify = 0x200;  // AT_HANDLE_FID
  RawHandle handle;
  return handle.Read(path, 0) || handle.Read(path, kOnlyToIdentify);
}

// Returns the birth time straight from statx(2).
timespec BirthOf(const std::string& path) {
  struct statx about {};
  EXPECT_EQ(statx(AT_FDCWD, path.c_str(), AT_SYMLINK_NOFOLLOW, STATX_BTIME, &about), 0) << path;
  return {static_cast<time_t>(about.stx_btime.tv_sec), static_cast<long>(about.stx_btime.tv_nsec)};
}

class AnOverlay : public ARealFileSystem {
 protected:
  void SetUp() override {
    ARealFileSystem::SetUp();
    if (IsSkipped()) return;
    chmod(mFolder.Path().c_str(), 0755);
    mBelow.emplace("tmpfs", mFolder.MakeFolder("fs"), "tmpfs");
    for (const char* name : {"lower", "upper", "work"}) {
      mFolder.MakeFolder(std::string("fs/") + name);
    }
    MakeItems(mFolder.Path() / "fs/lower", true);
    std::filesystem::create_directories(mFolder.Path() / "fs/upper/folder 2/only above");
    Mount();
    if (!mOverlay->IsMounted()) GTEST_SKIP() << "no overlays here";
  }
  void Mount() {
    const std::string fs = mFolder.Path() / "fs";
    mOverlay.reset();
    mOverlay.emplace("overlay", mFolder.MakeFolder("merged"), "overlay", 0,
                     "lowerdir=" + fs + "/lower,upperdir=" + fs + "/upper,workdir=" + fs + "/work");
  }
  std::string Top() const { return mFolder.Path() / "merged"; }

  TemporaryFolder mFolder;
  std::optional<ScopedMount> mBelow;
  std::optional<ScopedMount> mOverlay;
};

TEST_F(AnOverlay, OnOneFileSystemKeepsThePromises) {
  ExpectPromises(Top());
}

TEST_F(AnOverlay, OnOneFileSystemGivesTheSameIDsAfterMountingAgain) {
  const IDs before = IDsBelow(Top());
  Mount();
  ASSERT_TRUE(mOverlay->IsMounted());
  EXPECT_EQ(IDsBelow(Top()), before);
}

TEST_F(AnOverlay, FindsAFileByItsIDAlone) {
  const std::string path = Top() + "/folder 3/below/file";
  const FSCatalogInfo info = InfoOf(path);
  EXPECT_TRUE(HoldsForNobody([&] {
    FSRef found{};
    return FSResolveNodeID(info.volume, info.nodeID, &found) == noErr && PathOf(found) == path;
  }));
}

// The first rename or write copies a lower item up, which gives it a new birth time.
TEST_F(AnOverlay, LeavesReferencesValidThroughTheFirstChange) {
  const OtherTime later(std::chrono::hours(1));
  const std::string path = Top() + "/folder 3/below/file";
  if (!HasHandleToIdentify(path)) GTEST_SKIP() << "this kernel has no handles for overlays";
  const FSRef item = ReferenceTo(path);
  const timespec before = BirthOf(path);
  WaitForTheNextTick();
  std::filesystem::rename(path, Top() + "/renamed");
  std::ofstream(Top() + "/renamed") << "written to";
  const timespec after = BirthOf(Top() + "/renamed");
  ASSERT_TRUE(before.tv_sec != after.tv_sec || before.tv_nsec != after.tv_nsec)
      << "this kernel keeps the birth of a file of a lower layer";
  EXPECT_EQ(PathOf(item), Top() + "/renamed");
}

TEST_F(AnOverlay, DoesNotTakeANewItemForOneThatWasDeleted) {
  const std::string path = Top() + "/folder 3/below/file";
  const FSRef item = ReferenceTo(path);
  std::filesystem::remove(path);
  std::ofstream(path) << "new";
  EXPECT_EQ(PathOf(item), "(none)");
}

// Returns the system calls of a new process that resolves one record.
std::string CallsOfResolving(const FSSpec& spec) {
  const TemporaryFolder folder;
  const std::string record = folder.MakeFile("record");
  std::ofstream(record, std::ios::binary).write(reinterpret_cast<const char*>(&spec), sizeof spec);
  const std::string calls = folder.Path() / "calls";
  EXPECT_TRUE(RunTool({"strace", "-E", "ASAN_OPTIONS=detect_leaks=0", "-e",
                       "trace=getdents64,open_by_handle_at", "-o", calls, "sh", "-c",
                       std::string("exec ") + TALLOWMERE_RESOLVE_SPEC + " <" + record}));
  std::ifstream file(calls);
  return {std::istreambuf_iterator<char>(file), {}};
}

TEST_F(ARealFileSystem, Ext4IsNotSearchedByAPrivilegedProcess) {
  if (!RunTool({"strace", "-V"})) GTEST_SKIP() << "no strace here";
  MakeImage("ext4", {"mkfs.ext4", "-q", "-F"}, 32 * kMegabyte);
  if (IsSkipped()) return;
  const std::string top = mImage->Path();
  MakeItems(top, true);
  if (!MayOpenByHandle(top)) GTEST_SKIP() << "not permitted here";
  const FSSpec present = SpecOf(top + "/folder 3/below/deeper");
  const FSSpec missing = MakeRecord(present.vRefNum, 0x1000, "x");
  const FSSpec inAFile = MakeRecord(present.vRefNum, IDOf(top + "/folder 3/below/file"), "x");
  // Removed, but still open.
  const std::string gone = top + "/gone";
  ASSERT_EQ(mkdir(gone.c_str(), 0755), 0);
  const kernel::Descriptor held(open(gone.c_str(), O_PATH | O_CLOEXEC));
  const FSSpec inWhatIsGone = MakeRecord(present.vRefNum, IDOf(gone), "x");
  ASSERT_EQ(rmdir(gone.c_str()), 0);
  for (const FSSpec& spec : {present, missing, inAFile, inWhatIsGone}) {
    const std::string calls = CallsOfResolving(spec);
    EXPECT_NE(calls.find("open_by_handle_at"), std::string::npos) << calls;
    EXPECT_EQ(calls.find("getdents64"), std::string::npos) << calls;
  }
}

}  // namespace
}  // namespace tallowmere::test
