#include "Types/XQueryBinary.h"
#include "TypesTestSupport.h"

namespace xquery {
namespace {

using testing::text;
using testing::view;
using namespace std::string_literals;

std::string fromHex(std::string_view digits) {
  const Ref<XQueryHexBinary> binary = XQueryHexBinary::binaryWithString(view(digits));
  return binary ? std::string(binary->data()->bytes()) : "(null)";
}

std::string fromBase64(std::string_view digits) {
  const Ref<XQueryBase64Binary> binary = XQueryBase64Binary::binaryWithString(view(digits));
  return binary ? std::string(binary->data()->bytes()) : "(null)";
}

TEST(HexBinary, PairsOfDigitsMakeBytes) {
  EXPECT_EQ(fromHex("0f A0"), "\x0F\xA0"s);
  EXPECT_EQ(fromHex("41 6 2\t4\n3\r"), "AbC");
  EXPECT_EQ(fromHex(""), "");
  EXPECT_EQ(fromHex("00fFaA"), "\x00\xFF\xAA"s);
}

TEST(HexBinary, OtherCharactersAndALoneDigitFail) {
  EXPECT_EQ(fromHex("0g"), "(null)");
  EXPECT_EQ(fromHex("abc"), "(null)");
  EXPECT_EQ(fromHex("ab-cd"), "(null)");
  EXPECT_FALSE(XQueryHexBinary::binaryWithString(text("4\xEF\xBC\x91")->view()));
}

TEST(HexBinary, PrintsUpperCaseDigits) {
  const Ref<XQueryHexBinary> binary = XQueryHexBinary::binaryWithString(view("0f A0"));
  EXPECT_EQ(binary->stringValue()->utf8(), "0FA0");
  EXPECT_EQ(binary->XQueryStringValue()->utf8(), "0FA0");
  EXPECT_EQ(XQueryObjectTypeID(binary.get()), 26);
  EXPECT_EQ(XQueryHexEncode("\x00\x9A\xFF"s), "009AFF");
}

TEST(Base64, EncodesThreeBytesToFourCharactersWithPadding) {
  EXPECT_EQ(Base64Encode(""), "");
  EXPECT_EQ(Base64Encode("f"), "Zg==");
  EXPECT_EQ(Base64Encode("fo"), "Zm8=");
  EXPECT_EQ(Base64Encode("foo"), "Zm9v");
  EXPECT_EQ(Base64Encode("foob"), "Zm9vYg==");
  EXPECT_EQ(Base64Encode("fooba"), "Zm9vYmE=");
  EXPECT_EQ(Base64Encode("foobar"), "Zm9vYmFy");
  EXPECT_EQ(Base64Encode("\xFB\xFF\xFE"s), "+//+");
  EXPECT_EQ(Base64Encode(std::string(300, 'a')).find('\n'), std::string::npos);
}

TEST(Base64, DecodesWhatItEncodes) {
  std::string bytes;
  for (int length = 0; length < 260; ++length) {
    EXPECT_EQ(fromBase64(Base64Encode(bytes)), bytes) << length;
    bytes += static_cast<char>(length * 7);
  }
}

TEST(Base64, ACountThatIsNoMultipleOfFourFails) {
  EXPECT_EQ(fromBase64("QQ=="), "A");
  EXPECT_EQ(fromBase64("QQ"), "(null)");
  EXPECT_EQ(fromBase64("QQ="), "(null)");
  EXPECT_EQ(fromBase64("QUFBQ"), "(null)");
  EXPECT_EQ(fromBase64(""), "");
}

TEST(Base64, CharactersOutsideTheAlphabetAreSkipped) {
  EXPECT_EQ(fromBase64("Q Q = ="), "A");
  EXPECT_EQ(fromBase64("Z!m\n9*v"), "foo");
  EXPECT_EQ(fromBase64("****"), "");
}

TEST(Base64, AStrayCharacterBetweenPadsResetsThePadCount) {
  EXPECT_EQ(fromBase64("QQ=*="), "A\0"s);
  EXPECT_EQ(fromBase64("QQ=\n="), "A");
}

TEST(Base64, EqualSignsInsideAGroupCountAsZeroDigits) {
  EXPECT_EQ(fromBase64("Q==Q"), "@\0\x10"s);
  EXPECT_EQ(fromBase64("===="), "\0"s);
}

TEST(Base64, TextThatIsNotASCIIFails) {
  EXPECT_FALSE(XQueryBase64Binary::binaryWithString(text("QQ==\xC3\xA9")->view()));
}

TEST(Binary, EqualityIsOfClassAndBytes) {
  const Ref<NSData> data = NSData::dataWithBytes("ab");
  const Ref<XQueryHexBinary> hex = XQueryHexBinary::binaryWithData(data);
  const Ref<XQueryBase64Binary> base64 = XQueryBase64Binary::binaryWithData(data);
  EXPECT_EQ(base64->stringValue()->utf8(), "YWI=");
  EXPECT_EQ(XQueryObjectTypeID(base64.get()), 25);
  const Ref<XQueryHexBinary> same = XQueryHexBinary::binaryWithString(view("6162"));
  EXPECT_TRUE(hex->isEqual(*same));
  EXPECT_EQ(hex->hash(), same->hash());
  EXPECT_FALSE(hex->isEqual(*base64));
  EXPECT_FALSE(hex->isEqual(*XQueryHexBinary::binaryWithString(view("6163"))));
}

}  // namespace
}  // namespace xquery
