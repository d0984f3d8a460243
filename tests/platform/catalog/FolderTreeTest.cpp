// The tree of folders that an index keeps in memory.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "catalog/FolderTree.h"

namespace tallowmere::catalog {
namespace {

kernel::Item FolderWith(std::uint64_t inode, std::uint64_t device = 1, std::int32_t mount = 10) {
  kernel::Item item{};
  item.inode = inode;
  item.device = device;
  item.mount = mount;
  item.type = S_IFDIR;
  return item;
}

class AFolderTree : public testing::Test {
 protected:
  FolderNumber LearnIn(FolderTree& tree, FolderNumber parent, const std::string& name,
                       std::uint32_t number) {
    return tree.Learn({parent, name}, FolderWith(number), number);
  }
  FolderNumber Learn(FolderNumber parent, const std::string& name, std::uint32_t number) {
    return LearnIn(mTree, parent, name, number);
  }

  FolderTree mTree{FolderTree::Identity::kByNumbers};
  FolderNumber mTop = Learn(kNoParent, "/v", 100);
};

TEST_F(AFolderTree, KnowsThePathOfAFolder) {
  const FolderNumber inner = Learn(Learn(mTop, "a", 101), "b", 102);
  EXPECT_EQ(mTree.PathOf(inner), "/v/a/b");
  EXPECT_EQ(mTree.PathOf({inner, "c"}), "/v/a/b/c");
  EXPECT_EQ(mTree.PathOf({kNoParent, "/x"}), "/x");
}

TEST_F(AFolderTree, KnowsThePathOfAFolderInTheRoot) {
  FolderTree tree(FolderTree::Identity::kByNumbers);
  EXPECT_EQ(tree.PathOf(LearnIn(tree, LearnIn(tree, kNoParent, "/", 2), "a", 101)), "/a");
}

TEST_F(AFolderTree, RecognisesAFolderWhereverItHasMoved) {
  const FolderNumber a = Learn(mTop, "a", 101);
  const FolderNumber b = Learn(mTop, "b", 102);
  const FolderNumber below = Learn(b, "below", 103);
  EXPECT_EQ(Learn(a, "c", 102), b);
  EXPECT_EQ(mTree.PathOf(below), "/v/a/c/below");
}

TEST_F(AFolderTree, KeepsAFolderUnderItsParentWhenReachedByItsPath) {
  const FolderNumber a = Learn(mTop, "a", 101);
  EXPECT_EQ(Learn(kNoParent, "/v/a", 101), a);
  Learn(kNoParent, "/w", 100);
  EXPECT_EQ(mTree.PathOf(a), "/w/a");
  Learn(kNoParent, "/elsewhere", 101);
  EXPECT_EQ(mTree.PathOf(a), "/elsewhere");
}

TEST_F(AFolderTree, FindsTheFoldersWithAnID) {
  const FolderNumber a = Learn(mTop, "a", 101);
  const FolderNumber same = mTree.Learn({mTop, "b"}, FolderWith(102), 101);
  EXPECT_EQ(mTree.WithID(101), (std::vector{a, same}));
  EXPECT_TRUE(mTree.WithID(999).empty());
  EXPECT_TRUE(FolderTree(FolderTree::Identity::kByNumbers).WithID(101).empty());
}

TEST_F(AFolderTree, FindsEachOfManyFolders) {
  for (std::uint32_t i = 0; i < 5000; ++i) Learn(mTop, std::to_string(i), 1000 + i);
  for (std::uint32_t i = 0; i < 5000; ++i) {
    const auto found = mTree.WithID(1000 + i);
    ASSERT_EQ(found.size(), 1u);
    EXPECT_EQ(mTree.NameOf(found.front()), std::to_string(i));
    EXPECT_EQ(Learn(mTop, std::to_string(i), 1000 + i), found.front());
  }
}

TEST_F(AFolderTree, ForgetsAFolder) {
  const FolderNumber a = Learn(mTop, "a", 101);
  mTree.Forget(a);
  EXPECT_TRUE(mTree.WithID(101).empty());
  EXPECT_NE(Learn(mTop, "a", 101), a);
}

TEST_F(AFolderTree, IsMostlyWasteWhenMostNamesAreOfDeletedFolders) {
  const std::string name(50, 'n');
  mTree.Forget(Learn(mTop, name, 101));
  EXPECT_TRUE(mTree.IsMostlyWaste());
  Learn(mTop, name + name, 102);
  EXPECT_FALSE(mTree.IsMostlyWaste());
  Learn(mTop, "x", 102);
  EXPECT_TRUE(mTree.IsMostlyWaste());
}

TEST_F(AFolderTree, HasNoPathForFoldersThatSeemToContainEachOther) {
  const FolderNumber a = Learn(mTop, "a", 101);
  const FolderNumber b = Learn(a, "b", 102);
  Learn(b, "a", 101);
  EXPECT_EQ(mTree.PathOf(a), "");
}

TEST_F(AFolderTree, DistinguishesFoldersOfTwoDevices) {
  const FolderNumber here = mTree.Learn({mTop, "a"}, FolderWith(101, 1), 101);
  const FolderNumber there = mTree.Learn({mTop, "b"}, FolderWith(101, 2), 101);
  EXPECT_NE(here, there);
  EXPECT_EQ(mTree.RegionOf(there).device, 2u);
  EXPECT_FALSE(mTree.IsSame(here, FolderWith(101, 2)));
}

TEST_F(AFolderTree, RecognisesAFolderAtAnotherMount) {
  const FolderNumber a = Learn(mTop, "a", 101);
  EXPECT_EQ(mTree.Learn({kNoParent, "/w"}, FolderWith(101, 1, 11), 101), a);
  EXPECT_EQ(mTree.PathOf(a), "/w");
  EXPECT_TRUE(mTree.IsSame(a, FolderWith(101, 1, 11)));
  EXPECT_FALSE(mTree.IsSame(a, FolderWith(101, 1, 10)));
}

TEST_F(AFolderTree, KeepsOnlyTheHandleOfARegionsFirstFolder) {
  kernel::Item first = FolderWith(101, 2);
  first.handle.size = 8;
  const FolderNumber outer = mTree.Learn({mTop, "a"}, first, 101);
  const FolderNumber inner = mTree.Learn({outer, "b"}, FolderWith(102, 2), 102);
  EXPECT_EQ(mTree.RegionOf(inner).handle.size, 8u);
}

TEST_F(AFolderTree, IsEmptyWhenItIsCleared) {
  Learn(mTop, "a", 101);
  mTree.Clear();
  EXPECT_EQ(mTree.Count(), 0u);
  EXPECT_EQ(mTree.Size(), FolderTree(FolderTree::Identity::kByNumbers).Size());
}

class AFolderTreeByPlaces : public AFolderTree {
 protected:
  AFolderTreeByPlaces() : mPlaces(FolderTree::Identity::kByPlace) {
    mRoot = LearnIn(mPlaces, kNoParent, "/v", 100);
  }

  FolderTree mPlaces;
  FolderNumber mRoot;
};

TEST_F(AFolderTreeByPlaces, DistinguishesFoldersWithTheSameNumber) {
  const FolderNumber a = LearnIn(mPlaces, mRoot, "a", 101);
  const FolderNumber b = LearnIn(mPlaces, mRoot, "b", 101);
  const FolderNumber inner = LearnIn(mPlaces, a, "b", 101);
  EXPECT_NE(a, b);
  EXPECT_NE(b, inner);
  EXPECT_EQ(mPlaces.PathOf(a), "/v/a");
  EXPECT_EQ(mPlaces.PathOf(b), "/v/b");
  EXPECT_EQ(mPlaces.PathOf(inner), "/v/a/b");
}

TEST_F(AFolderTreeByPlaces, RecognisesAFolderAtItsPlace) {
  const FolderNumber a = LearnIn(mPlaces, mRoot, "a", 101);
  mPlaces[a].isRead = true;
  EXPECT_EQ(LearnIn(mPlaces, mRoot, "a", 101), a);
  EXPECT_TRUE(mPlaces[a].isRead);
}

TEST_F(AFolderTreeByPlaces, RereadsAFolderThatHasTakenAPlace) {
  const FolderNumber a = LearnIn(mPlaces, mRoot, "a", 101);
  mPlaces[a].isRead = true;
  EXPECT_EQ(LearnIn(mPlaces, mRoot, "a", 102), a);
  EXPECT_FALSE(mPlaces[a].isRead);
  EXPECT_EQ(mPlaces[a].id, 102u);
  EXPECT_TRUE(mPlaces.IsSame(a, FolderWith(102)));
}

TEST_F(AFolderTreeByPlaces, FindsEachOfManyFolders) {
  std::vector<FolderNumber> numbers;
  for (int i = 0; i < 5000; ++i) {
    numbers.push_back(LearnIn(mPlaces, mRoot, std::to_string(i), 101));
  }
  for (int i = 0; i < 5000; ++i) {
    EXPECT_EQ(LearnIn(mPlaces, mRoot, std::to_string(i), 101), numbers[static_cast<size_t>(i)]);
  }
}

}  // namespace
}  // namespace tallowmere::catalog
