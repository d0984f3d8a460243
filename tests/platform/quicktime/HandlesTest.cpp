// Handles: blocks of memory, their sizes and their lifetimes.
#include <QuickTime/QuickTime.h>
#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "support/OwnedByCallers.h"

namespace tallowmere::quicktime::test {
namespace {

using tallowmere::test::LiveHandles;
using tallowmere::test::NewHandleWith;

TEST(Handles, ANewBlockIsZeroAndHasItsSize) {
  // Leaves nonzero bytes in freed memory.
  const Handle before = NewHandleClear(36);
  std::memset(*before, 0xFF, 36);
  DisposeHandle(before);
  const Handle handle = NewHandleClear(36);
  ASSERT_NE(handle, nullptr);
  EXPECT_EQ(std::string(*handle, 36), std::string(36, '\0'));
  EXPECT_EQ(GetHandleSize(handle), 36);
  DisposeHandle(handle);
}

TEST(Handles, ABlockOfNoBytesIsABlock) {
  const auto before = LiveHandles();
  const Handle handle = NewHandleClear(0);
  ASSERT_NE(handle, nullptr);
  EXPECT_EQ(GetHandleSize(handle), 0);
  EXPECT_EQ(LiveHandles(), before + 1);
  DisposeHandle(handle);
}

TEST(Handles, EachBlockIsItsOwn) {
  const Handle first = NewHandleClear(4);
  const Handle second = NewHandleClear(5);
  std::memcpy(*first, "1234", 4);
  std::memcpy(*second, "abcde", 5);
  EXPECT_EQ(std::string(*first, 4), "1234");
  EXPECT_EQ(GetHandleSize(first), 4);
  EXPECT_EQ(GetHandleSize(second), 5);
  DisposeHandle(first);
  EXPECT_EQ(std::string(*second, 5), "abcde");
  DisposeHandle(second);
}

TEST(Handles, AmongThousandsEachBlockIsItsOwnAndStaysWhereItIs) {
  const auto before = LiveHandles();
  std::vector<Handle> handles;
  std::vector<char*> bytes;
  for (int i = 0; i < 5000; ++i) {
    handles.push_back(NewHandleWith("block " + std::to_string(i)));
    bytes.push_back(*handles.back());
  }
  for (std::size_t i = 0; i < handles.size(); i += 2) DisposeHandle(handles[i]);
  for (std::size_t i = 0; i < handles.size(); ++i) {
    const std::string content = "block " + std::to_string(i);
    const bool isLive = i % 2 == 1;
    ASSERT_EQ(GetHandleSize(handles[i]), isLive ? static_cast<Size>(content.size()) : 0);
    if (!isLive) continue;
    ASSERT_EQ(*handles[i], bytes[i]);
    ASSERT_EQ(std::string(*handles[i], content.size()), content);
  }
  for (std::size_t i = 1; i < handles.size(); i += 2) DisposeHandle(handles[i]);
  EXPECT_EQ(LiveHandles(), before);
}

TEST(Handles, ANeighbouringPointerIsNoHandle) {
  const Handle handle = NewHandleClear(1);
  const auto before = LiveHandles();
  for (const int away : {-1, 1, 2}) {
    EXPECT_EQ(GetHandleSize(handle + away), 0) << away;
    DisposeHandle(handle + away);
  }
  EXPECT_EQ(LiveHandles(), before);
  DisposeHandle(handle);
}

TEST(Handles, ABlockIsAliveUntilItIsDisposedOf) {
  const auto before = LiveHandles();
  const Handle handle = NewHandleClear(1);
  EXPECT_EQ(LiveHandles(), before + 1);
  DisposeHandle(handle);
  EXPECT_EQ(LiveHandles(), before);
}

TEST(Handles, AnInvalidHandleHasNoSizeAndIsNotDisposedOf) {
  const auto before = LiveHandles();
  char bytes[] = "no block";
  char* pointer = bytes;
  EXPECT_EQ(GetHandleSize(nullptr), 0);
  EXPECT_EQ(GetHandleSize(&pointer), 0);
  DisposeHandle(nullptr);
  DisposeHandle(&pointer);
  EXPECT_EQ(LiveHandles(), before);
}

TEST(Handles, ADisposedBlockHasNoSizeAndIsNotDisposedOfAgain) {
  const Handle handle = NewHandleClear(8);
  DisposeHandle(handle);
  EXPECT_EQ(GetHandleSize(handle), 0);
  DisposeHandle(handle);
}

TEST(Handles, ThereIsNoBlockOfASizeBelow0OrBeyondAllMemory) {
  const auto before = LiveHandles();
  EXPECT_EQ(NewHandleClear(-1), nullptr);
  EXPECT_EQ(NewHandleClear(std::numeric_limits<Size>::min()), nullptr);
#ifndef __SANITIZE_ADDRESS__  // ends the process instead
  EXPECT_EQ(NewHandleClear(std::numeric_limits<Size>::max()), nullptr);
#endif
  EXPECT_EQ(LiveHandles(), before);
}

TEST(Handles, AnEmptiedPointerDoesNotKeepABlockFromBeingFreed) {
  const Handle handle = NewHandleClear(16);
  *handle = nullptr;
  EXPECT_EQ(GetHandleSize(handle), 16);
  DisposeHandle(handle);  // a leak would show in the leak check
}

TEST(Handles, ABlockIsMadeOfBytes) {
  const std::string bytes("a\0b", 3);
  const Handle handle = NewHandleWith(bytes);
  ASSERT_EQ(GetHandleSize(handle), 3);
  EXPECT_EQ(std::string(*handle, 3), bytes);
  DisposeHandle(handle);
}

}  // namespace
}  // namespace tallowmere::quicktime::test
