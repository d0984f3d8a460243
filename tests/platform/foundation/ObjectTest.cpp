// Reference counting and equality of objects.
#include <gtest/gtest.h>

#include <array>
#include <latch>
#include <thread>

#include "TestStrings.h"

namespace tallowmere::foundation::test {
namespace {

TEST(Object, BeginsWithOneReference) {
  EXPECT_EQ(CFGetRetainCount(MakeString(u"a").Get()), 1);
  EXPECT_EQ(CFGetRetainCount(MakeUrl("/a", false).Get()), 1);
}

TEST(Object, RetainAddsAReferenceAndReturnsTheObject) {
  const auto url = MakeUrl("/a", false);
  EXPECT_EQ(CFRetain(url.Get()), url.Get());
  EXPECT_EQ(CFGetRetainCount(url.Get()), 2);
  CFRelease(url.Get());
  EXPECT_EQ(CFGetRetainCount(url.Get()), 1);
}

TEST(Object, CountsEveryReferenceOfSeveralThreads) {
  constexpr int kThreads = 4;
  constexpr int kReferences = 100000;
  const auto string = MakeString(u"a");
  std::latch start(kThreads);
  std::array<std::thread, kThreads> threads;
  for (std::thread& thread : threads) {
    thread = std::thread([&string, &start] {
      start.arrive_and_wait();
      for (int k = 0; k < kReferences; ++k) CFRetain(string.Get());
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(CFGetRetainCount(string.Get()), 1 + kThreads * kReferences);
  for (int i = 0; i < kThreads * kReferences; ++i) CFRelease(string.Get());
}

TEST(Object, EqualsItself) {
  const auto url = MakeUrl("/a", false);
  EXPECT_TRUE(CFEqual(url.Get(), url.Get()));
}

TEST(Object, StringsAreEqualWhenTheirUnitsAre) {
  const auto string = MakeString(u"\u00E9");
  EXPECT_TRUE(CFEqual(string.Get(), MakeString(u"\u00E9").Get()));
  EXPECT_FALSE(CFEqual(string.Get(), MakeString(u"e\u0301").Get()));
}

TEST(Object, MutableStringEqualsAnImmutableOneWithItsText) {
  const auto string = MakeString(u"abc");
  const CFOwned copy(CFStringCreateMutableCopy(kCFAllocatorDefault, 0, string.Get()));
  EXPECT_TRUE(CFEqual(string.Get(), copy.Get()));
}

TEST(Object, StringAndUrlAreNotEqual) {
  const auto url = ParseUrl("a");
  EXPECT_FALSE(CFEqual(url.Get(), MakeString(u"a").Get()));
  EXPECT_FALSE(CFEqual(MakeString(u"a").Get(), url.Get()));
}

}  // namespace
}  // namespace tallowmere::foundation::test
