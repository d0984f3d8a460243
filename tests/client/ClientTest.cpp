#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <tallowmere/Client.h>

#include <filesystem>

#include "support/AtomReader.h"
#include "support/TemporaryFolder.h"

namespace tallowmere {
namespace {

using std::chrono::milliseconds;
using test::TemporaryFolder;
using testing::HasSubstr;

Client StartClient() {
  return Client({.service = TALLOWMERE_SERVICE});
}

// The path of a shell script that takes the service's place.
std::string Impostor(const TemporaryFolder& folder, const std::string& script) {
  const std::string path = folder.MakeFile("impostor", "#!/bin/sh\n" + script + "\n").string();
  chmod(path.c_str(), 0755);
  return path;
}

std::string FailureOfFirstRequest(const std::string& service) {
  Client client({.service = service, .deadline = milliseconds(300)});
  const auto name = client.GetHFSVolumeName(0);
  return name ? "" : name.Failure().message;
}

TEST(Client, AsksForTheVolumesNamesAndNumbers) {
  Client client = StartClient();
  const auto name = client.GetHFSVolumeName(0);
  ASSERT_TRUE(name);
  ASSERT_TRUE(name->has_value());
  const auto number = client.GetVolRefnumByHFSName(**name);
  ASSERT_TRUE(number);
  ASSERT_TRUE(number->has_value());
  EXPECT_LT(**number, 0);
}

TEST(Client, AsksForNamesAndPathsOfAFile) {
  Client client = StartClient();
  const TemporaryFolder folder;
  const std::string file = folder.MakeFile("a:b");
  const auto name = client.GetHFSName(file);
  ASSERT_TRUE(name);
  EXPECT_EQ(*name, "a/b");
  const auto added = client.AddHFSName(folder.Path().string(), "a/b");
  ASSERT_TRUE(added);
  EXPECT_EQ(*added, file);
  const auto fullPath = client.MakeFullPath(file);
  ASSERT_TRUE(fullPath);
  const auto back = client.MakeFileRefFromPath(*fullPath + "a/b");
  ASSERT_TRUE(back);
  EXPECT_EQ(*back, file);
  const auto spec = client.GetFSSpec(file);
  ASSERT_TRUE(spec && *spec);
  const auto path = client.SetFileRefFromFSSpec(**spec, false);
  ASSERT_TRUE(path);
  EXPECT_EQ(*path, file);
}

TEST(Client, WhatCannotBeAskedIsNoneAndNoError) {
  Client client = StartClient();
  const std::string withNUL("/a\0b", 4);
  const std::string tooLong(65535, 'x');
  for (const std::string& path : {withNUL, tooLong}) {
    EXPECT_EQ(*client.GetHFSName(path), std::nullopt);
    EXPECT_EQ(*client.AddHFSName(path, "x"), std::nullopt);
    EXPECT_EQ(*client.AddHFSName("/", path), std::nullopt);
    EXPECT_EQ(*client.MakeFullPath(path), ":");
    EXPECT_EQ(*client.MakeFileRefFromPath(path), std::nullopt);
    EXPECT_FALSE(*client.GetFSSpec(path));
  }
  EXPECT_TRUE(*client.GetHFSVolumeName(0));
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

TEST(Client, ANameThatTheServiceWouldRefuseIsNoVolumesAndTheServiceLives) {
  Client client = StartClient();
  for (const std::string& name : {std::string(255, 'x'), std::string(256, 'x'),
                                  std::string(70000, 'x'), std::string(3, '\0')}) {
    const auto number = client.GetVolRefnumByHFSName(name);
    ASSERT_TRUE(number);
    EXPECT_FALSE(number->has_value());
  }
  EXPECT_TRUE(client.GetHFSVolumeName(0));
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
  Client client = StartClient();
  const auto settings = client.GetAIFFExportSettings(
      {.rate = 48000u << 16, .sampleSize = 16, .channels = 2, .format = 0x6D703461});
  ASSERT_TRUE(settings);
  EXPECT_EQ(settings->result, -206);
  EXPECT_EQ(settings->bytes, "");
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, AMissingProgramIsSaid) {
  EXPECT_THAT(FailureOfFirstRequest("/nonexistent/tallowmere"),
              HasSubstr("/nonexistent/tallowmere could not be started: No such file"));
}

TEST(Client, AProgramThatExitsAtOnceIsSaid) {
  EXPECT_EQ(FailureOfFirstRequest("/bin/true"), "the service ended before it answered");
}

TEST(Client, ATruncatedAnswerIsSaid) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureOfFirstRequest(Impostor(folder, "head -c 4 >/dev/null; printf '\\001\\005'")),
            "the service ended before it answered");
}

TEST(Client, AnAnswerWithAnotherTrailerIsSaid) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureOfFirstRequest(Impostor(
                folder, "head -c 4 >/dev/null; printf '\\000\\001\\000\\000mwlt'; sleep 2")),
            "the service's answer does not end as the protocol says");
}

TEST(Client, AServiceThatNeverAnswersIsSaidWhenTheDeadlineHasPassed) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureOfFirstRequest(Impostor(folder, "exec sleep 60")),
            "the service did not answer in time");
}

TEST(Client, AfterAnErrorTheNextRequestStartsAnotherService) {
  const TemporaryFolder folder;
  Client client({.service = Impostor(folder, "test -e ran && exec " TALLOWMERE_SERVICE " $1\n"
                                             "touch ran; exit")});
  std::filesystem::current_path(folder.Path());
  const auto failed = client.GetHFSVolumeName(0);
  ASSERT_FALSE(failed);
  EXPECT_EQ(failed.Failure().message, "the service ended before it answered");
  EXPECT_TRUE(client.GetHFSVolumeName(0));
}

TEST(Client, EndsItsServiceAndLeavesNeitherProcessNorDescriptor) {
  const auto openDescriptors = [] {
    const auto folder = std::filesystem::directory_iterator("/proc/self/fd");
    return std::distance(begin(folder), end(folder));
  };
  const auto before = openDescriptors();
  for (int i = 0; i < 20; ++i) {
    Client client = StartClient();
    ASSERT_TRUE(client.GetHFSVolumeName(0));
    Client moved = std::move(client);
    ASSERT_TRUE(moved.GetHFSVolumeName(0));
  }
  EXPECT_EQ(openDescriptors(), before);
  EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1);
  EXPECT_EQ(errno, ECHILD);
}

TEST(Client, AServiceThatDoesNotEndByItselfIsKilled) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureOfFirstRequest(Impostor(folder, "trap '' PIPE; exec sleep 60")),
            "the service did not answer in time");
  EXPECT_EQ(waitpid(-1, nullptr, WNOHANG), -1);
}

TEST(Client, TakesNoStandardDescriptorThatItsProgramHasClosed) {
  const pid_t child = fork();
  if (child == 0) {
    close(0);
    close(1);
    Client client = StartClient();
    const bool works = client.GetHFSVolumeName(0).HasValue();
    // What such a program prints by mistake must not reach the service.
    const bool untouched = write(1, "x", 1) == -1 && fcntl(0, F_GETFD) == -1;
    _exit(works && untouched ? 0 : 1);
  }
  int status = -1;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
}

TEST(Client, TellsTheServiceItsOwnProcessID) {
  const TemporaryFolder folder;
  EXPECT_EQ(
      FailureOfFirstRequest(Impostor(
          folder,
          "head -c 4 >/dev/null; test $1 = $PPID && printf '\\000\\001\\000\\000MWLT'; sleep 1")),
      "");
}

TEST(Client, LeavesAProgramThatIgnoresTheEndOfItsChildrenAlone) {
  const pid_t child = fork();
  if (child == 0) {
    signal(SIGCHLD, SIG_IGN);
    {
      Client client = StartClient();
      if (!client.GetHFSVolumeName(0)) _exit(1);
    }
    _exit(0);
  }
  int status = -1;
  waitpid(child, &status, 0);
  EXPECT_EQ(status, 0);
}

}  // namespace
}  // namespace tallowmere
