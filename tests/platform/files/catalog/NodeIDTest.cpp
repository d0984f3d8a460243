#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "files/NodeID.h"

namespace tallowmere::files {
namespace {

constexpr std::uint64_t kDevice = 0x803;
constexpr std::uint32_t kLowestMixed = 0x80000000;
constexpr std::uint32_t kHighestMixed = 0xFFFFFFEF;

ItemReference Root(std::uint64_t inode = 128) {
  ItemReference root{};
  root.device = kDevice;
  root.inode = inode;
  return root;
}

bool IsMixed(std::uint32_t id) {
  return id >= kLowestMixed && id <= kHighestMixed;
}

TEST(NodeID, OfTheRootIs2WhateverItsInodeNumber) {
  for (const std::uint64_t inode : {1ULL, 2ULL, 4ULL, 128ULL, 256ULL, 0x80000000ULL, ~0ULL}) {
    EXPECT_EQ(NodeIDOf(inode, kDevice, Root(inode)), 2u) << inode;
  }
}

TEST(NodeID, AnInodeNumberFrom16To31BitsIsItsOwnID) {
  for (const std::uint32_t inode : {16u, 17u, 255u, 65536u, 0x7FFFFEFEu, 0x7FFFFEFFu}) {
    EXPECT_EQ(NodeIDOf(inode, kDevice, Root()), inode);
  }
}

TEST(NodeID, InodeNumbersThatDoNotFitAreMixedIntoTheUpperHalf) {
  for (const std::uint64_t inode : {0ULL, 1ULL, 2ULL, 3ULL, 15ULL, 0x7FFFFF00ULL, 0x7FFFFFFFULL,
                                    0x80000000ULL, 0xFFFFFFFFULL, 0x100000010ULL, ~0ULL}) {
    EXPECT_TRUE(IsMixed(NodeIDOf(inode, kDevice, Root()))) << inode;
  }
}

TEST(NodeID, AnItemOfAnotherDeviceIsMixedEvenWithTheRootsNumber) {
  for (const std::uint64_t inode : {1ULL, 16ULL, 128ULL, 0x7FFFFEFFULL, 0x80000000ULL}) {
    EXPECT_TRUE(IsMixed(NodeIDOf(inode, kDevice + 1, Root()))) << inode;
  }
}

TEST(NodeID, TheSameNumberOnOtherDevicesIsMixedDifferently) {
  EXPECT_NE(NodeIDOf(300, kDevice + 1, Root()), NodeIDOf(300, kDevice + 2, Root()));
  EXPECT_NE(NodeIDOf(3, kDevice, Root()), NodeIDOf(3, kDevice + 1, Root()));
}

TEST(NodeID, SmallNumbersDoNotShareOne) {
  std::vector<std::uint32_t> ids;
  for (std::uint64_t inode = 0; inode < 16; ++inode)
    ids.push_back(NodeIDOf(inode, kDevice, Root()));
  std::sort(ids.begin(), ids.end());
  EXPECT_EQ(std::adjacent_find(ids.begin(), ids.end()), ids.end());
}

// What is on record somewhere has to keep its meaning.
TEST(NodeID, TheMixingStaysAsItIs) {
  EXPECT_EQ(NodeIDOf(3, kDevice, Root()), NodeIDOf(3, 0x99, [] {
              ItemReference root = Root();
              root.device = 0x99;
              return root;
            }()));
  EXPECT_EQ(NodeIDOf(0, kDevice, Root()), kLowestMixed);
}

TEST(NodeID, OnlyIDsOfInodeNumbersAreCertain) {
  for (const std::uint32_t id : {16u, 0x7FFFFEFFu}) EXPECT_TRUE(IsInodeNumber(id)) << id;
  for (const std::uint32_t id :
       {0u, 1u, 2u, 15u, 0x7FFFFF00u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFEFu, 0xFFFFFFFFu}) {
    EXPECT_FALSE(IsInodeNumber(id)) << id;
  }
}

TEST(NodeID, NoItemHasAnIDThatTheFileManagerReserves) {
  for (const std::uint32_t id : {2u, 16u, 0x7FFFFEFFu, 0x80000000u, 0xFFFFFFEFu}) {
    EXPECT_TRUE(CanBeNodeID(id)) << id;
  }
  for (const std::uint32_t id :
       {0u, 1u, 3u, 15u, 0x7FFFFF00u, 0x7FFFFFFFu, 0xFFFFFFF0u, 0xFFFFFFFFu}) {
    EXPECT_FALSE(CanBeNodeID(id)) << id;
  }
}

RC_GTEST_PROP(NodeID, IsAlwaysOneThatAnItemCanHave,
              (std::uint64_t inode, std::uint64_t device, std::uint64_t rootInode)) {
  const ItemReference root = Root(rootInode);
  const std::uint32_t id = NodeIDOf(inode, *rc::gen::element(device, kDevice), root);
  RC_ASSERT(CanBeNodeID(id));
}

RC_GTEST_PROP(NodeID, OneThatIsAnInodeNumberIsThatOfASingleItem,
              (std::uint64_t otherInode, std::uint64_t otherDevice)) {
  const auto inode = *rc::gen::inRange<std::uint32_t>(16, 0x7FFFFF00);
  const ItemReference root = Root();
  RC_PRE(inode != root.inode && (otherInode != inode || otherDevice != kDevice));
  RC_ASSERT(NodeIDOf(otherInode, otherDevice, root) != NodeIDOf(inode, kDevice, root));
}

}  // namespace
}  // namespace tallowmere::files
