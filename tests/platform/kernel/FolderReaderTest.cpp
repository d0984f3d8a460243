// Reading the entries of a folder.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <map>
#include <set>
#include <string>

#include "kernel/FolderReader.h"
#include "support/OtherKernel.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::kernel {
namespace {

using testing::UnorderedElementsAre;

class EntriesOfAFolder : public testing::Test {
 protected:
  Descriptor Open() const {
    return Descriptor(open(mFolder.Path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  }
  std::map<std::string, Entry::Kind> Kinds() const {
    const Descriptor folder = Open();
    FolderReader reader(folder);
    std::map<std::string, Entry::Kind> kinds;
    while (const Entry* const entry = reader.Next()) kinds[entry->name] = entry->kind;
    EXPECT_EQ(reader.FailedBy().number, 0);
    return kinds;
  }

  test::TemporaryFolder mFolder;
};

TEST_F(EntriesOfAFolder, AreNoneInAnEmptyFolder) {
  EXPECT_TRUE(Kinds().empty());
}

TEST_F(EntriesOfAFolder, ExcludeTheFolderItselfAndItsParent) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("file");
  mFolder.MakeFile("...");
  mFolder.MakeFile("..a");
  mFolder.MakeFile(".b");
  mFolder.MakeFile("\xFF\n");
  mFolder.MakeLink("link", "folder");
  ASSERT_EQ(mkfifo((mFolder.Path() / "pipe").c_str(), 0600), 0);
  using Kind = Entry::Kind;
  EXPECT_THAT(Kinds(), UnorderedElementsAre(
                           std::pair("folder", Kind::kFolder), std::pair("file", Kind::kOther),
                           std::pair("...", Kind::kOther), std::pair("..a", Kind::kOther),
                           std::pair(".b", Kind::kOther), std::pair("\xFF\n", Kind::kOther),
                           std::pair("link", Kind::kOther), std::pair("pipe", Kind::kOther)));
}

TEST_F(EntriesOfAFolder, HaveTheNumbersOfTheirItems) {
  const std::string path = mFolder.MakeFile("file");
  struct stat about {};
  ASSERT_EQ(stat(path.c_str(), &about), 0);
  const Descriptor folder = Open();
  FolderReader reader(folder);
  const Entry* const entry = reader.Next();
  ASSERT_NE(entry, nullptr);
  EXPECT_EQ(entry->inode, about.st_ino);
  EXPECT_EQ(reader.Next(), nullptr);
  EXPECT_EQ(reader.Next(), nullptr);
}

TEST_F(EntriesOfAFolder, HaveNoKindWhereTheFileSystemDoesNotSay) {
  mFolder.MakeFolder("folder");
  mFolder.MakeFile("file");
  const test::UntypedEntries untyped;
  EXPECT_THAT(Kinds(), UnorderedElementsAre(std::pair("folder", Entry::Kind::kUnknown),
                                            std::pair("file", Entry::Kind::kUnknown)));
}

// Several times as many entries as one system call returns.
TEST_F(EntriesOfAFolder, AreEachReturnedOnceFromALargeFolder) {
  constexpr int kFiles = 2000;
  std::set<std::string> made;
  for (int i = 0; i < kFiles; ++i) {
    const std::string name = std::string(60, 'n') + std::to_string(i);
    mFolder.MakeFile(name);
    made.insert(name);
  }
  const Descriptor folder = Open();
  FolderReader reader(folder);
  std::multiset<std::string> read;
  while (const Entry* const entry = reader.Next()) read.insert(entry->name);
  EXPECT_EQ(read, std::multiset<std::string>(made.begin(), made.end()));
}

TEST_F(EntriesOfAFolder, EndWithTheErrorOfTheFolder) {
  const Descriptor file(open(mFolder.MakeFile("file").c_str(), O_RDONLY | O_CLOEXEC));
  FolderReader reader(file);
  EXPECT_EQ(reader.Next(), nullptr);
  EXPECT_EQ(reader.FailedBy().number, ENOTDIR);
}

}  // namespace
}  // namespace tallowmere::kernel
