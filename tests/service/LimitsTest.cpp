// Every request is answered correctly with few descriptors, little memory and few permissions.
#include <gtest/gtest.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fstream>
#include <optional>
#include <string>
#include <vector>

#include "service/RightAnswers.h"
#include "support/DeadMount.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using std::filesystem::path;

const std::string kFewDescriptors = "ulimit -n 64";
const std::string kLittleMemory = "ulimit -v 65536";  // KiB

const std::vector<std::string> kAsNobody{"setpriv", "--reuid=65534", "--regid=65534",
                                         "--clear-groups"};

// A folder with an item in it, readable by everyone.
class Limits : public testing::Test {
 protected:
  Limits() {
    std::filesystem::permissions(mFolder.Path(), std::filesystem::perms(0755));
    mItem = MakeItem(mFolder.Path() / "folder");
  }

  static std::string MakeItem(const path& folder) {
    std::filesystem::create_directories(folder);
    std::ofstream(folder / "a track.aif").put('x');
    return folder / "a track.aif";
  }

  TemporaryFolder mFolder;
  std::string mItem;
};

// The same on a tmpfs, where the service finds items only by a pass over the volume.
class LimitsOfAPass : public Limits {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mMount.emplace("tmpfs", mFolder.MakeFolder("Volume"), "tmpfs");
    ASSERT_TRUE(mMount->IsMounted());
    // Uses up the small inode numbers. Other items could share their ids, so a folder that the user
    // may not read would leave open which item is meant.
    for (int i = 0; i < 20; ++i) std::filesystem::remove(MakeItem(Volume()));
  }

  path Volume() const { return mFolder.Path() / "Volume"; }

  // Returns the record of the item in the last folder of 1000 folders with 100 each.
  std::string RecordOnALargeVolume() {
    for (int i = 0; i < 100'000; ++i) {
      const path folder = Volume() / std::to_string(i / 100);
      if (i % 100 == 0) std::filesystem::create_directory(folder);
      std::filesystem::create_directory(folder / std::to_string(i));
    }
    return RecordOf(Volume() / "999/99999/folder");
  }

  // Makes an item and returns its record, asked of a service that is used for nothing else.
  std::string RecordOf(const path& folder) {
    mItem = MakeItem(folder);
    Service service;
    return service.Ask(RecordRequest(mItem), 75).substr(1, 70);
  }

  std::optional<ScopedMount> mMount;
};

// --- Descriptors --------------------------------------------------------------------------------

TEST_F(Limits, SixtyFourDescriptorsAreEnoughForEveryRequest) {
  Service service(After(kFewDescriptors));
  for (int i = 0; i < 10; ++i) ExpectRightAnswers(service, mItem);
}

TEST_F(LimitsOfAPass, SixtyFourDescriptorsAreEnoughForADeepVolume) {
  path folder = Volume();
  for (int depth = 0; depth < 1500; ++depth) {
    std::filesystem::create_directory(folder /= "d");
  }
  const std::string record = RecordOf(folder);
  Service service(After(kFewDescriptors));
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
}

TEST_F(LimitsOfAPass, SixtyFourDescriptorsAreEnoughForAWideVolume) {
  for (int i = 0; i < 3000; ++i) std::filesystem::create_directory(Volume() / std::to_string(i));
  const std::string record = RecordOf(Volume() / "1500/folder");
  Service service(After(kFewDescriptors));
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
}

// --- Memory -------------------------------------------------------------------------------------

TEST_F(Limits, SixtyFourMegabytesAreEnoughForEveryRequest) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer takes terabytes";
  Service service(After(kLittleMemory));
  ExpectRightAnswers(service, mItem);
}

TEST_F(LimitsOfAPass, SixtyFourMegabytesAreEnoughForAHundredThousandFolders) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer takes terabytes";
  const std::string record = RecordOnALargeVolume();
  Service service(After(kLittleMemory + " && " + kFewDescriptors));
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
}

// Limits a running service's address space to what it uses plus `pages`, while the object exists.
class MemoryLimit {
 public:
  explicit MemoryLimit(const Service& service, rlim_t pages = 0) : mProcess(service.Process()) {
    rlim_t inUse = 0;
    std::ifstream("/proc/" + std::to_string(mProcess) + "/statm") >> inUse;
    const rlim_t most = (inUse + pages) * static_cast<rlim_t>(sysconf(_SC_PAGESIZE));
    const rlimit limit{most, RLIM_INFINITY};
    EXPECT_EQ(prlimit(mProcess, RLIMIT_AS, &limit, &mBefore), 0);
  }
  MemoryLimit(const MemoryLimit&) = delete;
  MemoryLimit& operator=(const MemoryLimit&) = delete;
  ~MemoryLimit() { prlimit(mProcess, RLIMIT_AS, &mBefore, nullptr); }

 private:
  pid_t mProcess;
  rlimit mBefore{};
};

TEST_F(LimitsOfAPass, WithoutMemoryThePassIsAnErrorAndTheNextOneIsRight) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer takes terabytes";
  const std::string record = RecordOnALargeVolume();
  Service service;
  ASSERT_TRUE(service.Answers(kAnyRequest, kItsResponse));
  {
    const MemoryLimit limit(service);
    EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), kNoItemResponse));
  }
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
}

// Returns a new service's answer within so many more pages, or an empty string when it ends.
std::string AnswerWithin(Service& service, rlim_t pages, const std::string& request) {
  EXPECT_TRUE(service.Answers(kAnyRequest, kItsResponse));
  const MemoryLimit limit(service, pages);
  return service.Ask(request, 75);
}

TEST_F(Limits, WithoutMemoryToLookAUserUpTheItemIsNotFound) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer takes terabytes";
  for (const std::string name : {"", "root", "no such user of tallowmere"}) {
    const std::string request = RecordRequest("~" + name);
    const std::string right = Service().Ask(request, 75);
    for (rlim_t pages = 0; pages < 60; ++pages) {
      Service service;
      const std::string answer = AnswerWithin(service, pages, request);
      EXPECT_TRUE(answer == right || answer == RecordResponse(0, kEmptyRecord)) << pages;
      EXPECT_EQ(service.Ask(request, 75), right) << name << " " << pages;
    }
  }
}

// The service ends when there is no memory for the request itself.
TEST_F(Limits, WithoutMemoryForAUsersLongNameTheItemIsNotFound) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer takes terabytes";
  const std::string request = RecordRequest("~" + std::string(60'000, 'u'));
  const std::string right = RecordResponse(0, kEmptyRecord);
  int answers = 0;
  for (rlim_t pages = 0; pages < 200; pages += 2) {
    Service service;
    const std::string answer = AnswerWithin(service, pages, request);
    if (answer.empty()) {
      EXPECT_EQ(service.Wait(), 0) << pages;
    } else {
      ++answers;
      EXPECT_EQ(answer, right) << pages;
      EXPECT_EQ(service.Ask(request, 75), right) << pages;
    }
  }
  EXPECT_GT(answers, 50);
}

// --- Permissions --------------------------------------------------------------------------------

TEST_F(Limits, NothingHasToBeWritable) {
  const std::vector<std::string> command = After(
      "for place in $(cut -d ' ' -f 5 /proc/self/mountinfo); do"
      " mount -o remount,bind,ro \"$place\" 2>/dev/null; done;"
      " ! touch /tallowmere-new 2>/dev/null && ! touch '" +
          mFolder.Path().string() + "/new' 2>/dev/null",
      {"unshare", "--mount", "--propagation", "private"});
  if (!IsPermitted(command)) GTEST_SKIP() << "mounting is not permitted here";
  Service service(command);
  ExpectRightAnswers(service, mItem);
}

TEST_F(Limits, NoPrivilegeIsNeeded) {
  if (!IsPermitted(kAsNobody)) GTEST_SKIP() << "changing the user is not permitted here";
  Service service(kAsNobody);
  ExpectRightAnswers(service, mItem);
}

TEST_F(LimitsOfAPass, NoPrivilegeIsNeededToFindAnItemByItsRecord) {
  if (!IsPermitted(kAsNobody)) GTEST_SKIP() << "changing the user is not permitted here";
  const std::string record = RecordOf(Volume() / "a/b/c");
  Service service(kAsNobody);
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
}

// A folder that holds the item's folder and is closed to the service's user.
class UnreadableFolder : public LimitsOfAPass {
 protected:
  void SetUp() override {
    LimitsOfAPass::SetUp();
    if (IsSkipped()) return;
    if (!IsPermitted(kAsNobody)) GTEST_SKIP() << "changing the user is not permitted here";
    mItem = MakeItem(Volume() / "closed/folder");
    Service privileged;
    mKnown = LearnItem(privileged, mItem);
    Allow(0);
  }
  void Allow(mode_t mode) const { ASSERT_EQ(chmod((Volume() / "closed").c_str(), mode), 0); }

  Item mKnown;
};

TEST_F(UnreadableFolder, IsAnErrorUntilItIsOpened) {
  Service service(kAsNobody);
  const std::string nearestVolume = mKnown.volumeName + ":";
  std::string buffer = nearestVolume;
  buffer.resize(kRoomForAFullPath);
  const auto size = static_cast<unsigned>(nearestVolume.size());
  EXPECT_TRUE(service.Answers(RequestAbout(mKnown, 1), (U16(size) + buffer).append(kTrailer)));
  EXPECT_TRUE(service.Answers(RequestAbout(mKnown, 2), ResultResponse(kResultNotPermitted)));
  EXPECT_TRUE(service.Answers(RequestAbout(mKnown, 5), NameResponse(0, "")));
  EXPECT_TRUE(
      service.Answers(RequestAbout(mKnown, 7), RecordResponse(0, Record(32767, -1, mKnown.name))));
  EXPECT_TRUE(service.Answers(RequestAbout(mKnown, 8), kNoPathResponse));
  EXPECT_TRUE(service.Answers(RequestAbout(mKnown, 9), kNoItemResponse));
  // These codes do not look at the item.
  for (const unsigned code : {3u, 4u, 6u}) {
    EXPECT_TRUE(service.Answers(RequestAbout(mKnown, code), AnswerAbout(mKnown, code))) << code;
  }
  Allow(0755);
  ExpectRightAnswers(service, mItem);
}

TEST_F(UnreadableFolder, WithSearchPermissionHidesNoPathThroughIt) {
  Allow(0711);
  Service service(kAsNobody);
  ExpectRightAnswers(service, mItem);
}

TEST_F(UnreadableFolder, HidesItsItemsFromAPass) {
  Allow(0711);
  Service service(kAsNobody);
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(mKnown.record, 0, 0), kNoItemResponse));
}

// --- A volume that never answers ----------------------------------------------------------------

TEST_F(LimitsOfAPass, AVolumeThatNeverAnswersBlocksNoRequestAboutAnother) {
  const DeadMount first(mFolder.MakeFolder("Dead"));
  const DeadMount second(mFolder.MakeFolder("Volume/a/Dead"));
  if (!second.IsMounted()) GTEST_SKIP() << "no FUSE mounts here";
  const std::string record = RecordOf(Volume() / "a/b/c");
  Service service;
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(mItem)));
  ExpectRightAnswers(service, mItem);
  EXPECT_LT(service.NumberOf("Dead"), 0);
  EXPECT_EQ(service.NameOf(service.NumberOf("Dead")), "Dead");
}

}  // namespace
}  // namespace tallowmere::test
