// Node ids of inode numbers, and the numbers that an id can come from.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <array>
#include <limits>
#include <optional>
#include <vector>

#include "names/NodeIDs.h"

namespace tallowmere::names {
namespace {

constexpr std::uint64_t kDevice = 0x803;
constexpr std::uint64_t kOtherDevice = 0x804;
constexpr std::uint64_t kRootSubvolume = 5;
constexpr std::uint64_t k31Bits = 0x80000000;
constexpr std::uint64_t k32Bits = 0xFFFFFFFF;
constexpr std::uint64_t kNoLimit = std::numeric_limits<std::uint64_t>::max();

constexpr NodeIDRule kMixed{{128, kDevice, 0}, UpperIDs::kMixed};
constexpr NodeIDRule kFolded{{128, kDevice, 0}, UpperIDs::kFolded};
constexpr NodeIDRule kSubvolumes{{256, kDevice, kRootSubvolume}, UpperIDs::kSubvolumes};
constexpr std::array kRules{kMixed, kFolded, kSubvolumes};

// Returns the id of an inode number on the root folder's device.
std::uint32_t IDOf(const NodeIDRule& rule, std::uint64_t inode) {
  return NodeIDOf({inode, kDevice, rule.root.subvolume}, rule);
}

// Returns the id of an inode number in a subvolume other than the root folder's.
std::uint32_t IDInSubvolume(std::uint64_t subvolume, std::uint64_t inode) {
  return NodeIDOf({inode, kOtherDevice, subvolume}, kSubvolumes);
}

using Numbers = std::optional<std::vector<Candidate>>;

TEST(NodeIDs, TheRootFolderIs2WhateverItsNumber) {
  for (const UpperIDs upper : {UpperIDs::kMixed, UpperIDs::kFolded, UpperIDs::kSubvolumes}) {
    for (const std::uint64_t inode : {1ULL, 2ULL, 4ULL, 128ULL, 256ULL, 0x80000000ULL, ~0ULL}) {
      const NodeIDRule rule{{inode, kDevice, kRootSubvolume}, upper};
      EXPECT_EQ(NodeIDOf(rule.root, rule), 2u) << inode;
    }
  }
}

TEST(NodeIDs, TheRootFoldersNumberOnAnotherDeviceIsAnotherItem) {
  EXPECT_EQ(NodeIDOf({128, kOtherDevice, 0}, kMixed), 0x982CB7C7u);
  EXPECT_EQ(IDInSubvolume(256, 256), 0x80000100u);
}

TEST(NodeIDs, ANumberFrom16To31BitsIsItsOwnID) {
  for (const NodeIDRule& rule : kRules) {
    EXPECT_EQ(IDOf(rule, 16), 16u);
    EXPECT_EQ(IDOf(rule, 17), 17u);
    EXPECT_EQ(IDOf(rule, 0x7FFFFF00), 0x7FFFFF00u);
    EXPECT_EQ(IDOf(rule, 0x7FFFFFFF), 0x7FFFFFFFu);
  }
}

TEST(NodeIDs, TheNumbersBelow16AreMovedAboveAllOthers) {
  for (const NodeIDRule& rule : kRules) {
    EXPECT_EQ(IDOf(rule, 1), 0xFFFFFFF0u);
    EXPECT_EQ(IDOf(rule, 2), 0xFFFFFFF1u);
    EXPECT_EQ(IDOf(rule, 3), 0xFFFFFFF2u);
    EXPECT_EQ(IDOf(rule, 15), 0xFFFFFFFEu);
  }
}

TEST(NodeIDs, FoldedNumbersOf32BitsAreTheirOwnIDs) {
  EXPECT_EQ(IDOf(kFolded, 0x80000000), 0x80000000u);
  EXPECT_EQ(IDOf(kFolded, 0xFFFFFFDF), 0xFFFFFFDFu);
  EXPECT_EQ(IDOf(kFolded, 0xFFFFFFEF), 0xFFFFFFEFu);
}

TEST(NodeIDs, FoldedNumbersAbove32BitsAreShifted) {
  EXPECT_EQ(IDOf(kFolded, 0x100000000), 0x9E3779B1u);
  EXPECT_EQ(IDOf(kFolded, 0x100000080), 0x9E377A31u);
  EXPECT_EQ(IDOf(kFolded, 0x17FFFFFEF), 0x9E3779A0u);
  EXPECT_EQ(IDOf(kFolded, 0x17FFFFFF0), 0x9E3779A1u);
  EXPECT_EQ(IDOf(kFolded, 0x180000000), 0xBC6EF362u);
  EXPECT_EQ(IDOf(kFolded, kNoLimit), 0xC3910C9Du);
}

TEST(NodeIDs, FoldedNumbersThatWouldCollideWithTheSmallOnesAreMovedDown) {
  EXPECT_EQ(IDOf(kFolded, 0xFFFFFFF0), 0xFFFFFFE0u);
  EXPECT_EQ(IDOf(kFolded, 0xFFFFFFFF), 0xFFFFFFEFu);
  EXPECT_EQ(IDOf(kFolded, 0x161C8863E), 0xFFFFFFEFu);
  EXPECT_EQ(IDOf(kFolded, 0x161C8863F), 0xFFFFFFE0u);
}

// Like the first new folder in each of the 32 groups of 1 TiB.
TEST(NodeIDs, TheSamePlaceInManyXfsGroupsHasIDsFarApart) {
  std::vector<std::uint32_t> ids;
  for (std::uint64_t group = 1; group < 32; ++group) {
    ids.push_back(IDOf(kFolded, group * k31Bits + 128));
  }
  std::sort(ids.begin(), ids.end());
  for (std::size_t i = 1; i < ids.size(); ++i) EXPECT_GT(ids[i] - ids[i - 1], 0x1000000u) << i;
}

TEST(NodeIDs, LowSubvolumesAndNumbersHavePlacesOfTheirOwn) {
  EXPECT_EQ(IDInSubvolume(256, 0), 0x80000000u);
  EXPECT_EQ(IDInSubvolume(256, 257), 0x80000101u);
  EXPECT_EQ(IDInSubvolume(256, 0x3FFFFF), 0x803FFFFFu);
  EXPECT_EQ(IDInSubvolume(257, 256), 0x80400100u);
  EXPECT_EQ(IDInSubvolume(639, 256), 0xDFC00100u);
  EXPECT_EQ(IDInSubvolume(639, 0x3FFFFF), 0xDFFFFFFFu);
}

TEST(NodeIDs, OtherSubvolumesAndNumbersAreMixedAboveTheLowOnes) {
  EXPECT_EQ(IDInSubvolume(255, 256), 0xF36999E0u);
  EXPECT_EQ(IDInSubvolume(640, 256), 0xF791C7AAu);
  EXPECT_EQ(IDInSubvolume(256, 0x400000), 0xFB4102F6u);
  EXPECT_EQ(IDInSubvolume(639, 0x400000), 0xE554562Du);
  EXPECT_EQ(IDInSubvolume(300, kNoLimit), 0xF28CBFBBu);
  EXPECT_EQ(IDInSubvolume(std::uint64_t{1} << 40, 257), 0xE2F2AA28u);
  EXPECT_EQ(IDInSubvolume(5, 256), 0xF29EC2D7u);
}

TEST(NodeIDs, NumbersAbove31BitsInTheRootFoldersSubvolumeAreMixed) {
  EXPECT_EQ(IDOf(kSubvolumes, 0x80000000), 0xEFDA86CAu);
  EXPECT_EQ(IDOf(kSubvolumes, 0x100000000), 0xECE81A14u);
}

TEST(NodeIDs, ARootFolderInALowSubvolumeLeavesItsNumbersAsTheyAre) {
  const NodeIDRule rule{{256, kDevice, 300}, UpperIDs::kSubvolumes};
  EXPECT_EQ(NodeIDOf({257, kDevice, 300}, rule), 257u);
  EXPECT_EQ(NodeIDOf({257, kOtherDevice, 5}, rule), IDInSubvolume(5, 257));
}

TEST(NodeIDs, OtherKindsMixNumbersAbove31BitsWithoutTheRootFoldersDevice) {
  EXPECT_EQ(IDOf(kMixed, 0), 0x80000000u);
  EXPECT_EQ(IDOf(kMixed, 0x80000000), 0x8A63FEFFu);
  EXPECT_EQ(IDOf(kMixed, 0xFFFFFFFF), 0xCF1B4CBCu);
  EXPECT_EQ(IDOf(kMixed, 0x100000000), 0x94C7F9BFu);
  EXPECT_EQ(IDOf(kMixed, kNoLimit), 0x8CD67FEBu);
}

TEST(NodeIDs, ItemsOfOtherDevicesAreMixedWithTheirDevice) {
  for (const NodeIDRule& rule : {kMixed, kFolded}) {
    EXPECT_EQ(NodeIDOf({15, kOtherDevice, 0}, rule), 0x8CA239D9u);
    EXPECT_EQ(NodeIDOf({16, kOtherDevice, 0}, rule), 0xC938E95Du);
    EXPECT_EQ(NodeIDOf({128, kOtherDevice, 0}, rule), 0x982CB7C7u);
  }
  EXPECT_EQ(NodeIDOf({0x80000000, kOtherDevice, 0}, kMixed), 0xA5F54B62u);
}

TEST(NodeIDs, TheSubvolumeCountsOnlyWhereNumbersAreNotTheirOwnIDs) {
  EXPECT_FALSE(NeedsSubvolume({256, kDevice, 0}, kSubvolumes));
  EXPECT_FALSE(NeedsSubvolume({15, kDevice, 0}, kSubvolumes));
  EXPECT_FALSE(NeedsSubvolume({0x7FFFFFFF, kDevice, 0}, kSubvolumes));
  EXPECT_TRUE(NeedsSubvolume({0x80000000, kDevice, 0}, kSubvolumes));
  EXPECT_TRUE(NeedsSubvolume({256, kOtherDevice, 0}, kSubvolumes));
  EXPECT_FALSE(NeedsSubvolume({256, kOtherDevice, 0}, kMixed));
  EXPECT_FALSE(NeedsSubvolume({0x80000000, kDevice, 0}, kFolded));
}

TEST(NodeIDs, SomeNumbersAreNoItems) {
  for (const std::uint32_t id : {0u, 1u, 3u, 15u, 0xFFFFFFFFu}) {
    EXPECT_FALSE(CanBeNodeID(id)) << id;
    for (const NodeIDRule& rule : kRules) {
      EXPECT_EQ(CandidatesOf(id, rule, kNoLimit), Numbers(std::vector<Candidate>{})) << id;
    }
  }
  for (const std::uint32_t id : {2u, 16u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFEFu, 0xFFFFFFFEu}) {
    EXPECT_TRUE(CanBeNodeID(id)) << id;
  }
}

TEST(NodeIDs, InodeNumbersAreTheLowerHalf) {
  for (const std::uint32_t id : {16u, 17u, 0x7FFFFFFFu}) EXPECT_TRUE(IsInodeNumber(id)) << id;
  for (const std::uint32_t id : {2u, 15u, 0x80000000u, 0xFFFFFFF0u, 0xFFFFFFFEu}) {
    EXPECT_FALSE(IsInodeNumber(id)) << id;
  }
}

TEST(NodeIDs, TheLowerHalfAndTheSmallNumbersAreOneNumberEach) {
  for (const NodeIDRule& rule : kRules) {
    EXPECT_EQ(CandidatesOf(16, rule, kNoLimit), Numbers({{16, 0}}));
    EXPECT_EQ(CandidatesOf(0x7FFFFFFF, rule, kNoLimit), Numbers({{0x7FFFFFFF, 0}}));
    EXPECT_EQ(CandidatesOf(0xFFFFFFF0, rule, kNoLimit), Numbers({{1, 0}}));
    EXPECT_EQ(CandidatesOf(0xFFFFFFFE, rule, kNoLimit), Numbers({{15, 0}}));
    EXPECT_EQ(CandidatesOf(2, rule, kNoLimit), Numbers({{rule.root.inode, 0}}));
  }
}

TEST(NodeIDs, TheRootFoldersNumberIsNoOtherIDsCandidate) {
  const Numbers none(std::vector<Candidate>{});
  EXPECT_EQ(CandidatesOf(128, kFolded, kNoLimit), none);
  const NodeIDRule small{{1, kDevice, 0}, UpperIDs::kMixed};
  EXPECT_EQ(CandidatesOf(0xFFFFFFF0, small, kNoLimit), none);
  const NodeIDRule large{{0x80000010, kDevice, 0}, UpperIDs::kFolded};
  EXPECT_EQ(CandidatesOf(0x80000010, large, k32Bits), none);
}

TEST(NodeIDs, AFoldedIDsCandidatesAreAllNumbersThatShareIt) {
  EXPECT_EQ(CandidatesOf(0x80000080, kFolded, k32Bits), Numbers({{0x80000080, 0}}));
  EXPECT_EQ(CandidatesOf(0x80000080, kFolded, 0x161C886CE), Numbers({{0x80000080, 0}}));
  EXPECT_EQ(CandidatesOf(0x80000080, kFolded, 0x161C886CF),
            Numbers({{0x80000080, 0}, {0x161C886CF, 0}}));
  EXPECT_EQ(CandidatesOf(0xFFFFFFE0, kFolded, 0x1FFFFFFFF), Numbers({{0xFFFFFFE0, 0},
                                                                     {0xFFFFFFF0, 0},
                                                                     {0x161C8862F, 0},
                                                                     {0x161C8863F, 0},
                                                                     {0x1C3910C7E, 0},
                                                                     {0x1C3910C8E, 0}}));
  EXPECT_EQ(CandidatesOf(0x80000080, kFolded, 0x8000007F), Numbers(std::vector<Candidate>{}));
}

TEST(NodeIDs, CandidatesAreNotListedBeyondTheirBound) {
  const auto most = CandidatesOf(0xFFFFFFE0, kFolded, 513 * k31Bits - 1);
  ASSERT_TRUE(most);
  EXPECT_EQ(most->size(), kMostCandidates);
  EXPECT_FALSE(CandidatesOf(0xFFFFFFE0, kFolded, 513 * k31Bits));
  EXPECT_FALSE(CandidatesOf(0x80000080, kFolded, kNoLimit));
}

TEST(NodeIDs, APlaceOfASubvolumeHasOneCandidate) {
  EXPECT_EQ(CandidatesOf(0x80000100, kSubvolumes, kNoLimit), Numbers({{256, 256}}));
  EXPECT_EQ(CandidatesOf(0xDFFFFFFF, kSubvolumes, kNoLimit), Numbers({{0x3FFFFF, 639}}));
  const NodeIDRule rule{{256, kDevice, 256}, UpperIDs::kSubvolumes};
  EXPECT_EQ(CandidatesOf(0x80000101, rule, kNoLimit), Numbers(std::vector<Candidate>{}));
}

TEST(NodeIDs, MixedIDsHaveCandidatesThatCannotBeListed) {
  EXPECT_FALSE(CandidatesOf(0x80000000, kMixed, k32Bits));
  EXPECT_FALSE(CandidatesOf(0xFFFFFFEF, kMixed, k32Bits));
  EXPECT_FALSE(CandidatesOf(0xE0000000, kSubvolumes, kNoLimit));
}

TEST(NodeIDs, CertaintyFollowsFromTheCandidates) {
  EXPECT_TRUE(IsCertain(0x7FFFFFFF, kMixed, kNoLimit));
  EXPECT_TRUE(IsCertain(0xFFFFFFF0, kMixed, kNoLimit));
  EXPECT_FALSE(IsCertain(0x80000000, kMixed, kNoLimit));
  EXPECT_TRUE(IsCertain(0x80000080, kFolded, k32Bits));
  EXPECT_TRUE(IsCertain(0xFFFFFFDF, kFolded, k32Bits));
  EXPECT_FALSE(IsCertain(0xFFFFFFE0, kFolded, k32Bits));
  EXPECT_FALSE(IsCertain(0xFFFFFFEF, kFolded, k32Bits));
  EXPECT_TRUE(IsCertain(0x80000080, kFolded, 0x161C886CE));
  EXPECT_FALSE(IsCertain(0x80000080, kFolded, 0x161C886CF));
  EXPECT_TRUE(IsCertain(0xDFFFFFFF, kSubvolumes, kNoLimit));
  EXPECT_FALSE(IsCertain(0xE0000000, kSubvolumes, kNoLimit));
}

rc::Gen<NodeIDRule> AnyRule() {
  return rc::gen::elementOf(std::vector<NodeIDRule>(kRules.begin(), kRules.end()));
}

constexpr std::uint64_t kOne = 1;

// Returns a number of any length but 0, or one near a boundary of the table of ids.
std::uint64_t AnyNumber() {
  if (*rc::gen::arbitrary<bool>()) {
    return (*rc::gen::arbitrary<std::uint64_t>() | kOne << 63) >> *rc::gen::inRange(0, 64);
  }
  const std::uint64_t boundary = *rc::gen::elementOf(std::vector<std::uint64_t>{
      19, 128, kOne << 22, kOne << 31, 0xFFFFFFE0, kOne << 32, 3 * (kOne << 31)});
  return boundary - 18 + *rc::gen::inRange<std::uint64_t>(0, 52);
}

ItemNumbers AnyItem(const NodeIDRule& rule) {
  const auto inode = AnyNumber();
  if (*rc::gen::arbitrary<bool>()) return {inode, kDevice, rule.root.subvolume};
  return {inode, kOtherDevice, *rc::gen::inRange<std::uint64_t>(250, 650)};
}

// Returns a candidate as the kernel would report it.
ItemNumbers Shown(const Candidate& candidate, const NodeIDRule& rule) {
  if (candidate.subvolume == 0) return {candidate.inode, kDevice, rule.root.subvolume};
  return {candidate.inode, kOtherDevice, candidate.subvolume};
}

RC_GTEST_PROP(NodeIDs, AreNeverReservedOnes, ()) {
  const NodeIDRule rule = *AnyRule();
  const ItemNumbers item = AnyItem(rule);
  const std::uint32_t id = NodeIDOf(item, rule);
  RC_ASSERT(CanBeNodeID(id));
  RC_ASSERT(id != 0u);
  RC_ASSERT(id != kParentOfRootID);
  RC_ASSERT(id != kNoVolumeID);
  RC_ASSERT(id != 0xFFFFFFFFu);
  const bool isRoot = item.device == rule.root.device && item.inode == rule.root.inode;
  RC_ASSERT((id == kRootFolderID) == isRoot);
}

RC_GTEST_PROP(NodeIDs, OfEveryCandidateAreTheOneAskedFor, (std::uint32_t id)) {
  const NodeIDRule rule = *AnyRule();
  const auto candidates = CandidatesOf(id, rule, *rc::gen::inRange<std::uint64_t>(0, kOne << 40));
  RC_PRE(candidates.has_value());
  for (const Candidate& candidate : *candidates) {
    RC_ASSERT(NodeIDOf(Shown(candidate, rule), rule) == id);
  }
}

RC_GTEST_PROP(NodeIDs, HaveEachItemAmongTheirCandidates, ()) {
  const NodeIDRule rule = *AnyRule();
  const ItemNumbers item = AnyItem(rule);
  RC_PRE(rule.upper != UpperIDs::kFolded || item.device == kDevice);
  RC_PRE(item.inode < kOne << 40);
  const auto candidates =
      CandidatesOf(NodeIDOf(item, rule), rule, *rc::gen::inRange(item.inode, kOne << 40));
  RC_PRE(candidates.has_value());
  const bool isThere =
      std::any_of(candidates->begin(), candidates->end(),
                  [&](const Candidate& candidate) { return Shown(candidate, rule) == item; });
  RC_ASSERT(isThere);
}

RC_GTEST_PROP(NodeIDs, ThatAreCertainHaveOneCandidate, (std::uint32_t id)) {
  const NodeIDRule rule = *AnyRule();
  const auto highest = AnyNumber();
  RC_PRE(IsCertain(id, rule, highest));
  const auto candidates = CandidatesOf(id, rule, highest);
  RC_ASSERT(candidates.has_value());
  RC_ASSERT(candidates->size() <= 1u);
}

// The lowest 31 bits of the two numbers differ by the shift.
RC_GTEST_PROP(NodeIDs, OfTwoItemsAreNotTheSameCertainOne, ()) {
  const auto kept = *rc::gen::inRange<std::uint64_t>(0, k31Bits);
  const auto fold = *rc::gen::inRange<std::uint64_t>(2, 500);
  const std::uint64_t one = k31Bits + kept;
  const std::uint64_t other = fold * k31Bits + (kept - (fold - 1) * 0x1E3779B1) % k31Bits;
  const std::uint32_t id = IDOf(kFolded, one);
  RC_ASSERT(id == IDOf(kFolded, other));
  RC_ASSERT(!IsCertain(id, kFolded, other));
}

RC_GTEST_PROP(NodeIDs, OfA32BitKindAreItsNumbers, ()) {
  const auto number = *rc::gen::inRange<std::uint32_t>(16, 0xFFFFFFF0);
  RC_PRE(number != kFolded.root.inode);
  RC_ASSERT(IDOf(kFolded, number) == number);
  RC_ASSERT(IsCertain(number, kFolded, k32Bits) == (number < 0xFFFFFFE0));
}

}  // namespace
}  // namespace tallowmere::names
