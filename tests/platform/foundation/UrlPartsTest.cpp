// Splitting URLs into parts, and percent-encoding.
#include <gtest/gtest.h>

#include "foundation/PercentEncoding.h"
#include "foundation/UrlParts.h"

namespace tallowmere::foundation {
namespace {

// The example of RFC 3986, section 3.
TEST(UrlParts, AreSplit) {
  const UrlParts parts = SplitUrl("foo://example.com:8042/over/there?name=ferret#nose");
  EXPECT_EQ(parts.scheme, "foo");
  EXPECT_EQ(parts.authority, "example.com:8042");
  EXPECT_EQ(parts.path, "/over/there");
  EXPECT_EQ(parts.query, "name=ferret");
  EXPECT_EQ(parts.fragment, "nose");
}

TEST(UrlParts, AbsentOnesAreNotEmptyOnes) {
  const UrlParts bare = SplitUrl("");
  EXPECT_FALSE(bare.scheme || bare.authority || bare.query || bare.fragment);
  EXPECT_EQ(bare.path, "");
  const UrlParts empty = SplitUrl("s://?#");
  EXPECT_EQ(empty.authority, "");
  EXPECT_EQ(empty.path, "");
  EXPECT_EQ(empty.query, "");
  EXPECT_EQ(empty.fragment, "");
}

TEST(UrlParts, MarksInLaterPartsAreText) {
  const UrlParts parts = SplitUrl("a/b:c?d?//e:f#g?h#i");
  EXPECT_EQ(parts.scheme, std::nullopt);
  EXPECT_EQ(parts.path, "a/b:c");
  EXPECT_EQ(parts.query, "d?//e:f");
  EXPECT_EQ(parts.fragment, "g?h#i");
}

TEST(UrlParts, OnlyThePathIsReplaced) {
  EXPECT_EQ(WithPath("s://h/a?q#f", "/b/c"), "s://h/b/c?q#f");
  EXPECT_EQ(WithPath("s://h?q", "//b"), "s://h//b?q");
  EXPECT_EQ(WithPath("a", "b"), "b");
}

TEST(UrlParts, PathIsNotMistakenForAnAuthority) {
  EXPECT_EQ(WithPath("s:/a", "//b"), "s:/.//b");
}

TEST(PercentEncoding, UsesCapitalDigits) {
  std::string text;
  AppendPercentEncodedPath(text, "\xAB\x0F", false);
  EXPECT_EQ(text, "%AB%0F");
}

TEST(PercentEncoding, DecodesBothLetterCases) {
  EXPECT_EQ(PercentDecode("%aB%Ab%2f"), "\xAB\xAB/");
}

TEST(PercentEncoding, LeavesInvalidSequencesUnchanged) {
  EXPECT_EQ(PercentDecode(std::string_view("%41").substr(0, 2)), "%4");
  EXPECT_EQ(PercentDecode("%"), "%");
  EXPECT_EQ(PercentDecode("%4"), "%4");
  EXPECT_EQ(PercentDecode("%4g%%41"), "%4g%A");
}

}  // namespace
}  // namespace tallowmere::foundation
