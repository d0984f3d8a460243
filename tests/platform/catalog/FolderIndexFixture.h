// A folder index on a volume of the test's own.
#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <optional>
#include <string>

#include "catalog/FolderIndex.h"
#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "support/MountNamespace.h"
#include "support/OtherKernel.h"
#include "support/Privileges.h"
#include "support/TemporaryFolder.h"
#include "volumes/Volumes.h"

namespace tallowmere::catalog {

inline kernel::Item ItemOf(const std::string& path) {
  const auto item = kernel::ReadItem(kernel::AtPath(path.c_str()));
  EXPECT_TRUE(item) << path;
  return item ? *item : kernel::Item{};
}

// Returns the volume that an item is on, or null when it is on none.
inline volumes::VolumePointer VolumeOf(volumes::VolumeTable& table, const std::string& path) {
  const auto listed = table.Now()->OfItem(ItemOf(path), path);
  const auto volume =
      listed ? listed->Enter() : kernel::Result<volumes::VolumePointer>(kernel::kNoVolume);
  return volume ? *volume : nullptr;
}

using test::HoldsForNobody;

// A node id that no item of the tests has.
inline constexpr std::uint32_t kOfNoItem = 0x12345678;

class AnIndex : public testing::Test {
 protected:
  void SetUp() override {
    if (!test::EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mTop = mFolder.MakeFolder("volume");
    mMount.emplace("tmpfs", mTop, "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
    for (int i = 0; i < 20; ++i) Remove(Make("first"));  // use up numbers below 16
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
    UseVolumeOf(PathTo(""));
  }
  void UseVolumeOf(const std::string& path) {
    mVolume = VolumeOf(mTable, path);
    ASSERT_TRUE(mVolume);
    mIndex.emplace(mVolume);
  }

  // Makes all changes so far too old to share a time with a change that the test makes later.
  void LetChangesAge() {
    test::WaitForTheNextTick();
    mOtherTime.emplace(std::chrono::seconds(3));
  }

  std::string PathTo(const std::string& name) const {
    return name.empty() ? mTop : mTop + "/" + name;
  }
  kernel::Item ItemAt(const std::string& name) const { return ItemOf(PathTo(name)); }
  std::uint32_t ID(const std::string& name) const { return mVolume->IDOf(ItemAt(name)); }

  std::string Make(const std::string& name) {
    mOtherTime.reset();
    std::filesystem::create_directories(PathTo(name));
    return PathTo(name);
  }
  std::string MakeFile(const std::string& name) {
    mOtherTime.reset();
    EXPECT_EQ(mknod(PathTo(name).c_str(), S_IFREG | 0644, 0), 0) << name;
    return PathTo(name);
  }
  void Move(const std::string& from, const std::string& to) {
    mOtherTime.reset();
    std::filesystem::rename(PathTo(from), PathTo(to));
  }
  void Remove(const std::string& path) {
    mOtherTime.reset();
    std::filesystem::remove_all(path);
  }

  std::optional<std::string> Search(const SearchedItem& item, const std::string& start) {
    return mIndex->Find(item, start, *mTable.Now());
  }
  // Returns where the index finds a folder, or "(none)".
  std::string Find(std::uint32_t id, const std::string& start = "") {
    return Search({id, nullptr, true}, PathTo(start)).value_or("(none)");
  }
  // Makes the index read every folder. It then knows them until they change.
  void KnowEverything() {
    LetChangesAge();
    EXPECT_EQ(Find(kOfNoItem), "(none)");
  }
  // Returns how many folders a search opens.
  std::uint64_t OpenedFor(std::uint32_t id) {
    const std::uint64_t before = mIndex->OpenedFolders();
    Find(id);
    return mIndex->OpenedFolders() - before;
  }
  // Returns where the index finds an item of any kind, or "(none)".
  std::string FindAny(std::uint32_t id, const std::string& start = "") {
    return Search({id, nullptr, false}, PathTo(start)).value_or("(none)");
  }
  std::uint64_t OpenedForAny(std::uint32_t id, const std::string& start = "") {
    const std::uint64_t before = mIndex->OpenedFolders();
    FindAny(id, start);
    return mIndex->OpenedFolders() - before;
  }
  void ExpectFound(const std::string& name) { EXPECT_EQ(Find(ID(name)), PathTo(name)); }

  std::uint32_t IDOfWhatIsGone() {
    const std::string path = Make("gone");
    const std::uint32_t id = ID("gone");
    Remove(path);
    return id;
  }

  test::TemporaryFolder mFolder;
  std::string mTop;  // of the volume
  std::optional<test::ScopedMount> mMount;
  volumes::VolumeTable mTable;
  volumes::VolumePointer mVolume;
  std::optional<FolderIndex> mIndex;

 private:
  std::optional<test::OtherTime> mOtherTime;
};

}  // namespace tallowmere::catalog
