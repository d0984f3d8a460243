#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <optional>
#include <string>
#include <vector>

#include "client/ClientSupport.h"
#include "client/FindService.h"
#include "support/AtomReader.h"

namespace tallowmere {
namespace {

using test::StartClient;
using test::TemporaryFolder;

TEST(Client, AsksForTheVolumesNamesAndNumbers) {
  Client client = StartClient();
  const auto name = client.GetHFSVolumeName(0);
  ASSERT_TRUE(name && *name);
  const auto number = client.GetVolRefnumByHFSName(**name);
  ASSERT_TRUE(number && *number);
  EXPECT_LT(**number, 0);
}

TEST(Client, AsksForNamesAndPathsOfAFile) {
  Client client = StartClient();
  const TemporaryFolder folder;
  const std::string file = folder.MakeFile("a:b");
  EXPECT_EQ(*client.GetHFSName(file), "a/b");
  EXPECT_EQ(*client.AddHFSName(folder.Path().string(), "a/b"), file);
  const auto fullPath = client.MakeFullPath(file);
  ASSERT_TRUE(fullPath);
  EXPECT_EQ(*client.MakeFileRefFromPath(*fullPath + "a/b"), file);
  const auto spec = client.GetFSSpec(file);
  ASSERT_TRUE(spec && *spec);
  EXPECT_EQ((*spec)->name, "a/b");
  EXPECT_EQ(*client.SetFileRefFromFSSpec(**spec, false), file);
  EXPECT_EQ(*client.SetFileRefFromFSSpecData(**spec), file);
}

TEST(Client, WhatIsNotMountedIsNoneAndNoError) {
  Client client = StartClient();
  const auto name = client.GetHFSVolumeName(32767);
  ASSERT_TRUE(name);
  EXPECT_FALSE(name->has_value());
  const auto number = client.GetVolRefnumByHFSName("no such volume");
  ASSERT_TRUE(number);
  EXPECT_FALSE(number->has_value());
}

TEST(Client, WhatIsMissingIsNoneAndNoError) {
  Client client = StartClient();
  EXPECT_EQ(*client.GetHFSName("/missing"), std::nullopt);
  EXPECT_EQ(*client.GetFSSpec("/missing/file"), std::nullopt);
  EXPECT_EQ(*client.MakeFileRefFromPath("no such volume:"), std::nullopt);
  EXPECT_EQ(*client.SetFileRefFromFSSpecData({32767, 2, "x"}), std::nullopt);
}

TEST(Client, GetsTheSettingsForASound) {
  Client client = StartClient();
  const std::uint32_t rate = 48000u << 16;
  const auto settings = client.GetAIFFExportSettings(
      {.rate = rate, .sampleSize = 24, .channels = 6, .format = 0x736F7774});
  ASSERT_TRUE(settings);
  EXPECT_EQ(settings->result, 0);
  EXPECT_EQ(test::ReadAtomContainer(settings->bytes), test::SettingsOf("sowt", rate, 24, 6));
}

TEST(Client, ASoundThatIsRefusedHasACodeAndNoSettingsAndTheServiceLives) {
  const test::MortalService service;
  Client client({.service = service.Path()});
  const auto settings = client.GetAIFFExportSettings(
      {.rate = 48000u << 16, .sampleSize = 16, .channels = 2, .format = 0x6D703461});
  ASSERT_TRUE(settings);
  EXPECT_EQ(settings->result, -206);
  EXPECT_EQ(settings->bytes, "");
  const pid_t process = service.Process();
  EXPECT_TRUE(client.GetHFSVolumeName(0));
  EXPECT_EQ(service.Process(), process);
}

TEST(Client, EndsItsServiceAndLeavesNeitherProcessNorDescriptor) {
  const auto before = test::OpenDescriptors();
  for (int i = 0; i < 20; ++i) {
    Client client = StartClient();
    ASSERT_TRUE(client.GetHFSVolumeName(0));
    Client moved = std::move(client);
    ASSERT_TRUE(moved.GetHFSVolumeName(0));
    moved = StartClient();
    ASSERT_TRUE(moved.GetHFSVolumeName(0));
  }
  EXPECT_EQ(test::OpenDescriptors(), before);
  EXPECT_TRUE(test::HasNoChild());
}

TEST(Client, WaitsForAServiceThatEndsByItself) {
  const TemporaryFolder folder;
  {
    Client client(
        {.service = test::Impostor(folder, TALLOWMERE_SERVICE " $1; sleep 0.2; touch ended")});
    ASSERT_TRUE(client.GetHFSVolumeName(0));
  }
  EXPECT_TRUE(exists(folder.Path() / "ended"));
}

TEST(Client, KillsAServiceThatDoesNotEndWithinASecond) {
  const TemporaryFolder folder;
  const auto start = std::chrono::steady_clock::now();
  {
    Client client(
        {.service = test::Impostor(folder,
                                   "head -c 4 >/dev/null; printf '\\000\\001\\000\\000MWLT'\n"
                                   "exec sleep 60")});
    ASSERT_TRUE(client.GetHFSVolumeName(0));
  }
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(20));
  EXPECT_TRUE(test::HasNoChild());
}

TEST(Client, StartsNoServiceBeforeTheFirstRequest) {
  const Client client = StartClient();
  EXPECT_TRUE(test::HasNoChild());
}

// Whether a program that has closed these descriptors gets an answer, and still has none of them
// open: what it prints by mistake must not reach the service.
bool LeavesClosed(const std::vector<int>& descriptors) {
  const pid_t child = fork();
  if (child == 0) {
    for (const int descriptor : descriptors) close(descriptor);
    Client client = StartClient();
    const bool works = client.GetHFSVolumeName(0).HasValue();
    const bool areClosed = std::all_of(descriptors.begin(), descriptors.end(), [](int descriptor) {
      return fcntl(descriptor, F_GETFD) == -1;
    });
    _exit(works && areClosed ? 0 : 1);
  }
  int status = -1;
  waitpid(child, &status, 0);
  return status == 0;
}

TEST(Client, TakesNoStandardDescriptorThatItsProgramHasClosed) {
  EXPECT_TRUE(LeavesClosed({0, 1}));
  EXPECT_TRUE(LeavesClosed({0, 2}));
  EXPECT_TRUE(LeavesClosed({1, 2}));
  EXPECT_TRUE(LeavesClosed({0, 1, 2}));
}

TEST(Client, TellsTheServiceItsOwnProcessID) {
  const TemporaryFolder folder;
  Client client(
      {.service = test::Impostor(folder,
                                 "head -c 4 >/dev/null\n"
                                 "test $1 = $PPID && printf '\\000\\001\\000\\000MWLT'; cat")});
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, LeavesAProgramThatIgnoresTheEndOfItsChildrenAlone) {
  const pid_t child = fork();
  if (child == 0) {
    signal(SIGCHLD, SIG_IGN);
    {
      Client client = StartClient();
      if (!client.GetHFSVolumeName(0)) _exit(1);
    }
    Client ended({.service = "/bin/true"});
    if (ended.GetHFSVolumeName(0)) _exit(1);
    _exit(0);
  }
  int status = -1;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
}

TEST(Client, TheServiceIsFoundOnTheSearchPath) {
  const TemporaryFolder folder;
  folder.MakeLink("tallowmere", TALLOWMERE_SERVICE);
  folder.MakeFolder("earlier/tallowmere");
  const char* const variable = getenv("PATH");
  const std::string before = variable == nullptr ? "" : variable;
  setenv(
      "PATH",
      ("/nonexistent::" + (folder.Path() / "earlier:").string() + folder.Path().string()).c_str(),
      1);
  Client client;
  const auto found = client.GetHFSVolumeName(0);
  setenv("PATH", "/nonexistent", 1);
  Client lost;
  const auto notFound = lost.GetHFSVolumeName(0);
  setenv("PATH", before.c_str(), 1);
  EXPECT_TRUE(found);
  EXPECT_EQ(test::MessageOf(notFound),
            "the service \"tallowmere\" is neither beside this program nor on PATH");
}

// The exit status of a child whose root is that folder, which holds its program alone.
int StatusIn(const std::filesystem::path& root, const std::function<bool()>& isRight) {
  const pid_t child = fork();
  if (child == 0) _exit(chroot(root.c_str()) == 0 && isRight() ? 0 : 1);
  int status = -1;
  waitpid(child, &status, 0);
  return status;
}

// It is neither the root folder nor the current one.
TEST(FindService, PassesOverAnEmptyElementOfTheSearchPath) {
  if (geteuid() != 0) GTEST_SKIP() << "changing the root folder is not permitted here";
  const TemporaryFolder folder;
  folder.MakeFolder("there");
  for (const char* const name : {"tallowmere", "there/tallowmere"}) {
    chmod(folder.MakeFile(name).c_str(), 0755);
  }
  EXPECT_EQ(StatusIn(folder.Path(),
                     [] {
                       setenv("PATH", "::", 1);
                       return chdir("/there") == 0 && FindService().empty();
                     }),
            0);
  EXPECT_EQ(StatusIn(folder.Path(),
                     [] {
                       setenv("PATH", ":/nonexistent::/there", 1);
                       return FindService() == "/there/tallowmere";
                     }),
            0);
}

}  // namespace
}  // namespace tallowmere
