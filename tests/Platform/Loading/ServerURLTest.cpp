#include "Platform/Loading/ServerURL.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

TEST(ServerURL, HasOneFormForAllSpellings) {
  EXPECT_EQ(normalisedServerURL("HTTP://H:80/a/./%62/../%63?q#f"), "http://h/a/c");
  EXPECT_EQ(normalisedServerURL("https://h:443"), "https://h/");
  EXPECT_EQ(normalisedServerURL("https://h:80//x/"), "https://h:80//x/");
  EXPECT_EQ(normalisedServerURL("http://h/%2f%c3%A4%7e%2"), std::nullopt);
  EXPECT_EQ(normalisedServerURL("http://h/%2f%c3%A4%7e"), "http://h/%2F%C3%A4~");
  EXPECT_EQ(normalisedServerURL("app://x:080/"), "app://x:80/");
  EXPECT_EQ(normalisedServerURL("http://[2001:DB8::1]:80/x"), "http://[2001:db8::1]/x");
  EXPECT_EQ(normalisedServerURL("http://h/../../a"), "http://h/a");
}

TEST(ServerURL, IsNoneWithoutAServer) {
  for (const auto* URL : {"", "a", "mailto:a@b", "http:", "http:///a", "file:///a", "file://h/a"}) {
    EXPECT_EQ(normalisedServerURL(URL), std::nullopt) << URL;
  }
}

TEST(ServerURL, OfAPrefixHasNeitherQueryNorFragment) {
  EXPECT_EQ(normalisedServerPrefix("http://h/a"), "http://h/a");
  EXPECT_EQ(normalisedServerPrefix("http://h/a?"), std::nullopt);
  EXPECT_EQ(normalisedServerPrefix("http://h/a#"), std::nullopt);
}

TEST(ServerURL, LiesBelowAnotherBySegments) {
  EXPECT_TRUE(isBelowServerURL("http://h/a", "http://h/a"));
  EXPECT_TRUE(isBelowServerURL("http://h/a/", "http://h/a"));
  EXPECT_TRUE(isBelowServerURL("http://h/a/b", "http://h/a/"));
  EXPECT_FALSE(isBelowServerURL("http://h/ab", "http://h/a"));
  EXPECT_FALSE(isBelowServerURL("http://h/a", "http://h/a/"));
}

}  // namespace
}  // namespace xquery
