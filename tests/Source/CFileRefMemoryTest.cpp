// Runs every operation with the n-th allocation failing, for n = 0, 1, 2, … until it succeeds. The
// reference must be right or empty, and nothing may be leaked or freed twice.
#include <gtest/gtest.h>

#include <functional>
#include <new>

#include "TestReferences.h"
#include "platform/foundation/FailingAllocator.h"

namespace tallowmere::test {
namespace {

using foundation::test::ArrayAllocations;
using foundation::test::FailAllocationsAfter;
using foundation::test::FailNoAllocation;
using foundation::test::FailOneAllocationAfter;
using foundation::test::LiveAllocations;
using foundation::test::SizeOfLastArray;

// Makes allocations fail after a number of successful ones.
using Failing = void (*)(long count);

// Runs `body` while allocations fail. Returns its result, or false when it throws std::bad_alloc.
bool RunFailing(Failing failAfter, long count, const std::function<bool()>& body) {
  failAfter(count);
  bool result = false;
  try {
    result = body();
  } catch (const std::bad_alloc&) {
  }
  FailNoAllocation();
  return result;
}

class AllocationFailure : public testing::Test {
 protected:
  using Operation = std::function<bool(CFileRef&)>;

  // Runs `operation` on a reference to `mUrl`, as described at the top: once with every allocation
  // from the n-th on failing, and once with only the n-th failing. Expects `expected` as its path
  // in the end. Returns how many allocations were made to fail.
  long FailEach(const Operation& operation, const std::string& expected) {
    for (long n = 0;; ++n) {
      Fail(FailOneAllocationAfter, n, operation, expected);
      if (Fail(FailAllocationsAfter, n, operation, expected) || n > 200) return n;
    }
  }

  // The same for a setter: when it fails, the reference must be empty.
  long FailEachSetting(const Operation& setter, const std::string& expected) {
    mMayStayAsItWas = false;
    const long count = FailEach(setter, expected);
    mMayStayAsItWas = true;
    return count;
  }

  bool Fail(Failing failAfter, long n, const Operation& operation, const std::string& expected) {
    const long liveBefore = LiveAllocations();
    bool isDone = false;
    {
      CFileRef reference(mUrl.Get());
      EXPECT_EQ(CFGetRetainCount(mUrl.Get()), 2);
      isDone = RunFailing(failAfter, n, [&] { return operation(reference); });
      const auto path = PathOf(reference);
      if (isDone) {
        EXPECT_EQ(path, expected) << n;
      } else if (mMayStayAsItWas && reference.IsValid()) {
        EXPECT_EQ(UrlOf(reference), mUrl.Get()) << n;
        EXPECT_EQ(CFGetRetainCount(mUrl.Get()), 2) << n;
      } else {
        EXPECT_TRUE(IsEmpty(reference)) << n;
        EXPECT_EQ(CFGetRetainCount(mUrl.Get()), 1) << n;
      }
    }
    EXPECT_EQ(CFGetRetainCount(mUrl.Get()), 1) << n;
    EXPECT_EQ(LiveAllocations(), liveBefore) << n;
    return isDone;
  }

  bool mMayStayAsItWas = true;
  static constexpr char kPath[] = "/a folder with a name/that is rather long/a file.extension";
  const CFOwned<CFURLRef> mUrl = MakeUrl("/a former folder with a name/a former file.of it", false);
  const CFOwned<CFStringRef> mFolder = MakeName("/a folder with a name/that is rather long");
  const CFOwned<CFStringRef> mName = MakeName("a file.extension");
};

TEST_F(AllocationFailure, InSettersLeavesTheReferenceEmpty) {
  // Constant strings are allocated on first use.
  CFileRef(mFolder.Get(), mName.Get()).Set("~/x", false);
  const auto path = MakeName(kPath);
  const auto url = MakeUrl(kPath, true);
  const CFileRef source(kPath, true);
  EXPECT_GT(FailEachSetting([](CFileRef& r) { return r.Set(kPath, false); }, kPath), 3);
  EXPECT_GT(FailEachSetting([&](CFileRef& r) { return r.Set(path.Get(), kPathStylePOSIX, false); },
                            kPath),
            2);
  EXPECT_GT(FailEachSetting(
                [&](CFileRef& r) { return r.Set(path.Get(), kPathStyleWindows, false); }, kPath),
            2);
  EXPECT_GT(FailEachSetting([&](CFileRef& r) { return r.Set(mFolder.Get(), mName.Get()); }, kPath),
            4);
  EXPECT_GT(FailEachSetting([&](CFileRef& r) { return r.Set(url.Get(), false); }, kPath), 2);
  EXPECT_GT(FailEachSetting([&](CFileRef& r) { return r.Set(source, false); }, kPath), 2);
  const std::string text = "file:///a%20long%20enough/path%20to%20be%20on%20the%20heap";
  EXPECT_GT(FailEachSetting([&](CFileRef& r) { return r.SetFromURLString(text); },
                            "/a long enough/path to be on the heap"),
            1);
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
  EXPECT_EQ(CFGetRetainCount(path.Get()), 1);
}

TEST_F(AllocationFailure, InSettingFromAnHFSPathLeavesTheReferenceEmpty) {
  const auto set = [](CFileRef& r) {
    return r.SetFromHFSPath("Data:a folder with a long name:a file with a long name", false);
  };
  EXPECT_GT(FailEachSetting(set, "/mnt/data/a folder with a long name/a file with a long name"), 3);
}

TEST_F(AllocationFailure, InCopyingNeverHappens) {
  const CFileRef source(kPath, false);
  EXPECT_EQ(FailEach([&](CFileRef& r) { return (r = source).IsValid(); }, kPath), 0);
  EXPECT_EQ(FailEach([&](CFileRef& r) { return r.Set(UrlOf(source)); }, kPath), 0);
}

TEST_F(AllocationFailure, InTildeExpansionLeavesTheReferenceEmpty) {
  const CFileRef home("~/x", false);
  if (!home.IsValid()) GTEST_SKIP() << "the current user has no entry";
  const std::string path = "~/a name that is long enough for the heap";
  CFileRef expected(path.c_str(), false);
  EXPECT_GT(
      FailEachSetting([&](CFileRef& r) { return r.Set(path.c_str(), false); }, *PathOf(expected)),
      5);
}

// A long user name is a heap string until the user is found.
TEST_F(AllocationFailure, InTildeExpansionWithALongUserNameLeavesTheReferenceEmpty) {
  const std::string path = "~tallowmere_no_user_of_such_a_long_name/x";
  CFileRef(path.c_str(), false);  // constant strings are allocated on first use
  for (long n = 0; n < 20; ++n) {
    for (const Failing failAfter : {FailOneAllocationAfter, FailAllocationsAfter}) {
      const long liveBefore = LiveAllocations();
      {
        CFileRef reference(mUrl.Get());
        EXPECT_FALSE(RunFailing(failAfter, n, [&] { return reference.Set(path.c_str(), false); }));
        EXPECT_TRUE(IsEmpty(reference)) << n;
      }
      EXPECT_EQ(CFGetRetainCount(mUrl.Get()), 1) << n;
      EXPECT_EQ(LiveAllocations(), liveBefore) << n;
    }
  }
}

TEST_F(AllocationFailure, InEditsLeavesTheReferenceEmptyOrAsItWas) {
  const CFileRef other("/x/a rather long name.with extension", false);
  const std::string folder = "/a former folder with a name";
  CFileRef("/a", true).AddToPath("b", false);
  EXPECT_GT(FailEach([&](CFileRef& r) { return r.AddToPath(mName.Get(), false); },
                     folder + "/a former file.of it/a file.extension"),
            4);
  EXPECT_GT(FailEach([&](CFileRef& r) { return r.AddToPath("a name in UTF-8 and long", true); },
                     folder + "/a former file.of it/a name in UTF-8 and long"),
            4);
  EXPECT_GT(FailEach([&](CFileRef& r) { return r.AddToPath(other); },
                     folder + "/a former file.of it/a rather long name.with extension"),
            4);
  EXPECT_GT(FailEach([&](CFileRef& r) { return r.ReplaceName(mName.Get(), false); },
                     folder + "/a file.extension"),
            4);
  EXPECT_GT(FailEach([&](CFileRef& r) { return r.ReplaceName(other); },
                     folder + "/a rather long name.with extension"),
            4);
  EXPECT_GT(FailEach(
                [](CFileRef& r) {
                  r.SetToParent();
                  return r.IsValid() && CachedPathOf(r) != nullptr;
                },
                folder),
            4);
}

TEST_F(AllocationFailure, InReplacingTheExtensionLeavesTheReferenceEmptyOrAsItWas) {
  EXPECT_GT(FailEach(
                [this](CFileRef& r) {
                  r.ReplaceExtensionBy("another one");
                  return r.IsValid() && UrlOf(r) != mUrl.Get();
                },
                "/a former folder with a name/a former file.another one"),
            4);
}

TEST_F(AllocationFailure, InResolvingALinkLeavesTheReferenceEmptyOrAsItWas) {
  const TemporaryFolder folder;
  const std::string link = folder.MakeLink("link", kPath);
  const CFileRef source(link.c_str(), false);
  ASSERT_TRUE(CFileRef(source).ResolveAlias(false));  // fills the platform's caches
  for (long n = 0;; ++n) {
    CFileRef reference(source);
    const long liveBefore = LiveAllocations();
    const bool isDone =
        RunFailing(FailAllocationsAfter, n, [&] { return reference.ResolveAlias(false); });
    if (isDone) {
      EXPECT_EQ(PathOf(reference), kPath);
    }
    EXPECT_EQ(CFGetRetainCount(UrlOf(source)), UrlOf(reference) == UrlOf(source) ? 2 : 1) << n;
    reference.ReInit();
    EXPECT_LE(LiveAllocations(), liveBefore + 2) << n;  // the platform may cache the item's place
    if (isDone) {
      EXPECT_GT(n, 6);
      return;
    }
    ASSERT_LT(n, 200);
  }
}

TEST_F(AllocationFailure, InQueriesGivesNoAnswer) {
  for (const std::string& path : {std::string(kPath), "/" + std::string(3000, 'x')}) {
    const CFileRef source(path.c_str(), false);
    const long liveBefore = LiveAllocations();
    for (long n = 0;; ++n) {
      const CFileRef reference(source);
      const bool isDone =
          RunFailing(FailAllocationsAfter, n, [&] { return reference.GetPath() != nullptr; });
      if (isDone) {
        EXPECT_EQ(std::string(reference.GetPath()), path);
        EXPECT_GT(n, 0);
        break;
      }
      EXPECT_EQ(CachedPathOf(reference), nullptr);
      ASSERT_LT(n, 200);
    }
    EXPECT_EQ(LiveAllocations(), liveBefore);
  }
}

// --- What a path costs ------------------------------------------------------------------------
//
// The reference's own arrays come from new[]. The platform's strings and URLs use plain new, which
// is not counted here.

TEST(TheCostOfAPath, IsOneArrayOfItsLengthWhenFirstAskedFor) {
  const CFileRef reference("/abc", false);
  const long arraysBefore = ArrayAllocations();
  ASSERT_NE(reference.GetPath(), nullptr);
  EXPECT_EQ(ArrayAllocations(), arraysBefore + 1);
  EXPECT_EQ(SizeOfLastArray(), 5U);
}

TEST(TheCostOfAPath, IsTwoArraysBeyondTheBufferOnTheStack) {
  const std::string longest = "/" + std::string(1022, 'x');
  const CFileRef fits(longest.c_str(), false);
  const CFileRef longer((longest + "x").c_str(), false);
  const long arraysBefore = ArrayAllocations();
  ASSERT_NE(fits.GetPath(), nullptr);
  EXPECT_EQ(ArrayAllocations(), arraysBefore + 1);
  ASSERT_NE(longer.GetPath(), nullptr);
  EXPECT_EQ(ArrayAllocations(), arraysBefore + 1 + 2);
}

TEST(TheCostOfAPath, IsNothingOnceItIsThere) {
  const CFileRef reference("/abc", false);
  const char* const path = reference.GetPath();
  char buffer[10];
  FailAllocationsAfter(0);
  const char* const again = reference.GetPath();
  const bool isCopied = reference.GetPath(buffer, sizeof buffer);
  FailNoAllocation();
  EXPECT_EQ(again, path);
  EXPECT_TRUE(isCopied);
}

}  // namespace
}  // namespace tallowmere::test
