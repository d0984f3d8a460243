// Alias files: which files are ones, where they lead, and what the host's calls answer.
#include <CoreServices/CoreServices.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <sys/mount.h>
#include <sys/wait.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <csignal>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "platform/HostCalls.h"
#include "support/CountedCalls.h"
#include "support/FileSystemImage.h"
#include "support/OldFormats.h"
#include "support/OwnMountNamespace.h"
#include "support/Pipe.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

constexpr std::uint32_t kFinderInfo = 9;  // entries of AppleDouble
constexpr std::uint32_t kResourceFork = 2;

// What a call made of a reference: a path, or the result code in brackets where it failed and left
// the reference as it came.
struct Outcome {
  std::string path;
  bool wasAliased = true;
  bool isFolder = false;

  bool operator==(const Outcome&) const = default;
};
std::ostream& operator<<(std::ostream& out, const Outcome& outcome) {
  return out << outcome.path << (outcome.wasAliased ? ", aliased" : "")
             << (outcome.isFolder ? ", folder" : "");
}

Outcome Resolve(const std::string& path, bool chains = true) {
  const FSRef before = ReferenceTo(path);
  FSRef item = before;
  Boolean targetIsFolder = 2;
  Boolean wasAliased = 2;
  const OSErr code = FSResolveAliasFile(&item, chains, &targetIsFolder, &wasAliased);
  const bool isUnchanged = std::memcmp(&item, &before, sizeof item) == 0;
  if (code != noErr) {
    EXPECT_TRUE(isUnchanged) << path;
    return {"(" + std::to_string(code) + ")", wasAliased == 1, targetIsFolder == 1};
  }
  EXPECT_EQ(wasAliased == 0, isUnchanged) << path;
  return {PathOf(item), wasAliased == 1, targetIsFolder == 1};
}

Outcome NoAlias(const std::string& path) {
  return {path, false, false};
}
Outcome Failed(int code, bool wasAliased = true) {
  return {"(" + std::to_string(code) + ")", wasAliased, false};
}

std::string ForkWith(const std::string& record) {
  return WriteResourceFork({{"icns", -16455, "icon"}, {"alis", 0, record}});
}

// A volume of its own with the name "Old Disk", on which aliases are and lead to.
class AliasFiles : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mDisk = mFolder.MakeFolder("Old Disk");
    mVolume.emplace("tmpfs", mDisk, "tmpfs");
    ASSERT_TRUE(mVolume->IsMounted());
    MakeFolder("folder");
    mFile = MakeFile("folder/file");
  }

  std::string At(const std::string& name) const { return mDisk + "/" + name; }
  std::string MakeFile(const std::string& name, const std::string& content = "content") const {
    std::ofstream(At(name), std::ios::binary) << content;
    return At(name);
  }
  std::string MakeFolder(const std::string& name) const {
    std::filesystem::create_directories(At(name));
    return At(name);
  }
  void MakeLink(const std::string& name, const std::string& target) const {
    std::filesystem::create_symlink(target, At(name));
  }

  // A file with a record in the AppleDouble file beside it.
  std::string MakeAlias(const std::string& name, const std::string& record,
                        const std::string& data = "") const {
    const std::filesystem::path path = MakeFile(name, data);
    std::ofstream(path.parent_path() / ("._" + path.filename().string()), std::ios::binary)
        << WriteSidecarOfAlias(record);
    return path;
  }
  std::string MakeAlias(const RecordToWrite& record) const {
    return MakeAlias("alias", Write(record));
  }
  std::string MakeBookmark(const BookmarkToWrite& bookmark) const {
    return MakeFile("alias", Write(bookmark).File());
  }

  // A record of a path on this volume, of version 2.
  static RecordToWrite ByPath(const std::string& path) {
    RecordToWrite record;
    record.volumeName = "Old Disk";
    record.name = std::filesystem::path(path).filename();
    record.tags = {{18, path}};
    return record;
  }
  static RecordToWrite ByHFSPath(const std::string& path) {
    RecordToWrite record = ByPath("");
    record.name = path.substr(path.rfind(':') + 1);
    record.tags = {{2, path}};
    return record;
  }
  static BookmarkToWrite Bookmark(const std::vector<std::string>& components) {
    return {.components = components, .volumeName = "Old Disk"};
  }

  TemporaryFolder mFolder;
  std::string mDisk;
  std::optional<ScopedMount> mVolume;
  std::string mFile;  // "folder/file" on the volume
};

// --- Which files are aliases --------------------------------------------------------------------

TEST_F(AliasFiles, WithARecordLeadToItsTarget) {
  EXPECT_EQ(Resolve(MakeAlias(ByPath("folder/file"))), (Outcome{mFile}));
}

TEST_F(AliasFiles, WithABookmarkLeadToItsTarget) {
  EXPECT_EQ(Resolve(MakeBookmark(Bookmark({"folder", "file"}))), (Outcome{mFile}));
}

TEST_F(AliasFiles, TellAFolder) {
  RecordToWrite record = ByPath("folder");
  record.kind = 1;
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{At("folder"), true, true}));
}

TEST_F(AliasFiles, AnswerTheSameWithMountFlags) {
  for (const unsigned long flags : {0UL, 1UL}) {
    FSRef item = ReferenceTo(MakeAlias(ByPath("folder/file")));
    Boolean isFolder = 2;
    Boolean wasAliased = 2;
    EXPECT_EQ(FSResolveAliasFileWithMountFlags(&item, true, &isFolder, &wasAliased, flags), noErr);
    EXPECT_EQ(PathOf(item), mFile);
    EXPECT_EQ(isFolder, 0);
    EXPECT_EQ(wasAliased, 1);
  }
}

TEST_F(AliasFiles, TellNothingToNull) {
  FSRef item = ReferenceTo(MakeAlias(ByPath("folder/file")));
  EXPECT_EQ(FSResolveAliasFile(&item, true, nullptr, nullptr), noErr);
  EXPECT_EQ(PathOf(item), mFile);
}

TEST_F(AliasFiles, TakeFlagForkAndResource) {
  const std::string file = MakeFile("alias", "");
  const std::string fork = ForkWith(Write(ByPath("folder/file")));
  const auto with = [&](const std::vector<std::pair<std::uint32_t, std::string>>& entries) {
    MakeFile("._alias", WriteAppleDouble(entries));
    return Resolve(file);
  };
  EXPECT_EQ(with({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, fork}}), (Outcome{mFile}));
  EXPECT_EQ(with({{kFinderInfo, FinderInfo(0x7FFF)}, {kResourceFork, fork}}), NoAlias(file));
  EXPECT_EQ(with({{kResourceFork, fork}}), NoAlias(file));
  EXPECT_EQ(with({{kFinderInfo, FinderInfo(kAliasFlag)}}), NoAlias(file));
  const std::string withoutRecord = WriteResourceFork({{"icns", 0, "icon"}});
  EXPECT_EQ(with({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, withoutRecord}}),
            NoAlias(file));
}

TEST_F(AliasFiles, AreNotRedirectedByASidecarThatOutlivedItsAlias) {
  const std::string file = MakeAlias("alias", Write(ByPath("folder/file")), "x");
  EXPECT_EQ(Resolve(file), NoAlias(file));
}

TEST_F(AliasFiles, GoByTheBookmarkWhereBothAreThere) {
  MakeFile("other");
  const std::string bookmark = Write(Bookmark({"other"})).File();
  EXPECT_EQ(Resolve(MakeAlias("alias", Write(ByPath("folder/file")), bookmark)),
            (Outcome{At("other")}));
}

TEST_F(AliasFiles, GoByTheRecordWhereTheBookmarkIsBroken) {
  const std::string cut = Write(Bookmark({"other"})).File().substr(0, 60);
  EXPECT_EQ(Resolve(MakeAlias("alias", Write(ByPath("folder/file")), cut)), (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeFile("alone", cut)), Failed(paramErr));
}

TEST_F(AliasFiles, AreNoBareBookmarks) {
  for (const std::string& data : {Write(Bookmark({"folder", "file"})).Bare(), std::string("book"),
                                  std::string("book\0\0\0\0mark\0\0\0", 15)}) {
    const std::string file = MakeFile("plain", data);
    EXPECT_EQ(Resolve(file), NoAlias(file));
  }
}

TEST_F(AliasFiles, AreNoFoldersAndNoLinks) {
  MakeAlias("alias", Write(ByPath("folder/file")));
  MakeLink("link", "alias");
  EXPECT_EQ(Resolve(At("link")), NoAlias(At("link")));
  std::filesystem::copy(At("._alias"), At("._folder"));
  EXPECT_EQ(Resolve(At("folder")), (Outcome{At("folder"), false, true}));
}

TEST_F(AliasFiles, TakeTheResourceWithID0ElseTheLowest) {
  MakeFile("first");
  MakeFile("second");
  const std::string file = MakeFile("alias", "");
  const auto with = [&](int id, int otherID) {
    const auto fork =
        WriteResourceFork({{"alis", static_cast<std::int16_t>(otherID), Write(ByPath("second"))},
                           {"alis", static_cast<std::int16_t>(id), Write(ByPath("first"))}});
    MakeFile("._alias",
             WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, fork}}));
    return Resolve(file);
  };
  EXPECT_EQ(with(0, -1), (Outcome{At("first")}));
  EXPECT_EQ(with(1, 2), (Outcome{At("first")}));
}

TEST_F(AliasFiles, ThatAreBrokenSaySo) {
  const std::string whole = Write(ByPath("folder/file"));
  EXPECT_EQ(Resolve(MakeAlias("cut", whole.substr(0, whole.size() - 1))), Failed(paramErr));
  EXPECT_EQ(Resolve(MakeAlias("empty", "")), Failed(paramErr));
  const std::string file = MakeFile("fork", "");
  MakeFile("._fork",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, "fork"}}));
  EXPECT_EQ(Resolve(file), Failed(paramErr, false)) << "no alias is told in it";
}

TEST_F(AliasFiles, OnAFileThatIsGoneFail) {
  const FSRef before = ReferenceTo(MakeFile("gone"));
  std::filesystem::remove(At("gone"));
  FSRef item = before;
  EXPECT_EQ(FSResolveAliasFile(&item, true, nullptr, nullptr), fnfErr);
  EXPECT_EQ(std::memcmp(&item, &before, sizeof item), 0);
}

// --- Leases -------------------------------------------------------------------------------------

// A process with a lease on a file, as file servers have: fcntl(2), F_SETLEASE. It gives the lease
// back as soon as another process wants the file, or keeps it.
class LeaseHolder {
 public:
  LeaseHolder(const std::string& file, bool givesBack) {
    const auto [reading, writing] = MakePipe();
    mChild = fork();
    if (mChild == 0) Hold(file, givesBack, writing);
    close(writing);
    char byte = 0;
    mHolds = read(reading, &byte, 1) == 1;
    close(reading);
  }
  ~LeaseHolder() {
    kill(mChild, SIGKILL);
    waitpid(mChild, nullptr, 0);
  }
  LeaseHolder(const LeaseHolder&) = delete;
  LeaseHolder& operator=(const LeaseHolder&) = delete;

  bool Holds() const { return mHolds; }

 private:
  [[noreturn]] static void Hold(const std::string& path, bool givesBack, int ready) {
    sigset_t wanted;  // told so by SIGIO
    sigemptyset(&wanted);
    sigaddset(&wanted, SIGIO);
    sigprocmask(SIG_BLOCK, &wanted, nullptr);
    const int file = open(path.c_str(), O_RDWR | O_CLOEXEC);
    if (fcntl(file, F_SETLEASE, F_WRLCK) == 0 && write(ready, "", 1) == 1) {
      int signal = 0;
      sigwait(&wanted, &signal);
      if (givesBack) fcntl(file, F_SETLEASE, F_UNLCK);
      pause();
    }
    _exit(1);
  }

  pid_t mChild;
  bool mHolds;
};

TEST_F(AliasFiles, UnderALeaseAreReadWhenItIsGivenBack) {
  const std::string alias = MakeBookmark(Bookmark({"folder", "file"}));
  const LeaseHolder server(alias, true);
  if (!server.Holds()) GTEST_SKIP() << "no leases here";
  EXPECT_EQ(Resolve(alias), (Outcome{mFile}));
}

TEST_F(AliasFiles, UnderALeaseThatIsKeptCannotBeRead) {
  const std::string alias = MakeBookmark(Bookmark({"folder", "file"}));
  const LeaseHolder server(alias, false);
  if (!server.Holds()) GTEST_SKIP() << "no leases here";
  EXPECT_EQ(Resolve(alias), Failed(ioErr, false));
}

// --- What it costs ------------------------------------------------------------------------------

// The system calls of one resolution.
std::optional<std::size_t> CallsFor(const std::string& path) {
  FSRef item{};
  const auto calls = CallsOf(
      [&] {
        item = ReferenceTo(path);
        FSResolveAliasFile(&item, true, nullptr, nullptr);
      },
      [&] { FSResolveAliasFile(&item, true, nullptr, nullptr); });
  if (!calls) return std::nullopt;
  return calls->size();
}

TEST_F(AliasFiles, CostNothingWhereFoldersAndLinksAreAskedFor) {
  MakeLink("link", "folder");
  const auto calls = CallsFor(At("folder"));
  if (!calls) GTEST_SKIP() << "tracing is not possible here";
  EXPECT_EQ(calls, 0u);
  EXPECT_EQ(CallsFor(At("link")), 0u);
}

TEST_F(AliasFiles, CostAFewCallsWhereAPlainFileIsAskedFor) {
  const auto calls = CallsFor(mFile);
  if (!calls) GTEST_SKIP() << "tracing is not possible here";
  EXPECT_LE(calls, 11u);
}

// --- Stores -------------------------------------------------------------------------------------

// On a file system with attributes.
class AliasStores : public AliasFiles {
 protected:
  void SetUp() override {
    AliasFiles::SetUp();
    if (IsSkipped()) return;
    if (geteuid() != 0) GTEST_SKIP() << "may not mount";
    mVolume->Unmount();
    mImage.emplace("ext4",
                   std::vector<std::string>{"mkfs.ext4", "-q", "-F", "-I", "256", "-O", "ea_inode"},
                   std::uintmax_t{8} << 20);
    if (!mImage->IsMade() || !mImage->Mount()) GTEST_SKIP() << "no ext4";
    mVolume.emplace(mImage->Path(), mDisk, nullptr, MS_BIND);
    mImage->Unmount();
    MakeFolder("folder");
    mFile = MakeFile("folder/file");
    mAlias = MakeFile("alias", "");
    mFork = ForkWith(Write(ByPath("folder/file")));
  }
  void TearDown() override {
    if (mVolume) mVolume->Unmount();
  }
  void Set(const char* name, const std::string& value) const {
    ASSERT_EQ(setxattr(mAlias.c_str(), name, value.data(), value.size(), 0), 0) << name;
  }
  std::string SMBInfo(std::uint16_t flags) const {
    return std::string("AFP\0", 4) + Big(0x00010000, 4) + std::string(8, '\0') + FinderInfo(flags) +
           std::string(12, '\0');
  }

  std::optional<FileSystemImage> mImage;
  std::string mAlias;
  std::string mFork;
};

TEST_F(AliasStores, Attributes) {
  Set("user.com.apple.FinderInfo", FinderInfo(kAliasFlag));
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
  Set("user.com.apple.ResourceFork", mFork);
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

// As most forks are: other resources follow the alias.
TEST_F(AliasStores, AnAttributeOfAKilobyte) {
  Set("user.com.apple.FinderInfo", FinderInfo(kAliasFlag));
  Set("user.com.apple.ResourceFork", mFork + std::string(1024, '\0'));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, AttributesOfAnAFPServer) {
  Set("user.org.netatalk.Metadata",
      WriteAppleDouble({{3, ""}, {kFinderInfo, FinderInfo(kAliasFlag)}}));
  Set("user.org.netatalk.ResourceFork", mFork);
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, AttributesOfAnAFPServerWithTheForkBeside) {
  Set("user.org.netatalk.Metadata", WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}}));
  MakeFile("._alias", WriteAppleDouble({{kResourceFork, mFork}}));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, StreamsOfAnSMBServer) {
  Set("user.DosStream.AFP_AfpInfo:$DATA", SMBInfo(kAliasFlag) + '\0');
  Set("user.DosStream.AFP_Resource:$DATA", mFork + '\0');
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, StreamsOfAnSMBServerThatGoOnElsewhereAreNotThere) {
  Set("user.DosStream.AFP_AfpInfo:$DATA", SMBInfo(kAliasFlag) + '\0');
  Set("user.DosStream.AFP_Resource:$DATA", mFork + '\1');
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

TEST_F(AliasStores, AppleDoubleBeside) {
  MakeFile("._alias", WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag) + "more"},
                                        {kResourceFork, mFork}}));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, AppleDoubleInAFolder) {
  MakeFolder(".AppleDouble");
  MakeFile(".AppleDouble/alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

// A server's own folder: a link leads to what nobody keeps for this folder's files.
TEST_F(AliasStores, AFolderOfAppleDoubleThatIsALinkIsNone) {
  MakeFolder("elsewhere");
  MakeFile("elsewhere/alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  MakeLink(".AppleDouble", "elsewhere");
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

TEST_F(AliasStores, AttributesOfAnAFPServerAreNoAppleSingle) {
  Set("user.org.netatalk.Metadata",
      WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}}, 0x00051600));
  Set("user.org.netatalk.ResourceFork", mFork);
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

TEST_F(AliasStores, AppleDoubleBesideCountsBeforeThatInAFolder) {
  MakeFile("other");
  MakeFolder(".AppleDouble");
  MakeFile(".AppleDouble/alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)},
                             {kResourceFork, ForkWith(Write(ByPath("other")))}}));
  MakeFile("._alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
}

TEST_F(AliasStores, TheFirstThatHasFinderInformationCounts) {
  MakeFile("._alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  Set("user.com.apple.FinderInfo", std::string(32, '\0'));
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile})) << "all zero is none";
  Set("user.com.apple.FinderInfo", FinderInfo(1));
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

TEST_F(AliasStores, TheFirstForkThatIsNotEmptyCounts) {
  MakeFile("other");
  MakeFile("._alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  Set("user.com.apple.ResourceFork", "");
  EXPECT_EQ(Resolve(mAlias), (Outcome{mFile}));
  Set("user.com.apple.ResourceFork", ForkWith(Write(ByPath("other"))));
  EXPECT_EQ(Resolve(mAlias), (Outcome{At("other")}));
}

// The whole of another file, with a data fork of its own.
TEST_F(AliasStores, AppleSingleBesideIsNone) {
  constexpr std::uint32_t kAppleSingle = 0x00051600;
  MakeFile("._alias",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}},
                            kAppleSingle));
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

TEST_F(AliasStores, ASidecarThatIsAPipeOrALinkIsNone) {
  ASSERT_EQ(mkfifo(At("._alias").c_str(), 0600), 0);
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
  std::filesystem::remove(At("._alias"));
  MakeFile("elsewhere",
           WriteAppleDouble({{kFinderInfo, FinderInfo(kAliasFlag)}, {kResourceFork, mFork}}));
  MakeLink("._alias", "elsewhere");
  EXPECT_EQ(Resolve(mAlias), NoAlias(mAlias));
}

// --- Relative -----------------------------------------------------------------------------------

class RelativeAliases : public AliasFiles {
 protected:
  // A record of a volume that is not mounted, of so many levels.
  static RecordToWrite OfLevels(int up, int down, const std::string& path) {
    RecordToWrite record = ByPath(path);
    record.volumeName = "Elsewhere";
    record.levelsUp = static_cast<std::int16_t>(up);
    record.levelsDown = static_cast<std::int16_t>(down);
    return record;
  }
};

TEST_F(RelativeAliases, GoUpAndDownFromTheFolderOfTheAlias) {
  MakeFolder("a/b");
  EXPECT_EQ(Resolve(MakeAlias("folder/alias", Write(OfLevels(1, 1, "x/y/file")))),
            (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeAlias("a/b/alias", Write(OfLevels(3, 2, "x/folder/file")))),
            (Outcome{mFile}));
}

TEST_F(RelativeAliases, GoByTheHFSPathAsWell) {
  RecordToWrite record = OfLevels(1, 2, "");
  record.name = "file";
  record.tags = {{2, "Elsewhere:x:folder:file"}};
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile}));
}

TEST_F(RelativeAliases, NeedBothLevels) {
  for (const auto& [up, down] : {std::pair(0, 1), {1, 0}, {-1, -1}, {-1, 1}, {1, -1}}) {
    EXPECT_EQ(Resolve(MakeAlias("folder/alias", Write(OfLevels(up, down, "x/file")))),
              Failed(nsvErr))
        << up << " " << down;
  }
}

TEST_F(RelativeAliases, NeedAPathOfSoManyComponents) {
  EXPECT_EQ(Resolve(MakeAlias(OfLevels(1, 2, "folder/file"))), (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeAlias(OfLevels(1, 3, "folder/file"))), Failed(nsvErr));
}

TEST_F(RelativeAliases, NeedAPathThatEndsInTheTargetsName) {
  RecordToWrite record = OfLevels(1, 2, "folder/file");
  record.name = "another";
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(nsvErr));
  record.tags.push_back({14, Units(u"file")});
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile})) << "UTF-16 counts";
}

TEST_F(RelativeAliases, DoNotLeaveTheVolume) {
  mFolder.MakeFile("outside");
  EXPECT_EQ(Resolve(MakeAlias(OfLevels(2, 1, "outside"))), Failed(nsvErr));
}

TEST_F(RelativeAliases, GiveWayToTheVolumeWhereTheirItemIsNotThere) {
  RecordToWrite record = OfLevels(1, 1, "folder/file");
  record.volumeName = "Old Disk";
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile}));
  MakeFolder("file");
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile})) << "a folder is not the record's file";
  std::filesystem::remove(At("file"));
  MakeFile("file");
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{At("file")}));
}

TEST_F(RelativeAliases, AreNotOfVersion3) {
  RecordToWrite record;
  record.version = 3;
  record.tags = {{14, Units(u"file")}, {15, Units(u"Elsewhere")}, {18, "folder/file"}};
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(nsvErr));
}

// --- Volumes ------------------------------------------------------------------------------------

class VolumesOfAliases : public AliasFiles {
 protected:
  // A second volume, with this name.
  std::string MountAnother(const std::string& name) {
    const std::string place = mFolder.MakeFolder("more/" + name);
    mAnother.emplace("tmpfs", place, "tmpfs");
    EXPECT_TRUE(mAnother->IsMounted());
    return place;
  }
  std::optional<ScopedMount> mAnother;
};

TEST_F(VolumesOfAliases, HaveTheRecordsName) {
  RecordToWrite record = ByPath("folder/file");
  record.volumeName = "Old Dis";
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(nsvErr));
  record.volumeName = "";
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(nsvErr));
}

TEST_F(VolumesOfAliases, HaveTheNameOfTheTagRatherThanOfTheHead) {
  RecordToWrite record = ByPath("folder/file");
  record.volumeName = "Another";
  record.tags.push_back({15, Units(u"Old Disk")});
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile}));
}

TEST_F(VolumesOfAliases, MayHaveItInOtherLetterCaseIfNoneHasIt) {
  RecordToWrite record = ByPath("folder/file");
  record.volumeName = "OLD disk";
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile}));
  MountAnother("OLD disk");
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(dirNFErr));
}

TEST_F(VolumesOfAliases, HaveNamesOfAnyScript) {
  const std::string place = MountAnother("\u65E5\u672C 1:2");
  std::ofstream(place + "/file") << "x";
  RecordToWrite record = ByPath("file");
  record.tags.push_back({15, Units(u"\u65E5\u672C 1/2")});
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{place + "/file"}));
}

TEST_F(VolumesOfAliases, WithTwoDifferentTargetsFindNone) {
  const std::string place = MountAnother("Old Disk");
  const std::string alias = MakeAlias(ByPath("folder/file"));
  EXPECT_EQ(Resolve(alias), (Outcome{mFile})) << "only one has it";
  std::filesystem::create_directories(place + "/folder");
  std::ofstream(place + "/folder/file") << "x";
  EXPECT_EQ(Resolve(alias), Failed(fnfErr));
}

class VolumesOfAliasesOnFAT : public VolumesOfAliases {
 protected:
  void SetUp() override {
    VolumesOfAliases::SetUp();
    if (IsSkipped()) return;
    FileSystemImage image("vfat", {"mkfs.vfat"}, std::uintmax_t{1} << 20);
    mPlace = mFolder.MakeFolder("more/Old Disk");
    if (geteuid() != 0 || !image.IsMade() || !KernelHas("vfat") || !image.Mount()) {
      GTEST_SKIP() << "no vfat";
    }
    mAnother.emplace(image.Path(), mPlace, nullptr, MS_BIND);
    image.Unmount();
    std::filesystem::create_directories(mPlace + "/folder");
    std::ofstream(mPlace + "/folder/file") << "x";
  }
  void TearDown() override { mAnother.reset(); }

  std::string mPlace;
};

TEST_F(VolumesOfAliasesOnFAT, AreLeftOutWhereTheRecordExcludesTheKind) {
  RecordToWrite record = ByPath("folder/file");
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{mFile}));
  record.signature = "BD";
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(fnfErr));
}

TEST_F(VolumesOfAliasesOnFAT, AreTakenWhereNoOtherHasTheName) {
  mVolume->Unmount();
  std::ofstream(mPlace + "/alias").flush();
  std::ofstream(mPlace + "/._alias", std::ios::binary)
      << WriteSidecarOfAlias(Write(ByPath("folder/file")));
  EXPECT_EQ(Resolve(mPlace + "/alias"), (Outcome{mPlace + "/folder/file"}));
}

TEST_F(VolumesOfAliases, ThatAreNotMountedAreNone) {
  const std::string place = MountAnother("Other");
  std::ofstream(place + "/file") << "x";
  RecordToWrite record = ByPath("file");
  record.volumeName = "Other";
  const std::string alias = MakeAlias(record);
  EXPECT_EQ(Resolve(alias), (Outcome{place + "/file"}));
  mAnother->Unmount();
  EXPECT_EQ(Resolve(alias), Failed(nsvErr));
}

TEST_F(VolumesOfAliases, InsideADiskImageAreNoneWhereThatIsNotMounted) {
  RecordToWrite record = ByPath("file");
  record.volumeName = "Image";
  record.tags.push_back({20, Write(ByPath("folder/file"))});
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(nsvErr));
}

// --- By path ------------------------------------------------------------------------------------

class PathsOfAliases : public AliasFiles {};

TEST_F(PathsOfAliases, MayBeginWithASlash) {
  EXPECT_EQ(Resolve(MakeAlias(ByPath("/folder/file"))), (Outcome{mFile}));
}

TEST_F(PathsOfAliases, NameTheVolumeItself) {
  RecordToWrite record = ByPath("/");
  record.kind = 1;
  const Outcome root{mDisk, true, true};
  EXPECT_EQ(Resolve(MakeAlias(record)), root);
  record.tags.clear();
  record.parentID = 1;
  EXPECT_EQ(Resolve(MakeAlias(record)), root);
  EXPECT_EQ(Resolve(MakeBookmark({.components = {}, .volumeName = "Old Disk", .flags = 10})), root);
}

TEST_F(PathsOfAliases, LeadToItemsOfTheirKindAlone) {
  RecordToWrite record = ByPath("folder");
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(fnfErr));
  record = ByPath("folder/file");
  record.kind = 1;
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(fnfErr));
  EXPECT_EQ(Resolve(MakeBookmark({.components = {"folder"}, .volumeName = "Old Disk", .flags = 1})),
            Failed(fnfErr));
  EXPECT_EQ(
      Resolve(MakeBookmark({.components = {"folder"}, .volumeName = "Old Disk", .flags = 0x12})),
      (Outcome{At("folder"), true, true}));
}

TEST_F(PathsOfAliases, TellWhatIsMissing) {
  EXPECT_EQ(Resolve(MakeAlias(ByPath("folder/none"))), Failed(fnfErr));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("none/file"))), Failed(dirNFErr));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("folder/file/below"))), Failed(dirNFErr));
}

TEST_F(PathsOfAliases, HaveNoEmptyComponentsAndNoDots) {
  for (const char* const path : {"folder/../folder/file", "./folder/file", "folder//file", "..",
                                 "folder/file/", "//folder/file"}) {
    EXPECT_EQ(Resolve(MakeAlias(ByPath(path))), Failed(fnfErr)) << path;
  }
  for (const auto& components :
       std::vector<std::vector<std::string>>{{"folder", "..", "folder", "file"},
                                             {"", "folder", "file"},
                                             {".", "folder", "file"},
                                             {"folder/file"},
                                             {std::string("folder\0x", 8), "file"}}) {
    EXPECT_EQ(Resolve(MakeBookmark(Bookmark(components))), Failed(fnfErr));
  }
}

TEST_F(PathsOfAliases, FindTheOtherFormOfAName) {
  const std::string composed = MakeFile("Caf\u00E9");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("Cafe\u0301"))), (Outcome{composed}));
  const std::string decomposed = MakeFile("\u30AB\u3099");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("\u30AC"))), (Outcome{decomposed}));
}

TEST_F(PathsOfAliases, FindNoneOfTwoFormsButTheirOwn) {
  const std::string composed = MakeFile("\u1EBF");
  const std::string decomposed = MakeFile("e\u0302\u0301");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("\u1EBF"))), (Outcome{composed}));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("e\u0302\u0301"))), (Outcome{decomposed}));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("\u00EA\u0301"))), Failed(fnfErr));
}

TEST_F(PathsOfAliases, OfPosixKeepColons) {
  const std::string file = MakeFile("a:b");
  RecordToWrite record = ByPath("a:b");
  record.name = "a/b";
  EXPECT_EQ(Resolve(MakeAlias(record)), (Outcome{file}));
}

TEST_F(PathsOfAliases, OfHFSFollowTheVolumesName) {
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:folder:file"))), (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Other Disk:folder:file"))), Failed(fnfErr));
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk::file"))), Failed(fnfErr));
}

TEST_F(PathsOfAliases, OfHFSMayHaveNULs) {
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath(std::string("Old Disk:\0folder:\0file\0", 23)))),
            (Outcome{mFile}));
}

TEST_F(PathsOfAliases, OfHFSExchangeSlashes) {
  const std::string file = MakeFile("a:b");
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:a/b"))), (Outcome{file}));
}

TEST_F(PathsOfAliases, OfHFSCountOnlyWithoutOneOfPosix) {
  RecordToWrite record = ByHFSPath("Old Disk:folder:file");
  record.tags.push_back({18, "none"});
  EXPECT_EQ(Resolve(MakeAlias(record)), Failed(fnfErr));
}

TEST_F(PathsOfAliases, OfHFSAreReadAsMacRomanAndAsUTF8) {
  const std::string cafe = MakeFile("Caf\u00E9");
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:Caf\x8E"))), (Outcome{cafe}));
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:Caf\u00E9"))), (Outcome{cafe}));
  MakeFile("Caf\u221A\u00A9");  // the same bytes as Mac Roman
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:Caf\u00E9"))), Failed(fnfErr));
}

TEST_F(PathsOfAliases, OfHFSTakeNamesThatMayBeShortLiterally) {
  const std::string longer = MakeFile(std::string(80, 'n'));
  const std::string itsShortForm = NameOf(SpecOf(longer));
  ASSERT_NE(itsShortForm.find('#'), std::string::npos);
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:" + itsShortForm))), Failed(fnfErr));
  const std::string literal = MakeFile(itsShortForm);
  EXPECT_EQ(Resolve(MakeAlias(ByHFSPath("Old Disk:" + itsShortForm))), (Outcome{literal}));
}

// --- Leaving the volume -------------------------------------------------------------------------

class AliasesThatLeave : public AliasFiles {};

TEST_F(AliasesThatLeave, MayFollowLinksWithinTheVolume) {
  MakeFolder("a/b");
  MakeLink("a/b/link", "../../folder");
  MakeLink("twice", "./a//b/link/");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("a/b/link/file"))), (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("twice/file"))), (Outcome{mFile}));
}

TEST_F(AliasesThatLeave, FollowAsManyLinksAsTheKernel) {
  std::string target = "folder";
  for (int link = 1; link <= 41; ++link) {
    const std::string name = "link" + std::to_string(link);
    MakeLink(name, target);
    target = name;
  }
  EXPECT_TRUE(std::filesystem::exists(At("link40/file")));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("link40/file"))), (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("link41/file"))), Failed(dirNFErr));
}

TEST_F(AliasesThatLeave, DoNotFollowALinkInTheLastPlace) {
  MakeLink("link", "folder/file");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("link"))), (Outcome{At("link")}));
  EXPECT_EQ(Resolve(MakeBookmark(Bookmark({"link"}))), Failed(fnfErr)) << "it is of a file";
  EXPECT_EQ(Resolve(MakeBookmark({.components = {"link"}, .volumeName = "Old Disk", .flags = 4})),
            (Outcome{At("link")}));
}

TEST_F(AliasesThatLeave, ByALinkWithAnAbsoluteTargetFindNothing) {
  MakeLink("absolute", At("folder"));
  EXPECT_EQ(Resolve(MakeAlias(ByPath("absolute/file"))), Failed(fnfErr));
}

TEST_F(AliasesThatLeave, ByALinkThatClimbsOutFindNothing) {
  MakeLink("out and in", "../Old Disk/folder");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("out and in/file"))), Failed(fnfErr));
}

TEST_F(AliasesThatLeave, ByALinkInARingFindNothing) {
  MakeLink("one", "two");
  MakeLink("two", "one");
  EXPECT_EQ(Resolve(MakeAlias(ByPath("one/file"))), Failed(dirNFErr));
}

TEST_F(AliasesThatLeave, ByAMountPointFindNothing) {
  const std::string place = MakeFolder("mounted");
  MakeFile("mounted/file");
  MakeLink("link", "mounted");
  const std::string alias = MakeAlias(ByPath("mounted/file"));
  EXPECT_EQ(Resolve(alias), (Outcome{place + "/file"}));
  for (const bool isSameVolume : {false, true}) {
    const ScopedMount mount(isSameVolume ? At("folder") : "tmpfs", place,
                            isSameVolume ? nullptr : "tmpfs", isSameVolume ? MS_BIND : 0);
    ASSERT_TRUE(mount.IsMounted());
    MakeFile("mounted/file");
    EXPECT_EQ(Resolve(alias), Failed(fnfErr));
    RecordToWrite itself = ByPath("mounted");
    itself.kind = 1;
    EXPECT_EQ(Resolve(MakeAlias("itself", Write(itself))), Failed(fnfErr));
    EXPECT_EQ(Resolve(MakeAlias("by link", Write(ByPath("link/file")))), Failed(fnfErr));
  }
}

TEST_F(AliasesThatLeave, ToAFileThatIsMountedAloneFindNothing) {
  const std::string place = MakeFile("covered");
  const ScopedMount mount(mFile, place, nullptr, MS_BIND);
  ASSERT_TRUE(mount.IsMounted());
  EXPECT_EQ(Resolve(MakeAlias(ByPath("covered"))), Failed(fnfErr));
}

TEST_F(AliasesThatLeave, ToADeviceOrAPipeFindNothing) {
  ASSERT_EQ(mkfifo(At("pipe").c_str(), 0600), 0);
  EXPECT_EQ(Resolve(MakeAlias(ByPath("pipe"))), Failed(fnfErr));
}

// --- Bookmarks ----------------------------------------------------------------------------------

class PlacesOfBookmarks : public AliasFiles {};

TEST_F(PlacesOfBookmarks, FollowTheVolumesPath) {
  EXPECT_EQ(Resolve(MakeBookmark({.components = {"Volumes", "Old Disk", "folder", "file"},
                                  .volumeName = "Old Disk",
                                  .volumePath = "/Volumes/Old Disk"})),
            (Outcome{mFile}));
  EXPECT_EQ(Resolve(MakeBookmark({.components = {"folder", "file"},
                                  .volumeName = "Old Disk",
                                  .volumePath = "/Volumes/Old Disk"})),
            (Outcome{mFile}))
      << "some writers begin at the volume";
}

TEST_F(PlacesOfBookmarks, BeginWhereTheTargetsTableDoes) {
  const auto with = [&](const std::vector<std::int64_t>& levels) {
    BookmarkWriter writer;
    const auto components = writer.Texts({"x", "folder", "file"});
    const auto flags = writer.Flags(1);
    const auto name = writer.Text("Old Disk");
    const auto path = writer.Text("/nonsense");
    const auto list = writer.Numbers(levels);
    writer.AddTable(
        1, {{0x1004, components}, {0x1010, flags}, {0x2000, list}, {0x2002, path}, {0x2010, name}});
    return Resolve(MakeFile("alias", writer.File()));
  };
  EXPECT_EQ(with({2, 1, 0, 0}), (Outcome{mFile}));
  EXPECT_EQ(with({1, 1, 0, 0}), (Outcome{mFile})) << "the last counts";
  EXPECT_EQ(with({1, 0, 0, 0}), Failed(dirNFErr));
  EXPECT_EQ(with({2, 0, 0, 0}), Failed(fnfErr)) << "none is the target's";
  EXPECT_EQ(with({2, 1, 0}), Failed(fnfErr)) << "one too few";
}

TEST_F(PlacesOfBookmarks, AreOfTheFirstTable) {
  BookmarkWriter writer;
  const auto otherName = writer.Text("Boot Disk");
  const auto second = writer.AddTable(0xF000, {{0x2010, otherName}});
  const auto components = writer.Texts({"folder", "file"});
  const auto flags = writer.Flags(1);
  const auto name = writer.Text("Old Disk");
  writer.AddTable(1, {{0x1004, components}, {0x1010, flags}, {0x2010, name}}, second);
  EXPECT_EQ(Resolve(MakeFile("alias", writer.File())), (Outcome{mFile}));
  writer.AddTable(1, {{0x1004, components}, {0x1010, flags}}, second);
  EXPECT_EQ(Resolve(MakeFile("alias", writer.File())), Failed(nsvErr)) << "tables are not merged";
}

TEST_F(PlacesOfBookmarks, NeedOneKindOnly) {
  for (const std::uint64_t flags : {3U, 5U, 6U, 7U}) {
    for (const char* const item : {"folder", "folder/file"}) {
      const std::filesystem::path path = item;
      EXPECT_EQ(Resolve(MakeBookmark({.components = {path.begin(), path.end()},
                                      .volumeName = "Old Disk",
                                      .flags = flags})),
                Failed(fnfErr))
          << item << ' ' << flags;
    }
  }
}

TEST_F(PlacesOfBookmarks, NeedAKind) {
  BookmarkWriter writer;
  const auto components = writer.Texts({"folder", "file"});
  const auto unknown = writer.Flags(1, 0);
  const auto name = writer.Text("Old Disk");
  writer.AddTable(1, {{0x1004, components}, {0x2010, name}});
  EXPECT_EQ(Resolve(MakeFile("alias", writer.File())), Failed(fnfErr));
  writer.AddTable(1, {{0x1004, components}, {0x1010, unknown}, {0x2010, name}});
  EXPECT_EQ(Resolve(MakeFile("alias", writer.File())), Failed(fnfErr));
}

// --- Chains -------------------------------------------------------------------------------------

class AliasChains : public AliasFiles {
 protected:
  // "alias 1" leads to "alias 2", and so on, and the last to a file.
  void MakeChain(int length) const {
    for (int i = 1; i <= length; ++i) {
      const std::string next = i == length ? "folder/file" : "alias " + std::to_string(i + 1);
      MakeAlias("alias " + std::to_string(i), Write(ByPath(next)));
    }
  }
};

TEST_F(AliasChains, AreFollowedToTheirEnd) {
  MakeChain(3);
  EXPECT_EQ(Resolve(At("alias 1")), (Outcome{mFile}));
}

TEST_F(AliasChains, AreFollowedForOneStepOnRequest) {
  MakeChain(3);
  EXPECT_EQ(Resolve(At("alias 1"), false), (Outcome{At("alias 2")}));
}

TEST_F(AliasChains, HaveAtMost64Steps) {
  MakeChain(65);
  EXPECT_EQ(Resolve(At("alias 2")), (Outcome{mFile}));
  EXPECT_EQ(Resolve(At("alias 1")), Failed(fnfErr));
}

TEST_F(AliasChains, ThatAreRingsFindNothing) {
  MakeAlias("one", Write(ByPath("two")));
  MakeAlias("two", Write(ByPath("one")));
  EXPECT_EQ(Resolve(At("one")), Failed(fnfErr));
  EXPECT_EQ(Resolve(At("one"), false), (Outcome{At("two")}));
  EXPECT_EQ(Resolve(MakeAlias("itself", Write(ByPath("itself")))), Failed(fnfErr));
}

TEST_F(AliasChains, ThatBreakLeaveTheReferenceAsItCame) {
  MakeAlias("one", Write(ByPath("two")));
  MakeAlias("two", Write(ByPath("none")));
  EXPECT_EQ(Resolve(At("one")), Failed(fnfErr));
  MakeAlias("two", "broken");
  EXPECT_EQ(Resolve(At("one")), Failed(paramErr));
}

// --- Permission ---------------------------------------------------------------------------------

class RefusedAliases : public AliasFiles {
 protected:
  void SetUp() override {
    AliasFiles::SetUp();
    if (IsSkipped()) return;
    if (geteuid() != 0) GTEST_SKIP() << "only a privileged process becomes another one";
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
  }
  static bool IsRefusedToNobody(const std::string& alias, bool wasAliased) {
    Resolve(alias);  // reads the table of mounts: of children, only one would be told of a change
    return HoldsForNobody([&] { return Resolve(alias) == Failed(afpAccessDenied, wasAliased); });
  }
};

TEST_F(RefusedAliases, ToWhatMayNotBeSearched) {
  const std::string alias = MakeAlias(ByPath("folder/file"));
  chmod(At("folder").c_str(), 0700);
  EXPECT_TRUE(IsRefusedToNobody(alias, true));
}

TEST_F(RefusedAliases, ThatMayNotBeRead) {
  const std::string alias = MakeAlias(ByPath("folder/file"));
  chmod(At("._alias").c_str(), 0600);
  EXPECT_TRUE(IsRefusedToNobody(alias, false));
  chmod(alias.c_str(), 0600);
  EXPECT_TRUE(IsRefusedToNobody(alias, false));
}

// The beginning of the data tells that it is an alias file.
TEST_F(RefusedAliases, WhoseBookmarkIsBrokenAndWhoseRecordMayNotBeRead) {
  const std::string cut = Write(Bookmark({"folder", "file"})).File().substr(0, 60);
  const std::string alias = MakeAlias("alias", Write(ByPath("folder/file")), cut);
  chmod(At("._alias").c_str(), 0600);
  EXPECT_TRUE(IsRefusedToNobody(alias, true));
}

TEST_F(RefusedAliases, AreNoneWhereTheyMayBeRead) {
  EXPECT_FALSE(IsRefusedToNobody(MakeAlias(ByPath("folder/file")), true));
}

// --- Real file systems --------------------------------------------------------------------------

struct ImageKind {
  std::string type;
  std::vector<std::string> make;
  std::uintmax_t mebibytes;
};

class AliasesOnImages : public testing::TestWithParam<ImageKind> {};

TEST_P(AliasesOnImages, LeadToTheirTargets) {
  const auto& [type, make, mebibytes] = GetParam();
  if (geteuid() != 0 || !EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  FileSystemImage image(type, make, mebibytes << 20);
  if (!image.IsMade() || !KernelHas(type) || !image.Mount()) GTEST_SKIP() << "no " << type;
  const std::string disk = image.Path();
  std::filesystem::create_directories(disk + "/folder");
  std::ofstream(disk + "/folder/file") << "x";
  RecordToWrite record;
  record.volumeName = "mounted";
  record.name = "file";
  record.tags = {{18, "folder/file"}};
  std::ofstream(disk + "/by record", std::ios::binary) << "";
  std::ofstream(disk + "/._by record", std::ios::binary) << WriteSidecarOfAlias(Write(record));
  std::ofstream(disk + "/by bookmark", std::ios::binary)
      << Write(BookmarkToWrite{.components = {"folder", "file"}, .volumeName = "mounted"}).File();
  EXPECT_EQ(Resolve(disk + "/by record"), (Outcome{disk + "/folder/file"}));
  EXPECT_EQ(Resolve(disk + "/by bookmark"), (Outcome{disk + "/folder/file"}));
  EXPECT_EQ(Resolve(disk + "/folder/file"), NoAlias(disk + "/folder/file"));
}

// --- Letter case --------------------------------------------------------------------------------

// What makes a folder ignore it: ioctl_iflags(2), where it has no name yet.
bool MakeCasefold(const std::string& folder) {
  const int open = ::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  int flags = 0;
  const bool isRead = ioctl(open, FS_IOC_GETFLAGS, &flags) == 0;
  flags |= FS_CASEFOLD_FL;
  const bool isDone = isRead && ioctl(open, FS_IOC_SETFLAGS, &flags) == 0;
  close(open);
  return isDone;
}

// One on ext4, and a file in it. The folder above counts letter case.
class FoldersThatIgnoreCase : public testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0 || !EnterOwnMountNamespace()) GTEST_SKIP() << "may not mount";
    if (!mImage.IsMade() || !mImage.Mount()) GTEST_SKIP() << "no ext4 with casefold in this kernel";
    mFolder = mImage.Path() / "Folder";
    std::filesystem::create_directories(mFolder);
    ASSERT_TRUE(MakeCasefold(mFolder));
    std::filesystem::create_directories(mFolder + "/Inner");
    mFile = mFolder + "/Inner/Caf\u00E9";
    std::ofstream(mFile) << "x";
  }

  Outcome ResolveAliasTo(const std::string& path) const {
    RecordToWrite record;
    record.volumeName = "mounted";
    record.name = "CAF\u00C9";
    record.tags = {{18, path}};
    std::ofstream(mFolder + "/alias") << "";
    std::ofstream(mFolder + "/._alias", std::ios::binary) << WriteSidecarOfAlias(Write(record));
    return Resolve(mFolder + "/alias");
  }

  FileSystemImage mImage{
      "ext4", {"mkfs.ext4", "-q", "-F", "-O", "casefold"}, std::uintmax_t{8} << 20};
  std::string mFolder;
  std::string mFile;
};

TEST_F(FoldersThatIgnoreCase, GiveAliasesTheStoredNames) {
  EXPECT_EQ(ResolveAliasTo("Folder/INNER/CAF\u00C9"), (Outcome{mFile}));
  EXPECT_EQ(ResolveAliasTo("FOLDER/Inner/Caf\u00E9"), Failed(dirNFErr));
}

TEST_F(FoldersThatIgnoreCase, FindTheItemOfARecordInOtherCase) {
  FSSpec spec = SpecOf(mFile);
  spec.name[1] = 'c';
  FSRef item{};
  ASSERT_EQ(FSpMakeFSRef(&spec, &item), noErr);
  EXPECT_TRUE(std::filesystem::equivalent(PathOf(item), mFile));
}

INSTANTIATE_TEST_SUITE_P(OfAKind, AliasesOnImages,
                         testing::Values(ImageKind{"ext4", {"mkfs.ext4", "-q", "-F"}, 8},
                                         ImageKind{"xfs", {"mkfs.xfs", "-q", "-f"}, 300},
                                         ImageKind{"btrfs", {"mkfs.btrfs", "-q", "-f"}, 128},
                                         ImageKind{"vfat", {"mkfs.vfat"}, 1}),
                         [](const auto& kind) { return kind.param.type; });

}  // namespace
}  // namespace tallowmere::test
