// When the service ends, with which status, and that it leaves nothing behind.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <fstream>
#include <optional>
#include <utility>

#include "service/RightAnswers.h"
#include "support/ChildProgram.h"
#include "support/DeadMount.h"
#include "support/EveryRequest.h"
#include "support/MountNamespace.h"
#include "support/Pipe.h"
#include "support/TemporaryFolder.h"
#include "support/TracedService.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

// Returns the id of a process that has ended and been reaped.
std::string IDOfNoProcess() {
  const pid_t process = fork();
  if (process == 0) _exit(0);
  waitpid(process, nullptr, 0);
  return std::to_string(process);
}

TEST(Lifetime, WithoutAnArgumentTheServiceSaysSoAndReadsNothing) {
  ChildProgram service(ServiceToTest(), {});
  service.Write(kAnyRequest);
  EXPECT_EQ(service.ReadErrorsToEnd(), "Tallowmere missing a parameter.\n");
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 1);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, FurtherArgumentsAreIgnored) {
  ChildProgram service(ServiceToTest(), {std::to_string(getpid()), "0", "x"});
  service.Write(kAnyRequest + kAnyRequest + kQuit);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse + kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

// Arguments for which kill finds a process: this process group, every process, or (as P) this
// process. The service then serves one request after another.
class ArgumentThatNamesAProcess : public testing::TestWithParam<const char*> {};

TEST_P(ArgumentThatNamesAProcess, KeepsTheServiceServing) {
  std::string argument = GetParam();
  if (const auto place = argument.find('P'); place != std::string::npos) {
    argument.replace(place, 1, std::to_string(getpid()));
  }
  Service service(argument);
  for (int i = 0; i < 3; ++i) ASSERT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  service.Write(kQuit);
  EXPECT_EQ(service.Wait(), 0);
}

INSTANTIATE_TEST_SUITE_P(Lifetime, ArgumentThatNamesAProcess,
                         testing::Values("abc", "-1", "", "0", " Px", "\t+P"));

TEST(Lifetime, ANumberEndsAtTheFirstNonDigit) {
  Service service(" " + IDOfNoProcess() + "x");
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, WithoutALivingParentTheFirstRequestIsStillServedInFull) {
  Service service(IDOfNoProcess());
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, EndsAfterTheRequestDuringWhichItsParentDied) {
  const pid_t parent = fork();
  if (parent == 0) {
    pause();
    _exit(0);
  }
  Service service(std::to_string(parent));
  EXPECT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  EXPECT_EQ(service.Ask(kAnyRequest, 8), kItsResponse);
  // The service has looked for its parent once it has read a byte of the next request.
  service.Write(kAnyRequest.substr(0, 1));
  while (service.UnreadInput() > 0) usleep(100);
  kill(parent, SIGKILL);
  waitpid(parent, nullptr, 0);
  service.Write(kAnyRequest.substr(1) + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, InputClosedBeforeAnyByteEndsTheServiceWithStatus0) {
  Service service;
  service.CloseInput();
  EXPECT_EQ(service.ReadToEnd(), "");
  EXPECT_EQ(service.Wait(), 0);
}

TEST(Lifetime, QuitAfterSeveralRequestsEndsWithStatus0AndNoResponse) {
  Service service;
  service.Write(kAnyRequest + kAnyRequest + kQuit + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse + kItsResponse);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

TEST(Lifetime, TheParentIsLookedForAfterEveryRequestEvenAFailedOne) {
  const auto run = RunTraced("kill", kAnyRequest + kAnyRequest);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  const std::string look = "kill(" + std::to_string(getpid()) + ", 0)";
  EXPECT_EQ(run->responses, kItsResponse + kItsResponse);
  EXPECT_EQ(std::count_if(run->calls.begin(), run->calls.end(),
                          [&](const std::string& call) { return call.starts_with(look); }),
            3);
}

TEST(Lifetime, TheParentIsNotLookedForWhenACodeEndsTheService) {
  for (const unsigned code : {0u, 11u, 65535u}) {
    const auto run = RunTraced("kill", kAnyRequest + U16(code));
    if (!run) GTEST_SKIP() << "strace cannot trace here";
    EXPECT_EQ(run->responses, kItsResponse);
    EXPECT_EQ(std::count_if(run->calls.begin(), run->calls.end(),
                            [](const std::string& call) { return IsCall(call, "kill"); }),
              1)
        << code;
  }
}

class UnknownCode : public testing::TestWithParam<unsigned> {};

TEST_P(UnknownCode, EndsTheServiceWithStatus1AndNoResponse) {
  Service service;
  service.Write(kAnyRequest + U16(GetParam()) + kAnyRequest);
  EXPECT_EQ(service.ReadToEnd(), kItsResponse);
  EXPECT_EQ(service.Wait(), 1);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

INSTANTIATE_TEST_SUITE_P(Lifetime, UnknownCode, testing::Values(11u, 255u, 256u, 65535u));

TEST(Lifetime, AResponseThatNobodyReadsRaisesTheBrokenPipeSignal) {
  Service service;
  service.CloseOutput();
  service.Write(kAnyRequest);
  EXPECT_EQ(service.Wait(), -SIGPIPE);
}

TEST(Lifetime, AResponseThatNobodyReadsEndsTheServiceWithStatus0WhereTheSignalIsIgnored) {
  Service service(std::to_string(getpid()), ChildProgram::BrokenPipe::kIsAnError);
  service.CloseOutput();
  service.Write(kAnyRequest + kAnyRequest);
  EXPECT_EQ(service.Wait(), 0);
  EXPECT_EQ(service.UnreadInput(), kAnyRequest.size());
}

// --- A parent that is killed --------------------------------------------------------------------

constexpr int kStillRuns = -1000;

// A process that starts a service and is killed. Only it holds the other ends of the service's
// pipes. Once it is gone, the service is reparented to this process.
class MortalParent {
 public:
  explicit MortalParent(ChildProgram::BrokenPipe brokenPipe = ChildProgram::BrokenPipe::kEnds) {
    prctl(PR_SET_CHILD_SUBREAPER, 1);
    const auto toParent = MakePipe();
    const auto toTest = MakePipe();
    mProcess = fork();
    if (mProcess == 0) {
      close(toParent[1]);
      Live(toParent[0], toTest[1], brokenPipe);
    }
    close(toParent[0]);
    close(toTest[1]);
    mOrders = toParent[1];
    if (read(toTest[0], &mService, sizeof mService) != sizeof mService) std::abort();
    close(toTest[0]);
  }
  MortalParent(const MortalParent&) = delete;
  MortalParent& operator=(const MortalParent&) = delete;
  ~MortalParent() {
    Kill();
    if (mService > 0) kill(mService, SIGKILL);
    if (mService > 0) waitpid(mService, nullptr, 0);
    close(mOrders);
    prctl(PR_SET_CHILD_SUBREAPER, 0);
  }

  pid_t ServiceProcess() const { return mService; }

  // Makes the parent write these bytes to the service. It reads no response.
  void Order(std::string_view requests) const {
    if (write(mOrders, requests.data(), requests.size()) < 0) std::abort();
  }

  void Kill() {
    if (mProcess <= 0) return;
    kill(mProcess, SIGKILL);
    waitpid(std::exchange(mProcess, -1), nullptr, 0);
  }

  // Returns the service's exit status, the negated number of the signal that ended it, or
  // kStillRuns after ten seconds. REQUIRES: the parent is gone.
  int StatusOfService() {
    int status = 0;
    for (int waited = 0; waited < 10'000; ++waited) {
      if (waitpid(mService, &status, WNOHANG) == mService) {
        mService = -1;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
      }
      usleep(1000);
    }
    return kStillRuns;
  }

 private:
  // Reports the service's process id once it has answered, then forwards the orders to it.
  [[noreturn]] static void Live(int orders, int test, ChildProgram::BrokenPipe brokenPipe) {
    Service service(std::to_string(getpid()), brokenPipe);
    const bool lives = service.Answers(kAnyRequest, kItsResponse);
    const pid_t process = service.Process();
    if (!lives || write(test, &process, sizeof process) != sizeof process) _exit(1);
    std::array<char, 4096> bytes;
    for (ssize_t got = 1; got > 0;) {
      got = read(orders, bytes.data(), bytes.size());
      if (got > 0) service.Write({bytes.data(), static_cast<std::size_t>(got)});
    }
    _exit(0);
  }

  pid_t mProcess = -1;
  pid_t mService = -1;
  int mOrders = -1;
};

// A system call in which a process is blocked.
struct AwaitedCall {
  long number = 0;
  unsigned long size = 0;  // of a read or write
};

// Returns nullopt while the process runs, and where the kernel does not say.
std::optional<AwaitedCall> CallAwaitedBy(pid_t process) {
  std::ifstream file("/proc/" + std::to_string(process) + "/syscall");
  AwaitedCall call;
  std::string descriptor;
  std::string buffer;
  file >> call.number >> descriptor >> buffer >> std::hex >> call.size;
  return file ? std::optional(call) : std::nullopt;
}

// Returns whether the kernel reports such calls, at least for this process.
bool AwaitedCallsAreTold() {
  return CallAwaitedBy(getpid()).has_value();
}

// Returns whether the process blocks within ten seconds in a call that satisfies `is`.
template <class Predicate>
bool ComesToAwait(pid_t process, Predicate is) {
  for (int waited = 0; waited < 10'000; ++waited) {
    const auto call = CallAwaitedBy(process);
    if (call && is(*call)) return true;
    usleep(1000);
  }
  return false;
}

constexpr const char* kCallsAreNotTold = "the kernel does not report which call blocks a process";

// Stops a process in front of a system call. The process continues when the object ends.
class StoppedAtCall {
 public:
  // REQUIRES: the process waits for input.
  explicit StoppedAtCall(pid_t process)
      : mProcess(process),
        mTraces(ptrace(PTRACE_SEIZE, process, nullptr, PTRACE_O_TRACESYSGOOD) == 0 &&
                ptrace(PTRACE_INTERRUPT, process, nullptr, nullptr) == 0 && Stops()) {}
  StoppedAtCall(const StoppedAtCall&) = delete;
  StoppedAtCall& operator=(const StoppedAtCall&) = delete;
  ~StoppedAtCall() { ptrace(PTRACE_DETACH, mProcess, nullptr, nullptr); }

  // Returns false where the process may not be traced.
  bool Traces() const { return mTraces; }

  // Lets the process run up to its next call of that number. Returns false when it ends first.
  bool GoTo(std::uint64_t number) const {
    while (ptrace(PTRACE_SYSCALL, mProcess, nullptr, nullptr) == 0 && Stops()) {
      __ptrace_syscall_info info{};
      ptrace(PTRACE_GET_SYSCALL_INFO, mProcess, sizeof info, &info);
      if (info.op == PTRACE_SYSCALL_INFO_ENTRY && info.entry.nr == number) return true;
    }
    return false;
  }

 private:
  bool Stops() const {
    int status = 0;
    return waitpid(mProcess, &status, __WALL) == mProcess && WIFSTOPPED(status);
  }

  pid_t mProcess;
  bool mTraces;
};

TEST(KilledParent, EndsTheServiceThatWaits) {
  if (!AwaitedCallsAreTold()) GTEST_SKIP() << kCallsAreNotTold;
  MortalParent parent;
  const auto isReadOfACode = [](const AwaitedCall& call) {
    return call.number == SYS_read && call.size == 2;
  };
  ASSERT_TRUE(ComesToAwait(parent.ServiceProcess(), isReadOfACode));
  parent.Kill();
  EXPECT_EQ(parent.StatusOfService(), 0);
}

TEST(KilledParent, EndsTheServiceThatWaitsForTheRestOfARequest) {
  if (!AwaitedCallsAreTold()) GTEST_SKIP() << kCallsAreNotTold;
  MortalParent parent;
  parent.Order(U16(7) + U16(1000) + "/");
  const auto isReadOfTheRest = [](const AwaitedCall& call) {
    return call.number == SYS_read && call.size == 999;
  };
  ASSERT_TRUE(ComesToAwait(parent.ServiceProcess(), isReadOfTheRest));
  parent.Kill();
  EXPECT_EQ(parent.StatusOfService(), 0);
}

// How a service ends whose parent is killed before or while it writes.
struct AtTheBrokenPipe {
  const char* name;
  ChildProgram::BrokenPipe brokenPipe;
  int status;
};

class KilledParentOfABusyService : public testing::TestWithParam<AtTheBrokenPipe> {};

TEST_P(KilledParentOfABusyService, EndsItInTheMiddleOfAPassOverAVolume) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
  const TemporaryFolder folder;
  const ScopedMount volume("none", folder.MakeFolder("Large"), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  for (int i = 0; i < 100; ++i) folder.MakeFolder("Large/" + std::to_string(i));
  Service learns;
  const int number = learns.NumberOf("Large");

  MortalParent parent(GetParam().brokenPipe);
  {
    const StoppedAtCall service(parent.ServiceProcess());
    if (!service.Traces()) GTEST_SKIP() << "the service cannot be traced here";
    parent.Order(PathOfRecordRequest(Record(number, kSharedID, "none"), 0, 0));
    for (int read = 0; read < 50; ++read) ASSERT_TRUE(service.GoTo(SYS_getdents64));
    parent.Kill();
  }
  EXPECT_EQ(parent.StatusOfService(), GetParam().status);
}

TEST_P(KilledParentOfABusyService, EndsItInTheMiddleOfAResponse) {
  if (!AwaitedCallsAreTold()) GTEST_SKIP() << kCallsAreNotTold;
  MortalParent parent(GetParam().brokenPipe);
  std::string requests;  // whose responses exceed the capacity of a pipe
  for (int i = 0; i < 200; ++i) requests += FullPathRequest("/", 1024, 1);
  parent.Order(requests);
  const auto isWrite = [](const AwaitedCall& call) { return call.number == SYS_write; };
  ASSERT_TRUE(ComesToAwait(parent.ServiceProcess(), isWrite));
  parent.Kill();
  EXPECT_EQ(parent.StatusOfService(), GetParam().status);
}

INSTANTIATE_TEST_SUITE_P(
    Lifetime, KilledParentOfABusyService,
    testing::Values(AtTheBrokenPipe{"BySignal", ChildProgram::BrokenPipe::kEnds, -SIGPIPE},
                    AtTheBrokenPipe{"ByItself", ChildProgram::BrokenPipe::kIsAnError, 0}),
    [](const auto& tested) { return tested.param.name; });

// A service that the kernel keeps waiting for a dead server cannot end by itself.
class KilledParentOfAServiceAtADeadMount : public testing::Test {
 protected:
  void SetUp() override {
    if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted here";
    mDead.emplace(mFolder.MakeFolder("Dead"));
    if (!mDead->IsMounted()) GTEST_SKIP() << "no FUSE mounts here";
    if (!AwaitedCallsAreTold()) GTEST_SKIP() << kCallsAreNotTold;
    mParent.emplace();
    mParent->Order(RecordRequest(mFolder.Path().string() + "/Dead/item"));
    const auto isLook = [](const AwaitedCall& call) {
      return call.number > 0 && call.number != SYS_read;
    };
    ASSERT_TRUE(ComesToAwait(mParent->ServiceProcess(), isLook));
    mParent->Kill();
  }

  TemporaryFolder mFolder;
  std::optional<DeadMount> mDead;
  std::optional<MortalParent> mParent;
};

TEST_F(KilledParentOfAServiceAtADeadMount, EndsItWhenTheServerEnds) {
  mDead->End();
  EXPECT_EQ(mParent->StatusOfService(), -SIGPIPE);
}

TEST_F(KilledParentOfAServiceAtADeadMount, LeavesItToBeKilled) {
  kill(mParent->ServiceProcess(), SIGKILL);
  EXPECT_EQ(mParent->StatusOfService(), -SIGKILL);
}

// --- What is left behind ------------------------------------------------------------------------

// Traces every request, a pass over a volume and the exit. Covers the calls that name a file, that
// create or send something for other processes, and that write.
TEST(Lifetime, NothingIsCreatedChangedOrSent) {
  if (kIsSanitized) GTEST_SKIP() << "the sanitizer makes calls of its own";
  const EveryRequest every;
  if (!every.IsMade()) GTEST_SKIP() << "the path of the temporary folder is too long";
  std::string requests;
  for (unsigned code = 1; code <= 10; ++code) requests += every.Of(code);
  const TemporaryFolder folder;
  std::optional<ScopedMount> volume;
  if (EnterOwnMountNamespace()) volume.emplace("none", folder.MakeFolder("Volume"), "tmpfs");
  folder.MakeFolder("Volume/folder/folder");
  Service learns;
  const int number = learns.NumberOf("Volume");
  requests += PathOfRecordRequest(Record(number, kSharedID, "none"), 0, 0);

  const auto run = RunTraced(
      "%file,%network,%ipc,%process,getdents64,write,writev,pwrite64,pwritev,pwritev2,sendfile,"
      "splice,copy_file_range,ftruncate,fallocate,fchmod,fchown,fsetxattr,memfd_create,mq_open,"
      "open_by_handle_at,inotify_init1,pidfd_open",
      requests);
  if (!run) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_EQ(run->status, 0);
  const std::vector<std::string> looks{"access",
                                       "execve",
                                       "exit_group",
                                       "getcwd",
                                       "getdents64",
                                       "kill",
                                       "lstat",
                                       "newfstatat",
                                       "name_to_handle_at",
                                       "open_by_handle_at",
                                       "openat",
                                       "openat2",
                                       "readlink",
                                       "readlinkat",
                                       "stat",
                                       "statx",
                                       "faccessat2",
                                       "statfs",
                                       "open"};
  int passes = 0;
  for (const std::string& call : run->calls) {
    if (call.starts_with("+++ ")) continue;  // strace's note of the exit
    const std::string name = call.substr(0, call.find('('));
    passes += name == "getdents64" ? 1 : 0;
    if (name == "write") {
      EXPECT_TRUE(call.starts_with("write(1, ")) << call;
      continue;
    }
    EXPECT_THAT(looks, testing::Contains(name)) << call;
    if (!name.starts_with("open")) continue;
    for (const char* const flag : {"O_CREAT", "O_WRONLY", "O_RDWR", "O_TMPFILE", "O_TRUNC"}) {
      EXPECT_EQ(call.find(flag), std::string::npos) << call;
    }
  }
  if (volume) {
    EXPECT_GT(passes, 0);
  }
}

}  // namespace
}  // namespace tallowmere::test
