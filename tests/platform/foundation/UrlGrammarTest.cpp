// Which texts are URLs by the grammar of RFC 3986.
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <string>
#include <string_view>

#include "foundation/UrlParts.h"

namespace tallowmere::foundation {
namespace {

using namespace std::string_view_literals;

// RFC 3986, sections 5.4.1 and 5.4.2.
TEST(UrlGrammar, AdmitsTheReferenceExamples) {
  for (const char* text : {"http://a/b/c/d;p?q",
                           "g:h",
                           "g",
                           "./g",
                           "g/",
                           "/g",
                           "//g",
                           "?y",
                           "g?y",
                           "#s",
                           "g#s",
                           "g?y#s",
                           ";x",
                           "g;x",
                           "g;x?y#s",
                           ".",
                           "./",
                           "..",
                           "../",
                           "../g",
                           "../..",
                           "../../",
                           "../../g",
                           "../../../g",
                           "../../../../g",
                           "/./g",
                           "/../g",
                           "g.",
                           ".g",
                           "g..",
                           "..g",
                           "./../g",
                           "./g/.",
                           "g/./h",
                           "g/../h",
                           "g;x=1/./y",
                           "g;x=1/../y",
                           "g?y/./x",
                           "g?y/../x",
                           "g#s/./x",
                           "g#s/../x",
                           "http:g"}) {
    EXPECT_TRUE(IsUrl(text)) << text;
  }
}

// RFC 3986, section 1.1.2.
TEST(UrlGrammar, AdmitsTheExampleUris) {
  for (const char* text :
       {"ftp://ftp.is.co.za/rfc/rfc1808.txt", "http://www.ietf.org/rfc/rfc2396.txt",
        "ldap://[2001:db8::7]/c=GB?objectClass?one", "mailto:John.Doe@example.com",
        "news:comp.infosystems.www.servers.unix", "tel:+1-816-555-1212", "telnet://192.0.2.16:80/",
        "urn:oasis:names:specification:docbook:dtd:xml:4.1.2"}) {
    EXPECT_TRUE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, AdmitsEveryCharacterWhereItMayStand) {
  EXPECT_TRUE(IsUrl("aZ09+-.:aZ09-._~!$&'()*+,;=:@%aF/"));
  EXPECT_TRUE(IsUrl("s://aZ09-._~!$&'()*+,;=:%aF@aZ09-._~!$&'()*+,;=%aF:09"));
  EXPECT_TRUE(IsUrl("?aZ09-._~!$&'()*+,;=:@%aF/?"));
  EXPECT_TRUE(IsUrl("#aZ09-._~!$&'()*+,;=:@%aF/?"));
}

TEST(UrlGrammar, RefusesTheEmptyText) {
  EXPECT_FALSE(IsUrl(""));
}

TEST(UrlGrammar, RefusesBadPercentSequences) {
  for (const char* text : {"%", "%2", "a%", "a%4", "a%g0", "a%0g", "a%%20", "a?%", "a?%2", "a#%zz",
                           "//%/a", "//%4", "//%0x@a", "%2/0"}) {
    EXPECT_FALSE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, RefusesCharactersOutsideTheSyntax) {
  for (int c = 0; c < 256; ++c) {
    const bool outside = c <= ' ' || c >= 0x7F ||
                         "\"<>[\\]^`{|}"sv.find(static_cast<char>(c)) != std::string_view::npos;
    const std::string character(1, static_cast<char>(c));
    if (!outside && character != "%") {
      EXPECT_TRUE(IsUrl("s:/" + character + "x")) << c;
      continue;
    }
    for (const char* place : {"s:/", "/a?", "/a#", "//h", "s://u:"}) {
      EXPECT_FALSE(IsUrl(place + character + "x")) << place << c;
    }
  }
}

TEST(UrlGrammar, RefusesASecondFragment) {
  EXPECT_FALSE(IsUrl("a#b#c"));
}

TEST(UrlGrammar, RefusesBadSchemes) {
  for (const char* text :
       {":", ":a", "1a:b", "+a:b", "-:b", ".:b", "a_b:c", "a%41:b", "a~:b", "1:2", "a b:c", "@:"}) {
    EXPECT_FALSE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, ColonAfterASlashIsNoScheme) {
  EXPECT_TRUE(IsUrl("./1a:b"));
  EXPECT_TRUE(IsUrl("/a_b:c"));
  EXPECT_TRUE(IsUrl("?:"));
}

TEST(UrlGrammar, AdmitsPorts) {
  for (const char* text :
       {"//h:", "//h:0", "//h:123456789", "//:80", "//u@:", "//[::1]:80", "//"}) {
    EXPECT_TRUE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, RefusesBadPorts) {
  for (const char* text :
       {"//h:a", "//h:8a", "//h:-1", "//h:80:90", "//h:%38", "//[::1]:x", "//[::1]80"}) {
    EXPECT_FALSE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, RefusesASecondUserInfo) {
  EXPECT_FALSE(IsUrl("//a@b@c"));
  EXPECT_TRUE(IsUrl("//a:b:c@d"));
}

TEST(UrlGrammar, AdmitsIpLiterals) {
  for (const char* host :
       {"::", "::1", "1::", "1:2:3:4:5:6:7:8", "1:2:3:4:5:6:7::", "::2:3:4:5:6:7:8", "1::8",
        "abcd:EF01:2345:6789:a:b:c:d", "::1.2.3.4", "1:2:3:4:5:6:1.2.3.4", "1:2:3:4:5::1.2.3.4",
        "::255.255.255.255", "v1.a", "VF.a:b", "v1F.~!:"}) {
    EXPECT_TRUE(IsUrl("//[" + std::string(host) + "]/a")) << host;
  }
}

TEST(UrlGrammar, RefusesBadIpLiterals) {
  for (const char* host : {"",
                           ":",
                           ":::",
                           "1",
                           "1:2",
                           "1:2:3:4:5:6:7",
                           "1:2:3:4:5:6:7:8:9",
                           "1::2::3",
                           "1:2:3:4::5:6:7:8",
                           "12345::",
                           "g::",
                           "::1.2.3",
                           "::1.2.3.256",
                           "::01.2.3.4",
                           "1.2.3.4",
                           "::1.2.3.4:5",
                           "1.2.3.4::",
                           "1:2:3:4:5:6:7:1.2.3.4",
                           ":1",
                           "1:",
                           "::1%25en0",
                           "::1%en0",
                           "v.a",
                           "v1.",
                           "v1",
                           "vg.a",
                           "v1.%41",
                           "v1.a@b",
                           "x1.a",
                           "[::1]",
                           "::1 "}) {
    EXPECT_FALSE(IsUrl("//[" + std::string(host) + "]/a")) << host;
  }
}

TEST(UrlGrammar, RefusesBracketsElsewhereInAHost) {
  for (const char* text : {"//[", "//]", "//[::1", "//::1]", "//a[::1]", "//[::1]a", "//[::1]]",
                           "//[[::1]]", "//a]:80"}) {
    EXPECT_FALSE(IsUrl(text)) << text;
  }
}

TEST(UrlGrammar, RefusesALiteralOfAnyLength) {
  EXPECT_FALSE(IsUrl("//[" + std::string(100, ':') + "]"));
  EXPECT_FALSE(IsUrl("//[::1\0]"sv));
}

TEST(UrlGrammar, ReadsNothingAfterTheText) {
  EXPECT_FALSE(IsUrl("a%41"sv.substr(0, 3)));
  EXPECT_FALSE(IsUrl("a%41"sv.substr(0, 2)));
}

RC_GTEST_PROP(UrlGrammar, AdmitsTheSameWithAnotherLetterCaseOfItsHexDigits, ()) {
  const int byte = *rc::gen::inRange(0, 256);
  char lower[8];
  char upper[8];
  RC_ASSERT(snprintf(lower, sizeof lower, "%%%02x", static_cast<unsigned>(byte)) == 3);
  RC_ASSERT(snprintf(upper, sizeof upper, "%%%02X", static_cast<unsigned>(byte)) == 3);
  RC_ASSERT(IsUrl(lower));
  RC_ASSERT(IsUrl(upper));
}

}  // namespace
}  // namespace tallowmere::foundation
