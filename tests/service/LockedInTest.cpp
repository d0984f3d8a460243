// What a locked-in service can no longer do, attempted from inside its process.
#include <gtest/gtest.h>
#include <linux/landlock.h>
#include <sys/mount.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "service/RightAnswers.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

using Outcomes = std::map<std::string, int>;  // attempts and their error numbers

// A listening local socket at a path.
class Listener {
 public:
  explicit Listener(const std::string& path) : mSocket(socket(AF_UNIX, SOCK_STREAM, 0)) {
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    std::strncpy(address.sun_path, path.c_str(), sizeof address.sun_path - 1);
    if (bind(mSocket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
        listen(mSocket, 1) != 0) {
      std::abort();
    }
  }
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;
  ~Listener() { close(mSocket); }

 private:
  int mSocket;
};

// Runs a service that makes every attempt after its first request and goes on serving.
class LockedIn : public testing::Test {
 protected:
  LockedIn() {
    for (const char* const file : {"file", "old file", "old name"}) mFolder.MakeFile(file);
    mFolder.MakeFolder("old folder");
  }

  // `wrapper` precedes the program. Returns no outcomes where the kernel forbids the wrapper.
  Outcomes AttemptAll(const std::vector<std::string>& wrapper = {},
                      const std::string& program = TALLOWMERE_SERVICE) {
    const Listener listener((mFolder.Path() / "socket").string());
    std::vector<std::string> command = wrapper;
    command.insert(
        command.end(),
        {"env", "ASAN_OPTIONS=verify_asan_link_order=0", "LD_PRELOAD=" TALLOWMERE_ATTEMPTS,
         "TALLOWMERE_ATTEMPTS=" + mFolder.Path().string(), program, std::to_string(getpid())});
    ChildProgram service(command[0], {command.begin() + 1, command.end()});
    service.Write(kAnyRequest + kAnyRequest + kQuit);
    EXPECT_EQ(service.ReadToEnd(), kItsResponse + kItsResponse);
    std::istringstream lines(service.ReadErrorsToEnd());
    EXPECT_EQ(service.Wait(), 0);
    Outcomes outcomes;
    std::string name;
    for (int error = 0; lines >> name >> error;) outcomes[name] = error;
    EXPECT_GT(outcomes.size(), 60u);
    return outcomes;
  }

  TemporaryFolder mFolder;
};

bool IsOf(const std::string& attempt, const char* group) {
  return attempt.starts_with(std::string(group) + "/");
}
bool IsNeeded(const std::string& attempt) {
  return IsOf(attempt, "needed");
}
// A sanitizer's leak check needs these calls, so they stay open for it.
bool IsOfTheLeakCheck(const std::string& attempt) {
  return kIsSanitized && IsOf(attempt, "processes");
}

// Returns the version of this kernel's Landlock; not positive where it has none.
long LandlockVersion() {
  return syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
}
constexpr long kTruncatingIsKnown = 3;
constexpr long kNetworksAreKnown = 4;

bool MeansRefused(int error) {
  return error == EPERM || error == EACCES || error == ENOSYS;
}

TEST_F(LockedIn, IsRefusedEveryAttemptAndLives) {
  if (LandlockVersion() < kTruncatingIsKnown) GTEST_SKIP() << "this Landlock leaves openat2 open";
  for (const auto& [attempt, error] : AttemptAll()) {
    if (IsNeeded(attempt) || IsOfTheLeakCheck(attempt)) continue;
    EXPECT_TRUE(MeansRefused(error)) << attempt << ": " << std::strerror(error);
  }
}

TEST_F(LockedIn, MayDoWhatItNeeds) {
  for (const auto& [attempt, error] : AttemptAll()) {
    if (IsNeeded(attempt)) {
      EXPECT_EQ(error, 0) << attempt << ": " << std::strerror(error);
    }
  }
}

// Shows that the attempts are real: without the lock, nothing refuses them.
TEST_F(LockedIn, CouldMakeEveryAttemptWithoutTheLock) {
  if (geteuid() != 0) GTEST_SKIP() << "some attempts need privileges";
  for (const auto& [attempt, error] : AttemptAll({}, TALLOWMERE_OPEN_SERVICE)) {
    const bool isAbsent =
        IsOf(attempt, "absent") || (IsOf(attempt, "configured") && error == ENOSYS);
    if (isAbsent) continue;  // the kernel was built without this call
    EXPECT_FALSE(MeansRefused(error)) << attempt << ": " << std::strerror(error);
  }
}

TEST_F(LockedIn, LeavesEveryFileAsItIs) {
  std::ofstream(mFolder.Path() / "file") << "content";
  const auto before = std::filesystem::last_write_time(mFolder.Path() / "file");
  AttemptAll();
  EXPECT_EQ(std::filesystem::file_size(mFolder.Path() / "file"), 7u);
  EXPECT_EQ(std::filesystem::last_write_time(mFolder.Path() / "file"), before);
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(mFolder.Path())) {
    names.push_back(entry.path().filename());
  }
  std::sort(names.begin(), names.end());
  EXPECT_EQ(names,
            (std::vector<std::string>{"file", "old file", "old folder", "old name", "socket"}));
}

TEST_F(LockedIn, IsInForceFromTheFirstRequestOn) {
  Service service;
  ASSERT_TRUE(service.Answers(kAnyRequest, kItsResponse));
  std::ifstream status("/proc/" + std::to_string(service.Process()) + "/status");
  const std::string text{std::istreambuf_iterator<char>(status), {}};
  EXPECT_NE(text.find("\nNoNewPrivs:\t1\n"), std::string::npos);
  EXPECT_NE(text.find("\nSeccomp:\t2\n"), std::string::npos);
}

// --- Kernels that offer less --------------------------------------------------------------------

std::vector<std::string> Without(const char* wall) {
  return {TALLOWMERE_WITHOUT_WALLS, wall};
}

TEST_F(LockedIn, WithoutLandlockIsKeptFromFilesByTheFilter) {
  for (const auto& [attempt, error] : AttemptAll(Without("landlock"))) {
    if (IsNeeded(attempt)) {
      EXPECT_EQ(error, 0) << attempt;
    } else if (IsOf(attempt, "openat2")) {
      EXPECT_EQ(error, 0) << "the filter cannot see " << attempt;
    } else if (!IsOfTheLeakCheck(attempt)) {
      EXPECT_TRUE(MeansRefused(error)) << attempt << ": " << std::strerror(error);
    }
  }
}

TEST_F(LockedIn, WithoutFiltersIsKeptFromFilesAndTCPByLandlock) {
  if (LandlockVersion() < kNetworksAreKnown)
    GTEST_SKIP() << "this kernel's Landlock cannot restrict networks";
  for (const auto& [attempt, error] : AttemptAll(Without("filters"))) {
    if (IsNeeded(attempt)) {
      EXPECT_EQ(error, 0) << attempt;
    }
    if (IsOf(attempt, "files") || IsOf(attempt, "openat2") || IsOf(attempt, "tcp")) {
      EXPECT_EQ(error, EACCES) << attempt;
    }
  }
}

class LockedInOnAKernel : public testing::TestWithParam<const char*> {};

TEST_P(LockedInOnAKernel, AnswersEveryRequest) {
  const TemporaryFolder folder;
  folder.MakeFolder("folder");
  Service service(Without(GetParam()));
  ExpectRightAnswers(service, folder.MakeFile("folder/a track.aif"));
}

INSTANTIATE_TEST_SUITE_P(Without, LockedInOnAKernel,
                         testing::Values("landlock", "filters", "both"));

// --- Networks -----------------------------------------------------------------------------------

// Mounts another file over /etc/nsswitch.conf.
class LockedInWithUsersFrom : public LockedIn {
 protected:
  Outcomes AttemptAllWith(const std::string& nameServiceSwitch) {
    const std::string file = mSwitch.MakeFile("nsswitch.conf", nameServiceSwitch);
    const ScopedMount mount(file, "/etc/nsswitch.conf", nullptr, MS_BIND);
    EXPECT_TRUE(mount.IsMounted());
    return AttemptAll();
  }
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    if (access("/etc/nsswitch.conf", F_OK) != 0) GTEST_SKIP() << "no /etc/nsswitch.conf here";
  }

  TemporaryFolder mSwitch;
};

TEST_F(LockedInWithUsersFrom, ANetworkMayOpenItsSockets) {
  const Outcomes outcomes = AttemptAllWith("group: files\npasswd: files ldap\n");
  for (const char* const attempt : {"network/internet", "network/internet6", "network/netlink"}) {
    EXPECT_EQ(outcomes.at(attempt), 0) << attempt;
  }
  EXPECT_EQ(outcomes.at("calls/packet"), EPERM);
  EXPECT_EQ(outcomes.at("tcp/connect"), ECONNREFUSED);
  EXPECT_TRUE(MeansRefused(outcomes.at("files/write")));
}

TEST_F(LockedInWithUsersFrom, FilesAndLocalDaemonsMayNot) {
  const Outcomes outcomes =
      AttemptAllWith("passwd: files [NOTFOUND=continue] systemd sss # ldap\nhosts: files dns\n");
  for (const char* const attempt : {"network/internet", "network/internet6", "network/netlink"}) {
    EXPECT_EQ(outcomes.at(attempt), EPERM) << attempt;
  }
}

}  // namespace
}  // namespace tallowmere::test
