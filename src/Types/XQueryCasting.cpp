// Casting, as a table: the class of the source against the primitive type of the target, one small
// function per entry. An entry answers null for a value that does not fit and an absent entry is a
// pair that cannot be cast at all; both end in the same error. The list types are in no entry:
// nothing can be cast to them. A value's own type, which asks for no work, has one for notations
// only.
#include "Types/XQueryCasting.h"

#include "Platform/Numbers/NumberText.h"
#include "Types/TypesContext.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryIntegerText.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"
#include "xquery/URL.h"
#include "xquery/Values.h"
#include "xquery/XQuery.h"

#include <array>
#include <cmath>

namespace xquery {

namespace {

struct Cast {
  const Value& object;
  XQueryTypeID target;
  XQueryContext& context;

  const NSString& string() const { return *cast<NSString>(object); }
  const NSNumber& number() const { return *cast<NSNumber>(object); }
};

// --- rows shared by several sources --------------------------------------------------------------

// The text as an untyped value, even where a typed string went into making the object.
Ref<NSString> plainString(const NSString& text) {
  return text.kind() == Kind::String ? Ref<NSString>(const_cast<NSString*>(&text))
                                     : make<NSString>(Kind::String, uint16_t{0}, text);
}

Value toUntypedAtomic(const Cast& cast) {
  return plainString(*XQueryStringValue(*cast.object));
}

Value toStringFamily(const Cast& cast) {
  Ref<XQueryString> string = XQueryString::stringWithString(*XQueryStringValue(*cast.object));
  if (cast.target == XQueryTypeString) return string;
  return XQueryCastAs(string, cast.target, cast.context);
}

Value textToTarget(const Cast& cast) {
  return XQueryCastAs(plainString(*XQueryStringValue(*cast.object)), cast.target, cast.context);
}

// --- from strings --------------------------------------------------------------------------------

Value stringToUntypedAtomic(const Cast& cast) {
  return plainString(cast.string());
}

Value stringToStringFamily(const Cast& cast) {
  return XQueryString::stringOfType(cast.target, cast.string());
}

Value stringToBoolean(const Cast& cast) {
  const NSStringView text = cast.string().view();
  if (text == "1" || text == "true") return NSNumber::trueValue();
  if (text == "0" || text == "false") return NSNumber::falseValue();
  return nullptr;
}

Value doubleNumber(double value, XQueryTypeID target) {
  if (target == XQueryTypeFloat) return XQueryMakeFloat(static_cast<float>(value));
  return XQueryNumber::numberWithDouble(value);
}

Value stringToDouble(const Cast& cast) {
  const NSStringView text = cast.string().view();
  if (text == "NaN") return XQueryNumber::nan();
  if (text == "INF") return XQueryNumber::posInf();
  if (text == "-INF") return XQueryNumber::negInf();
  double value = 0;
  if (!scanDouble(text, value)) return nullptr;
  return doubleNumber(value, cast.target);
}

// A small whole number cast to integer skips the range rules, which have nothing to say about it.
Value stringToDecimal(const Cast& cast) {
  NSDecimal value;
  if (!NSDecimal::scan(cast.string().view(), value)) return nullptr;
  if (cast.target == XQueryTypeInteger && value.isSmallInteger()) {
    return XQueryNumber::integerWithInt64(value.smallInteger());
  }
  Ref<XQueryNumber> decimal = XQueryNumber::numberWithDecimal(std::move(value));
  if (cast.target == XQueryTypeDecimal) return decimal;
  return XQueryCastAs(decimal, cast.target, cast.context);
}

Value stringToAnyURI(const Cast& cast) {
  return NSURL::URLWithString(plainString(cast.string()));
}

Value stringToQName(const Cast& cast) {
  const Ref<NSString> name = plainString(cast.string());
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(name, prefix, localPart);
  if (prefix->length() == 0) {
    return XQueryQName::qname(name, XQueryDefaultElementNamespace(cast.context));
  }
  const Ref<NSString> URI = XQueryNamespaceForPrefix(cast.context, prefix->view());
  if (!URI) return nullptr;
  return XQueryQName::qname(name, URI);
}

template <Ref<XQueryDate> (*parse)(NSStringView)>
Value stringToDate(const Cast& cast) {
  return parse(cast.string().view());
}

Value stringToDuration(const Cast& cast) {
  if (cast.target == XQueryTypeYearMonthDuration) {
    return XQueryNumber::yearMonthDurationWithString(cast.string().view());
  }
  if (cast.target == XQueryTypeDayTimeDuration) {
    return XQueryNumber::dayTimeDurationWithString(cast.string().view());
  }
  return XQueryDuration::durationWithString(cast.string().view());
}

Value stringToBase64Binary(const Cast& cast) {
  return XQueryBase64Binary::binaryWithString(cast.string().view());
}

Value stringToHexBinary(const Cast& cast) {
  return XQueryHexBinary::binaryWithString(cast.string().view());
}

// Only from xs:string itself, neither from an untyped value nor from a derived type.
Value stringToNotation(const Cast& cast) {
  if (XQueryObjectTypeID(cast.object.get()) != XQueryTypeString) return nullptr;
  return XQueryNotation::notationWithString(plainString(cast.string()));
}

// --- from numbers --------------------------------------------------------------------------------

bool isEqual(const NSNumber& number, const XQueryNumber* other) {
  return number.isEqualToNumber(*other);
}

Value numberToBoolean(const Cast& cast) {
  const NSNumber& number = cast.number();
  const bool isFalse =
      isEqual(number, XQueryNumber::nan()) || isEqual(number, XQueryNumber::zero());
  return NSNumber::numberWithBool(!isFalse);
}

// The rule is to print the number and read the text again. Only of a float this makes a difference:
// of any other number the text is exact, or is the shortest that reads back to the value.
Value numberToDouble(const Cast& cast) {
  const NSNumber& number = cast.number();
  const NSDecimal* decimal = number.storedDecimal();
  const bool isNaN = decimal && decimal->isNaN();
  if (isNaN || number.storage() == NSNumber::Storage::Float) return textToTarget(cast);
  return doubleNumber(number.doubleValue(), cast.target);
}

Value numberToStringFamily(const Cast& cast) {
  if (cast.target != XQueryTypeString || !XQueryIntegerText::isFor(cast.number())) {
    return toStringFamily(cast);
  }
  return XQueryString::stringWithView(XQueryIntegerText(cast.number()).view());
}

Value booleanToDouble(const Cast& cast) {
  const bool isTrue = cast.object.get() == NSNumber::trueValue();
  return XQueryCastAs(Value(isTrue ? XQueryNumber::one() : XQueryNumber::zero()), cast.target,
                      cast.context);
}

using NumberFactory = Ref<XQueryNumber> (*)(const NSNumber&);

// By target, from integer on.
constexpr NumberFactory integerFactories[] = {
    XQueryNumber::integerWithNumber,
    XQueryNumber::nonNegativeIntegerWithNumber,
    XQueryNumber::positiveIntegerWithNumber,
    XQueryNumber::nonPositiveIntegerWithNumber,
    XQueryNumber::negativeIntegerWithNumber,
    XQueryNumber::longWithNumber,
    XQueryNumber::intWithNumber,
    XQueryNumber::shortWithNumber,
    XQueryNumber::byteWithNumber,
    XQueryNumber::unsignedLongWithNumber,
    XQueryNumber::unsignedIntWithNumber,
    XQueryNumber::unsignedShortWithNumber,
    XQueryNumber::unsignedByteWithNumber,
};
static_assert(std::size(integerFactories) == XQueryTypeUnsignedByte - XQueryTypeInteger + 1);

// A decimal is no infinity however large it is, although it equals one where doubles compare.
bool isSpecialValue(const NSNumber& number) {
  switch (number.storage()) {
    case NSNumber::Storage::Double:
    case NSNumber::Storage::Float:
      return !std::isfinite(number.doubleValue());
    case NSNumber::Storage::Decimal:
      return number.storedDecimal()->isNaN();
    default:
      return false;
  }
}

// The factories check a machine type's lower bound on the value as given, but a cast checks it on
// the truncated value: -128.9 is the byte -128. A value that already is an integer goes as it is,
// because one of a derived type (by number) is taken over without a check.
Value numberToDecimal(const Cast& cast) {
  const NSNumber& number = cast.number();
  if (isSpecialValue(number)) return nullptr;
  if (cast.target == XQueryTypeDecimal) return XQueryNumber::decimalWithNumber(number);
  const NumberFactory factory = integerFactories[cast.target - XQueryTypeInteger];
  if (cast.target >= XQueryTypeLong && XQueryObjectTypeID(&number) < XQueryTypeInteger) {
    return factory(*XQueryNumber::integerWithNumber(number));
  }
  return factory(number);
}

// --- from the other classes ----------------------------------------------------------------------

// A QName casts to string itself only, not to the types derived from it.
Value toStringOnly(const Cast& cast) {
  return cast.target == XQueryTypeString ? toStringFamily(cast) : nullptr;
}

Value notationToNotation(const Cast& cast) {
  return XQueryNotation::notationWithString(XQueryStringValue(*cast.object));
}

Value dateToDate(const Cast& source) {
  return cast<XQueryDate>(source.object)->castToType(source.target);
}

// By way of text, so that the texts' own rules hold.
Value durationToOrderedDuration(const Cast& source) {
  const XQueryDuration& duration = *cast<XQueryDuration>(source.object);
  const bool isDayTime = source.target == XQueryTypeDayTimeDuration;
  const std::string text = isDayTime ? duration.dayTimeText() : duration.yearMonthText();
  return XQueryCastAs(NSString::stringWithASCII(text), source.target, source.context);
}

Value binaryToHexBinary(const Cast& source) {
  return XQueryHexBinary::binaryWithData(cast<XQueryBinary>(source.object)->data());
}

Value binaryToBase64Binary(const Cast& source) {
  return XQueryBase64Binary::binaryWithData(cast<XQueryBinary>(source.object)->data());
}

// --- the table -----------------------------------------------------------------------------------

enum class Source : uint8_t {
  String,
  Number,
  Boolean,
  OrderedDuration,  // a number that counts months or seconds
  Date,             // any of the eight date and time types
  Duration,
  AnyURI,
  QName,
  Notation,
  Base64Binary,
  HexBinary,
  None,  // not castable; last
};

using CastFunction = Value (*)(const Cast&);

struct CastRow {
  Source from;
  XQueryTypeID to;  // a primitive type
  CastFunction function;
};

constexpr CastRow castRows[] = {
    {Source::String, XQueryTypeUntypedAtomic, stringToUntypedAtomic},
    {Source::String, XQueryTypeString, stringToStringFamily},
    {Source::String, XQueryTypeBoolean, stringToBoolean},
    {Source::String, XQueryTypeDouble, stringToDouble},
    {Source::String, XQueryTypeFloat, stringToDouble},
    {Source::String, XQueryTypeDecimal, stringToDecimal},
    {Source::String, XQueryTypeAnyURI, stringToAnyURI},
    {Source::String, XQueryTypeQName, stringToQName},
    {Source::String, XQueryTypeGYearMonth, stringToDate<XQueryDate::xqueryGMonthYearFromString>},
    {Source::String, XQueryTypeGYear, stringToDate<XQueryDate::xqueryGYearFromString>},
    {Source::String, XQueryTypeGMonthDay, stringToDate<XQueryDate::xqueryGMonthDayFromString>},
    {Source::String, XQueryTypeGDay, stringToDate<XQueryDate::xqueryGDayFromString>},
    {Source::String, XQueryTypeGMonth, stringToDate<XQueryDate::xqueryGMonthFromString>},
    {Source::String, XQueryTypeDateTime, stringToDate<XQueryDate::xqueryDateTimeFromString>},
    {Source::String, XQueryTypeDate, stringToDate<XQueryDate::xqueryDateFromString>},
    {Source::String, XQueryTypeTime, stringToDate<XQueryDate::xqueryTimeFromString>},
    {Source::String, XQueryTypeDuration, stringToDuration},
    {Source::String, XQueryTypeBase64Binary, stringToBase64Binary},
    {Source::String, XQueryTypeHexBinary, stringToHexBinary},
    {Source::String, XQueryTypeNotation, stringToNotation},

    {Source::Number, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Number, XQueryTypeString, numberToStringFamily},
    {Source::Number, XQueryTypeBoolean, numberToBoolean},
    {Source::Number, XQueryTypeDouble, numberToDouble},
    {Source::Number, XQueryTypeFloat, numberToDouble},
    {Source::Number, XQueryTypeDecimal, numberToDecimal},

    {Source::Boolean, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Boolean, XQueryTypeString, toStringFamily},
    {Source::Boolean, XQueryTypeDouble, booleanToDouble},
    {Source::Boolean, XQueryTypeFloat, booleanToDouble},
    {Source::Boolean, XQueryTypeDecimal, numberToDecimal},

    {Source::OrderedDuration, XQueryTypeUntypedAtomic, textToTarget},
    {Source::OrderedDuration, XQueryTypeString, textToTarget},
    {Source::OrderedDuration, XQueryTypeDuration, textToTarget},

    {Source::Date, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Date, XQueryTypeString, toStringFamily},
    {Source::Date, XQueryTypeGYearMonth, dateToDate},
    {Source::Date, XQueryTypeGYear, dateToDate},
    {Source::Date, XQueryTypeGMonthDay, dateToDate},
    {Source::Date, XQueryTypeGDay, dateToDate},
    {Source::Date, XQueryTypeGMonth, dateToDate},
    {Source::Date, XQueryTypeDateTime, dateToDate},
    {Source::Date, XQueryTypeDate, dateToDate},
    {Source::Date, XQueryTypeTime, dateToDate},

    {Source::Duration, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Duration, XQueryTypeString, toStringFamily},
    {Source::Duration, XQueryTypeDuration, durationToOrderedDuration},

    {Source::AnyURI, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::AnyURI, XQueryTypeString, toStringFamily},

    {Source::QName, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::QName, XQueryTypeString, toStringOnly},

    {Source::Notation, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Notation, XQueryTypeString, toStringOnly},
    {Source::Notation, XQueryTypeNotation, notationToNotation},

    {Source::Base64Binary, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::Base64Binary, XQueryTypeString, toStringFamily},
    {Source::Base64Binary, XQueryTypeHexBinary, binaryToHexBinary},

    {Source::HexBinary, XQueryTypeUntypedAtomic, toUntypedAtomic},
    {Source::HexBinary, XQueryTypeString, toStringFamily},
    {Source::HexBinary, XQueryTypeBase64Binary, binaryToBase64Binary},
};

constexpr size_t sourceCount = static_cast<size_t>(Source::None);
constexpr size_t primitiveCount = XQueryTypeNotation + 1;
using CastTable = std::array<std::array<CastFunction, primitiveCount>, sourceCount>;

constexpr CastTable makeCastTable() {
  CastTable table{};
  for (const CastRow& row : castRows) {
    table[static_cast<size_t>(row.from)][static_cast<size_t>(row.to)] = row.function;
  }
  return table;
}

constexpr CastTable castTable = makeCastTable();

Source sourceOfNumber(const NSNumber& number) {
  if (number.kind() != Kind::TypedNumber) {
    return number.isBoolean() ? Source::Boolean : Source::Number;
  }
  return XQueryIsKindOfType(cast<XQueryNumber>(&number)->typeID(), XQueryTypeDuration)
             ? Source::OrderedDuration
             : Source::Number;
}

Source sourceOf(const NSObject* object) {
  if (!object) return Source::None;
  switch (object->kind()) {
    case Kind::String:
    case Kind::TypedString:
      return Source::String;
    case Kind::Number:
    case Kind::DecimalNumber:
    case Kind::TypedNumber:
      return sourceOfNumber(*cast<NSNumber>(object));
    case Kind::URL:
      return Source::AnyURI;
    case Kind::TypedDate:
      return Source::Date;
    case Kind::Duration:
      return Source::Duration;
    case Kind::QName:
      return Source::QName;
    case Kind::Notation:
      return Source::Notation;
    case Kind::Base64Binary:
      return Source::Base64Binary;
    case Kind::HexBinary:
      return Source::HexBinary;
    default:
      return Source::None;
  }
}

}  // namespace

Value XQueryCastAs(const Value& object, XQueryTypeID type, XQueryContext& forContext) {
  const Source source = sourceOf(object.get());
  if (source == Source::None) {
    XQueryRaise(forContext, XQueryErrors::invalidConversion.error());
  }
  // A value of the type already is the answer itself; only a notation is made anew.
  if (source != Source::Notation && XQueryObjectTypeID(object.get()) == type) return object;
  const auto primitive = static_cast<size_t>(XQueryPrimitiveTypeForTypeID(type));
  const CastFunction function =
      primitive < primitiveCount ? castTable[static_cast<size_t>(source)][primitive] : nullptr;
  if (function) {
    if (Value result = function({object, type, forContext})) return result;
  }
  Ref<XQueryError> error = XQueryErrors::valueOfAnotherType.error();
  // Of a URI the error is the answer and travels on as an item; no other class does this.
  if (source == Source::AnyURI) return error;
  XQueryRaise(forContext, std::move(error));
}

Value XQueryCastObject(const Value& object, XQueryTypeID asType, XQueryContext& forContext,
                       bool allowEmpty) {
  // Atomizing it would give the item itself.
  if (XQueryIsAtomicType(object.get())) return XQueryCastAs(object, asType, forContext);
  const int occurrence = allowEmpty ? XQueryOccurrenceAnyAlso : XQueryOccurrenceExactlyOne;
  Value item = XQueryAtomizationCheckingOccurrence(object, occurrence, forContext);
  if (allowEmpty && isa<NSNull>(item)) return item;
  return XQueryCastAs(item, asType, forContext);
}

Value XQueryCastAsTypeForContext(const Value& object, XQueryTypeID type, XQueryContext& context) {
  return XQueryCastObject(object, type, context, false);
}

}  // namespace xquery
