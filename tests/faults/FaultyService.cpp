#include "faults/FaultyService.h"

#include <linux/futex.h>
#include <sys/mman.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <iterator>
#include <new>

namespace tallowmere::test {
namespace {

constexpr std::chrono::seconds kPatience(10);
constexpr timespec kOneLook{0, 2'000'000};

// One page for all services of this program, which run one at a time.
struct SharedPage {
  SharedPage() {
    file = memfd_create("faults", 0);
    if (file < 0 || ftruncate(file, sizeof(FaultPage)) != 0) std::abort();
    void* const memory =
        mmap(nullptr, sizeof(FaultPage), PROT_READ | PROT_WRITE, MAP_SHARED, file, 0);
    if (memory == MAP_FAILED) std::abort();
    page = new (memory) FaultPage{};
  }

  int file;
  FaultPage* page;
};

SharedPage& Shared() {
  static SharedPage shared;
  return shared;
}

FaultPage& Page() {
  return *Shared().page;
}

bool HasEnded(pid_t process) {
  siginfo_t about{};
  const bool asked =
      waitid(P_PID, static_cast<id_t>(process), &about, WEXITED | WNOHANG | WNOWAIT) == 0;
  return !asked || about.si_pid == process;
}

}  // namespace

std::string Fault::Text() const {
  const std::string ofAll = std::to_string(number);
  if (kind == Kind::kNone) return "no fault";
  if (kind == Kind::kAllocation) return "no memory for allocation " + ofAll;
  const char* const name = effect > 0 ? strerrorname_np(effect) : "no bytes";
  return std::string(effect == kShortened ? "fewer bytes" : name) + " from call " + ofAll;
}

std::unique_ptr<Copies> FaultyService::Original() {
  setenv(kFaultPageVariable, std::to_string(Shared().file).c_str(), 1);
  return std::make_unique<Copies>(TALLOWMERE_SERVICE, TALLOWMERE_FAULT_LIBRARY);
}

FaultyService::FaultyService(const Copies& copies, const Fault& fault) {
  Page().rests = 0;
  Page().liveAllocations = 0;
  Arm(fault);
  mProgram = std::make_unique<ChildProgram>(
      [&copies](const ChildProgram::Streams& streams) { return copies.Make(streams); });
  AwaitRest();
}

void FaultyService::Arm(const Fault& fault) {
  Page().calls = 0;
  Page().allocations = 0;
  Page().failed = 0;
  Page().effect = fault.effect;
  Page().failingCall = fault.kind == Fault::Kind::kCall ? fault.number : 0;
  Page().failingAllocation = fault.kind == Fault::Kind::kAllocation ? fault.number : 0;
}

bool FaultyService::AwaitRest() {
  const auto end = std::chrono::steady_clock::now() + kPatience;
  while (Page().rests == mRests) {
    syscall(SYS_futex, &Page().rests, FUTEX_WAIT, mRests, &kOneLook, nullptr, 0);
    if (Page().rests != mRests) break;
    if (HasEnded(mProgram->Process()) || std::chrono::steady_clock::now() > end) return false;
  }
  mRests = Page().rests;
  return true;
}

Outcome FaultyService::Ask(std::string_view request) {
  mProgram->Write(request);
  Outcome outcome{};
  if (!AwaitRest()) outcome.status = mProgram->Wait();
  outcome.response = mProgram->Read(mProgram->UnreadOutput());
  outcome.hasFailed = Page().failed != 0;
  outcome.failedCall = Page().failedCall;
  outcome.callsBefore = Page().callsBefore;
  return outcome;
}

Effort FaultyService::EffortSoFar() const {
  const std::uint32_t count = Page().calls;
  if (count > kMostCalls) std::abort();
  return {{Page().seen, Page().seen + count}, Page().allocations};
}

Holdings FaultyService::Holds() const {
  const std::filesystem::directory_iterator open("/proc/" + std::to_string(mProgram->Process()) +
                                                 "/fd");
  return {Page().liveAllocations, static_cast<std::size_t>(std::distance(begin(open), end(open)))};
}

}  // namespace tallowmere::test
