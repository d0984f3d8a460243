#include <gtest/gtest.h>

#include "formats/Bookmark.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

using formats::Bookmark;
using formats::ReadBookmark;
using formats::ReadBookmarkFile;

std::string Changed(std::string bytes, std::size_t offset, const std::string& by) {
  return bytes.replace(offset, by.size(), by);
}

TEST(BookmarkReading, GivesWhatTheFirstTableSays) {
  BookmarkWriter writer;
  const auto components = writer.Texts({"Volumes", "Disk", "file"});
  const auto ids =
      writer.List({writer.Number(5), writer.Number(0x100000000), writer.Add(0x0A01, "")});
  const auto flags = writer.Flags(1, 0x1F);
  const auto levels = writer.Numbers({2, 0, 1, 0});
  const auto path = writer.Text("/Volumes/Disk");
  const auto name = writer.Text("Disk");
  const auto truth = writer.Add(0x0501, "");
  const auto date = writer.Add(0x0400, Big(0x41B0000000000000, 8));
  writer.AddTable(1, {{0x1004, components},
                      {0x1005, ids},
                      {0x1010, flags},
                      {0x1040, date},
                      {0x2000, levels},
                      {0x2002, path},
                      {0x2010, name},
                      {0x2030, truth}});
  for (const auto& bookmark : {ReadBookmarkFile(writer.File()), ReadBookmark(writer.Bare())}) {
    ASSERT_TRUE(bookmark);
    EXPECT_EQ(bookmark->components, (std::vector<std::string>{"Volumes", "Disk", "file"}));
    EXPECT_EQ(bookmark->ids, (std::vector<std::int64_t>{5, 0x100000000, 0}));
    EXPECT_TRUE(bookmark->flags->Has(formats::BookmarkFlags::kFile));
    EXPECT_FALSE(bookmark->flags->Has(formats::BookmarkFlags::kFolder));
    EXPECT_EQ(bookmark->volumeLevels, (std::vector<std::int64_t>{2, 0, 1, 0}));
    EXPECT_EQ(bookmark->volumePath, "/Volumes/Disk");
    EXPECT_EQ(bookmark->volumeName, "Disk");
    EXPECT_EQ(bookmark->isOnBootVolume, true);
    EXPECT_EQ(bookmark->targetCreation, 268435456.0);
  }
}

TEST(BookmarkReading, SkipsUnknownKeysAndNames) {
  BookmarkWriter writer;
  const auto name = writer.Text("Disk");
  writer.AddTable(1, {{0x1054, 0xFFFFFFFF}, {0x80000004, 0xFFFFFFFF}, {0x2010, name}});
  EXPECT_EQ(ReadBookmark(writer.Bare())->volumeName, "Disk");
}

TEST(BookmarkReading, TakesTheFirstOfAKeyThatComesTwice) {
  BookmarkWriter writer;
  const auto first = writer.Text("first");
  const auto second = writer.Text("second");
  writer.AddTable(1, {{0x2010, first}, {0x2010, second}});
  EXPECT_EQ(ReadBookmark(writer.Bare())->volumeName, "first");
}

TEST(BookmarkReading, GoesByTheNumberOfEntriesOfATable) {
  BookmarkWriter writer;
  const auto name = writer.Text("Disk");
  const auto table = writer.AddTable(1, {{0x2010, name}});
  for (const unsigned size : {0U, 4U, 0xFFFFFFFFU}) {
    EXPECT_TRUE(ReadBookmark(Changed(writer.Bare(), 0x30 + table, Little(size, 4)))) << size;
  }
}

TEST(BookmarkReading, NeverMergesTables) {
  BookmarkWriter writer;
  const auto name = writer.Text("other");
  const auto components = writer.Texts({"a"});
  const auto other = writer.AddTable(2, {{0x2010, name}});
  writer.AddTable(1, {{0x1004, components}}, other);
  const auto bookmark = ReadBookmark(writer.Bare());
  ASSERT_TRUE(bookmark) << "the next table may lie before this one";
  EXPECT_TRUE(bookmark->components);
  EXPECT_FALSE(bookmark->volumeName);
}

TEST(BookmarkReading, WhoseFirstTableIsNotTheTargetsIsBroken) {
  for (const std::uint32_t level : {0U, 2U, 0xF000U, 0xFFFFFFFFU}) {
    BookmarkWriter writer;
    const auto components = writer.Texts({"a"});
    writer.AddTable(level, {{0x1004, components}});
    EXPECT_FALSE(ReadBookmark(writer.Bare())) << level;
  }
}

TEST(BookmarkReading, OfATableMetTwiceIsBroken) {
  BookmarkWriter writer;
  const auto second = writer.AddTable(2, {});
  const auto first = writer.AddTable(1, {}, second);
  ASSERT_TRUE(ReadBookmark(writer.Bare()));
  writer.Chain(second, first);
  EXPECT_FALSE(ReadBookmark(writer.Bare()));
  writer.Chain(second, second);
  EXPECT_FALSE(ReadBookmark(writer.Bare()));
}

TEST(BookmarkReading, OfADecidingKeyWithAnotherTypeIsBroken) {
  for (const std::uint32_t key : {0x1004U, 0x1010U, 0x2000U, 0x2002U, 0x2010U}) {
    BookmarkWriter writer;
    const auto date = writer.Add(0x0400, Big(0, 8));
    writer.AddTable(1, {{key, date}});
    EXPECT_FALSE(ReadBookmark(writer.Bare())) << key;
  }
  BookmarkWriter shown;
  const auto text = shown.Text("not a date");
  shown.AddTable(1, {{0x1040, text}});
  EXPECT_TRUE(ReadBookmark(shown.Bare()));
}

TEST(BookmarkReading, OfAnItemOutsideIsBroken) {
  BookmarkWriter writer;
  const auto name = writer.Text("Disk");
  const auto list = writer.List({0xFFFFFFF0});
  writer.AddTable(1, {{0x2010, name}});
  const std::string whole = writer.Bare();
  EXPECT_FALSE(ReadBookmark(Changed(whole, 0x30 + name, Little(0xFFFFFFFF, 4))));
  writer.AddTable(1, {{0x2010, 0xFFFFFFF0}});
  EXPECT_FALSE(ReadBookmark(writer.Bare()));
  writer.AddTable(1, {{0x1004, list}});
  EXPECT_FALSE(ReadBookmark(writer.Bare()));
}

TEST(BookmarkReading, CutAnywhereIsBroken) {
  const BookmarkWriter writer = Write(BookmarkToWrite{{"a", "b"}, "Disk"});
  const std::string file = writer.File();
  ASSERT_TRUE(ReadBookmarkFile(file));
  for (std::size_t size = 0; size < file.size(); ++size) {
    EXPECT_FALSE(ReadBookmarkFile(file.substr(0, size))) << size;
  }
  const std::string bare = writer.Bare();
  for (std::size_t size = 0; size < bare.size(); ++size) {
    EXPECT_FALSE(ReadBookmark(bare.substr(0, size))) << size;
  }
}

TEST(BookmarkReading, OfAFileWithAnotherLengthOrVersionIsBroken) {
  const std::string file = Write(BookmarkToWrite{{"a"}, "Disk"}).File();
  EXPECT_FALSE(ReadBookmarkFile(file + "x"));
  for (const std::size_t at : {16U, 20U, 24U, 28U}) {
    EXPECT_FALSE(ReadBookmarkFile(Changed(file, at, Little(0x39, 4)))) << at;
  }
}

TEST(BookmarkReading, TellsAFileByAll16Bytes) {
  const std::string file = Write(BookmarkToWrite{{"a"}, "Disk"}).File();
  EXPECT_TRUE(formats::BeginsBookmarkFile(file));
  for (std::size_t at = 0; at < 16; ++at) {
    EXPECT_FALSE(formats::BeginsBookmarkFile(Changed(file, at, "x"))) << at;
  }
  EXPECT_FALSE(formats::BeginsBookmarkFile(Write(BookmarkToWrite{{"a"}, "Disk"}).Bare()));
}

// A list of the same text, whose content would be as large as the product of both.
TEST(BookmarkReading, TakesTextsOfUpTo1024Bytes) {
  for (const std::size_t size : {std::size_t{1024}, std::size_t{1025}}) {
    BookmarkWriter writer;
    const auto path = writer.Text(std::string(size, '/'));
    writer.AddTable(1, {{0x2002, path}});
    EXPECT_EQ(ReadBookmark(writer.Bare()).has_value(), size == 1024) << size;
  }
}

TEST(BookmarkReading, DoesNotGrowBeyondItsSize) {
  BookmarkWriter writer;
  const auto text = writer.Text(std::string(100000, 'x'));
  const auto list = writer.List(std::vector<BookmarkWriter::Offset>(100000, text));
  writer.AddTable(1, {{0x1004, list}});
  EXPECT_FALSE(ReadBookmark(writer.Bare()));
}

}  // namespace
}  // namespace tallowmere::test
