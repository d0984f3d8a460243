#include <gtest/gtest.h>

#include "formats/Bytes.h"
#include "formats/ResourceFork.h"
#include "support/OldFormats.h"

namespace tallowmere::test {
namespace {

constexpr std::uint32_t kAlias = formats::Code("alis");

std::string Changed(std::string bytes, std::size_t offset, const std::string& by) {
  return bytes.replace(offset, by.size(), by);
}

TEST(ResourceFork, GivesTheResourcesOfOneType) {
  const std::string fork = WriteResourceFork(
      {{"icns", -16455, "icon"}, {"alis", 7, "second"}, {"alis", 0, "first"}, {"zzzz", 0, "last"}});
  const auto resources = formats::ResourcesOfType(fork, kAlias);
  ASSERT_TRUE(resources);
  ASSERT_EQ(resources->size(), 2u);
  EXPECT_EQ((*resources)[0].id, 7);
  EXPECT_EQ((*resources)[0].data, "second");
  EXPECT_EQ((*resources)[1].data, "first");
}

TEST(ResourceFork, WithoutTheTypeHasNone) {
  const auto resources = formats::ResourcesOfType(WriteResourceFork({{"icns", 0, "x"}}), kAlias);
  ASSERT_TRUE(resources);
  EXPECT_TRUE(resources->empty());
}

TEST(ResourceFork, WithAnEmptyListOfTypesHasNone) {
  const std::string fork = Changed(WriteResourceFork({}), 256 + 28, Big(0xFFFF, 2));
  const auto resources = formats::ResourcesOfType(fork, kAlias);
  ASSERT_TRUE(resources);
  EXPECT_TRUE(resources->empty());
}

TEST(ResourceFork, PrefersID0ThenTheLowest) {
  const auto first = [](const std::vector<ResourceToWrite>& resources) {
    return formats::FirstByID(*formats::ResourcesOfType(WriteResourceFork(resources), kAlias)).id;
  };
  EXPECT_EQ(first({{"alis", 5, ""}, {"alis", 0, ""}, {"alis", -3, ""}}), 0);
  EXPECT_EQ(first({{"alis", 5, ""}, {"alis", -3, ""}, {"alis", 1, ""}}), -3);
}

TEST(ResourceFork, CutAnywhereIsBroken) {
  const std::string fork = WriteResourceFork({{"alis", 0, "data"}, {"zzzz", 0, "x"}});
  ASSERT_TRUE(formats::ResourcesOfType(fork, kAlias));
  for (std::size_t size = 0; size < fork.size(); ++size) {
    EXPECT_FALSE(formats::ResourcesOfType(fork.substr(0, size), kAlias)) << size;
  }
}

TEST(ResourceFork, WithAnOffsetOutsideIsBroken) {
  const std::string fork = WriteResourceFork({{"alis", 0, "data"}});
  const std::size_t map = 256 + 8;
  for (const std::size_t at : {0U, 4U, 8U, 12U}) {
    EXPECT_FALSE(formats::ResourcesOfType(Changed(fork, at, Big(0xFFFFFFFF, 4)), kAlias)) << at;
  }
  const std::size_t typeList = map + 28;
  for (const std::size_t at : {map + 24, typeList, typeList + 6, typeList + 8}) {
    EXPECT_FALSE(formats::ResourcesOfType(Changed(fork, at, Big(0xFFF0, 2)), kAlias)) << at;
  }
}

TEST(ResourceFork, OfAResourceOutsideTheDataGivesNoData) {
  const std::string fork = WriteResourceFork({{"alis", 0, "data"}});
  const std::size_t reference = 256 + 8 + 28 + 10;
  const auto outside = formats::ResourcesOfType(Changed(fork, reference + 5, Big(9, 3)), kAlias);
  ASSERT_TRUE(outside);
  EXPECT_FALSE(outside->at(0).data);
  const auto tooLong = formats::ResourcesOfType(Changed(fork, 256, Big(5, 4)), kAlias);
  ASSERT_TRUE(tooLong);
  EXPECT_FALSE(tooLong->at(0).data);
}

}  // namespace
}  // namespace tallowmere::test
