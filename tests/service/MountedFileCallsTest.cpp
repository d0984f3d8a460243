// A file of a volume that is also mounted by itself elsewhere shows no folder of the volume twice,
// so it must not cost any request a system call.
#include <gtest/gtest.h>
#include <sys/mount.h>

#include <algorithm>
#include <optional>
#include <string>
#include <vector>

#include "support/EveryRequest.h"
#include "support/MountNamespace.h"
#include "support/TemporaryFolder.h"
#include "support/TracedService.h"

namespace tallowmere::test {
namespace {

// Returns the sorted names of the calls that the last of several requests about an item makes.
std::optional<std::vector<std::string>> CallsFor(const Item& item, unsigned code) {
  const std::string request = RequestAbout(item, code);
  const auto run = RunTraced("%file,%desc,kill", RequestAbout(item, 7) + request + request + kQuit);
  if (!run) return std::nullopt;
  std::vector<std::string> names;
  for (const std::string& call : CallsOfLastRequest(*run)) {
    if (!IsCall(call, "mmap")) names.push_back(call.substr(0, call.find('(')));  // of memory
  }
  std::sort(names.begin(), names.end());
  return names;
}

class MountedFile : public testing::TestWithParam<unsigned> {};

TEST_P(MountedFile, AddsNoSystemCall) {
  if (!EnterOwnMountNamespace()) GTEST_SKIP() << "mounting is not permitted";
  const TemporaryFolder folder;
  // On a tmpfs a new item takes the same calls as an old one.
  const ScopedMount volume("tmpfs", folder.MakeFolder("volume"), "tmpfs");
  ASSERT_TRUE(volume.IsMounted());
  folder.MakeFolder("volume/folder/inner");
  const std::string path = folder.MakeFile("volume/folder/inner/a track.aif");
  const std::string mounted = folder.MakeFile("volume/mounted.aif");
  const std::string elsewhere = folder.MakeFile("elsewhere.aif");
  Item item;
  {
    Service service;
    item = LearnItem(service, path);
  }
  ASSERT_FALSE(item.record.empty());

  const auto without = CallsFor(item, GetParam());
  const ScopedMount mount(mounted, elsewhere, "", MS_BIND);
  ASSERT_TRUE(mount.IsMounted());
  const auto with = CallsFor(item, GetParam());
  if (!without || !with) GTEST_SKIP() << "strace cannot trace here";
  EXPECT_FALSE(without->empty());
  EXPECT_EQ(*with, *without);
}

INSTANTIATE_TEST_SUITE_P(OfEachCode, MountedFile, testing::Range(1u, 11u),
                         [](const auto& code) { return "Code" + std::to_string(code.param); });

}  // namespace
}  // namespace tallowmere::test
