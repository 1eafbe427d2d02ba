#include "xquery/URL.h"

#include <gtest/gtest.h>

#include <filesystem>
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

TEST(URL, AddressesAreCheckedGroupByGroup) {
  for (const char* address :
       {"[::]", "[::1]", "[1::]", "[1:2:3:4:5:6:7:8]", "[1:2:3:4:5:6:7::]", "[::2:3:4:5:6:7:8]",
        "[1:2:3:4:5:6:1.2.3.4]", "[::255.255.255.255]", "[abcd:EF01::1]", "[v1.a]", "[VF.a:b!]"}) {
    EXPECT_TRUE(NSURL::URLWithString(text(std::string("http://") + address + ":80/"))) << address;
  }
  for (const char* address : {"[]",
                              "[:]",
                              "[:::]",
                              "[1:2:3:4:5:6:7]",
                              "[1:2:3:4:5:6:7:8:9]",
                              "[1::2::3]",
                              "[12345::]",
                              "[1:2:3:4:5:6:7:8::]",
                              "[1.2.3.4::]",
                              "[::1.2.3]",
                              "[::1.2.3.256]",
                              "[::01.2.3.4]",
                              "[v.a]",
                              "[v1.]",
                              "[vg.a]",
                              "[v1.a@]",
                              "[::1]x",
                              "[::1",
                              "::1]",
                              "h:8a",
                              "a@b@c",
                              "a[@h"}) {
    EXPECT_FALSE(NSURL::URLWithString(text(std::string("http://") + address + "/"))) << address;
  }
}

TEST(URL, APathWithoutAnAuthorityDoesNotComeToHaveOne) {
  EXPECT_EQ(resolved("/.//b", "urn:/a"), "urn:/.//b");
  EXPECT_EQ(resolved("..//b", "file:/x/y"), "file:/.//b");
  EXPECT_EQ(resolved("..", "urn:/a/b"), "urn:/");
  EXPECT_EQ(resolved(".//b", "http://h/a"), "http://h//b");
}

TEST(URL, DotsAtTheStartOfAPathWithoutASlashMeanNothing) {
  EXPECT_EQ(resolved("../../c", "urn:a/b"), "urn:/c");
  EXPECT_EQ(resolved("./c", "urn:b"), "urn:c");
  EXPECT_EQ(resolved("../c", "urn:b"), "urn:c");
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

struct PartsRow {
  const char* text;
  const char* scheme;
  const char* host;
  const char* path;
};

TEST(URL, SchemeHostAndPath) {
  const PartsRow rows[] = {
      {"http://a/b/c.xml?q=/x#y:z", "http", "a", "/b/c.xml"},
      {"HTTP://A.B/c", "http", "A.B", "/c"},
      {"http://user:pw@host:80/p", "http", "host", "/p"},
      {"http://[::1]:80/p", "http", "[::1]", "/p"},
      {"http://[::1]/p", "http", "[::1]", "/p"},
      {"http://host", "http", "host", ""},
      {"http://host?q", "http", "host", ""},
      {"file:///a%20b/%41", "file", "", "/a b/A"},
      {"file:/a", "file", "", "/a"},
      {"urn:a:b", "urn", "", "a:b"},
      {"mailto:x@y", "mailto", "", "x@y"},
      {"//host/p", "", "host", "/p"},
      {"/p:q", "", "", "/p:q"},
      {"p/q:r", "", "", "p/q:r"},
      {"?q:r", "", "", ""},
      {"#a:b", "", "", ""},
      {"", "", "", ""},
  };
  for (const PartsRow& row : rows) {
    const Ref<NSURL> url = NSURL::URLWithString(text(row.text));
    ASSERT_TRUE(url) << row.text;
    EXPECT_EQ(url->scheme(), row.scheme) << row.text;
    EXPECT_EQ(url->host(), row.host) << row.text;
    EXPECT_EQ(url->path(), row.path) << row.text;
    EXPECT_EQ(url->relativePath(), row.path) << row.text;
  }
}

TEST(URL, RelativePathIsThatOfTheReferenceAsGiven) {
  const Ref<NSURL> base = NSURL::URLWithString(text("http://h/a/b.html?x"));
  const auto relativePath = [&](std::string_view reference) {
    return NSURL::URLWithString(text(reference), *base)->relativePath();
  };
  EXPECT_EQ(relativePath("../c.xml"), "../c.xml");
  EXPECT_EQ(relativePath("?y"), "");
  EXPECT_EQ(relativePath("http://g/d.%68tm"), "/d.htm");
  EXPECT_EQ(NSURL::URLWithString(text("?y"), *base)->path(), "/a/b.html");
}

TEST(URL, OfAFileIsMadeOfItsPath) {
  const auto URL = [](std::string_view path) {
    return NSURL::fileURLWithPath(path)->absoluteString()->utf8();
  };
  EXPECT_EQ(URL("/a/b.xq"), "file:///a/b.xq");
  EXPECT_EQ(URL("/a b/100%/#?[]\\\xC3\xA9"), "file:///a%20b/100%25/%23%3F%5B%5D%5C%C3%A9");
  EXPECT_EQ(URL("/-._~!$&'()*+,;=:@"), "file:///-._~!$&'()*+,;=:@");
  const auto folder = NSURL::fileURLWithPath("./");
  const auto file = NSURL::fileURLWithPath("x.xml");
  EXPECT_EQ(file->path(), (std::filesystem::current_path() / "x.xml").string());
  EXPECT_EQ(NSURL::URLWithString(NSString::stringWithASCII("x.xml"), *folder)->path(),
            file->path());
  EXPECT_EQ(NSURL::fileURLWithPath("/a \xFF")->path(), "/a \xFF");
}

TEST(URL, VeryLongReferencesAreHandled) {
  std::string path = "/";
  while (path.size() < 1000000) path += "../a/";
  EXPECT_EQ(resolved(path, "http://h/x"), "http://h/a/");
  const std::string letters(1000000, 'a');
  EXPECT_EQ(resolved(letters, "http://h/x"), "http://h/" + letters);
  const std::string slashes(1000000, '/');
  EXPECT_EQ(resolved("." + slashes, "http://h/x"), "http://h" + slashes);
}

}  // namespace
}  // namespace xquery
