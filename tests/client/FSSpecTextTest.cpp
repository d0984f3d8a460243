#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <tallowmere/Types.h>

#include <algorithm>

namespace tallowmere {
namespace {

TEST(FSSpecText, IsVolumeParentAndName) {
  EXPECT_EQ(TextOfFSSpec({-27, 19, "host\x8E"}), "-27:19:host\xC3\xA9");
}

RC_GTEST_PROP(FSSpecText, ComesBack, ()) {
  auto name = *rc::gen::container<std::string>(rc::gen::arbitrary<char>());
  name.resize(std::min<std::size_t>(name.size(), 63));
  const FSSpec spec{*rc::gen::arbitrary<std::int16_t>(), *rc::gen::arbitrary<std::int32_t>(), name};
  RC_ASSERT(FSSpecOfText(TextOfFSSpec(spec)) == spec);
}

TEST(FSSpecText, HasAParentSignedOrUnsigned) {
  EXPECT_EQ(FSSpecOfText("1:4294967295:a"), (FSSpec{1, -1, "a"}));
  EXPECT_EQ(FSSpecOfText("1:-2147483648:a"), (FSSpec{1, -2147483647 - 1, "a"}));
}

TEST(FSSpecText, HasANameWithColonsOrNone) {
  EXPECT_EQ(FSSpecOfText("1:2:a:b"), (FSSpec{1, 2, "a:b"}));
  EXPECT_EQ(FSSpecOfText("1:2:"), (FSSpec{1, 2, ""}));
}

TEST(FSSpecText, IsNothingElse) {
  for (const std::string& text :
       {std::string(), std::string("1:2"), std::string("x:2:a"), std::string("1:y:a"),
        std::string("1 :2:a"), std::string("+1:2:a"), std::string("32768:2:a"),
        std::string("-32769:2:a"), std::string("1:4294967296:a"), std::string("1:-2147483649:a"),
        std::string("1::a"), std::string(":2:a"), "1:2:" + std::string(64, 'n'),
        std::string("1:2:\xE6\x97\xA5"), std::string("1:2:\xFF")}) {
    EXPECT_EQ(FSSpecOfText(text), std::nullopt) << text;
  }
}

}  // namespace
}  // namespace tallowmere
