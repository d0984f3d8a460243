#include <gtest/gtest.h>

#include "formats/AppleDouble.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

using formats::AppleDouble;

std::optional<AppleDouble> Read(const std::string& bytes) {
  return formats::ReadAppleDouble(bytes, bytes.size());
}

std::string Changed(std::string bytes, std::size_t offset, const std::string& by) {
  return bytes.replace(offset, by.size(), by);
}

TEST(AppleDouble, TellsWhereItsEntriesAre) {
  const std::string bytes = WriteAppleDouble({{9, "information"}, {2, "fork"}});
  const auto read = Read(bytes);
  ASSERT_TRUE(read);
  EXPECT_FALSE(read->isSingle);
  const auto* const fork = read->Find(AppleDouble::kResourceFork);
  ASSERT_NE(fork, nullptr);
  EXPECT_EQ(bytes.substr(fork->offset, fork->length), "fork");
  EXPECT_EQ(read->Find(AppleDouble::kDataFork), nullptr);
}

TEST(AppleDouble, ReadsAppleSingleAndTheOlderVersion) {
  const std::string single = WriteAppleDouble({{1, "data"}}, 0x00051600);
  EXPECT_TRUE(Read(single)->isSingle);
  EXPECT_TRUE(Read(Changed(single, 4, Big(0x00010000, 4))));
}

TEST(AppleDouble, PassesOverWhatIsEmptyOrUnknown) {
  const auto read = Read(WriteAppleDouble({{2, ""}, {0x80000001, "x"}, {2, "fork"}}));
  ASSERT_TRUE(read);
  EXPECT_EQ(read->Find(AppleDouble::kResourceFork)->length, 4u);
}

TEST(AppleDouble, PassesOverAnUnknownEntryOutside) {
  for (const std::uint32_t unknown : {8U, 15U, 0x80000001U, 0xFFFFFFFFU}) {
    const std::string bytes = WriteAppleDouble({{unknown, "x"}, {2, "fork"}});
    const auto read = Read(Changed(bytes, 30, Big(0xFFFFFFFF, 4)));
    ASSERT_TRUE(read) << unknown;
    EXPECT_NE(read->Find(AppleDouble::kResourceFork), nullptr);
    EXPECT_EQ(read->Find(unknown), nullptr);
  }
}

TEST(AppleDouble, IsToldByItsMagicNumberAndVersion) {
  const std::string bytes = WriteAppleDouble({{2, "fork"}});
  EXPECT_FALSE(Read(Changed(bytes, 0, Big(0x00051608, 4))));
  EXPECT_FALSE(Read(Changed(bytes, 4, Big(0x00030000, 4))));
  EXPECT_FALSE(Read(""));
}

TEST(AppleDouble, CutAnywhereIsBroken) {
  const std::string bytes = WriteAppleDouble({{9, "information"}, {2, "fork"}});
  for (std::size_t size = 0; size < bytes.size(); ++size) {
    EXPECT_FALSE(Read(bytes.substr(0, size))) << size;
  }
}

TEST(AppleDouble, WithAKnownEntryOutsideIsBroken) {
  for (const std::uint32_t id : {1U, 2U, 3U, 9U}) {
    const std::string entry = WriteAppleDouble({{id, "x"}});
    EXPECT_FALSE(Read(Changed(entry, 30, Big(0xFFFFFFFF, 4)))) << id;
  }
  const std::string bytes = WriteAppleDouble({{2, "fork"}});
  EXPECT_FALSE(Read(Changed(bytes, 30, Big(0xFFFFFFFF, 4))));
  EXPECT_FALSE(Read(Changed(bytes, 34, Big(0xFFFFFFFF, 4))));
  EXPECT_FALSE(Read(Changed(bytes, 24, Big(0xFFFF, 2)))) << "more entries than there are bytes";
}

TEST(AppleDouble, IsToldByItsBeginning) {
  const std::string bytes = WriteAppleDouble({{2, std::string(100000, 'x')}});
  const auto read = formats::ReadAppleDouble(
      std::string_view(bytes).substr(0, formats::kLongestAppleDoubleHead), bytes.size());
  ASSERT_TRUE(read);
  EXPECT_EQ(read->Find(AppleDouble::kResourceFork)->length, 100000u);
}

}  // namespace
}  // namespace tallowmere::test
