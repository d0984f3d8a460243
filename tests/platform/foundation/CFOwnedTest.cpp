// CFOwned, the owner of one reference to an object.
#include <gtest/gtest.h>

#include <utility>

#include "Source/CFOwned.h"
#include "TestStrings.h"

namespace tallowmere::foundation::test {
namespace {

TEST(CFOwned, ReleasesItsReferenceAtItsEnd) {
  const auto string = MakeString(u"a");
  {
    CFRetain(string.Get());
    const CFOwned second(string.Get());
    EXPECT_EQ(CFGetRetainCount(string.Get()), 2);
  }
  EXPECT_EQ(CFGetRetainCount(string.Get()), 1);
}

TEST(CFOwned, HoldsNullUntilGivenAnObject) {
  CFOwned<CFStringRef> string;
  EXPECT_FALSE(string);
  EXPECT_EQ(string.Get(), nullptr);
  string = MakeString(u"a");
  EXPECT_TRUE(string);
}

TEST(CFOwned, AssignmentReleasesTheOldObjectOnce) {
  const auto first = MakeString(u"a");
  const auto second = MakeString(u"b");
  CFRetain(first.Get());
  CFRetain(second.Get());
  {
    CFOwned owned(first.Get());
    owned = CFOwned(second.Get());
    EXPECT_EQ(owned.Get(), second.Get());
    EXPECT_EQ(CFGetRetainCount(first.Get()), 1);
    EXPECT_EQ(CFGetRetainCount(second.Get()), 2);
  }
  EXPECT_EQ(CFGetRetainCount(second.Get()), 1);
}

TEST(CFOwned, DetachHandsOverTheReference) {
  auto owned = MakeString(u"a");
  const CFStringRef string = owned.Detach();
  EXPECT_FALSE(owned);
  EXPECT_EQ(CFGetRetainCount(string), 1);
  CFRelease(string);
}

}  // namespace
}  // namespace tallowmere::foundation::test
