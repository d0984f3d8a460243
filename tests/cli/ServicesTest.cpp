#include <gtest/gtest.h>

#include "cli/Services.h"

namespace tallowmere::cli {
namespace {

const std::string kRoot = "22 1 254:0 / / rw - ext4 /dev/vda rw\n";

TEST(Services, AnswerAlikeWhereEachFolderIsShownOnce) {
  EXPECT_TRUE(AllAnswerAlike(""));
  EXPECT_TRUE(AllAnswerAlike(kRoot));
  EXPECT_TRUE(AllAnswerAlike(kRoot + "23 22 0:5 / /proc rw - proc proc rw\n"));
  EXPECT_TRUE(AllAnswerAlike("30 1 0:7 /a /x rw - btrfs b rw\n31 1 0:7 /ab /y rw - btrfs b rw\n"));
}

TEST(Services, DoNotAnswerAlikeWhereAFolderIsShownTwice) {
  EXPECT_FALSE(AllAnswerAlike(kRoot + "23 22 254:0 / /again rw - ext4 /dev/vda rw\n"));
  EXPECT_FALSE(AllAnswerAlike(kRoot + "23 22 254:0 /home /again rw - ext4 /dev/vda rw\n"));
  EXPECT_FALSE(AllAnswerAlike("30 1 0:7 /a/b /x rw - xfs b rw\n31 1 0:7 /a /y rw - xfs b rw\n"));
}

// Each service gives such a mount a free number when it first sees it.
TEST(Services, DoNotAnswerAlikeAboveTheMountIDsThatAreNumbers) {
  EXPECT_TRUE(AllAnswerAlike("32768 1 0:7 / /x rw - tmpfs t rw\n"));
  EXPECT_FALSE(AllAnswerAlike("32769 1 0:7 / /x rw - tmpfs t rw\n"));
}

}  // namespace
}  // namespace tallowmere::cli
