// Calls made while the process exits, from exit handlers and destructors of static objects.
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "platform/HostCalls.h"
#include "support/OwnMountNamespace.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

// An item's path, reference and record from before the exit.
std::string gPath;
FSRef gItem;
FSSpec gSpec;

bool IsAllRight() {
  FSRef again{};
  return PathOf(gItem) == gPath && ItemOf(gSpec) == gPath && VolumeAt(1).number != 0 &&
         FSpMakeFSRef(&gSpec, &again) == noErr && FSCompareFSRefs(&gItem, &again) == noErr;
}

// Constructed before any object of the platform, so destroyed after all of them.
struct LastOfAll {
  ~LastOfAll() {
    if (isArmed) _exit(IsAllRight() ? 0 : 1);
  }
  bool isArmed = false;
} gLastOfAll;

// Returns the exit status of a child process that runs `prepare` and then calls exit(3).
template <class Prepare>
int StatusOfExit(Prepare prepare) {
  std::fflush(nullptr);
  const pid_t child = fork();
  if (child == 0) {
    prepare();
    std::exit(2);
  }
  int status = 0;
  return waitpid(child, &status, 0) == child && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

class AtTheEndOfTheProcess : public testing::Test {
 protected:
  void SetUp() override {
    gPath = mFolder.MakeFile("x");
    gItem = ReferenceTo(gPath);
    gSpec = SpecOf(gPath);
    ASSERT_TRUE(IsAllRight());
  }

  const TemporaryFolder mFolder;
};

TEST_F(AtTheEndOfTheProcess, AnExitHandlerGetsRightAnswers) {
  EXPECT_EQ(StatusOfExit([] { std::atexit([] { _exit(IsAllRight() ? 0 : 1); }); }), 0);
}

TEST_F(AtTheEndOfTheProcess, AStaticObjectGetsRightAnswers) {
  EXPECT_EQ(StatusOfExit([] { gLastOfAll.isArmed = true; }), 0);
}

}  // namespace
}  // namespace tallowmere::test
