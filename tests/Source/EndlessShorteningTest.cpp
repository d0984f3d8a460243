// Shortening a full path that cannot become short enough never ends. The bridge is compiled at the
// highest optimisation, which must not assume that the loop ends.
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include "Source/LegacyHFSBridge.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

constexpr unsigned kPatience = 1;  // seconds

// Returns whether the call still ran after a second.
bool NeverReturns(const CFileRef& ref, unsigned short maxLength) {
  const pid_t child = fork();
  if (child == 0) {
    char path[1024];
    alarm(kPatience);
    CFileUtilMakeFullPath(ref, path, maxLength, 1);
    _exit(0);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM;
}

unsigned short LengthOf(const CFileRef& ref) {
  return CFileUtilMakeFullPath(ref, nullptr, 0, 1);
}

TEST(EndlessShortening, OfAVolumeWithoutFolders) {
  const CFileRef root("/", true);
  EXPECT_TRUE(NeverReturns(root, LengthOf(root)));
  EXPECT_TRUE(NeverReturns(root, 0));
  EXPECT_FALSE(NeverReturns(root, static_cast<unsigned short>(LengthOf(root) + 1)));
}

TEST(EndlessShortening, OfFoldersThatCannotBeShortened) {
  const TemporaryFolder folder;
  const CFileRef ref(folder.MakeFolder("Work/Docs").c_str(), true);
  char path[1024];
  CFileUtilMakeFullPath(ref, path, sizeof path, 0);
  const auto shortest = static_cast<unsigned short>(std::string(path).size() + 1 + 4);
  EXPECT_TRUE(NeverReturns(ref, shortest));
  EXPECT_FALSE(NeverReturns(ref, static_cast<unsigned short>(shortest + 1)));
}

TEST(EndlessShortening, DoesNotHappenWithoutABuffer) {
  EXPECT_EQ(CFileUtilMakeFullPath(CFileRef(), nullptr, 0, 1), 1);
}

}  // namespace
}  // namespace tallowmere::test
