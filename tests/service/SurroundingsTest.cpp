// The root folder, the clock and the language of the service's environment change no answer.
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include "service/RightAnswers.h"
#include "support/FileSystemImage.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using std::filesystem::path;

// --- A root folder of its own -------------------------------------------------------------------

// Starts a service in a user, mount and process namespace of its own. Its root folder is a tmpfs
// with the service, its libraries, "/Home/folder/a track.aif", and the same folder on a volume
// mounted at "/Media/Disk".
class Container : public testing::Test {
 protected:
  // `proc` is a shell command that mounts "proc" or does not. Returns null where not permitted.
  std::unique_ptr<Service> Start(const std::string& proc) const {
    const std::string furnish = "set -e; cd '" + mFolder.Path().string() +
                                "'; mount -t tmpfs none .; cd \"$PWD\"; "
                                "cp --parents $(ldd '" TALLOWMERE_SERVICE
                                "' | grep -o '/[^ ]*') '" TALLOWMERE_SERVICE
                                "' .; mkdir -p Media/Disk proc; mount -t tmpfs none Media/Disk; "
                                "for volume in Home Media/Disk; do mkdir -p $volume/folder; "
                                "echo x >\"$volume/folder/a track.aif\"; done; " +
                                proc;
    std::vector<std::string> command = After(
        furnish,
        {"unshare", "--user", "--map-root-user", "--mount", "--pid", "--fork", "--kill-child"});
    if (!IsPermitted(command)) return nullptr;
    command.insert(command.end(), {TALLOWMERE_ENTER_ROOT, mFolder.Path().string()});
    return std::make_unique<Service>(command);
  }

  TemporaryFolder mFolder;
};

constexpr const char* kMountProc = "mount -t proc none proc";
constexpr const char* kWithoutProc = "true";

TEST_F(Container, AnswersEveryRequestAboutEveryVolume) {
  const auto service = Start(kMountProc);
  if (!service) GTEST_SKIP() << "namespaces or mounting are not permitted here";
  ExpectRightAnswers(*service, "/Home/folder/a track.aif");
  ExpectRightAnswers(*service, "/Media/Disk/folder/a track.aif");
  EXPECT_EQ(service->NameOf(0), "Root");
  EXPECT_EQ(service->NameOf(service->NumberOf("Root")), "Root");
  EXPECT_EQ(service->NameOf(service->NumberOf("Disk")), "Disk");
}

TEST_F(Container, WithoutProcAnswersEveryRequestAboutItsOneVolume) {
  const auto service = Start(kWithoutProc);
  if (!service) GTEST_SKIP() << "namespaces or mounting are not permitted here";
  ExpectRightAnswers(*service, "/Home/folder/a track.aif");
  EXPECT_EQ(service->NameOf(0), "Root");
  EXPECT_EQ(service->NumberOf("Disk"), 32767);
}

TEST_F(Container, WithoutProcHasNoRecordOfItemsOnAnotherVolume) {
  const auto service = Start(kWithoutProc);
  if (!service) GTEST_SKIP() << "namespaces or mounting are not permitted here";
  EXPECT_TRUE(service->Answers(RecordRequest("/Media/Disk/folder/a track.aif"),
                               RecordResponse(0, kEmptyRecord)));
}

TEST_F(Container, DoesNotOutliveItsPipesAsTheFirstProcess) {
  const auto closed = Start(kMountProc);
  if (!closed) GTEST_SKIP() << "namespaces or mounting are not permitted here";
  closed->CloseInput();
  EXPECT_EQ(closed->ReadToEnd(), "");
  EXPECT_EQ(closed->Wait(), 0);
  // The kernel spares a namespace's first process the SIGPIPE, so its write fails instead.
  const auto unread = Start(kMountProc);
  ASSERT_TRUE(unread->Answers(kAnyRequest, kItsResponse));
  unread->CloseOutput();
  unread->Write(kAnyRequest);
  EXPECT_EQ(unread->Wait(), 0);
}

// --- Clocks -------------------------------------------------------------------------------------

struct Clock {
  const char* name;
  const char* start;  // seconds since 1970
  const char* step;
};

class ClockSetTo : public testing::TestWithParam<Clock> {
 protected:
  std::vector<std::string> Command() const {
    return {"env", std::string("TALLOWMERE_CLOCK=") + GetParam().start,
            std::string("TALLOWMERE_CLOCK_STEP=") + GetParam().step,
            "ASAN_OPTIONS=verify_asan_link_order=0", "LD_PRELOAD=" TALLOWMERE_OTHER_CLOCK};
  }
};

TEST_P(ClockSetTo, ChangesNoAnswer) {
  const TemporaryFolder folder;
  folder.MakeFolder("folder");
  Service service(Command());
  ExpectRightAnswers(service, folder.MakeFile("folder/a track.aif"));
}

// A pass records which folders it has read and when. Folders that have changed are read again.
TEST_P(ClockSetTo, DoesNotHideChangesSinceAPass) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount volume("none", folder.MakeFolder("Volume").string(), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  const path before = folder.MakeFolder("Volume/a/b");
  const path after = folder.MakeFolder("Volume/c") / "d";
  for (int i = 0; i < 20; ++i) std::filesystem::create_directory(before / std::to_string(i));
  const std::string item = folder.MakeFile("Volume/a/b/19/a track.aif");
  Service learns;
  const std::string record = learns.Ask(RecordRequest(item), 75).substr(1, 70);

  Service service(Command());
  const std::string none = Record(service.NumberOf("Volume"), kSharedID, "none");
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(none, 0, 0), kNoItemResponse));
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(item)));
  std::filesystem::rename(before, after);
  EXPECT_TRUE(service.Answers(PathOfRecordRequest(record, 0, 0),
                              PathResponse((after / "19/a track.aif").string())));
}

INSTANTIATE_TEST_SUITE_P(Surroundings, ClockSetTo,
                         testing::Values(Clock{"Before1970", "-86400", "0"},
                                         Clock{"The1stOfJanuary1970", "0", "0"},
                                         Clock{"TheYear2038", "2147483647", "1"},
                                         Clock{"TheYear9999", "253402300799", "0"},
                                         Clock{"GoingBackwards", "1800000000", "-3600"}),
                         [](const auto& clock) { return clock.param.name; });

// A disk's times from another machine, whose clock was set to anything.
class TimesOnDisk : public testing::TestWithParam<const char*> {
 protected:
  // Sets every time of the folders and the item, including the birth time.
  bool SetTimes(const std::string& time) {
    std::string commands;
    for (const char* const item : {"/", "/folder", "/folder/a track.aif"}) {
      for (const char* const field : {"atime", "ctime", "mtime", "crtime"}) {
        commands +=
            std::string("set_inode_field \\\"") + item + "\\\" " + field + " " + time + "\n";
      }
    }
    return RunTool({"sh", "-c", "printf \"" + commands + "\" | debugfs -w '" + ImagePath() + "'"});
  }
  std::string ImagePath() const { return (mImage.Path().parent_path() / "image").string(); }

  FileSystemImage mImage{"ext4", {"mkfs.ext4", "-q", "-F", "-L", "Disk"}, 8 << 20};
};

TEST_P(TimesOnDisk, ChangeNoAnswer) {
  if (!EnterOwnMountNamespace() || !mImage.IsMade() || !mImage.Mount()) {
    GTEST_SKIP() << "no ext4 images here";
  }
  const path folder = mImage.Path() / "folder";
  std::filesystem::create_directory(folder);
  std::ofstream(folder / "a track.aif").put('x');
  std::filesystem::permissions(mImage.Path().parent_path(), std::filesystem::perms(0755));
  mImage.Unmount();
  ASSERT_TRUE(SetTimes(GetParam()));
  ASSERT_TRUE(mImage.Mount());

  Service service;
  ExpectRightAnswers(service, folder / "a track.aif");
  const Item item = LearnItem(service, folder / "a track.aif");
  // Found by a pass, and found again after its folder is renamed.
  const std::vector<std::string> nobody{"setpriv", "--reuid=65534", "--clear-groups"};
  Service another(IsPermitted(nobody) ? nobody : std::vector<std::string>{"env"});
  EXPECT_TRUE(another.Answers(RequestAbout(item, 9), PathResponse(item.path)));
  const path renamed = mImage.Path() / "renamed";
  std::filesystem::rename(folder, renamed);
  EXPECT_TRUE(
      another.Answers(RequestAbout(item, 9), PathResponse((renamed / "a track.aif").string())));
}

INSTANTIATE_TEST_SUITE_P(Surroundings, TimesOnDisk,
                         testing::Values("19700101000000", "20380119031408", "24000101000000"));

// --- Languages and time zones -------------------------------------------------------------------

constexpr const char* kTurkish = "tr_TR.UTF-8";  // where "I" is not the capital of "i"

// Names of every kind: ASCII, both forms of accents, Turkish, Japanese, not UTF-8, too long.
class Language : public testing::Test {
 protected:
  Language() {
    for (const std::string& name :
         {std::string("INFO.aif"), std::string("\xC3\xA9t\xC3\xA9.aif"),
          std::string("e\xCC\x81t\xC3\xA9.aif"), std::string("\xC4\xB0\xC4\xB1.aif"),
          std::string("\xE6\x97\xA5\xE6\x9C\xAC.aif"), std::string("\xFF:\x01.aif"),
          std::string(200, 'i') + ".aif"}) {
      mItems.push_back(mFolder.MakeFile(name));
    }
  }

  // Returns a service's answers to every request about every item, with nothing else in its
  // environment than these variables.
  std::string Answers(const std::vector<std::string>& environment) const {
    std::vector<std::string> command{"env", "-i"};
    command.insert(command.end(), environment.begin(), environment.end());
    Service service(command);
    for (const std::string& path : mItems) {
      Item item = mAnyItem;
      item.path = path;
      for (unsigned code = 1; code <= 10; ++code) service.Write(RequestAbout(item, code));
      service.Write(AddNameRequest(item.folder, "I\x8E/i.AIF", 0));
      service.Write(PathOfRecordRequest(Record(item.volume, item.folderID, "\x8Et\x8E.AIF"), 1, 0));
    }
    service.CloseInput();
    std::string answers = service.ReadToEnd();
    EXPECT_EQ(service.Wait(), 0);
    return answers;
  }

  TemporaryFolder mFolder;
  std::vector<std::string> mItems;
  Service mLearns;
  const Item mAnyItem = LearnItem(mLearns, mFolder.MakeFile("a track.aif"));
};

TEST_F(Language, ChangesNoByteOfAnAnswer) {
  const std::string plain = Answers({});
  EXPECT_GT(plain.size(), mItems.size() * 12 * kTrailer.size());
  // A locale that cannot be made here counts as one more missing locale.
  RunTool({"localedef", "-i", "tr_TR", "-f", "UTF-8", (mFolder.Path() / kTurkish).string()});
  const std::string places = "LOCPATH=" + mFolder.Path().string();
  for (const std::string language :
       {"", "C", "POSIX", "C.UTF-8", "en_US.ISO-8859-1", kTurkish, "no such language"}) {
    for (const std::string variable :
         {"LANG=", "LC_ALL=", "LC_CTYPE=", "LC_COLLATE=", "LC_NUMERIC=", "LANGUAGE="}) {
      EXPECT_EQ(Answers({places, variable + language}), plain) << variable << language;
    }
  }
}

TEST_F(Language, IsNoDifferentInAnotherTimeZone) {
  const std::string plain = Answers({});
  for (const char* const zone :
       {"TZ=", "TZ=UTC", "TZ=Asia/Kathmandu", "TZ=<-12>+12", "TZ=:nowhere"}) {
    EXPECT_EQ(Answers({zone}), plain) << zone;
  }
}

}  // namespace
}  // namespace tallowmere::test
