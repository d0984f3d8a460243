// The bounded memory of the places where items were last seen.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <map>
#include <string>

#include "catalog/PlaceMemory.h"

namespace tallowmere::catalog {
namespace {

constexpr std::size_t kPlenty = 1 << 16;

PlaceKey Item(std::uint64_t space, std::uint64_t number) {
  return {space, number};
}

std::string PathOf(const PlaceMemory::Place* place) {
  return place == nullptr ? "(null)" : place->path;
}

// Returns the bytes that one place with a short path takes.
std::size_t SizeOfOnePlace() {
  PlaceMemory memory(kPlenty);
  memory.Remember(Item(1, 1), "/a");
  return memory.Size();
}

TEST(PlaceMemory, RecallsWhatItWasTold) {
  PlaceMemory memory(kPlenty);
  memory.Remember(Item(1, 1), "/a");
  memory.Remember(Item(1, 2), "/b");
  memory.Remember(Item(2, 1), "/c");
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 1))), "/a");
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 2))), "/b");
  EXPECT_EQ(PathOf(memory.Recall(Item(2, 1))), "/c");
}

TEST(PlaceMemory, KnowsNothingElse) {
  PlaceMemory memory(kPlenty);
  memory.Remember(Item(1, 1), "/a");
  EXPECT_EQ(memory.Recall(Item(1, 3)), nullptr);
}

TEST(PlaceMemory, KeepsTheLastPlaceOfAnItem) {
  PlaceMemory memory(kPlenty);
  memory.Remember(Item(1, 1), "/a");
  const std::size_t size = memory.Size();
  memory.Remember(Item(1, 1), "/b");
  memory.Remember(Item(1, 1), "/b");
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 1))), "/b");
  EXPECT_EQ(memory.Size(), size);
}

TEST(PlaceMemory, ForgetsTheLeastRecentlyUsedFirst) {
  PlaceMemory memory(3 * SizeOfOnePlace());
  memory.Remember(Item(1, 1), "/a");
  memory.Remember(Item(1, 2), "/b");
  memory.Remember(Item(1, 3), "/c");
  memory.Recall(Item(1, 1));
  memory.Remember(Item(1, 2), "/b");
  memory.Remember(Item(1, 4), "/d");
  EXPECT_EQ(memory.Recall(Item(1, 3)), nullptr);
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 1))), "/a");
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 2))), "/b");
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 4))), "/d");
}

TEST(PlaceMemory, ForgetsAsMuchAsALongPathTakes) {
  PlaceMemory memory(20 * SizeOfOnePlace());
  for (std::uint64_t inode = 0; inode < 20; ++inode) memory.Remember(Item(1, inode), "/a");
  const std::string path(10 * SizeOfOnePlace(), 'x');
  memory.Remember(Item(2, 1), path);
  EXPECT_EQ(PathOf(memory.Recall(Item(2, 1))), path);
  EXPECT_EQ(memory.Recall(Item(1, 9)), nullptr);
  EXPECT_EQ(PathOf(memory.Recall(Item(1, 19))), "/a");
}

TEST(PlaceMemory, WithoutRoomRemembersNothing) {
  PlaceMemory memory(SizeOfOnePlace() - 1);
  memory.Remember(Item(1, 1), "/a");
  EXPECT_EQ(memory.Recall(Item(1, 1)), nullptr);
  EXPECT_EQ(memory.Size(), 0U);
}

TEST(PlaceMemory, StaysBoundedAfterAMillionItems) {
  PlaceMemory memory(kPlenty);
  for (std::uint64_t inode = 0; inode < 1000000; ++inode) {
    memory.Remember(Item(1, inode), "/a folder/with/a file of some name");
    ASSERT_LE(memory.Size(), kPlenty);
  }
  EXPECT_GT(memory.Size(), kPlenty / 2);
  EXPECT_EQ(memory.Recall(Item(1, 0)), nullptr);
  EXPECT_NE(memory.Recall(Item(1, 999999)), nullptr);
}

TEST(PlaceMemory, KnowsTheParentOfAPlaceUntilTheItemIsElsewhere) {
  PlaceMemory memory(kPlenty);
  memory.Remember(Item(1, 1), "/a");
  EXPECT_EQ(memory.Recall(Item(1, 1))->parent, 0U);
  memory.RememberParent(Item(1, 1), "/b", 7);
  EXPECT_EQ(memory.Recall(Item(1, 1))->parent, 0U);
  memory.RememberParent(Item(1, 1), "/a", 7);
  EXPECT_EQ(memory.Recall(Item(1, 1))->parent, 7U);
  memory.Remember(Item(1, 1), "/a");
  EXPECT_EQ(memory.Recall(Item(1, 1))->parent, 7U);
  memory.Remember(Item(1, 1), "/b");
  EXPECT_EQ(memory.Recall(Item(1, 1))->parent, 0U);
  memory.RememberParent(Item(1, 2), "/c", 7);
  EXPECT_EQ(memory.Recall(Item(1, 2)), nullptr);
}

TEST(PlaceMemory, KnowsThePlaceOfTheLastUse) {
  PlaceMemory memory(kPlenty);
  EXPECT_EQ(memory.Latest(), "");
  memory.Remember(Item(1, 1), "/a");
  memory.Remember(Item(1, 2), "/b");
  EXPECT_EQ(memory.Latest(), "/b");
  memory.Recall(Item(1, 1));
  EXPECT_EQ(memory.Latest(), "/a");
}

// It only recalls what it was told last, and its size is that of what it can recall.
RC_GTEST_PROP(PlaceMemory, NeverRecallsAWrongPlace, ()) {
  PlaceMemory memory(10 * SizeOfOnePlace());
  std::map<std::uint64_t, std::string> told;
  const auto steps = *rc::gen::container<std::vector<std::pair<std::uint64_t, std::uint8_t>>>(
      rc::gen::pair(rc::gen::inRange<std::uint64_t>(0, 20), rc::gen::arbitrary<std::uint8_t>()));
  for (const auto& [inode, length] : steps) {
    if (length % 4 == 0) {
      memory.Recall(Item(1, inode));
    } else {
      told[inode] = "/" + std::string(length, 'x');
      memory.Remember(Item(1, inode), told[inode]);
    }
    RC_ASSERT(memory.Size() <= 10 * SizeOfOnePlace());
  }
  for (std::uint64_t inode = 0; inode < 20; ++inode) {
    const PlaceMemory::Place* const place = memory.Recall(Item(1, inode));
    if (place != nullptr) RC_ASSERT(place->path == told.at(inode));
  }
}

}  // namespace
}  // namespace tallowmere::catalog
