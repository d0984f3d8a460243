#include <CoreServices/CoreServices.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <cstring>

#include "platform/HostCalls.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {
namespace {

// Expects that `path` is no alias, by both calls, and that it is a folder or not.
void ExpectNoAlias(const std::string& path, bool isFolder) {
  const FSRef before = ReferenceTo(path);
  for (const bool withFlags : {false, true}) {
    FSRef item = before;
    Boolean targetIsFolder = 2;
    Boolean wasAliased = 2;
    EXPECT_EQ(withFlags ? FSResolveAliasFileWithMountFlags(&item, true, &targetIsFolder,
                                                           &wasAliased, kResolveAliasFileNoUI)
                        : FSResolveAliasFile(&item, true, &targetIsFolder, &wasAliased),
              noErr);
    EXPECT_EQ(wasAliased, 0);
    EXPECT_EQ(targetIsFolder, isFolder ? 1 : 0);
    EXPECT_EQ(std::memcmp(&item, &before, sizeof item), 0);
  }
}

TEST(AliasResolution, FindsNoAliasInAnyKindOfItem) {
  const TemporaryFolder folder;
  folder.MakeLink("link", "/");
  ExpectNoAlias(folder.MakeFile("x"), false);
  ExpectNoAlias(folder.Path(), true);
  ExpectNoAlias(folder.Path() / "link", false);
}

TEST(AliasResolution, TellsNothingToNull) {
  FSRef item = ReferenceTo("/");
  EXPECT_EQ(FSResolveAliasFile(&item, true, nullptr, nullptr), noErr);
}

TEST(AliasResolution, OfNoItemFails) {
  FSRef nothing = {};
  Boolean targetIsFolder = 2;
  Boolean wasAliased = 2;
  EXPECT_EQ(FSResolveAliasFile(&nothing, true, &targetIsFolder, &wasAliased), fnfErr);
  EXPECT_EQ(FSResolveAliasFile(nullptr, true, &targetIsFolder, &wasAliased), fnfErr);
  EXPECT_EQ(targetIsFolder, 2);
  EXPECT_EQ(wasAliased, 2);
}

}  // namespace
}  // namespace tallowmere::test
