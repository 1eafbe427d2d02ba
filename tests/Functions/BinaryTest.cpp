#include "Functions/Binary.h"
#include "Functions/FunctionsTesting.h"
#include "Types/XQueryBinary.h"
#include "xquery/Data.h"
#include "xquery/URL.h"

#include <chrono>

namespace xquery {
namespace {

using namespace functiontest;

Value hex(std::string_view digits) {
  return XQueryHexBinary::binaryWithString(NSStringView::ascii(digits));
}

Value base64(std::string_view text) {
  return XQueryBase64Binary::binaryWithString(NSStringView::ascii(text));
}

// The slices as hexadecimal digits, separated by blanks; "null" for none.
std::string slices(XQueryProcedure procedure, std::string_view data, std::string_view start,
                   std::string_view end) {
  const Value arguments[] = {hex(data), hex(start), hex(end)};
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value found = procedure(arguments, 3, *context);
  if (!found) return "null";
  if (const auto* one = dyn_cast<NSData>(found.get())) return XQueryHexEncode(one->bytes());
  std::string text;
  for (const Value& slice : cast<NSArray>(found.get())->objects()) {
    text += (text.empty() ? "" : " ") + XQueryHexEncode(cast<NSData>(slice.get())->bytes());
  }
  return text;
}

// --- texts -----------------------------------------------------------------------------------

TEST(BinaryFromString, EncodesInUTF8WithoutACharset) {
  EXPECT_EQ(call(ext_binary_from_string, {string("Az")}), "hexBinary 417A");
  EXPECT_EQ(call(ext_binary_from_string, {string("é€😀")}), "hexBinary C3A9E282ACF09F9880");
  EXPECT_EQ(call(ext_binary_from_string, {string("")}), "hexBinary ");
}

TEST(BinaryFromString, EncodesInTheNamedCharset) {
  const auto in = [](std::string_view text, std::string_view charset) {
    return call(ext_binary_from_string, {string(text), string(charset)});
  };
  EXPECT_EQ(in("é", "ISO-8859-1"), "hexBinary E9");
  EXPECT_EQ(in("é", "latin1"), "hexBinary E9");
  EXPECT_EQ(in("é", "utf-8"), "hexBinary C3A9");
  EXPECT_EQ(in("A€", "windows-1252"), "hexBinary 4180");
  EXPECT_EQ(in("A", "UTF-16BE"), "hexBinary 0041");
  EXPECT_EQ(in("A", "utf-16le"), "hexBinary 4100");
  EXPECT_EQ(in("日本", "Shift_JIS"), "hexBinary 93FA967B");
  EXPECT_EQ(in("a", "US-ASCII"), "hexBinary 61");
}

TEST(BinaryFromString, RefusesUnknownCharsets) {
  for (const std::string_view name :
       {"no-such-charset", "", "utf-8,swaplfnl", "x", " ", "ibm-1208_P100-1995"}) {
    EXPECT_EQ(call(ext_binary_from_string, {string("a"), string(name)}), "null") << name;
  }
  EXPECT_EQ(call(ext_binary_from_string, {string("a"), NSNull::null()}), "null");
}

TEST(BinaryFromString, RefusesTextThatTheCharsetDoesNotHave) {
  EXPECT_EQ(call(ext_binary_from_string, {string("€"), string("ISO-8859-1")}), "null");
  EXPECT_EQ(call(ext_binary_from_string, {string("é"), string("US-ASCII")}), "null");
}

TEST(BinaryFromString, PromotesItsText) {
  EXPECT_EQ(call(ext_binary_from_string, {untyped("a")}), "hexBinary 61");
  EXPECT_EQ(call(ext_binary_from_string, {NSNull::null()}), "hexBinary ");
  EXPECT_EQ(call(ext_binary_from_string, {integer(1)}), "error 6 not a string type - 1");
}

TEST(StringFromBinary, DecodesUTF8WithoutACharset) {
  EXPECT_EQ(call(ext_string_from_binary, {hex("C3A9E282ACF09F9880")}), "untypedAtomic é€😀");
  EXPECT_EQ(call(ext_string_from_binary, {hex("")}), "untypedAtomic ");
  EXPECT_EQ(call(ext_string_from_binary, {base64("QQ==")}), "untypedAtomic A");
  EXPECT_EQ(call(ext_string_from_binary, {string("4 1")}), "untypedAtomic A");
}

TEST(StringFromBinary, DecodesInTheNamedCharset) {
  EXPECT_EQ(call(ext_string_from_binary, {hex("E9"), string("iso-8859-1")}), "untypedAtomic é");
  EXPECT_EQ(call(ext_string_from_binary, {hex("93FA967B"), string("shift_jis")}),
            "untypedAtomic 日本");
  EXPECT_EQ(call(ext_string_from_binary, {hex("00410042"), string("UTF-16BE")}),
            "untypedAtomic AB");
}

TEST(StringFromBinary, RefusesBytesThatAreNoText) {
  EXPECT_EQ(call(ext_string_from_binary, {hex("FF")}), "null");
  EXPECT_EQ(call(ext_string_from_binary, {hex("C3")}), "null");
  EXPECT_EQ(call(ext_string_from_binary, {hex("EDA080")}), "null");
  EXPECT_EQ(call(ext_string_from_binary, {hex("80"), string("US-ASCII")}), "null");
  EXPECT_EQ(call(ext_string_from_binary, {hex("004100"), string("UTF-16BE")}), "null");
  EXPECT_EQ(call(ext_string_from_binary, {hex("41"), string("unknown")}), "null");
}

TEST(StringFromBinary, RaisesForWhatIsNoBinary) {
  EXPECT_EQ(call(ext_string_from_binary, {string("xyz")}),
            "error 6 value does not match a required type");
}

TEST(StringFromBinary, BringsLongTextsBack) {
  std::string text;
  for (int index = 0; index < 20000; ++index) text += "aé€";
  for (const std::string_view charset : {"utf-8", "utf-16be", "utf-32", "windows-1252"}) {
    const std::string query =
        "declare variable $t external; string(ext:string-from-binary("
        "ext:binary-from-string($t, '" +
        std::string(charset) + "'), '" + std::string(charset) + "')) eq $t";
    EXPECT_EQ(answer(query, {}, {{"t", untyped(text)}}), "true") << charset;
  }
}

// --- the two types -----------------------------------------------------------------------------

TEST(BinaryConversion, KeepsTheBytes) {
  EXPECT_EQ(call(ext_binary_hex_to_base64, {hex("0FA0")}), "base64Binary D6A=");
  EXPECT_EQ(call(ext_binary_base64_to_hex, {base64("D6A=")}), "hexBinary 0FA0");
  EXPECT_EQ(call(ext_binary_hex_to_base64, {hex("")}), "base64Binary ");
}

TEST(BinaryConversion, ReadsTexts) {
  EXPECT_EQ(call(ext_binary_hex_to_base64, {untyped("0f a0")}), "base64Binary D6A=");
  EXPECT_EQ(call(ext_binary_base64_to_hex, {string("D6 A=")}), "hexBinary 0FA0");
  EXPECT_EQ(call(ext_binary_hex_to_base64, {string("0g")}),
            "error 6 value does not match a required type");
}

TEST(BinaryLength, CountsBytes) {
  EXPECT_EQ(call(ext_binary_length, {hex("0FA0FF")}), "integer 3");
  EXPECT_EQ(call(ext_binary_length, {hex("")}), "integer 0");
  EXPECT_EQ(call(ext_binary_length, {base64("QQ==")}), "integer 1");
  EXPECT_EQ(call(ext_binary_length, {string("414243")}), "integer 3");
}

TEST(BinaryInsertAndRemove, AreRefusedWhateverTheyAreGiven) {
  for (size_t count = 0; count < 6; ++count) {
    const std::vector<Value> arguments(count, hex("00"));
    EXPECT_EQ(call(ext_binary_insert, arguments), "null");
    EXPECT_EQ(call(ext_binary_remove, arguments), "null");
  }
}

// --- finding -----------------------------------------------------------------------------------

TEST(BinaryFind, GivesTheFirstSliceWithItsDelimiters) {
  EXPECT_EQ(slices(ext_binary_find, "00 AA 11 BB AA BB", "AA", "BB"), "AA11BB");
  EXPECT_EQ(slices(ext_binary_find, "AA BB", "AA", "BB"), "AABB");
  // The end is looked for after the start.
  EXPECT_EQ(slices(ext_binary_find, "AA 01 AA", "AA", "AA"), "AA01AA");
}

TEST(BinaryFind, TakesEmptyPatternsForTheBounds) {
  EXPECT_EQ(slices(ext_binary_find, "00 AA 11", "", "AA"), "00AA");
  EXPECT_EQ(slices(ext_binary_find, "00 AA 11", "AA", ""), "AA11");
  EXPECT_EQ(slices(ext_binary_find, "00 AA 11", "", ""), "00AA11");
}

TEST(BinaryFind, IsRefusedWhereNothingMatches) {
  EXPECT_EQ(slices(ext_binary_find, "00 11", "AA", "11"), "null");
  EXPECT_EQ(slices(ext_binary_find, "AA 00", "AA", "11"), "null");
  EXPECT_EQ(slices(ext_binary_find, "", "", ""), "null");
  EXPECT_EQ(slices(ext_binary_find, "AA", "AA AA", "AA"), "null");
}

TEST(BinaryFindAll, GivesEverySliceOneAfterAnother) {
  EXPECT_EQ(slices(ext_binary_find_all, "AA 01 BB 02 AA BB AA", "AA", "BB"), "AA01BB AABB");
  EXPECT_EQ(slices(ext_binary_find_all, "AA 01 BB", "AA", "BB"), "AA01BB");
  // With no start every slice begins where the last one ended.
  EXPECT_EQ(slices(ext_binary_find_all, "01 BB 02 BB 03", "", "BB"), "01BB 02BB");
}

TEST(BinaryFindAll, StopsWhereNothingIsLeft) {
  EXPECT_EQ(slices(ext_binary_find_all, "01 02", "", ""), "0102");
  EXPECT_EQ(slices(ext_binary_find_all, "01 02", "03", ""), "null");
  EXPECT_EQ(slices(ext_binary_find_all, "", "", ""), "null");
}

TEST(BinaryFind, AnswersItemsWithoutAType) {
  EXPECT_EQ(answer("count(ext:binary-find-all('AA01BBAABB', 'AA', 'BB'))"), "integer 2");
  EXPECT_EQ(answer("ext:binary-find('00', 'AA', 'BB')"),
            "error 17 line 1 invalid arguments to function - ext:binary-find");
}

TEST(BinaryFind, IsLinearInTheData) {
  // A pattern that nearly matches everywhere, and very many matches.
  const std::string query =
      "declare variable $d external; count(ext:binary-find-all($d, '00', '00'))";
  EXPECT_EQ(answer(query, {}, {{"d", hex(std::string(2000000, '0'))}}), "integer 500000");
}

TEST(BinaryFind, EndsAtTheDeadline) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(20);
  context->contextSetLimits(limits);
  const Value data = hex(std::string(20000000, '0'));
  Ref<XQueryError> error;
  const auto query = XQuery::xqueryWithSource(
      "declare variable $d external; count(ext:binary-find-all($d, '00', '00'))");
  EXPECT_FALSE(context->evaluateXQuery(*query, {{"d", data}}, {}, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->msg()->utf8(), "limit: deadline passed");
}

TEST(BinaryFunctions, CheckTheirArgumentCounts) {
  EXPECT_EQ(refusedCounts(ext_binary_from_string, string("utf-8")), "0 3 4 5");
  EXPECT_EQ(refusedCounts(ext_string_from_binary, hex("41"), 1), "0");
  EXPECT_EQ(call(ext_string_from_binary, {hex("41"), string("utf-8"), string("utf-8")}), "null");
  EXPECT_EQ(refusedCounts(ext_binary_hex_to_base64, hex("00")), "0 2 3 4 5");
  EXPECT_EQ(refusedCounts(ext_binary_base64_to_hex, base64("QQ==")), "0 2 3 4 5");
  EXPECT_EQ(refusedCounts(ext_binary_length, hex("00")), "0 2 3 4 5");
  for (const size_t count : {0, 1, 2, 4}) {
    const std::vector<Value> arguments(count, hex("00"));
    EXPECT_EQ(call(ext_binary_find, arguments), "null");
    EXPECT_EQ(call(ext_binary_find_all, arguments), "null");
  }
}

// A cast from a URI answers its error where other casts raise it.
TEST(BinaryFunctions, AURIIsNoBinary) {
  const Value URI = NSURL::URLWithString(NSString::stringWithASCII("urn:x"));
  const Value binary = hex("00");
  const std::string failure(operatortest::invalidCast);
  for (const auto procedure : {ext_string_from_binary, ext_binary_hex_to_base64,
                               ext_binary_base64_to_hex, ext_binary_length}) {
    EXPECT_EQ(call(procedure, {URI}), failure);
  }
  for (const auto procedure : {ext_binary_find, ext_binary_find_all}) {
    EXPECT_EQ(call(procedure, {URI, binary, binary}), failure);
    EXPECT_EQ(call(procedure, {binary, URI, binary}), failure);
    EXPECT_EQ(call(procedure, {binary, binary, URI}), failure);
  }
}

}  // namespace
}  // namespace xquery
