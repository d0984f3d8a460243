// What remains when memory runs out at any point.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "../foundation/FailingAllocator.h"
#include "ExporterFixture.h"
#include "support/OwnedByCallers.h"

namespace tallowmere::quicktime::test {
namespace {

using foundation::test::FailAllocationsAfter;
using foundation::test::FailNoAllocation;
using foundation::test::LiveAllocations;
using tallowmere::test::LiveHandles;
using tallowmere::test::OpenInstances;

class Memory : public WithExporter {};

// Enough to make the table grow more than once.
constexpr int kMany = 100;

TEST_F(Memory, WithoutItThereIsNoBlock) {
  DisposeHandle(NewHandleClear(1));  // allocates the table of blocks
  std::vector<Handle> made;
  long most = 0;
  for (int i = 0; i < kMany; ++i) {
    const auto handles = LiveHandles();
    const long allocations = LiveAllocations();
    Handle handle = nullptr;
    long count = 0;
    for (; handle == nullptr; ++count) {
      EXPECT_EQ(LiveHandles(), handles);
      EXPECT_EQ(LiveAllocations(), allocations);
      FailAllocationsAfter(count);
      handle = NewHandleClear(36);
      FailNoAllocation();
    }
    EXPECT_GE(count, 2);
    most = std::max(most, count);
    EXPECT_EQ(GetHandleSize(handle), 36);
    made.push_back(handle);
  }
  EXPECT_GE(most, 4);
  for (const Handle handle : made) DisposeHandle(handle);
}

TEST_F(Memory, WithoutItNoInstanceIsOpened) {
  ComponentDescription looking{};
  const Component component = FindNextComponent(nullptr, &looking);
  std::vector<ComponentInstance> opened;
  long most = 0;
  for (int i = 0; i < kMany; ++i) {
    const auto instances = OpenInstances();
    const long allocations = LiveAllocations();
    ComponentInstance instance = nullptr;
    ComponentResult result = memFullErr;
    long count = 0;
    for (; result != noErr; ++count) {
      EXPECT_EQ(result, -108);
      EXPECT_EQ(instance, nullptr);
      EXPECT_EQ(OpenInstances(), instances);
      EXPECT_EQ(LiveAllocations(), allocations);
      FailAllocationsAfter(count);
      result = OpenAComponent(component, &instance);
      FailNoAllocation();
    }
    most = std::max(most, count);
    opened.push_back(instance);
  }
  EXPECT_GE(most, 3);
  for (const ComponentInstance instance : opened) CloseComponent(instance);
}

TEST_F(Memory, WithoutItThereAreNoSettings) {
  ASSERT_EQ(Set(Sound("twos")), noErr);
  const auto handles = LiveHandles();
  const long allocations = LiveAllocations();
  Handle settings = nullptr;
  ComponentResult result = memFullErr;
  long count = 0;
  for (; result != noErr; ++count) {
    EXPECT_EQ(result, -108);
    EXPECT_EQ(settings, nullptr);
    EXPECT_EQ(LiveHandles(), handles);
    EXPECT_EQ(LiveAllocations(), allocations);
    FailAllocationsAfter(count);
    result = MovieExportGetSettingsAsAtomContainer(mExporter, &settings);
    FailNoAllocation();
  }
  EXPECT_GE(count, 2);
  DisposeHandle(settings);
}

TEST_F(Memory, OfClosedInstancesAndDisposedBlocksIsFreed) {
  const auto once = [] {
    ComponentDescription looking{};
    ComponentInstance instance = nullptr;
    ASSERT_EQ(OpenAComponent(FindNextComponent(nullptr, &looking), &instance), noErr);
    CloseComponent(instance);
    DisposeHandle(NewHandleClear(36));
  };
  once();
  const long before = LiveAllocations();
  for (int i = 0; i < 100; ++i) once();
  EXPECT_EQ(LiveAllocations(), before);
}

}  // namespace
}  // namespace tallowmere::quicktime::test
