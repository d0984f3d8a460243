#include <gtest/gtest.h>

#include "cli/Nearest.h"

namespace tallowmere::cli {
namespace {

const std::vector<std::string> kWords{"spec", "path", "hfs", "posix", "name", "volumes"};

TEST(Nearest, TakesTheFewestChanges) {
  EXPECT_EQ(Nearest("spec", kWords), "spec");
  EXPECT_EQ(Nearest("specs", kWords), "spec");
  EXPECT_EQ(Nearest("spce", kWords), "spec");
  EXPECT_EQ(Nearest("pth", kWords), "path");
  EXPECT_EQ(Nearest("bath", kWords), "path");
  EXPECT_EQ(Nearest("volunes", kWords), "volumes");
}

TEST(Nearest, OfABeginningIsTheWhole) {
  EXPECT_EQ(Nearest("vol", kWords), "volumes");
}

TEST(Nearest, OfWhatSharesNothingIsNone) {
  EXPECT_EQ(Nearest("qq", kWords), "");
  EXPECT_EQ(Nearest("", kWords), "");
}

}  // namespace
}  // namespace tallowmere::cli
