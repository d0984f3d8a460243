#include <gtest/gtest.h>

#include "formats/MacBinary.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

using formats::ReadMacBinary;

std::string Changed(std::string bytes, std::size_t offset, const std::string& by) {
  return bytes.replace(offset, by.size(), by);
}

TEST(MacBinary, HasBothForksAndTheFinderInformation) {
  const std::string bytes = Write(MacBinaryToWrite{"an alias", 0x8012, "data", "resources"});
  const auto file = ReadMacBinary(bytes);
  ASSERT_TRUE(file);
  EXPECT_EQ(file->name, "an alias");
  EXPECT_EQ(file->type, 0x616C6973u);
  EXPECT_EQ(file->creator, 0x4D414353u);
  EXPECT_EQ(file->finderFlags, 0x8012);
  EXPECT_EQ(file->dataFork, "data");
  EXPECT_EQ(file->resourceFork, "resources");
}

TEST(MacBinary, OfTheThirdVersionMayHaveASecondHeader) {
  MacBinaryToWrite written;
  written.dataFork = "data";
  written.secondHeader = 130;
  written.version = 130;
  EXPECT_EQ(ReadMacBinary(Write(written))->dataFork, "data");
}

TEST(MacBinary, IsToldByItsChecksum) {
  const std::string bytes = Write(MacBinaryToWrite{});
  ASSERT_TRUE(ReadMacBinary(bytes));
  for (std::size_t at = 0; at < 126; ++at) {
    const auto other = static_cast<unsigned char>(bytes[at] ^ 1);
    EXPECT_FALSE(ReadMacBinary(Changed(bytes, at, Big(other, 1)))) << at;
  }
}

TEST(MacBinary, CutIsBroken) {
  MacBinaryToWrite written;
  written.dataFork = std::string(200, 'd');
  written.resourceFork = std::string(256, 'r');
  const std::string bytes = Write(written);
  for (std::size_t size = 0; size < bytes.size(); ++size) {
    EXPECT_FALSE(ReadMacBinary(bytes.substr(0, size))) << size;
  }
}

TEST(MacBinary, NeedsNoPaddingBehindItsLastFork) {
  MacBinaryToWrite written;
  written.dataFork = "data";
  EXPECT_TRUE(ReadMacBinary(Write(written).substr(0, 132)));
}

TEST(MacBinary, WithoutANameOrWithTooLongAOneIsNone) {
  EXPECT_FALSE(ReadMacBinary(Write(MacBinaryToWrite{""})));
  EXPECT_TRUE(ReadMacBinary(Write(MacBinaryToWrite{std::string(63, 'n')})));
}

}  // namespace
}  // namespace tallowmere::test
