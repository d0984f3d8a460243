#include <gtest/gtest.h>

#include <utility>

#include "formats/AliasRecord.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

using formats::ReadAliasRecord;

RecordToWrite Version2() {
  RecordToWrite record;
  record.kind = 1;
  record.volumeName = "Old Disk";
  record.volumeCreation = 0xB0000001;
  record.parentID = 23;
  record.name = "Folder";
  record.targetID = 42;
  record.targetCreation = 0xB0000002;
  record.levelsUp = 2;
  record.levelsDown = 1;
  return record;
}

RecordToWrite Version3() {
  RecordToWrite record;
  record.version = 3;
  record.volumeCreation = 0x123456789ABCDEF0;
  record.targetCreation = 0x0FEDCBA987654321;
  record.parentID = 23;
  record.targetID = 42;
  record.tags = {{14, Units(u"file")}, {15, Units(u"Disk")}};
  return record;
}

TEST(AliasRecord, OfVersion2HasAllFieldsOfItsHead) {
  const auto record = ReadAliasRecord(Write(Version2()));
  ASSERT_TRUE(record);
  EXPECT_EQ(record->version, 2);
  EXPECT_TRUE(record->isFolder);
  EXPECT_EQ(record->shortVolumeName, "Old Disk");
  EXPECT_EQ(record->volumeCreation, 0xB0000001);
  EXPECT_EQ(record->signature, 0x482B);
  EXPECT_EQ(record->parentID, 23u);
  EXPECT_EQ(record->shortTargetName, "Folder");
  EXPECT_EQ(record->targetID, 42u);
  EXPECT_EQ(record->targetCreation, 0xB0000002);
  EXPECT_EQ(record->type, 0x54455854u);
  EXPECT_EQ(record->creator, 0x74747874u);
  EXPECT_EQ(record->levelsUp, 2);
  EXPECT_EQ(record->levelsDown, 1);
  EXPECT_FALSE(record->volumeName);
}

TEST(AliasRecord, OfVersion3HasPreciseDatesAndNoLevels) {
  const auto record = ReadAliasRecord(Write(Version3()));
  ASSERT_TRUE(record);
  EXPECT_EQ(record->version, 3);
  EXPECT_FALSE(record->isFolder);
  EXPECT_EQ(record->preciseVolumeCreation, 0x123456789ABCDEF0u);
  EXPECT_EQ(record->preciseTargetCreation, 0x0FEDCBA987654321u);
  EXPECT_EQ(record->parentID, 23u);
  EXPECT_EQ(record->targetID, 42u);
  EXPECT_EQ(record->levelsUp, -1);
  EXPECT_EQ(record->targetName, u"file");
  EXPECT_EQ(record->volumeName, u"Disk");
}

TEST(AliasRecord, ReadsTagsInAnyOrderAndSkipsUnknownOnes) {
  RecordToWrite record = Version2();
  record.tags = {{18, "/a/b"},
                 {0x7777, "odd"},
                 {2, std::string("D:\0a:\0b\0", 8)},
                 {0, "a"},
                 {1, Big(9, 4) + Big(7, 4)},
                 {20, "image"},
                 {21, Big(2, 2)},
                 {17, Big(5, 8)},
                 {19, "/Volumes/D"}};
  const auto read = ReadAliasRecord(Write(record));
  ASSERT_TRUE(read);
  EXPECT_EQ(read->posixPath, "/a/b");
  EXPECT_EQ(read->hfsPath, "D:a:b");
  EXPECT_EQ(read->folderName, "a");
  EXPECT_EQ(read->folders, (std::vector<std::uint32_t>{9, 7}));
  EXPECT_EQ(read->diskImage, "image");
  EXPECT_EQ(read->homeComponents, 2);
  EXPECT_EQ(read->preciseTargetCreation, 5u);
  EXPECT_EQ(read->mountPoint, "/Volumes/D");
}

TEST(AliasRecord, TakesTheFirstOfATagThatComesTwice) {
  RecordToWrite record = Version2();
  record.tags = {{18, "first"}, {18, "second"}};
  EXPECT_EQ(ReadAliasRecord(Write(record))->posixPath, "first");
}

TEST(AliasRecord, EndsWithItsLastByteWhereNoTagEndsIt) {
  RecordToWrite record = Version2();
  record.tags = {{18, "path"}};
  record.hasEndTag = false;
  EXPECT_EQ(ReadAliasRecord(Write(record))->posixPath, "path");
}

TEST(AliasRecord, DoesNotReachBehindItsSize) {
  RecordToWrite record = Version2();
  record.hasEndTag = false;
  const std::string tagOfAnother = Big(18, 2) + Big(4, 2) + "path";
  const auto read = ReadAliasRecord(Write(record) + tagOfAnother);
  ASSERT_TRUE(read);
  EXPECT_FALSE(read->posixPath);
}

TEST(AliasRecord, CutAnywhereIsBroken) {
  for (RecordToWrite record : {Version2(), Version3()}) {
    record.tags.push_back({18, "a/path"});
    const std::string whole = Write(record);
    ASSERT_TRUE(ReadAliasRecord(whole));
    for (std::size_t size = 0; size < whole.size(); ++size) {
      EXPECT_FALSE(ReadAliasRecord(whole.substr(0, size))) << size;
    }
  }
}

// The bytes of a record with others in place of some.
std::string Changed(std::string bytes, std::size_t offset, const std::string& by) {
  return bytes.replace(offset, by.size(), by);
}

TEST(AliasRecord, OfAnotherVersionOrKindIsBroken) {
  const std::string whole = Write(Version2());
  for (const unsigned version : {0U, 1U, 4U, 0x200U}) {
    EXPECT_FALSE(ReadAliasRecord(Changed(whole, 6, Big(version, 2)))) << version;
  }
  EXPECT_FALSE(ReadAliasRecord(Changed(whole, 8, Big(2, 2))));
}

TEST(AliasRecord, ThatIsSmallerThanItsHeadIsBroken) {
  for (const auto& [record, head] : {std::pair(Version2(), 150U), std::pair(Version3(), 58U)}) {
    const std::string whole = Write(record);
    EXPECT_TRUE(ReadAliasRecord(Changed(whole, 4, Big(head, 2))));
    EXPECT_FALSE(ReadAliasRecord(Changed(whole, 4, Big(head - 1, 2))));
    EXPECT_FALSE(ReadAliasRecord(Changed(whole, 4, Big(0, 2))));
  }
}

TEST(AliasRecord, WithANameLongerThanItsFieldIsBroken) {
  const std::string whole = Write(Version2());
  EXPECT_TRUE(ReadAliasRecord(Changed(whole, 10, Big(27, 1))));
  EXPECT_FALSE(ReadAliasRecord(Changed(whole, 10, Big(28, 1))));
  EXPECT_TRUE(ReadAliasRecord(Changed(whole, 50, Big(63, 1))));
  EXPECT_FALSE(ReadAliasRecord(Changed(whole, 50, Big(64, 1))));
}

TEST(AliasRecord, WithATagThatDoesNotFitIsBroken) {
  const std::vector<Tag> misfits = {{14, Big(2, 2) + "ab"},  // says two units, has one
                                    {15, Big(0xFFFF, 2)},   {14, "x"}, {1, "three"},
                                    {17, Big(1, 7)},        {16, ""},  {21, "x"}};
  for (const Tag& tag : misfits) {
    RecordToWrite record = Version2();
    record.tags = {tag};
    EXPECT_FALSE(ReadAliasRecord(Write(record))) << tag.number;
  }
  RecordToWrite beyond = Version2();
  beyond.tags = {{18, "path"}};
  EXPECT_FALSE(ReadAliasRecord(Changed(Write(beyond), 152, Big(0xFFFF, 2))));
  EXPECT_FALSE(ReadAliasRecord(Changed(Write(Version2()), 152, Big(1, 2))))
      << "an end with content";
}

}  // namespace
}  // namespace tallowmere::test
