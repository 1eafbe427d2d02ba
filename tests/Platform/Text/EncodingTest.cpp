#include "Platform/Text/Encoding.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

using namespace std::string_view_literals;

Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

std::string bytes(std::string_view utf8, const std::string& charset) {
  return bytesInCharset(text(utf8)->view(), charset).value_or("(none)");
}

std::string decoded(std::string_view bytes, const std::string& charset) {
  const auto string = stringWithBytesInCharset(bytes, charset);
  return string ? string->utf8() : "(none)";
}

TEST(TextEncoding, KnowsCharsetsByTheNamesOfIANA) {
  for (const char* name : {"ISO-8859-1", "iso_8859-1:1987", "latin1", "l1", "IBM819", "cp819"}) {
    EXPECT_EQ(bytes("é", name), "\xE9") << name;
    EXPECT_EQ(decoded("\xE9", name), "é") << name;
  }
  for (const char* name : {"", "latin", "utf-8x", "ISO-8859-1,swaplfnl", "\xFF"}) {
    EXPECT_EQ(bytes("a", name), "(none)") << name;
    EXPECT_EQ(decoded("a", name), "(none)") << name;
  }
  EXPECT_EQ(bytes("a", std::string("utf-8\0x", 7)), "(none)");
  EXPECT_EQ(bytes("a", std::string(100000, 'u')), "(none)");
}

TEST(TextEncoding, IsStrictInBothDirections) {
  EXPECT_EQ(bytes("a€", "ISO-8859-1"), "(none)");
  EXPECT_EQ(decoded("\x61\x81", "Shift_JIS"), "(none)");
  EXPECT_EQ(decoded("\xF8", "utf-8"), "(none)");
  EXPECT_EQ(decoded("\xD8\x00"sv, "UTF-16BE"), "(none)");
}

TEST(TextEncoding, ReplacesLoneSurrogatesInUTF8Only) {
  const auto lone = NSString::stringWithUTF16(u"\xD800");
  EXPECT_EQ(bytesInCharset(lone->view(), "utf-8"), "\xEF\xBF\xBD");
  EXPECT_EQ(bytesInCharset(lone->view(), "utf-16be"), std::nullopt);
}

TEST(TextEncoding, ConvertsTextsLongerThanAPiece) {
  std::string utf8;
  for (int index = 0; index < 5000; ++index) utf8 += "a日";
  EXPECT_EQ(decoded(bytes(utf8, "EUC-JP"), "EUC-JP"), utf8);
  EXPECT_EQ(decoded(bytes("", "EUC-JP"), "EUC-JP"), "");
}

}  // namespace
}  // namespace xquery
