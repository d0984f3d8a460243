// What records say of their targets, as far as it is pure: dates and numbers that prove an item,
// which only a volume of HFS+ has.
#include <gtest/gtest.h>

#include <limits>
#include <optional>
#include <string>

#include "aliases/Target.h"
#include "support/OldFormats.h"

namespace tallowmere::aliases {
namespace {

using test::RecordToWrite;

constexpr std::int64_t kHour = 3600;
constexpr std::int64_t kDay = 24 * kHour;
constexpr std::int64_t k1904 = -(66 * 365 + 17) * kDay;  // in seconds since 1970

Target TargetOf(const RecordToWrite& record) {
  const auto read = formats::ReadAliasRecord(test::Write(record));
  EXPECT_TRUE(read);
  return aliases::TargetOf(*read);
}

// --- Dates --------------------------------------------------------------------------------------

TEST(ABirth, InUTCIsThatOfTheSameSecond) {
  const Creation creation{1000, true};
  EXPECT_TRUE(IsBirthOf(creation, 1000));
  for (const std::int64_t other : {999L, 1001L, 1000L + 900, 1000L + kHour, 0L}) {
    EXPECT_FALSE(IsBirthOf(creation, other)) << other;
  }
}

TEST(ABirth, InAnUnknownTimeZoneIsWholeQuartersApart) {
  const Creation creation{100 * kDay, false};
  for (const std::int64_t apart : {0L, 900L, -900L, 5 * kHour + 2700, 14 * kHour, -14 * kHour}) {
    EXPECT_TRUE(IsBirthOf(creation, 100 * kDay + apart)) << apart;
  }
  for (const std::int64_t apart : {1L, 899L, 901L, -1L, 14 * kHour + 900, -14 * kHour - 900}) {
    EXPECT_FALSE(IsBirthOf(creation, 100 * kDay + apart)) << apart;
  }
}

TEST(ABirth, ThatIsNoDateIsNone) {
  EXPECT_FALSE(IsBirthOf({0, false}, std::numeric_limits<std::int64_t>::min()));
  EXPECT_FALSE(IsBirthOf({-1, true}, std::numeric_limits<std::int64_t>::max()));
}

// --- Ids ----------------------------------------------------------------------------------------

RecordToWrite WithIDs() {
  RecordToWrite record;
  record.volumeName = "Disk";
  record.name = "file";
  record.parentID = 20;
  record.targetID = 30;
  record.targetCreation = 0xB0000000;
  return record;
}

TEST(IDsOfARecord, AreThoseOfHFSAndHFSPlus) {
  for (const char* const signature : {"H+", "HX", "BD"}) {
    RecordToWrite record = WithIDs();
    record.signature = signature;
    const auto ids = TargetOf(record).ids;
    ASSERT_TRUE(ids) << signature;
    EXPECT_EQ(ids->target, 30u);
    EXPECT_EQ(ids->parent, 20u);
    EXPECT_EQ(ids->creation.seconds, k1904 + 0xB0000000);
    EXPECT_FALSE(ids->creation.isInUTC);
  }
}

TEST(IDsOfARecord, AreNoneOnForeignFileSystems) {
  RecordToWrite record = WithIDs();
  record.signature = "BD";
  record.fileSystemID = 0x4953;
  EXPECT_FALSE(TargetOf(record).ids);
  for (const char* const signature : {"RW", "NT", "KG"}) {
    record = WithIDs();
    record.signature = signature;
    EXPECT_FALSE(TargetOf(record).ids) << signature;
  }
}

TEST(IDsOfARecord, OfVersion3NeedACodeThatEndsInZeros) {
  RecordToWrite record = WithIDs();
  record.version = 3;
  record.targetCreation = 0xB0000000'8000;
  ASSERT_TRUE(TargetOf(record).ids);
  EXPECT_EQ(TargetOf(record).ids->creation.seconds, k1904 + 0xB0000000);
  EXPECT_TRUE(TargetOf(record).ids->creation.isInUTC);
  record.fileSystemID = 0x6375;
  EXPECT_FALSE(TargetOf(record).ids);
}

TEST(IDsOfARecord, NeedADate) {
  RecordToWrite record = WithIDs();
  record.targetCreation = 0;
  EXPECT_FALSE(TargetOf(record).ids);
  record.tags = {{17, test::Big(0xB0000000'0000, 8)}};
  EXPECT_TRUE(TargetOf(record).ids->creation.isInUTC) << "the precise date counts";
}

TEST(IDsOfARecord, AreUnknownWhereTheyAre0OrAllOnes) {
  for (const std::uint32_t unknown : {0U, 0xFFFFFFFFU}) {
    RecordToWrite record = WithIDs();
    record.targetID = unknown;
    record.parentID = unknown;
    EXPECT_FALSE(TargetOf(record).ids->target);
    EXPECT_FALSE(TargetOf(record).ids->parent);
  }
}

// --- Names --------------------------------------------------------------------------------------

TEST(NamesOfARecord, In8BitsHaveTwoReadingsWhereTheyMayBeUTF8) {
  RecordToWrite record = WithIDs();
  EXPECT_EQ(TargetOf(record).volumeNames, (std::vector<std::u16string>{u"Disk"}));
  record.volumeName = "Caf\u00E9";
  EXPECT_EQ(TargetOf(record).volumeNames,
            (std::vector<std::u16string>{u"Caf\u221A\u00A9", u"Caf\u00E9"}));
  record.volumeName = "Caf\x8E";
  EXPECT_EQ(TargetOf(record).volumeNames, (std::vector<std::u16string>{u"Caf\u00E9"}));
}

// The bytes are Japanese in the writer's encoding, and other letters in Mac Roman.
TEST(PathOfARecord, In8BitsIsNoneWhereItContradictsTheNameInUTF16) {
  formats::AliasRecord record;
  record.version = 3;
  record.volumeName = u"Disk";
  record.hfsPath = "Disk:folder:\x83\x65";
  record.targetName = u"\u30C6";
  EXPECT_TRUE(aliases::TargetOf(record).ways.empty());
}

TEST(PathOfARecord, In8BitsHasTheReadingOfTheNameInUTF16) {
  formats::AliasRecord record;
  record.version = 3;
  record.volumeName = u"Disk";
  record.hfsPath = "Disk:folder:caf\u00E9";
  EXPECT_EQ(aliases::TargetOf(record).ways.size(), 2u);
  record.targetName = u"caf\u00E9";
  const auto ways = aliases::TargetOf(record).ways;
  ASSERT_EQ(ways.size(), 1u);
  EXPECT_EQ(ways[0].components, (std::vector<std::string>{"folder", "caf\u00E9"}));
}

}  // namespace
}  // namespace tallowmere::aliases
