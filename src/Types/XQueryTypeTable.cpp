// The types' names and their derivation.
//
// Derivation is asked for in every comparison and arithmetic step, so the rules are worked out at
// compile time into one bit per pair of types: bit `base` of kindMasks[type]. The rules stay in
// `derives`, which also answers for numbers that are no type.
#include "Types/XQueryTypeTable.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Types/SafeNSArrayAdd.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"

#include <array>
#include <new>
#include <unordered_map>

namespace xquery {

namespace {

constexpr size_t typeCount = 55;
constexpr const char* xsNamespace = "http://www.w3.org/2001/XMLSchema";
constexpr const char* xdtNamespace = "http://www.w3.org/2004/10/xpath-datatypes";

struct TypeName {
  XQueryTypeID id;
  const char* namespaceURI;
  const char* localName;
};

constexpr TypeName typeNames[] = {
    {XQueryTypeAnyType, xsNamespace, "anyType"},
    {XQueryTypeAnyComplex, xsNamespace, "anyComplex"},
    {XQueryTypeAnySimpleType, xsNamespace, "anySimpleType"},
    {XQueryTypeAnyAtomicType, xdtNamespace, "anyAtomicType"},
    {XQueryTypeUntypedAtomic, xdtNamespace, "untypedAtomic"},
    {XQueryTypeString, xsNamespace, "string"},
    {XQueryTypeBoolean, xsNamespace, "boolean"},
    {XQueryTypeDouble, xsNamespace, "double"},
    {XQueryTypeFloat, xsNamespace, "float"},
    {XQueryTypeDecimal, xsNamespace, "decimal"},
    {XQueryTypeAnyURI, xsNamespace, "anyURI"},
    {XQueryTypeQName, xsNamespace, "QName"},
    {XQueryTypeGYearMonth, xsNamespace, "gYearMonth"},
    {XQueryTypeGYear, xsNamespace, "gYear"},
    {XQueryTypeGMonthDay, xsNamespace, "gMonthDay"},
    {XQueryTypeGDay, xsNamespace, "gDay"},
    {XQueryTypeGMonth, xsNamespace, "gMonth"},
    {XQueryTypeDateTime, xsNamespace, "dateTime"},
    {XQueryTypeDate, xsNamespace, "date"},
    {XQueryTypeTime, xsNamespace, "time"},
    {XQueryTypeDuration, xsNamespace, "duration"},
    {XQueryTypeBase64Binary, xsNamespace, "base64Binary"},
    {XQueryTypeHexBinary, xsNamespace, "hexBinary"},
    {XQueryTypeNotation, xsNamespace, "NOTATION"},
    {XQueryTypeYearMonthDuration, xdtNamespace, "yearMonthDuration"},
    {XQueryTypeDayTimeDuration, xdtNamespace, "dayTimeDuration"},
    {XQueryTypeNormalizedString, xsNamespace, "normalizedString"},
    {XQueryTypeToken, xsNamespace, "token"},
    {XQueryTypeLanguage, xsNamespace, "language"},
    {XQueryTypeName, xsNamespace, "Name"},
    {XQueryTypeNCName, xsNamespace, "NCName"},
    {XQueryTypeXSID, xsNamespace, "ID"},
    {XQueryTypeIDREF, xsNamespace, "IDREF"},
    {XQueryTypeIDREFS, xsNamespace, "IDREFS"},
    {XQueryTypeENTITY, xsNamespace, "ENTITY"},
    {XQueryTypeENTITIES, xsNamespace, "ENTITIES"},
    {XQueryTypeNMTOKEN, xsNamespace, "NMTOKEN"},
    {XQueryTypeNMTOKENS, xsNamespace, "NMTOKENS"},
    {XQueryTypeInteger, xsNamespace, "integer"},
    {XQueryTypeNonNegativeInteger, xsNamespace, "nonNegativeInteger"},
    {XQueryTypePositiveInteger, xsNamespace, "positiveInteger"},
    {XQueryTypeNonPositiveInteger, xsNamespace, "nonPositiveInteger"},
    {XQueryTypeNegativeInteger, xsNamespace, "negativeInteger"},
    {XQueryTypeLong, xsNamespace, "long"},
    {XQueryTypeInt, xsNamespace, "int"},
    {XQueryTypeShort, xsNamespace, "short"},
    {XQueryTypeByte, xsNamespace, "byte"},
    {XQueryTypeUnsignedLong, xsNamespace, "unsignedLong"},
    {XQueryTypeUnsignedInt, xsNamespace, "unsignedInt"},
    {XQueryTypeUnsignedShort, xsNamespace, "unsignedShort"},
    {XQueryTypeUnsignedByte, xsNamespace, "unsignedByte"},
};

// The list types keep their own number: nothing is derived from a list by way of string.
constexpr XQueryTypeID primitiveOf(XQueryTypeID id) {
  if (id < XQueryTypeYearMonthDuration || id > XQueryTypeUnsignedByte) return id;
  if (id == XQueryTypeIDREFS || id == XQueryTypeENTITIES || id == XQueryTypeNMTOKENS) return id;
  if (id <= XQueryTypeDayTimeDuration) return XQueryTypeDuration;
  return id < XQueryTypeInteger ? XQueryTypeString : XQueryTypeDecimal;
}

// Within the string and the decimal family derivation goes by number, not by the schema's tree: a
// larger number counts as derived from a smaller one.
constexpr bool derives(XQueryTypeID type, XQueryTypeID base) {
  if (base == XQueryTypeNone) return false;
  if (type == base) return true;
  const XQueryTypeID primitive = primitiveOf(type);
  const XQueryTypeID primitiveBase = primitiveOf(base);
  switch (primitiveBase) {
    case XQueryTypeAnyType:
    case XQueryTypeAnySimpleType:
    case XQueryTypeAnyAtomicType:
    case XQueryTypeUntypedAtomic:
      return primitive >= primitiveBase;
    case XQueryTypeString:
    case XQueryTypeDecimal:
      return type >= base && primitive == primitiveBase;
    case XQueryTypeDuration:
      return base == XQueryTypeDuration && primitive == XQueryTypeDuration;
    default:
      return false;
  }
}

constexpr std::array<uint64_t, typeCount> makeKindMasks() {
  std::array<uint64_t, typeCount> masks{};
  for (size_t type = 0; type < typeCount; ++type) {
    for (size_t base = 0; base < typeCount; ++base) {
      if (derives(static_cast<XQueryTypeID>(type), static_cast<XQueryTypeID>(base))) {
        masks[type] |= uint64_t{1} << base;
      }
    }
  }
  return masks;
}

constexpr std::array<uint64_t, typeCount> kindMasks = makeKindMasks();

Ref<NSString> immortalText(const char* text) {
  Ref<NSString> string = NSString::stringWithASCII(text);
  NSCounting::makeImmortal(*string);
  return string;
}

// The two tables. They never change and are never destroyed, so that what runs at exit may still
// ask for types.
struct TypeTables {
  std::vector<Value> sXQueryTypeNames;
  std::unordered_map<Ref<XQueryQName>, XQueryTypeID, XQueryQNameHash, XQueryQNameEqual>
      sXQueryNameIDMappings;

  TypeTables() {
    const LastingObjects lasting;
    const Ref<NSString> xs = immortalText(xsNamespace);
    const Ref<NSString> xdt = immortalText(xdtNamespace);
    for (const TypeName& row : typeNames) {
      const Ref<NSString>& URI = row.namespaceURI == xsNamespace ? xs : xdt;
      Ref<XQueryQName> name = XQueryQName::qnameWithLocalPart(immortalText(row.localName), URI);
      NSCounting::makeImmortal(*name);
      sXQueryNameIDMappings.emplace(name, row.id);
      SafeNSArrayAdd(sXQueryTypeNames, name, static_cast<size_t>(row.id));
    }
  }
};

const TypeTables& typeTables() {
  alignas(TypeTables) static unsigned char storage[sizeof(TypeTables)];
  static const TypeTables* const tables = ::new (storage) TypeTables;
  return *tables;
}

// Both are integer types, low < high.
XQueryTypeID leastCommonIntegerType(XQueryTypeID low, XQueryTypeID high) {
  switch (low) {
    case XQueryTypeInteger:
      return XQueryTypeInteger;
    case XQueryTypePositiveInteger:
      return XQueryIsKindOfType(high, XQueryTypeUnsignedLong) ? XQueryTypeNonNegativeInteger
                                                              : XQueryTypeInteger;
    case XQueryTypeUnsignedLong:
      return high == XQueryTypePositiveInteger ? XQueryTypeNonNegativeInteger : XQueryTypeInteger;
    default:
      return XQueryIsKindOfType(high, low) ? low : XQueryTypeInteger;
  }
}

}  // namespace

void BuiltInTypeInit() {
  (void)typeTables();
}

Ref<XQueryQName> XQueryQNameForTypeID(XQueryTypeID id) {
  const std::vector<Value>& names = typeTables().sXQueryTypeNames;
  if (id <= 0 || static_cast<size_t>(id) >= names.size()) return nullptr;
  return Ref<XQueryQName>(dyn_cast<XQueryQName>(names[static_cast<size_t>(id)]));
}

XQueryTypeID XQueryTypeIDForQName(const XQueryQName& qName) {
  const auto& mappings = typeTables().sXQueryNameIDMappings;
  const auto found = mappings.find(qName);
  return found == mappings.end() ? XQueryTypeNone : found->second;
}

XQueryTypeID XQueryObjectTypeID(const NSObject* object) {
  if (!object) return XQueryTypeNone;
  switch (object->kind()) {
    case Kind::String:
      return XQueryTypeUntypedAtomic;
    case Kind::TypedString:
      return cast<XQueryString>(object)->typeID();
    case Kind::Number:
    case Kind::DecimalNumber:
      return cast<NSNumber>(object)->isBoolean() ? XQueryTypeBoolean : XQueryTypeDouble;
    case Kind::TypedNumber:
      return cast<XQueryNumber>(object)->typeID();
    case Kind::URL:
      return XQueryTypeAnyURI;
    case Kind::QName:
      return XQueryTypeQName;
    case Kind::TypedDate:
      return cast<XQueryDate>(object)->typeID();
    case Kind::Duration:
      return XQueryTypeDuration;
    case Kind::Base64Binary:
      return XQueryTypeBase64Binary;
    case Kind::HexBinary:
      return XQueryTypeHexBinary;
    case Kind::Notation:
      return XQueryTypeNotation;
    case Kind::Null:
      return XQueryTypeEmpty;
    case Kind::QueryError:
      return XQueryTypeError;
    default:
      return XQueryTypeNone;
  }
}

bool XQueryIsAtomicType(const NSObject* object) {
  return XQueryObjectTypeID(object) > XQueryTypeAnySimpleType;
}

bool XQueryIsNumericTypeID(XQueryTypeID id) {
  return id == XQueryTypeDouble || id == XQueryTypeFloat ||
         XQueryIsKindOfType(id, XQueryTypeDecimal);
}

bool XQueryIsNumericType(const NSObject* object) {
  return XQueryIsNumericTypeID(XQueryObjectTypeID(object));
}

XQueryTypeID XQueryPrimitiveTypeForTypeID(XQueryTypeID id) {
  return primitiveOf(id);
}

bool XQueryIsKindOfType(XQueryTypeID type, XQueryTypeID base) {
  if (static_cast<size_t>(type) < typeCount && static_cast<size_t>(base) < typeCount) {
    return (kindMasks[static_cast<size_t>(type)] >> base & 1) != 0;
  }
  return derives(type, base);
}

XQueryTypeID XQueryLeastCommonNumericType(XQueryTypeID a, XQueryTypeID b) {
  if (!XQueryIsNumericTypeID(a) || !XQueryIsNumericTypeID(b)) return XQueryTypeNone;
  if (a == b) return a;
  const XQueryTypeID low = a < b ? a : b;
  const XQueryTypeID high = a < b ? b : a;
  if (low >= XQueryTypeInteger) return leastCommonIntegerType(low, high);
  if (low == XQueryTypeDouble || low == XQueryTypeFloat) return XQueryTypeDouble;
  return XQueryTypeDecimal;
}

Value xquery_type_equal(const NSObject& a, const NSObject& b, XQueryTypeID type) {
  if (XQueryObjectTypeID(&a) != type || XQueryObjectTypeID(&b) != type) return nullptr;
  return NSNumber::numberWithBool(XQueryObjectsEqual(a, b));
}

}  // namespace xquery
