#include "Types/XQueryBinary.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryTypeTable.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

#include <set>

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::text;
using testing::view;
using testing::xsString;

constexpr const char* xs = "http://www.w3.org/2001/XMLSchema";
constexpr const char* xdt = "http://www.w3.org/2004/10/xpath-datatypes";

struct TypeRow {
  XQueryTypeID id;
  const char* URI;  // null: no name
  const char* name;
  XQueryTypeID primitive;
};

const TypeRow typeRows[] = {
    {0, nullptr, nullptr, 0},
    {1, nullptr, nullptr, 1},
    {2, nullptr, nullptr, 2},
    {3, xs, "anyType", 3},
    {4, xs, "anyComplex", 4},
    {5, nullptr, nullptr, 5},
    {6, xs, "anySimpleType", 6},
    {7, xdt, "anyAtomicType", 7},
    {8, xdt, "untypedAtomic", 8},
    {9, xs, "string", 9},
    {10, xs, "boolean", 10},
    {11, xs, "double", 11},
    {12, xs, "float", 12},
    {13, xs, "decimal", 13},
    {14, xs, "anyURI", 14},
    {15, xs, "QName", 15},
    {16, xs, "gYearMonth", 16},
    {17, xs, "gYear", 17},
    {18, xs, "gMonthDay", 18},
    {19, xs, "gDay", 19},
    {20, xs, "gMonth", 20},
    {21, xs, "dateTime", 21},
    {22, xs, "date", 22},
    {23, xs, "time", 23},
    {24, xs, "duration", 24},
    {25, xs, "base64Binary", 25},
    {26, xs, "hexBinary", 26},
    {27, xs, "NOTATION", 27},
    {28, xdt, "yearMonthDuration", 24},
    {29, xdt, "dayTimeDuration", 24},
    {30, xs, "normalizedString", 9},
    {31, xs, "token", 9},
    {32, xs, "language", 9},
    {33, xs, "Name", 9},
    {34, xs, "NCName", 9},
    {35, xs, "ID", 9},
    {36, xs, "IDREF", 9},
    {37, xs, "IDREFS", 37},
    {38, xs, "ENTITY", 9},
    {39, xs, "ENTITIES", 39},
    {40, xs, "NMTOKEN", 9},
    {41, xs, "NMTOKENS", 41},
    {42, xs, "integer", 13},
    {43, xs, "nonNegativeInteger", 13},
    {44, xs, "positiveInteger", 13},
    {45, xs, "nonPositiveInteger", 13},
    {46, xs, "negativeInteger", 13},
    {47, xs, "long", 13},
    {48, xs, "int", 13},
    {49, xs, "short", 13},
    {50, xs, "byte", 13},
    {51, xs, "unsignedLong", 13},
    {52, xs, "unsignedInt", 13},
    {53, xs, "unsignedShort", 13},
    {54, xs, "unsignedByte", 13},
};

TEST(TypeTable, EveryNamedTypeIsFoundByNumberAndByName) {
  for (const TypeRow& row : typeRows) {
    const Ref<XQueryQName> name = XQueryQNameForTypeID(row.id);
    if (!row.URI) {
      EXPECT_FALSE(name) << row.id;
      continue;
    }
    ASSERT_TRUE(name) << row.id;
    EXPECT_EQ(name->namespaceURI()->utf8(), row.URI) << row.id;
    EXPECT_EQ(name->localPart()->utf8(), row.name) << row.id;
    EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text(row.name), text(row.URI))), row.id);
  }
}

TEST(TypeTable, NumbersOutsideTheTableHaveNoName) {
  for (const XQueryTypeID id : {-1, 55, 1000}) EXPECT_FALSE(XQueryQNameForTypeID(id)) << id;
}

TEST(TypeTable, AnUnknownNameIsTypeZero) {
  EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text("nothing"), text(xs))), 0);
  EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text("string"), nullptr)), 0);
  EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text("string"), text(xdt))), 0);
}

TEST(TypeTable, TheFourDatatypesAreInTheirNamespaceOnly) {
  for (const char* name :
       {"anyAtomicType", "untypedAtomic", "yearMonthDuration", "dayTimeDuration"}) {
    EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text(name), text(xs))), 0) << name;
  }
}

TEST(TypeTable, ThePrefixPlaysNoPart) {
  EXPECT_EQ(XQueryTypeIDForQName(*XQueryQName::qname(text("x:string"), text(xs))), 9);
}

TEST(TypeTable, PrimitiveTypes) {
  for (const TypeRow& row : typeRows) {
    EXPECT_EQ(XQueryPrimitiveTypeForTypeID(row.id), row.primitive) << row.id;
  }
  for (const XQueryTypeID id : {-1, 55, 1000}) EXPECT_EQ(XQueryPrimitiveTypeForTypeID(id), id);
}

// The rule said in words: which types each base takes in, beside itself.
bool expectedKind(XQueryTypeID type, XQueryTypeID base) {
  const std::set<XQueryTypeID> strings = {9, 30, 31, 32, 33, 34, 35, 36, 38, 40};
  if (base == 0) return false;
  if (type == base) return true;
  const XQueryTypeID primitive = typeRows[type].primitive;
  if (base == 3 || base == 6 || base == 7 || base == 8) return primitive >= base;
  if (strings.contains(base)) return strings.contains(type) && type > base;
  if (base == 13 || base >= 42) return type >= 42 && type > base;
  if (base == 24) return type == 28 || type == 29;
  return false;
}

TEST(IsKindOfType, HoldsForExactlyTheRightPairs) {
  for (XQueryTypeID type = 0; type < 55; ++type) {
    for (XQueryTypeID base = 0; base < 55; ++base) {
      EXPECT_EQ(XQueryIsKindOfType(type, base), expectedKind(type, base)) << type << " " << base;
    }
  }
}

TEST(IsKindOfType, OrderedDurationsAreDurationsButNotEachOther) {
  EXPECT_FALSE(XQueryIsKindOfType(29, 28));
  EXPECT_FALSE(XQueryIsKindOfType(28, 29));
  EXPECT_TRUE(XQueryIsKindOfType(28, 24));
  EXPECT_TRUE(XQueryIsKindOfType(29, 24));
}

TEST(IsKindOfType, GoesByNumberWithinAFamily) {
  EXPECT_TRUE(XQueryIsKindOfType(54, 48));
  EXPECT_TRUE(XQueryIsKindOfType(34, 32));
  EXPECT_FALSE(XQueryIsKindOfType(48, 54));
  EXPECT_FALSE(XQueryIsKindOfType(37, 9));
}

TEST(IsKindOfType, EveryTypeFromEightOnIsAKindOfUntyped) {
  EXPECT_TRUE(XQueryIsKindOfType(8, 8));
  EXPECT_TRUE(XQueryIsKindOfType(9, 8));
  EXPECT_FALSE(XQueryIsKindOfType(7, 8));
}

TEST(IsKindOfType, NumbersThatAreNoTypeFollowTheSameRules) {
  EXPECT_TRUE(XQueryIsKindOfType(60, 60));
  EXPECT_TRUE(XQueryIsKindOfType(60, 7));
  EXPECT_FALSE(XQueryIsKindOfType(60, 13));
  EXPECT_FALSE(XQueryIsKindOfType(9, 60));
  EXPECT_FALSE(XQueryIsKindOfType(-1, 3));
  EXPECT_FALSE(XQueryIsKindOfType(9, -1));
}

TEST(NumericTypes, AreDoubleFloatDecimalAndTheIntegers) {
  for (XQueryTypeID id = 0; id < 55; ++id) {
    const bool numeric = id == 11 || id == 12 || id == 13 || id >= 42;
    EXPECT_EQ(XQueryIsNumericTypeID(id), numeric) << id;
  }
}

XQueryTypeID expectedCommon(XQueryTypeID a, XQueryTypeID b) {
  const auto numeric = [](XQueryTypeID id) { return (id >= 11 && id <= 13) || id >= 42; };
  if (!numeric(a) || !numeric(b)) return 0;
  if (a == b) return a;
  const XQueryTypeID low = std::min(a, b);
  const XQueryTypeID high = std::max(a, b);
  if (low <= 12) return 11;
  if (low == 13) return 13;
  if (low == 42 || low == 51) return 42;
  if (low == 44) return high >= 51 ? 43 : 42;
  return low;
}

TEST(LeastCommonNumericType, OfEveryPair) {
  for (XQueryTypeID a = 0; a < 55; ++a) {
    for (XQueryTypeID b = 0; b < 55; ++b) {
      EXPECT_EQ(XQueryLeastCommonNumericType(a, b), expectedCommon(a, b)) << a << " " << b;
    }
  }
}

TEST(LeastCommonNumericType, WellKnownPairs) {
  EXPECT_EQ(XQueryLeastCommonNumericType(12, 13), 11);
  EXPECT_EQ(XQueryLeastCommonNumericType(12, 12), 12);
  EXPECT_EQ(XQueryLeastCommonNumericType(42, 9), 0);
  EXPECT_EQ(XQueryLeastCommonNumericType(43, 46), 43);
  EXPECT_EQ(XQueryLeastCommonNumericType(46, 43), 43);
  EXPECT_EQ(XQueryLeastCommonNumericType(44, 52), 43);
  EXPECT_EQ(XQueryLeastCommonNumericType(44, 47), 42);
  EXPECT_EQ(XQueryLeastCommonNumericType(51, 52), 42);
  EXPECT_EQ(XQueryLeastCommonNumericType(13, 54), 13);
  EXPECT_EQ(XQueryLeastCommonNumericType(28, 28), 0);
}

TEST(ObjectTypeID, OfEachClass) {
  const Ref<NSData> data = NSData::dataWithBytes("a");
  const std::pair<Value, XQueryTypeID> rows[] = {
      {text("a"), 8},
      {xsString("a"), 9},
      {XQueryString::tokenWithString(*text("a")), 31},
      {NSNumber::trueValue(), 10},
      {NSNumber::falseValue(), 10},
      {NSNumber::numberWithLongLong(1), 11},
      {NSNumber::numberWithDouble(1.5), 11},
      {NSDecimalNumber::decimalNumberWithString(view("1")), 11},
      {integer(1), 42},
      {decimal("1.5"), 13},
      {XQueryNumber::yearMonthDurationWithMonths(1), 28},
      {XQueryNumber::dayTimeDurationWithSeconds(1), 29},
      {XQueryNumber::nan(), 11},
      {NSURL::URLWithString(text("http://a/")), 14},
      {XQueryQName::qname(text("a"), nullptr), 15},
      {XQueryBase64Binary::binaryWithData(data), 25},
      {XQueryHexBinary::binaryWithData(data), 26},
      {XQueryNotation::notationWithString(text("a")), 27},
      {NSNull::null(), 2},
      {XQueryError::error(6, "a"), 1},
      {NSArray::array(), 0},
      {data, 0},
      {NSXMLNode::textWithStringValue(view("a")), 0},
  };
  for (const auto& [value, type] : rows) {
    EXPECT_EQ(XQueryObjectTypeID(value.get()), type);
    EXPECT_EQ(XQueryIsAtomicType(value.get()), type > 6);
    EXPECT_EQ(XQueryIsNumericType(value.get()), XQueryIsNumericTypeID(type));
  }
  EXPECT_EQ(XQueryObjectTypeID(nullptr), 0);
  EXPECT_FALSE(XQueryIsAtomicType(nullptr));
}

TEST(TypeEqual, NeedsExactlyTheTypeOnBothSides) {
  const Ref<XQueryString> a = xsString("a");
  const Ref<XQueryString> same = xsString("a");
  EXPECT_EQ(xquery_type_equal(*a, *same, 9).get(), NSNumber::trueValue());
  EXPECT_EQ(xquery_type_equal(*a, *xsString("b"), 9).get(), NSNumber::falseValue());
  EXPECT_FALSE(xquery_type_equal(*a, *text("a"), 9));
  EXPECT_FALSE(xquery_type_equal(*text("a"), *a, 9));
  EXPECT_FALSE(xquery_type_equal(*a, *same, 8));
  EXPECT_FALSE(xquery_type_equal(*a, *XQueryString::tokenWithString(*text("a")), 9));
  EXPECT_EQ(xquery_type_equal(*XQueryQName::qname(text("p:a"), text("u")),
                              *XQueryQName::qname(text("q:a"), text("u")), 15)
                .get(),
            NSNumber::trueValue());
}

}  // namespace
}  // namespace xquery
