// Sends every request with every system call and every allocation of the service failing in turn,
// each call with each error that it can have. The answer must be right or say that it is not known,
// or the service must end as the protocol says; the same question must be answered correctly right
// after, and nothing may be left behind.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "faults/FaultyService.h"
#include "faults/PlausibleFaults.h"
#include "faults/Subject.h"
#include "faults/TwoVolumeRoot.h"
#include "support/OwnMountNamespace.h"
#include "support/Wire.h"

namespace tallowmere::test {
namespace {

// Enough to see what is wrong with a request.
constexpr int kMostFindings = 6;

class InjectedFaults : public testing::Environment {
 public:
  void TearDown() override {
    testing::Test::RecordProperty("faults", std::to_string(count));
    std::cout << "Faults injected: " << count << "\n";
    const bool haveTestsRun = testing::UnitTest::GetInstance()->successful_test_count() > 0;
    EXPECT_TRUE(count > 0 || !haveTestsRun) << "nothing was made to fail";
  }

  static inline unsigned long count = 0;
};
testing::Environment* const kInjectedFaults = testing::AddGlobalTestEnvironment(new InjectedFaults);

std::vector<Fault> FaultsIn(const Effort& effort) {
  std::vector<Fault> faults;
  for (std::uint32_t i = 0; i < effort.calls.size(); ++i) {
    for (const std::int32_t effect : PlausibleEffects(effort.calls[i])) {
      faults.push_back({Fault::Kind::kCall, i + 1, effect});
    }
  }
  for (std::uint32_t i = 0; i < effort.allocations; ++i) {
    faults.push_back({Fault::Kind::kAllocation, i + 1, 0});
  }
  return faults;
}

bool IsReadOfInput(const SeenCall& call) {
  return call.number == SYS_read && call.first == STDIN_FILENO;
}

// Whether an allocation after this many calls is for a field of the request: it comes after the
// read of the field's length and before the read of the field.
bool IsForField(std::size_t callsBefore, const std::vector<SeenCall>& calls) {
  if (callsBefore == 0 || callsBefore >= calls.size()) return false;
  const SeenCall& length = calls[callsBefore - 1];
  return IsReadOfInput(length) && length.size == sizeof(std::uint16_t) &&
         IsReadOfInput(calls[callsBefore]);
}

// Whether a service may end this way. `calls` are those that it makes when nothing fails, including
// the one that waits for the next request.
bool IsDocumentedEnd(const Fault& fault, const Outcome& outcome, const std::vector<SeenCall>& calls,
                     const std::string& right) {
  if (outcome.status != 0) return false;
  const std::string& response = outcome.response;
  if (fault.kind == Fault::Kind::kAllocation) {
    return response.empty() && IsForField(outcome.callsBefore, calls);
  }
  switch (outcome.failedCall.number) {
    case SYS_read: {
      // Zero bytes mean the end of the input.
      const bool hasEnded = fault.effect >= kWithoutBytes;
      const bool isWait = fault.number == calls.size();
      return IsReadOfInput(outcome.failedCall) && hasEnded && response == (isWait ? right : "");
    }
    case SYS_write:
      return outcome.failedCall.first == STDOUT_FILENO && fault.effect > kWithoutBytes &&
             right.starts_with(response) && response != right;
    case SYS_kill:
      return response == right;
    default:
      return false;
  }
}

// Leaves out the trailer, and the zeros before it.
std::string Readable(std::string response) {
  if (response.ends_with(kTrailer)) response.resize(response.size() - kTrailer.size());
  return testing::PrintToString(response.substr(0, response.find_last_not_of('\0') + 1));
}

// Memory that stays once may hold something learned; memory that stays twice is a leak.
constexpr int kMostAttempts = 2;

// How often a new service is asked again after its first right answer following a fault.
constexpr int kMoreAnswers = 3;

// Whether clang counts what the services reach. A fault at their start then determines whether the
// file of counts is open.
bool IsCounted() {
  return getenv("LLVM_PROFILE_FILE") != nullptr;
}

// One question, asked while something fails.
class Trial {
 public:
  Trial(const Copies& services, Question question)
      : mServices(services),
        mRequest(std::move(question.request)),
        mRight(std::move(question.right)),
        mAnswers(std::move(question.honest)) {
    mAnswers.insert(mRight);
  }

  // Uses a new service for each fault. Each of this many failing allocations may end it with
  // SIGSEGV.
  void FailNewServices(int deadlyAllocations) {
    mDeadlyAllocations = deadlyAllocations;
    FaultyService sound(mServices);
    if (!IsAnswered(sound)) return;
    mEffort = sound.EffortSoFar();
    const Holdings once = sound.Holds();
    mDescriptors = once.descriptors;
    if (!IsAnswered(sound)) return;
    mKept = sound.Holds().allocations - once.allocations;
    for (const Fault& fault : FaultsIn(mEffort)) {
      FailANewService(fault);
      if (mFindings >= kMostFindings) break;
    }
  }

  // Uses one service that has answered the question before, for as long as it lives and stays
  // unchanged.
  void FailAnOldService() {
    auto service = OldService();
    const Holdings known = service->Holds();
    service->Arm({});
    if (!IsAnswered(*service)) return;
    mEffort = service->EffortSoFar();
    mKept = service->Holds().allocations - known.allocations;
    for (const Fault& fault : FaultsIn(mEffort)) {
      bool survives = false;
      // The service keeps what it learns when it has to search.
      bool isLevel = false;
      for (int attempt = 0; attempt < kMostAttempts && !isLevel; ++attempt) {
        isLevel = FailOnce(*service, fault, survives) || !survives;
      }
      if (!isLevel) Report(fault, "leaves something behind");
      if (!survives || !TakesAsMuch(*service)) service = OldService();
      if (mFindings >= kMostFindings) break;
    }
  }

 private:
  // Asks without a fault; otherwise nothing would be tested.
  bool IsAnswered(FaultyService& service) {
    const std::string response = service.Ask(mRequest).response;
    EXPECT_TRUE(response == mRight && !mRight.empty())
        << Readable(response) << ", not " << Readable(mRight);
    return !testing::Test::HasFailure();
  }

  std::unique_ptr<FaultyService> OldService() const {
    auto service = std::make_unique<FaultyService>(mServices);
    service->Ask(mRequest);
    service->Ask(mRequest);
    return service;
  }

  // Whether the last answer took as many calls and allocations as the first one; only then is the
  // next fault reached.
  bool TakesAsMuch(const FaultyService& service) const {
    const Effort effort = service.EffortSoFar();
    return effort.calls.size() == mEffort.calls.size() && effort.allocations == mEffort.allocations;
  }

  // The service keeps what only the fault made it learn, such as a path that it visited or folders
  // still to be read. It does so only once: afterwards it takes no more for each answer than a
  // service without faults.
  void FailANewService(const Fault& fault) {
    FaultyService service(mServices, fault);
    if (!Survives(service, fault)) return;
    AskAgain(service, fault);
    const std::int64_t learned = service.Holds().allocations;
    for (int i = 0; i < kMoreAnswers; ++i) AskAgain(service, fault);
    const Holdings after = service.Holds();
    const bool isLevel = after.descriptors == mDescriptors || IsCounted();
    if (!isLevel) Report(fault, "leaves a descriptor open");
    if (after.allocations != learned + kMoreAnswers * mKept) {
      Report(fault, "makes every answer leave something behind");
    }
  }

  // Whether it uses as much memory afterwards as before, except for what right answers make it
  // keep.
  bool FailOnce(FaultyService& service, const Fault& fault, bool& survives) {
    const Holdings before = service.Holds();
    service.Arm(fault);
    survives = Survives(service, fault);
    if (!survives) return false;
    AskAgain(service, fault);
    const Holdings after = service.Holds();
    // Whatever answers make it keep, a wrong one may keep at most as much as a right one.
    const std::int64_t grown = after.allocations - before.allocations - mKept;
    if (after.descriptors != before.descriptors) Report(fault, "leaves a descriptor open");
    return mIsRight ? grown == mKept : grown >= 0 && grown <= mKept;
  }

  // Returns false when the service has ended.
  bool Survives(FaultyService& service, const Fault& fault) {
    const Outcome outcome = service.Ask(mRequest);
    if (outcome.hasFailed) {
      ++InjectedFaults::count;
    } else {
      Report(fault, "is never reached");
    }
    mIsRight = outcome.response == mRight;
    if (outcome.status == -SIGSEGV && fault.kind == Fault::Kind::kAllocation &&
        mDeadlyAllocations > 0) {
      --mDeadlyAllocations;
      return false;
    }
    const bool isFine = outcome.status ? IsDocumentedEnd(fault, outcome, mEffort.calls, mRight)
                                       : mAnswers.contains(outcome.response);
    if (!isFine) {
      const std::string end =
          outcome.status ? "status " + std::to_string(*outcome.status) + " and " : "";
      Report(fault, CallText(fault, outcome) + "gives " + end + Readable(outcome.response) +
                        ", not " + Readable(mRight));
    }
    return !outcome.status;
  }

  static std::string CallText(const Fault& fault, const Outcome& outcome) {
    if (fault.kind != Fault::Kind::kCall) return {};
    return "(number " + std::to_string(outcome.failedCall.number) + ") ";
  }

  void AskAgain(FaultyService& service, const Fault& fault) {
    service.Arm({});
    const Outcome outcome = service.Ask(mRequest);
    if (!outcome.status && outcome.response == mRight) return;
    Report(fault,
           "has the next answer " + Readable(outcome.response) + ", not " + Readable(mRight));
  }

  void Report(const Fault& fault, const std::string& finding) {
    ++mFindings;
    ADD_FAILURE() << fault.Text() << " " << finding;
  }

  const Copies& mServices;
  std::string mRequest;
  std::string mRight;
  Answers mAnswers;
  Effort mEffort{};              // of the right answer, in the state in which things fail
  std::int64_t mKept = 0;        // allocations kept for each right answer
  std::size_t mDescriptors = 0;  // of a new service without faults
  bool mIsRight = false;         // whether the last answer while something failed was right
  int mDeadlyAllocations = 0;    // how many are still expected
  int mFindings = 0;
};

// --- What is asked about ----------------------------------------------------------------------

std::string LongName() {
  return std::string(100, 'l') + ".aif";
}

// Two items whose HFS names would be the same bytes, far apart in their folder: neither is found by
// that name.
constexpr char kOneOfTwins[] = "/Disk/twins/e\u0301t\u00E9";

void Make(const std::string& path) {
  std::filesystem::create_directories(std::filesystem::path(path).parent_path());
  std::ofstream{path, std::ios::app};
}

// Longer than a reference's buffer on the stack.
std::string DeepPath() {
  std::string path = "/Disk/";
  for (int i = 0; i < 6; ++i) path += std::string(200, 'd') + "/";
  return path + "a track.aif";
}

struct Item {
  const char* name;  // of the test
  Subject (*learn)();
  std::vector<unsigned> codes;         // sent to an old service
  std::vector<unsigned> codesWhenNew;  // sent to new services, which is slower
  bool asksForUsers = false;
};

const std::vector<unsigned> kCodesOfPaths{1, 2, 5, 6, 7, 8, 9};

const std::vector<Item> kItems{
    {"Plain",
     [] { return Subject("/Disk/folder/inner/a track.aif"); },
     {1, 2, 3, 4, 5, 6, 7, 8, 9, 10},
     {1, 2, 3, 4, 5, 6, 7, 8, 9, 10}},
    {"SharedID", [] { return Subject("/Disk/early/a track.aif"); }, {1, 2, 8, 9}, {8, 9}},
    {"LongName",
     [] { return Subject("/Disk/folder/" + LongName(), "", LongName().substr(0, 63)); },
     kCodesOfPaths,
     {8}},
    {"NotInMacRoman",
     [] { return Subject("/Disk/folder/日本.aif", "", "??.aif"); },
     kCodesOfPaths,
     {9}},
    // The first accent is a separate mark, the second one is not.
    {"Accented",
     [] { return Subject("/Disk/folder/e\u0301t\u00E9", "\u00E9t\u00E9"); },
     kCodesOfPaths,
     {8, 9}},
    {"Missing", [] { return Subject("/Disk/folder/missing.aif"); }, {1, 5, 6, 7, 8, 9}, {7, 8, 9}},
    {"Folder", [] { return Subject("/Disk/folder/inner"); }, kCodesOfPaths, {1, 7, 9}},
    {"OnExt4",
     [] { return Subject("/folder/inner/a track.aif"); },
     {1, 2, 3, 4, 5, 6, 7, 8, 9},
     {1, 2, 3, 4, 8, 9}},
    {"Twin", [] { return Subject(kOneOfTwins, "", "\x8Et\x8E"); }, {7, 9}, {}},
    {"MissingBesideTwins",
     [] { return Subject("/Disk/twins/\u00E9t\u00E9", "\u00E9t\u00E9"); },
     {9},
     {9}},
    {"InTheHomeFolder", [] { return Subject("~/a track.aif"); }, {1, 5, 7}, {1, 5, 7}, true},
    {"InAUsersFolder", [] { return Subject("~user/a track.aif"); }, {1, 5, 7}, {7}, true},
    {"Deep", [] { return Subject(DeepPath()); }, {5, 7, 9}, {7}},
    {"RootOfAVolume", [] { return Subject("/Disk"); }, {1, 2, 5, 7, 8, 9}, {7, 9}},
};

// A small root with all items on its volumes.
class Tree {
 public:
  Tree() : mRoot({TALLOWMERE_SERVICE, TALLOWMERE_FAULT_LIBRARY}) {
    if (!mRoot.IsEntered()) return;
    // The first inode numbers are too low for ids.
    Make("/Disk/early/a track.aif");
    for (int i = 0; i < 20; ++i) Make("/Disk/fill/" + std::to_string(i) + "/file");
    for (const char* const name :
         {"something else", "inner/a track.aif", "日本.aif", "e\u0301t\u00E9"}) {
      Make(std::string("/Disk/folder/") + name);
    }
    Make("/Disk/folder/" + LongName());
    Make(DeepPath());
    Make("/folder/inner/a track.aif");
    Make(TwoVolumeRoot::kHome + std::string("/a track.aif"));
    Make(kOneOfTwins);
    for (int i = 100; i < 230; ++i) {
      Make("/Disk/twins/" + std::to_string(i) + std::string(250, 'f'));
    }
    Make("/Disk/twins/\u00E9te\u0301");
    mServices = FaultyService::Original();
  }

  bool IsMade() const { return mRoot.IsEntered(); }
  bool IsOnImage() const { return mRoot.IsImage(); }

  // REQUIRES: it is made.
  const Copies& Services() const { return *mServices; }

 private:
  TwoVolumeRoot mRoot;
  std::unique_ptr<Copies> mServices;
};

struct Case {
  const Item* item;
  unsigned code;
};

std::vector<Case> Cases(std::vector<unsigned> Item::*codes) {
  std::vector<Case> cases;
  for (const Item& item : kItems) {
    for (const unsigned code : item.*codes) cases.push_back({&item, code});
  }
  return cases;
}

std::string NameOf(const testing::TestParamInfo<Case>& about) {
  return about.param.item->name + ("Code" + std::to_string(about.param.code));
}

class Faults : public testing::TestWithParam<Case> {
 protected:
  static void SetUpTestSuite() { tree = std::make_unique<Tree>(); }
  static void TearDownTestSuite() { tree.reset(); }

  void SetUp() override {
    if (!tree->IsMade()) GTEST_SKIP() << "no mount and no root of its own is permitted";
    if (!tree->Services().CanMake()) GTEST_SKIP() << "no filter of system calls is permitted";
    const bool isOnImage = std::string(GetParam().item->name).starts_with("OnExt4");
    if (isOnImage && !tree->IsOnImage()) GTEST_SKIP() << "no image can be mounted";
  }

  static Trial MakeTrial() {
    return {tree->Services(), GetParam().item->learn().Ask(GetParam().code)};
  }

  static inline std::unique_ptr<Tree> tree;
};

class FaultsOfNewServices : public Faults {};
class FaultsOfOldServices : public Faults {};

TEST_P(FaultsOfNewServices, AreAnsweredHonestlyAndNotRemembered) {
  // When the C library has no memory for one block that its first lookup of users keeps, it ends
  // the process itself. Only here is just that block refused.
  MakeTrial().FailNewServices(GetParam().item->asksForUsers ? 1 : 0);
}

TEST_P(FaultsOfOldServices, AreAnsweredHonestlyAndLeaveNothing) {
  MakeTrial().FailAnOldService();
}

INSTANTIATE_TEST_SUITE_P(Requests, FaultsOfNewServices,
                         testing::ValuesIn(Cases(&Item::codesWhenNew)), NameOf);
INSTANTIATE_TEST_SUITE_P(Requests, FaultsOfOldServices, testing::ValuesIn(Cases(&Item::codes)),
                         NameOf);

}  // namespace
}  // namespace tallowmere::test
