// The file system changes twice mid-request, in front of two system calls of the answer. The answer
// must be true before, between or after the changes, or be "no item", or lead nowhere. It never
// combines what was never there at the same time.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <array>
#include <filesystem>
#include <fstream>
#include <functional>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "RaceSupport.h"
#include "support/FileSystemImage.h"
#include "support/LoopDevice.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

namespace fs = std::filesystem;

// --- The volume -------------------------------------------------------------------------------

// A disk that can be mounted in the small root folder, which has no programs.
class Disk {
 public:
  // REQUIRES: this process still has the machine's root folder.
  Disk() {
    const TemporaryFolder folder;
    const std::string image = folder.MakeFile("image");
    fs::resize_file(image, 32 << 20);
    if (!RunTool({"mkfs.ext4", "-q", "-F", image})) return;
    mImage = open(image.c_str(), O_RDWR | O_CLOEXEC);
    mDevice.emplace(mImage);
  }
  Disk(const Disk&) = delete;
  Disk& operator=(const Disk&) = delete;
  ~Disk() {
    if (mDevice) mDevice->Close();
    close(mImage);
  }

  bool IsMade() const { return mDevice && mDevice->IsAttached(); }
  int Mount(const fs::path& place) const {
    constexpr unsigned kLoopDevices = 7;  // the kernel's Documentation/admin-guide/devices.txt
    if (!fs::exists("/disk"))
      mknod("/disk", S_IFBLK | 0600, makedev(kLoopDevices, mDevice->Number()));
    return mount("/disk", place.c_str(), "ext4", 0, "");
  }

 private:
  int mImage = -1;
  std::optional<LoopDevice> mDevice;
};

enum class Changes {
  kVolumeMovesThenFolderBecomesLink,
  kFolderBecomesLinkThenVolumeMoves,
  kVolumeMovesThenFoldersAreExchanged,
  kFoldersAreExchangedThenVolumeMoves,
  kFolderBecomesLinkThenItsTargetIsExchanged,
  kVolumeMovesAndComesBack,
  kDiskIsUnmountedAndMountedElsewhere,
  kBindMovesAndAnotherTakesItsPlace,
};

constexpr std::array<std::pair<Changes, const char*>, 8> kNames{{
    {Changes::kVolumeMovesThenFolderBecomesLink, "AVolumeMovesThenAFolderOfItBecomesALink"},
    {Changes::kFolderBecomesLinkThenVolumeMoves, "AFolderBecomesALinkThenItsVolumeMoves"},
    {Changes::kVolumeMovesThenFoldersAreExchanged, "AVolumeMovesThenFoldersOfItAreExchanged"},
    {Changes::kFoldersAreExchangedThenVolumeMoves, "FoldersAreExchangedThenTheirVolumeMoves"},
    {Changes::kFolderBecomesLinkThenItsTargetIsExchanged,
     "AFolderBecomesALinkThenItsTargetIsExchanged"},
    {Changes::kVolumeMovesAndComesBack, "AVolumeMovesAndComesBack"},
    {Changes::kDiskIsUnmountedAndMountedElsewhere, "ADiskIsUnmountedAndMountedElsewhere"},
    {Changes::kBindMovesAndAnotherTakesItsPlace, "ABindMovesAndAnotherTakesItsPlace"},
}};

// A volume with the folders "first" and "second" and a link to "first", mounted at "here" or at
// "there". The folders that it covers, and those that a bind mount shows, hold namesakes.
class MovingVolume {
 public:
  MovingVolume(Changes changes, const Disk* disk) : mChanges(changes), mDisk(disk) {
    for (const char* const place : {"here", "there"}) {
      for (const char* const name : {"first", "second", "link"}) MakeItem(Top() / place / name);
    }
    EXPECT_EQ(MountAt(Here()), 0);
    for (const auto& left : fs::directory_iterator(Here())) fs::remove_all(left);
    // Uses up the small inode numbers, which are not the items' ids.
    for (int i = 0; i < 20; ++i) std::ofstream(Here() / std::to_string(i));
    for (const char* const name : {"first", "second"}) MakeItem(Here() / name);
    fs::create_symlink("first", Here() / "link");
    if (IsOfBinds()) {
      Move(Here(), mFolder.MakeFolder("volume"));
      Bind("second", Here());
    }
  }
  MovingVolume(const MovingVolume&) = delete;
  MovingVolume& operator=(const MovingVolume&) = delete;
  ~MovingVolume() {
    for (const fs::path& place : {Here(), There(), Top() / "volume"}) {
      umount2(place.c_str(), MNT_DETACH);
    }
  }

  fs::path Path() const { return (IsOfBinds() ? Here() : Here() / "second") / "d" / kName; }

  void First() const {
    switch (mChanges) {
      case Changes::kVolumeMovesThenFolderBecomesLink:
      case Changes::kVolumeMovesThenFoldersAreExchanged:
      case Changes::kVolumeMovesAndComesBack:
      case Changes::kBindMovesAndAnotherTakesItsPlace:
        return Move(Here(), There());
      case Changes::kFoldersAreExchangedThenVolumeMoves:
        return Exchange(Here() / "first", Here() / "second");
      case Changes::kFolderBecomesLinkThenVolumeMoves:
      case Changes::kFolderBecomesLinkThenItsTargetIsExchanged:
        return Exchange(Here() / "second", Here() / "link");
      case Changes::kDiskIsUnmountedAndMountedElsewhere:
        umount2(Here().c_str(), MNT_DETACH);
    }
  }
  void Second() const {
    switch (mChanges) {
      case Changes::kVolumeMovesThenFolderBecomesLink:
        return Exchange(There() / "second", There() / "link");
      case Changes::kVolumeMovesThenFoldersAreExchanged:
        return Exchange(There() / "first", There() / "second");
      case Changes::kFolderBecomesLinkThenVolumeMoves:
      case Changes::kFoldersAreExchangedThenVolumeMoves:
        return Move(Here(), There());
      case Changes::kVolumeMovesAndComesBack:
        return Move(There(), Here());
      case Changes::kFolderBecomesLinkThenItsTargetIsExchanged:
        return Exchange(Here() / "first", Here() / "link");
      case Changes::kDiskIsUnmountedAndMountedElsewhere:
        EXPECT_EQ(MountAt(There()), 0);
        return;
      case Changes::kBindMovesAndAnotherTakesItsPlace:
        return Bind("first", Here());
    }
  }
  // Restores the tree after so many changes.
  void Undo(int made) const {
    if (made == 2) UndoSecond();
    if (made > 0) UndoFirst();
  }

 private:
  void UndoSecond() const {
    if (mChanges == Changes::kDiskIsUnmountedAndMountedElsewhere) {
      umount2(There().c_str(), MNT_DETACH);
    } else if (mChanges == Changes::kBindMovesAndAnotherTakesItsPlace) {
      umount2(Here().c_str(), MNT_DETACH);
    } else if (mChanges == Changes::kVolumeMovesAndComesBack) {
      Move(Here(), There());
    } else if (IsMovedLast()) {
      Move(There(), Here());
    } else {
      Second();  // an exchange
    }
  }
  void UndoFirst() const {
    if (mChanges == Changes::kDiskIsUnmountedAndMountedElsewhere) {
      EXPECT_EQ(MountAt(Here()), 0);
    } else if (IsMovedLast() || mChanges == Changes::kFolderBecomesLinkThenItsTargetIsExchanged) {
      First();  // an exchange
    } else {
      Move(There(), Here());
    }
  }
  bool IsMovedLast() const {
    return mChanges == Changes::kFolderBecomesLinkThenVolumeMoves ||
           mChanges == Changes::kFoldersAreExchangedThenVolumeMoves;
  }
  bool IsOfBinds() const { return mChanges == Changes::kBindMovesAndAnotherTakesItsPlace; }
  fs::path Top() const { return mFolder.Path(); }
  fs::path Here() const { return Top() / "here"; }
  fs::path There() const { return Top() / "there"; }

  static void MakeItem(const fs::path& folder) {
    fs::create_directories(folder / "d");
    std::ofstream(folder / "d" / kName) << folder;
  }
  int MountAt(const fs::path& place) const {
    if (mChanges == Changes::kDiskIsUnmountedAndMountedElsewhere) return mDisk->Mount(place);
    return mount("none", place.c_str(), "tmpfs", 0, "");
  }
  static void Move(const fs::path& from, const fs::path& to) {
    EXPECT_EQ(mount(from.c_str(), to.c_str(), nullptr, MS_MOVE, nullptr), 0);
  }
  void Bind(const char* name, const fs::path& place) const {
    const fs::path folder = Top() / "volume" / name;
    EXPECT_EQ(mount(folder.c_str(), place.c_str(), nullptr, MS_BIND, nullptr), 0);
  }

  Changes mChanges;
  const Disk* mDisk;
  TemporaryFolder mFolder;
};

// --- Races ------------------------------------------------------------------------------------

// The numbers of calls between the two changes. A first request takes many more calls.
const std::vector<int>& CallsBetween(Knowledge knowledge) {
  static const std::vector<int> few{2};
  static const std::vector<int> more{0, 1, 4};
  return knowledge == Knowledge::kNone ? few : more;
}

class RacesOfTwoChanges
    : public InSmallRoot,
      public testing::WithParamInterface<std::tuple<Changes, unsigned, Knowledge>> {
 protected:
  void SetUp() override {
    if (std::get<0>(GetParam()) == Changes::kDiskIsUnmountedAndMountedElsewhere) {
      static const Disk disk;
      if (!disk.IsMade()) GTEST_SKIP() << "no disk can be made here";
      mDisk = &disk;
    }
    InSmallRoot::SetUp();
  }

  // Returns how many changes happened during the request. The bystander has seen the volume at each
  // of its places, but is only asked while nothing changes.
  int Race(const MovingVolume& volume, Bystander& bystander, int call, int between) const {
    const unsigned code = std::get<1>(GetParam());
    const Knowledge knowledge = std::get<2>(GetParam());
    const Item item = ItemAt(bystander, volume.Path());
    const std::string request = RequestAbout(item, code);
    StoppedService service(StoppedServices());
    if (knowledge == Knowledge::kOfTheItem) Answer(service.Streams(), 7, RequestAbout(item, 7));
    Truth truth(item.path, code);
    truth.Note(Answer(bystander, code, request));
    int made = 0;
    service.ChangeAt(call, [&] {
      volume.First();
      truth.Note(Answer(bystander, code, request));
      ++made;
    });
    service.ThenChangeAt(call + between, [&] {
      volume.Second();
      ++made;
    });
    const std::string response = Answer(service.Streams(), code, request);
    service.HasChanged();
    const std::string fromNowOn = Answer(bystander, code, request);
    truth.Note(fromNowOn);
    EXPECT_TRUE(truth.Admits(response, bystander))
        << "changed at calls " << call << " and " << call + between << ": "
        << testing::PrintToString(response);
    const std::string again = Answer(service.Streams(), code, request);
    EXPECT_EQ(truth.ItemAnswered(again, bystander), truth.ItemAnswered(fromNowOn, bystander))
        << "changed at calls " << call << " and " << call + between << ", and asked again";
    volume.Undo(made);
    return made;
  }

  const Disk* mDisk = nullptr;
};

TEST_P(RacesOfTwoChanges, ChangeNoAnswerIntoThatOfAnotherItem) {
  if (!StoppedService(StoppedServices()).CanStop()) {
    GTEST_SKIP() << "the kernel does not let us stop a process here";
  }
  const MovingVolume volume(std::get<0>(GetParam()), mDisk);
  Bystander bystander;
  int call = 0;
  for (int made = 2; made > 0; ++call) {
    made = 2;
    for (const int between : CallsBetween(std::get<2>(GetParam()))) {
      if (made == 2) made = Race(volume, bystander, call, between);
    }
  }
  EXPECT_GT(call, 1);
}

std::string NameOfCase(const testing::TestParamInfo<RacesOfTwoChanges::ParamType>& info) {
  const auto [changes, code, knowledge] = info.param;
  const auto& name = kNames.at(static_cast<std::size_t>(changes));
  return name.second + std::string("Code") + std::to_string(code) + NameOf(knowledge);
}

INSTANTIATE_TEST_SUITE_P(
    AtTwoCalls, RacesOfTwoChanges,
    testing::Combine(testing::Values(Changes::kVolumeMovesThenFolderBecomesLink,
                                     Changes::kFolderBecomesLinkThenVolumeMoves,
                                     Changes::kVolumeMovesThenFoldersAreExchanged,
                                     Changes::kFoldersAreExchangedThenVolumeMoves,
                                     Changes::kFolderBecomesLinkThenItsTargetIsExchanged,
                                     Changes::kVolumeMovesAndComesBack,
                                     Changes::kDiskIsUnmountedAndMountedElsewhere,
                                     Changes::kBindMovesAndAnotherTakesItsPlace),
                     testing::Values(1u, 2u, 6u, 7u, 8u, 9u),
                     testing::Values(Knowledge::kNone, Knowledge::kOfTheItem)),
    NameOfCase);

}  // namespace
}  // namespace tallowmere::test
