#include "xquery/URL.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

std::string resolved(std::string_view reference, std::string_view base) {
  const Ref<NSURL> baseURL = NSURL::URLWithString(text(base));
  if (!baseURL) return "(base rejected)";
  const Ref<NSURL> url = NSURL::URLWithString(text(reference), *baseURL);
  return url ? url->absoluteString()->utf8() : "(null)";
}

TEST(URL, ReferencesKeepTheirTextAsGiven) {
  for (const char* reference :
       {"", "a", "a/b/../c", "/abs", "//host", "?q", "#f", "http://h:80/p?q#f", "HTTP://Host/%7e",
        "mailto:a@b", "urn:a:b:c", "http://[::1]:8080/x", "http://[v1.fe:x]/", "http://1.2.3.4/",
        "file:///tmp/x", "a;b=c,d", "http://u:p@h/", "./1a:b", "http://h/%41"}) {
    const Ref<NSURL> url = NSURL::URLWithString(text(reference));
    ASSERT_TRUE(url) << reference;
    EXPECT_EQ(url->absoluteString()->utf8(), reference);
  }
}

TEST(URL, CharactersAndFormsOutsideTheGrammarAreRejected) {
  for (const char* reference : {" ",
                                "a b",
                                "a ",
                                "%",
                                "%4",
                                "%zz",
                                "<a>",
                                "a\"b",
                                "a\\b",
                                "a^b",
                                "a`b",
                                "a{b}",
                                "a|b",
                                "\xC3\xA9",
                                "1a:b",
                                "http://[::1/",
                                "http://[gg::]/",
                                "http://h:port/",
                                "a#b#c",
                                "\x7F",
                                "http://a[b/",
                                "\t",
                                "a\n"}) {
    EXPECT_FALSE(NSURL::URLWithString(text(reference))) << reference;
  }
  EXPECT_FALSE(NSURL::URLWithString(text(std::string_view("a\0b", 3))));
  EXPECT_FALSE(NSURL::URLWithString(Ref<NSString>()));
}

// The normal and abnormal examples that RFC 3986 gives.
TEST(URL, ResolutionFollowsTheExamplesOfTheStandard) {
  struct Row {
    const char* reference;
    const char* expected;
  };
  constexpr Row rows[] = {
      {"g:h", "g:h"},
      {"g", "http://a/b/c/g"},
      {"./g", "http://a/b/c/g"},
      {"g/", "http://a/b/c/g/"},
      {"/g", "http://a/g"},
      {"//g", "http://g"},
      {"?y", "http://a/b/c/d;p?y"},
      {"g?y", "http://a/b/c/g?y"},
      {"#s", "http://a/b/c/d;p?q#s"},
      {"g#s", "http://a/b/c/g#s"},
      {"g?y#s", "http://a/b/c/g?y#s"},
      {";x", "http://a/b/c/;x"},
      {"g;x", "http://a/b/c/g;x"},
      {"g;x?y#s", "http://a/b/c/g;x?y#s"},
      {"", "http://a/b/c/d;p?q"},
      {".", "http://a/b/c/"},
      {"./", "http://a/b/c/"},
      {"..", "http://a/b/"},
      {"../", "http://a/b/"},
      {"../g", "http://a/b/g"},
      {"../..", "http://a/"},
      {"../../", "http://a/"},
      {"../../g", "http://a/g"},
      {"../../../g", "http://a/g"},
      {"../../../../g", "http://a/g"},
      {"/./g", "http://a/g"},
      {"/../g", "http://a/g"},
      {"g.", "http://a/b/c/g."},
      {".g", "http://a/b/c/.g"},
      {"g..", "http://a/b/c/g.."},
      {"..g", "http://a/b/c/..g"},
      {"./../g", "http://a/b/g"},
      {"./g/.", "http://a/b/c/g/"},
      {"g/./h", "http://a/b/c/g/h"},
      {"g/../h", "http://a/b/c/h"},
      {"g;x=1/./y", "http://a/b/c/g;x=1/y"},
      {"g;x=1/../y", "http://a/b/c/y"},
      {"g?y/./x", "http://a/b/c/g?y/./x"},
      {"g?y/../x", "http://a/b/c/g?y/../x"},
      {"g#s/./x", "http://a/b/c/g#s/./x"},
      {"g#s/../x", "http://a/b/c/g#s/../x"},
      {"http:g", "http:g"},
  };
  for (const Row& row : rows) {
    EXPECT_EQ(resolved(row.reference, "http://a/b/c/d;p?q"), row.expected) << row.reference;
  }
}

TEST(URL, ResolutionKeepsEveryPartAsWritten) {
  EXPECT_EQ(resolved("//[::1]:8080/x", "http://a/"), "http://[::1]:8080/x");
  EXPECT_EQ(resolved("x", "http://[2001:DB8::7]/y/z"), "http://[2001:DB8::7]/y/x");
  EXPECT_EQ(resolved("//[v1.fe:x]/", "http://a/"), "http://[v1.fe:x]/");
  EXPECT_EQ(resolved("x", "http://u:p@Host:81/a"), "http://u:p@Host:81/x");
  EXPECT_EQ(resolved("%7Ea", "http://a/b"), "http://a/%7Ea");
  EXPECT_EQ(resolved("y", "file:///x/z"), "file:///x/y");
  EXPECT_EQ(resolved("b", "http://a"), "http://a/b");
  EXPECT_EQ(resolved("?z", "http://a?q"), "http://a?z");
  EXPECT_EQ(resolved("c", "urn:a:b"), "urn:c");
  EXPECT_EQ(resolved("#c", "mailto:x"), "mailto:x#c");
}

TEST(URL, ResolutionNeedsAnAbsoluteBaseAndAReference) {
  EXPECT_EQ(resolved("c", "/x"), "(null)");
  EXPECT_EQ(resolved("c", ""), "(null)");
  EXPECT_EQ(resolved("a b", "http://a/"), "(null)");
  EXPECT_EQ(resolved("\xC3\xA9", "http://a/"), "(null)");
}

TEST(URL, EqualityIsThatOfTheText) {
  const Ref<NSURL> a = NSURL::URLWithString(text("http://a/b"));
  const Ref<NSURL> same = NSURL::URLWithString(text("http://a/b"));
  const Ref<NSURL> other = NSURL::URLWithString(text("HTTP://a/b"));
  EXPECT_TRUE(a->isEqual(*same));
  EXPECT_EQ(a->hash(), same->hash());
  EXPECT_FALSE(a->isEqual(*other));
}

TEST(URL, VeryLongReferencesAreHandled) {
  std::string path = "/";
  while (path.size() < 1000000) path += "../a/";
  EXPECT_EQ(resolved(path, "http://h/x"), "http://h/a/");
  const std::string letters(1000000, 'a');
  EXPECT_EQ(resolved(letters, "http://h/x"), "http://h/" + letters);
}

}  // namespace
}  // namespace xquery
