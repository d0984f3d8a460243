// What is asked when the process ends, by handlers and by destructors of static objects.
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

// Where an item was, and what is known of it.
std::string gPath;
FSRef gItem;
FSSpec gSpec;

bool IsAllRight() {
  FSRef again{};
  return PathOf(gItem) == gPath && ItemOf(gSpec) == gPath && VolumeAt(1).number != 0 &&
         FSpMakeFSRef(&gSpec, &again) == noErr && FSCompareFSRefs(&gItem, &again) == noErr;
}

// Made before anything of the platform, so that it is destroyed after all of it.
struct LastOfAll {
  ~LastOfAll() {
    if (isArmed) _exit(IsAllRight() ? 0 : 1);
  }
  bool isArmed = false;
} gLastOfAll;

// The status of a child process that ends by exit(3) after `prepare`.
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

TEST_F(AtTheEndOfTheProcess, AHandlerIsAnsweredRight) {
  EXPECT_EQ(StatusOfExit([] { std::atexit([] { _exit(IsAllRight() ? 0 : 1); }); }), 0);
}

TEST_F(AtTheEndOfTheProcess, AStaticObjectIsAnsweredRight) {
  EXPECT_EQ(StatusOfExit([] { gLastOfAll.isArmed = true; }), 0);
}

}  // namespace
}  // namespace tallowmere::test
