// An item has the same record, whichever service is asked, when and from where.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <unistd.h>

#include <filesystem>

#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t kResponseSize = 75;

// Returns the whole response to code 7.
std::string RecordOf(ChildProgram& service, const fs::path& path) {
  service.Write(U16(7) + CString(path.string()));
  return service.Read(kResponseSize);
}

// Returns the id of the folder that holds the item, or 0 for an unusable record.
std::uint32_t ParentID(const std::string& record) {
  std::uint32_t id = 0;
  if (record.size() == kResponseSize && record[0] == 1)
    record.copy(reinterpret_cast<char*>(&id), 4, 3);
  return id;
}

std::uint32_t ParentIDOf(ChildProgram& service, const fs::path& path) {
  return ParentID(RecordOf(service, path));
}

// A tree with one name of every kind. Paths() are relative to its top folder.
class Identity : public testing::Test {
 protected:
  Identity() { MakeTree(mFolder.MakeFolder("Tree")); }

  static void MakeTree(const fs::path& top) {
    for (const fs::path& path : Paths()) {
      fs::create_directories((top / path).parent_path());
      std::ofstream(top / path).put('x');
    }
  }

  static std::vector<fs::path> Paths() {
    return {"file", "folder/file", "folder/folder/f\xC3\xA9:", "folder/" + std::string(100, 'l'),
            "folder/\xFF"};
  }

  fs::path Tree() const { return mFolder.Path() / "Tree"; }

  TemporaryFolder mFolder;
};

TEST_F(Identity, TwoServicesOneAfterTheOtherGiveTheSameRecord) {
  std::vector<std::string> first;
  {
    Service service;
    for (const fs::path& path : Paths()) first.push_back(RecordOf(service, Tree() / path));
  }
  Service service;
  for (std::size_t i = 0; i < first.size(); ++i) {
    EXPECT_NE(ParentID(first[i]), 0u);
    EXPECT_EQ(RecordOf(service, Tree() / Paths()[i]), first[i]);
  }
}

TEST_F(Identity, TheRecordOfAMissingItemHasZerosAfterItsName) {
  Service service;
  RecordOf(service, Tree() / std::string(60, 'n'));
  const std::string record = RecordOf(service, Tree() / "new");
  ASSERT_EQ(record.size(), kResponseSize);
  EXPECT_EQ(record.substr(7), "\3new" + std::string(60, '\0') + std::string(kTrailer));
}

TEST_F(Identity, TheOrderOfTheQuestionsDoesNotMatter) {
  Service forwards;
  Service backwards;
  std::vector<std::string> records;
  for (const fs::path& path : Paths()) records.push_back(RecordOf(forwards, Tree() / path));
  for (std::size_t i = records.size(); i-- > 0;) {
    EXPECT_EQ(RecordOf(backwards, Tree() / Paths()[i]), records[i]);
  }
}

TEST_F(Identity, AServiceInAnotherWorkingDirectoryGivesTheSameRecord) {
  Service here;
  const fs::path before = fs::current_path();
  fs::current_path(Tree() / "folder");
  Service there;
  fs::current_path(before);
  for (const fs::path& path : Paths()) {
    const std::string record = RecordOf(here, Tree() / path);
    EXPECT_NE(ParentID(record), 0u);
    EXPECT_EQ(RecordOf(there, Tree() / path), record);
  }
}

TEST_F(Identity, AnItemKeepsItsIdThroughARename) {
  Service service;
  const std::uint32_t id = ParentIDOf(service, Tree() / "folder/file");
  fs::create_directory(Tree() / "other");
  fs::rename(Tree() / "folder", Tree() / "other/renamed");
  Service another;
  EXPECT_NE(id, 0u);
  EXPECT_EQ(ParentIDOf(service, Tree() / "other/renamed/file"), id);
  EXPECT_EQ(ParentIDOf(another, Tree() / "other/renamed/file"), id);
}

class IdentityWithMounts : public Identity {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  }

  // Starts a service in a mount namespace of its own, after the command has run there.
  static ChildProgram ServiceAfter(const std::string& command) {
    return {"unshare",
            {"--mount", "--propagation", "private", "sh", "-c", command + " && exec \"$0\" \"$1\"",
             ServiceToTest(), std::to_string(getpid())}};
  }
};

TEST_F(IdentityWithMounts, AVolumeMountedElsewhereInAnotherNamespaceHasTheSameIds) {
  const fs::path here = mFolder.MakeFolder("Here");
  const fs::path there = mFolder.MakeFolder("There");
  const ScopedMount volume("none", here.string(), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  MakeTree(here);
  Service service;
  ChildProgram elsewhere =
      ServiceAfter("mount --move '" + here.string() + "' '" + there.string() + "'");
  for (const fs::path& path : Paths()) {
    const std::string record = RecordOf(service, here / path);
    const std::string moved = RecordOf(elsewhere, there / path);
    EXPECT_NE(ParentID(record), 0u);
    EXPECT_EQ(ParentID(moved), ParentID(record));
    EXPECT_EQ(moved.substr(7), record.substr(7)) << "the names differ";
  }
}

TEST_F(IdentityWithMounts, AFolderMountedElsewhereInAnotherNamespaceHasTheSameIds) {
  const fs::path there = mFolder.MakeFolder("There");
  Service service;
  ChildProgram elsewhere =
      ServiceAfter("mount --bind '" + Tree().string() + "' '" + there.string() + "'");
  for (const fs::path& path : Paths()) {
    const std::string record = RecordOf(service, Tree() / path);
    const std::string bound = RecordOf(elsewhere, there / path);
    EXPECT_NE(ParentID(record), 0u);
    EXPECT_EQ(ParentID(bound), ParentID(record));
    EXPECT_EQ(bound.substr(7), record.substr(7)) << "the names differ";
  }
}

TEST_F(IdentityWithMounts, ARecordStaysTheSameAcrossRestartsWhileTheVolumeIsMounted) {
  ScopedMount before("none", mFolder.MakeFolder("Before").string(), "tmpfs");
  const fs::path place = mFolder.MakeFolder("Volume");
  const ScopedMount volume("none", place.string(), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  MakeTree(place);
  std::vector<std::string> records;
  {
    Service service;
    for (const fs::path& path : Paths()) records.push_back(RecordOf(service, place / path));
  }
  before.Unmount();
  const ScopedMount after("none", mFolder.MakeFolder("After").string(), "tmpfs");
  Service service;
  for (std::size_t i = 0; i < records.size(); ++i) {
    EXPECT_NE(ParentID(records[i]), 0u);
    EXPECT_EQ(RecordOf(service, place / Paths()[i]), records[i]);
  }
}

TEST_F(IdentityWithMounts, EveryVolumesRootFolderHasId2AndParent1) {
  const fs::path place = mFolder.MakeFolder("Volume");
  const ScopedMount volume("none", place.string(), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  MakeTree(place);
  Service service;
  EXPECT_EQ(ParentIDOf(service, place / "file"), 2u);
  EXPECT_EQ(ParentIDOf(service, place), 1u);
  EXPECT_EQ(ParentIDOf(service, "/"), 1u);
}

}  // namespace
}  // namespace tallowmere::test
