// Which items the workspace takes for packages.
#include <AppKit/Workspace.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>

#include "platform/foundation/TestStrings.h"
#include "support/TemporaryFolder.h"
#include "support/TurkishLocale.h"

namespace tallowmere::test {
namespace {

using foundation::test::MakeName;
using foundation::test::MakeString;

bool IsPackage(const std::string& path) {
  return Workspace::IsFilePackageAtPath(MakeName(path).Get());
}

class APackage : public testing::Test {
 protected:
  bool IsPackageHere(const std::string& name) const { return IsPackage(mFolder.Path() / name); }

  const TemporaryFolder mFolder;
};

TEST_F(APackage, IsAFolderWithARegisteredExtension) {
  for (const char* extension :
       {"aaxplugin",    "aplibrary",     "app",         "appex",         "band",
        "bundle",       "clr",           "colorpicker", "component",     "concert",
        "dictionary",   "docset",        "download",    "dpm",           "dsym",
        "fcpbundle",    "graffle",       "ibplugin",    "imovielibrary", "imovieproject",
        "kext",         "key",           "logicx",      "mdimporter",    "migratedphotolibrary",
        "mpkg",         "musiclibrary",  "numbers",     "pages",         "patch",
        "photolibrary", "photoslibrary", "pkg",         "playground",    "plugin",
        "prefpane",     "qlgenerator",   "rcproject",   "rtfd",          "saver",
        "scptd",        "service",       "slidesaver",  "sparsebundle",  "systemextension",
        "theater",      "tvlibrary",     "vst",         "vst3",          "wdgt",
        "webplugin",    "workflow",      "xcassets",    "xcdatamodel",   "xcdatamodeld",
        "xcodeproj",    "xcworkspace",   "xpc"}) {
    const std::string name = std::string("x.") + extension;
    mFolder.MakeFolder(name);
    EXPECT_TRUE(IsPackageHere(name)) << name;
  }
}

TEST_F(APackage, IsNoFolderWithAnotherExtension) {
  for (const char* name : {"x", "x.framework", "x.txt", "x.ap", "x.apps", "x.app.old", ".app", "x.",
                           "app", "x.app "}) {
    mFolder.MakeFolder(name);
    EXPECT_FALSE(IsPackageHere(name)) << name;
  }
}

TEST_F(APackage, IsRecognisedByItsExtensionInAnyLetterCase) {
  mFolder.MakeFolder("x.App");
  mFolder.MakeFolder("x.RTFD");
  EXPECT_TRUE(IsPackageHere("x.App"));
  EXPECT_TRUE(IsPackageHere("x.RTFD"));
}

TEST_F(APackage, IsRecognisedByItsExtensionInTurkishToo) {
  const TurkishLocale locale;
  if (!locale.IsChosen()) GTEST_SKIP() << "the C library's locales cannot be made here";
  mFolder.MakeFolder("x.IBPLUGIN");
  EXPECT_TRUE(IsPackageHere("x.IBPLUGIN"));
}

TEST_F(APackage, IsAFolderThatHoldsAPropertyList) {
  mFolder.MakeFolder("x/Contents");
  EXPECT_FALSE(IsPackageHere("x"));
  mFolder.MakeFile("x/Contents/Info.plist");
  EXPECT_TRUE(IsPackageHere("x"));
}

TEST_F(APackage, IsAFolderThatHoldsPackageInformation) {
  mFolder.MakeFolder("x/Contents");
  mFolder.MakeFile("x/Contents/PkgInfo");
  EXPECT_TRUE(IsPackageHere("x"));
}

TEST_F(APackage, NeedsAFileOfThatName) {
  mFolder.MakeFolder("x/Contents/Info.plist");
  EXPECT_FALSE(IsPackageHere("x"));
}

TEST_F(APackage, IsNoFile) {
  mFolder.MakeFile("x.app");
  EXPECT_FALSE(IsPackageHere("x.app"));
}

TEST_F(APackage, IsNoLinkToAPackage) {
  const auto package = mFolder.MakeFolder("x.app");
  mFolder.MakeLink("link.app", package);
  EXPECT_FALSE(IsPackageHere("link.app"));
  EXPECT_FALSE(IsPackageHere("link.app/"));
}

TEST_F(APackage, IsRecognisedFromAPathThatEndsInSlashes) {
  mFolder.MakeFolder("x.app");
  EXPECT_TRUE(IsPackageHere("x.app/"));
  EXPECT_TRUE(IsPackageHere("x.app//"));
}

TEST_F(APackage, IsRecognisedFromARelativePath) {
  mFolder.MakeFolder("x.app");
  const auto former = std::filesystem::current_path();
  std::filesystem::current_path(mFolder.Path());
  EXPECT_TRUE(IsPackage("x.app"));
  std::filesystem::current_path(former);
}

TEST_F(APackage, MayHaveANameThatIsNotUtf8) {
  mFolder.MakeFolder("\xFF.app");
  EXPECT_TRUE(IsPackageHere("\xFF.app"));
}

TEST(NoPackage, IsAnInvalidPathOrAMissingItem) {
  EXPECT_FALSE(Workspace::IsFilePackageAtPath(nullptr));
  EXPECT_FALSE(IsPackage(""));
  EXPECT_FALSE(IsPackage("/"));
  EXPECT_FALSE(IsPackage("/no such folder of tallowmere.app"));
  EXPECT_FALSE(IsPackage("/" + std::string(5000, 'x') + ".app"));
  EXPECT_FALSE(Workspace::IsFilePackageAtPath(MakeString(u"/\xD800.app").Get()));
  EXPECT_FALSE(
      Workspace::IsFilePackageAtPath(MakeString(std::u16string_view(u"/x\0.app", 7)).Get()));
}

}  // namespace
}  // namespace tallowmere::test
