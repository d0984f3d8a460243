// Statements of docs/protocol.md on how the service ends, on full paths and on new items.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/mount.h>
#include <unistd.h>

#include <array>
#include <filesystem>
#include <string>
#include <vector>

#include "support/EveryRequest.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

using std::filesystem::path;

// --- What ends the service ----------------------------------------------------------------------

// Runs the service under a shell that redirects its streams, e.g. "</dev/null".
Service Redirected(const std::string& streams) {
  return Service(std::vector<std::string>{"sh", "-c", "exec \"$@\" " + streams, "sh"});
}

TEST(UnusualStreams, NonBlockingInputWithoutDataEndsTheServiceWithStatus0) {
  std::array<int, 2> ends{};
  ASSERT_EQ(pipe2(ends.data(), O_NONBLOCK), 0);
  Service service = Redirected("<&" + std::to_string(ends[0]));
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
  for (const int end : ends) close(end);
}

TEST(UnusualStreams, AFolderAsInputEndsTheServiceWithStatus0) {
  Service service = Redirected("</");
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(UnusualStreams, AFullDeviceAsOutputEndsTheServiceWithStatus0) {
  Service service = Redirected(">/dev/full");
  service.Write(kAnyRequest);
  EXPECT_EQ(service.Wait(), 0);
}

TEST(UnusualStreams, AFileThatMayNotGrowRaisesItsSignal) {
  const TemporaryFolder folder;
  Service service(std::vector<std::string>{
      "sh", "-c", "ulimit -f 0; exec \"$@\" >'" + folder.Path().string() + "/out'", "sh"});
  service.Write(kAnyRequest);
  EXPECT_EQ(service.Wait(), -SIGXFSZ);
}

// --- Code 1 -------------------------------------------------------------------------------------

class FullPathOf : public testing::Test {
 protected:
  std::string FullPath(const std::string& item) {
    const std::string answer =
        mService.Ask(FullPathRequest(item, kRoomForAFullPath, 1), 2 + kRoomForAFullPath + 4);
    return answer.size() > 2 ? answer.c_str() + 2 : "";
  }

  TemporaryFolder mFolder;
  Service mService;
};

TEST_F(FullPathOf, APathOnNoVolumeIsAColon) {
  for (const char* const item : {"relative", "relative/x", "", "~no such user", "~no such user/x",
                                 "file:///etc", "/proc/self/status", "/dev/null"}) {
    EXPECT_EQ(FullPath(item), ":") << item;
  }
}

TEST_F(FullPathOf, AMissingItemInNoFolderIsTheVolumeAlone) {
  mFolder.MakeFile("file");
  mFolder.MakeLink("dangling", "nowhere");
  mFolder.MakeLink("link", mFolder.MakeFolder("folder"));
  const std::string here = FullPath(mFolder.Path());
  const std::string volume = here.substr(0, here.find(':') + 1);
  for (const char* const item : {"file/x", "dangling/x", "link/x", "missing/x"}) {
    EXPECT_EQ(FullPath(mFolder.Path() / item), volume) << item;
  }
}

TEST_F(FullPathOf, AnyOtherItemIsItsFolder) {
  mFolder.MakeFile("file");
  mFolder.MakeLink("dangling", "nowhere");
  const std::string here = FullPath(mFolder.Path());
  for (const char* const item : {"file", "dangling", "missing"}) {
    EXPECT_EQ(FullPath(mFolder.Path() / item), here) << item;
  }
  EXPECT_EQ(FullPath("/proc"), FullPath("/"));
}

TEST_F(FullPathOf, AFileMountedByItselfIsItsFolder) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const std::string file = mFolder.MakeFile("file");
  const ScopedMount mount(mFolder.MakeFile("other"), file, nullptr, MS_BIND);
  ASSERT_TRUE(mount.IsMounted());
  EXPECT_EQ(FullPath(file), FullPath(mFolder.Path()));
}

// --- New items ----------------------------------------------------------------------------------

class NewItems : public testing::Test {
 protected:
  std::string RecordOf(const std::string& item) {
    const std::string answer = mService.Ask(RecordRequest(item), 75);
    return answer.size() == 75 && answer[0] == 1 ? answer.substr(1, 70) : std::string();
  }
  std::string NameIn(const std::string& record) const {
    return record.substr(7, static_cast<unsigned char>(record.at(6)));
  }
  std::string RecordInFolder(const std::string& name) {
    std::string record = RecordOf(mFolder.MakeFile("known"));
    record.resize(6);
    return (record + Record(0, 0, name).substr(6));
  }
  bool Leads(const std::string& record, const path& item) {
    return mService.Answers(PathOfRecordRequest(record, 0, 0), PathResponse(item.string()));
  }

  TemporaryFolder mFolder;
  Service mService;
};

TEST_F(NewItems, OutsideMacRomanBecomeQuestionMarksAndNothingElseIsExchanged) {
  EXPECT_EQ(NameIn(RecordOf(mFolder.Path() / "\xE6\x97\xA5:x.aif")), "?:x.aif");
  EXPECT_EQ(NameIn(RecordOf(mFolder.Path() / "a\xFF"
                                             "b")),
            "a?b");
  EXPECT_TRUE(Leads(RecordOf(mFolder.Path() / "\xE6\x97\xA5.aif"), mFolder.MakeFile("?.aif")));
}

TEST_F(NewItems, LongerThanARecordAreCut) {
  const std::string there = mFolder.MakeFile(std::string(63, 'k'));
  EXPECT_TRUE(Leads(RecordOf(there + ".aif"), there));
}

TEST_F(NewItems, InDecomposedFormAreLedToThePrecomposedName) {
  EXPECT_TRUE(Leads(RecordOf(mFolder.Path() / "e\xCC\x81"), mFolder.Path() / "\xC3\xA9"));
}

TEST_F(NewItems, InNoFolderHaveRecordsThatLeadNowhere) {
  mFolder.MakeFile("file");
  mFolder.MakeLink("dangling", "nowhere");
  mFolder.MakeLink("link", mFolder.MakeFolder("folder"));
  for (const char* const item : {"file/x", "dangling/x", "link/x"}) {
    const std::string record = RecordOf(mFolder.Path() / item);
    ASSERT_FALSE(record.empty()) << item;
    EXPECT_TRUE(mService.Answers(PathOfRecordRequest(record, 0, 0), kNoItemResponse)) << item;
  }
}

TEST_F(NewItems, NamedByDotsAreOtherFolders) {
  const std::string here = mFolder.Path();
  for (const char* const name : {".", ".."}) {
    EXPECT_TRUE(mService.Answers(AddNameRequest(here, name, 0), PathResponse(here + "/" + name)));
    EXPECT_TRUE(Leads(RecordInFolder(name), mFolder.Path() / name));
  }
}

TEST_F(NewItems, WithoutANameAreTheirFolder) {
  EXPECT_TRUE(mService.Answers(AddNameRequest(mFolder.Path().string(), "", 0),
                               PathResponse(mFolder.Path().string())));
  EXPECT_TRUE(Leads(RecordInFolder(""), mFolder.Path()));
}

TEST_F(NewItems, WithAColonKeepIt) {
  const std::string item = mFolder.Path() / "a:b";
  EXPECT_TRUE(
      mService.Answers(AddNameRequest(mFolder.Path().string(), "a:b", 0), PathResponse(item)));
  EXPECT_TRUE(Leads(RecordInFolder("a:b"), item));
}

TEST_F(NewItems, BehindALinkKeepASlash) {
  const std::string link = mFolder.MakeLink("link", mFolder.MakeFolder("folder"));
  EXPECT_TRUE(mService.Answers(AddNameRequest(link, "a/b", 0), PathResponse(link + "/a/b")));
}

TEST_F(NewItems, NamedByATildeInNoFolderAreHomeFolders) {
  std::string home = mService.Ask(AddNameRequest("", "~", 0), 3);
  ASSERT_EQ(home.size(), 3u);
  home += mService.Read(static_cast<unsigned char>(home[1]) + 4u);
  EXPECT_GT(home.size(), 8u);
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(Record(32767, -1, "~"), 0, 0), home));
  EXPECT_TRUE(
      mService.Answers(PathOfRecordRequest(Record(32767, -1, "other"), 0, 0), kNoItemResponse));
}

TEST_F(NewItems, WithANulHaveNoPath) {
  const std::string record = RecordInFolder(std::string("new\0x", 5));
  EXPECT_TRUE(mService.Answers(PathOfRecordRequest(record, 0, 0), kNoItemResponse));
}

TEST_F(NewItems, InAnEmptyPathAreTheirNameAsAPath) {
  EXPECT_TRUE(mService.Answers(AddNameRequest("", "/abs", 0), PathResponse("/abs")));
}

TEST(AnEmptyFirstStringOfCode2, GetsNoColonAfterTheFolder) {
  const TemporaryFolder folder;
  const std::string item = folder.MakeFile("folder and name");
  Service service(std::vector<std::string>{"env", "-C", folder.Path().string()});
  // ":folder" and " and name", in the current directory.
  EXPECT_TRUE(service.Answers(
      PathOfHFSPathRequest(std::string("\0folder\0", 8), std::string(" and name\0", 10), 1),
      ResultResponse(0, item)));
}

}  // namespace
}  // namespace tallowmere::test
