// Runs every call with the n-th allocation failing, for n = 0, 1, 2, … until it succeeds. A failed
// call returns null and leaks nothing.
#include <gtest/gtest.h>

#include <functional>

#include "FailingAllocator.h"
#include "TestStrings.h"

namespace tallowmere::foundation::test {
namespace {

// Too long for a string to hold without an allocation.
constexpr char kLongName[] = "/a name/that is/rather long/\xC3\xA9\xFF/a b c d e f g h.extension";

// Runs `create` as described at the top and releases its result. Returns how many allocations were
// made to fail.
long FailEachAllocation(const std::function<CFTypeRef()>& create) {
  const long liveBefore = LiveAllocations();
  for (long n = 0;; ++n) {
    FailAllocationsAfter(n);
    const CFTypeRef result = create();
    FailNoAllocation();
    if (result != nullptr) CFRelease(result);
    EXPECT_EQ(LiveAllocations(), liveBefore) << "allocation " << n;
    if (result != nullptr) return n;
  }
}

class AllocationFailure : public testing::Test {
 protected:
  const CFOwned<CFStringRef> mName = MakeName(kLongName);
  const CFOwned<CFURLRef> mUrl = MakeUrl(kLongName, true);
  const CFOwned<CFURLRef> mRelativeUrl = MakeUrl(kLongName + 1, true);
};

TEST_F(AllocationFailure, GivesNoString) {
  EXPECT_GE(FailEachAllocation([] {
              return CFStringCreateWithFileSystemRepresentation(kCFAllocatorDefault, kLongName);
            }),
            2);
  EXPECT_GE(FailEachAllocation([] {
              return CFStringCreateWithCString(kCFAllocatorDefault, kLongName,
                                               kCFStringEncodingMacRoman);
            }),
            2);
  const CFOwned changing(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, mName.Get()));
  EXPECT_GE(FailEachAllocation(
                [&changing] { return CFStringCreateCopy(kCFAllocatorDefault, changing.Get()); }),
            2);
  EXPECT_GE(FailEachAllocation(
                [this] { return CFStringCreateMutableCopy(kCFAllocatorDefault, 0, mName.Get()); }),
            2);
  EXPECT_GE(FailEachAllocation([this] {
              return CFStringCreateWithSubstring(kCFAllocatorDefault, mName.Get(),
                                                 CFRangeMake(1, 30));
            }),
            2);
  const CFStringRef format = CFSTR("%@/%@");
  EXPECT_GE(FailEachAllocation([this, format] {
              return CFStringCreateWithFormat(kCFAllocatorDefault, nullptr, format, mName.Get(),
                                              mName.Get());
            }),
            2);
}

TEST_F(AllocationFailure, GivesNoCharactersAndNoPascalString) {
  const UniChar units[40] = {};
  EXPECT_GE(FailEachAllocation(
                [&units] { return CFStringCreateWithCharacters(kCFAllocatorDefault, units, 40); }),
            2);
  const unsigned char pascal[41] = {40};
  EXPECT_GE(FailEachAllocation([&pascal] {
              return CFStringCreateWithPascalString(kCFAllocatorDefault, pascal,
                                                    kCFStringEncodingMacRoman);
            }),
            2);
}

TEST_F(AllocationFailure, GivesNoUrl) {
  for (const CFURLPathStyle style :
       {kCFURLPOSIXPathStyle, kCFURLHFSPathStyle, kCFURLWindowsPathStyle}) {
    const auto path = MakeName("Data:a rather long name of an item:and another, rather long, too");
    EXPECT_GE(FailEachAllocation([&path, style] {
                return CFURLCreateWithFileSystemPath(kCFAllocatorDefault, path.Get(), style, 1);
              }),
              3);
  }
  EXPECT_GE(FailEachAllocation([] {
              constexpr std::string_view kText = "file:///a/rather/long/path/of/an/item";
              return CFURLCreateWithBytes(
                  kCFAllocatorDefault, reinterpret_cast<const UInt8*>(kText.data()),
                  static_cast<CFIndex>(kText.size()), kCFStringEncodingUTF8, nullptr);
            }),
            2);
}

TEST_F(AllocationFailure, GivesNoEditedUrl) {
  for (const CFURLRef url : {mUrl.Get(), mRelativeUrl.Get()}) {
    EXPECT_GE(FailEachAllocation([url] {
                return CFURLCreateCopyDeletingLastPathComponent(kCFAllocatorDefault, url);
              }),
              2);
    EXPECT_GE(FailEachAllocation([this, url] {
                return CFURLCreateCopyAppendingPathComponent(kCFAllocatorDefault, url, mName.Get(),
                                                             1);
              }),
              2);
  }
}

TEST_F(AllocationFailure, GivesNoPathAndNoComponent) {
  for (const CFURLRef url : {mUrl.Get(), mRelativeUrl.Get()}) {
    for (const CFURLPathStyle style : {kCFURLHFSPathStyle, kCFURLWindowsPathStyle}) {
      EXPECT_GE(FailEachAllocation([url, style] { return CFURLCopyFileSystemPath(url, style); }),
                2);
    }
    EXPECT_GE(FailEachAllocation([url] { return CFURLCopyLastPathComponent(url); }), 2);
    EXPECT_GE(FailEachAllocation([url] { return CFURLCopyPathExtension(url); }), 1);
  }
}

TEST_F(AllocationFailure, DoesNotAffectThePathOfAUrlOrTheCopyOfAnImmutableString) {
  Boolean isAbsolute = false;
  FailAllocationsAfter(0);
  const CFOwned path(CFURLCopyStrictPath(mUrl.Get(), &isAbsolute));
  const CFOwned samePath(CFURLCopyFileSystemPath(mUrl.Get(), kCFURLPOSIXPathStyle));
  const CFOwned name(CFStringCreateCopy(kCFAllocatorDefault, mName.Get()));
  FailNoAllocation();
  EXPECT_EQ(NameOf(path.Get()), kLongName);
  EXPECT_EQ(path.Get(), samePath.Get());
  EXPECT_TRUE(isAbsolute);
  EXPECT_EQ(name.Get(), mName.Get());
}

TEST_F(AllocationFailure, LeavesAMutableStringAsItWas) {
  const CFOwned string(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, mName.Get()));
  const CFStringRef slash = CFSTR("/");
  FailAllocationsAfter(0);
  CFStringAppend(string.Get(), mName.Get());
  const CFIndex replaced =
      CFStringFindAndReplace(string.Get(), slash, mName.Get(), Whole(string.Get()), 0);
  FailNoAllocation();
  EXPECT_EQ(replaced, 0);
  EXPECT_TRUE(CFEqual(string.Get(), mName.Get()));
}

TEST_F(AllocationFailure, GivesNoFileSystemRepresentation) {
  char buffer[256] = "old";
  FailAllocationsAfter(0);
  const Boolean done = CFStringGetFileSystemRepresentation(mName.Get(), buffer, sizeof buffer);
  FailNoAllocation();
  EXPECT_FALSE(done);
  EXPECT_STREQ(buffer, "old");
}

TEST_F(AllocationFailure, DoesNotAffectCallsThatNeedNoMemory) {
  FailAllocationsAfter(0);
  const bool folder = CFURLHasDirectoryPath(mUrl.Get()) != 0;
  const bool equal = CFEqual(mUrl.Get(), mUrl.Get()) != 0;
  UInt8 buffer[256];
  const CFIndex units = CFStringGetBytes(mName.Get(), Whole(mName.Get()), kCFStringEncodingMacRoman,
                                         '?', false, buffer, sizeof buffer, nullptr);
  FailNoAllocation();
  EXPECT_TRUE(folder);
  EXPECT_TRUE(equal);
  EXPECT_EQ(units, CFStringGetLength(mName.Get()));
}

}  // namespace
}  // namespace tallowmere::foundation::test
