#include "Types/XQueryAtomization.h"

#include "Platform/Base/WorkMeter.h"
#include "Types/TypesContext.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNodeFunctions.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"
#include "xquery/XQuery.h"

namespace xquery {

namespace {

[[noreturn]] void raiseWrongCount(XQueryContext& context) {
  XQueryRaise(context, XQueryErrors::invalidAtomization.error());
}

bool allAtomic(const std::vector<Value>& items) {
  WorkPacer pacer;
  for (const Value& item : items) {
    pacer.turn();
    if (!XQueryIsAtomicType(item.get())) return false;
  }
  return true;
}

// Of two items or more.
Value typedValues(const Value& sequence, XQueryContext& context) {
  const std::vector<Value>& items = cast<NSArray>(sequence)->objects();
  if (allAtomic(items)) return sequence;
  std::vector<Value> values;
  values.reserve(items.size());
  WorkPacer pacer;
  for (const Value& item : items) {
    pacer.turn();
    if (!isa<NSNull>(item)) values.push_back(XQueryTypedValue(item, context));
  }
  if (values.empty()) return NSNull::null();
  return NSArray::arrayWithObjects(std::move(values));
}

bool isFalseNumber(const NSNumber& number) {
  switch (number.storage()) {
    case NSNumber::Storage::Boolean:
      return !number.boolValue();
    case NSNumber::Storage::Int64:
    case NSNumber::Storage::UInt64:
      return number.unsignedLongLongValue() == 0 && number.longLongValue() == 0;
    default:
      return number.isEqualToNumber(*XQueryNumber::zero()) ||
             number.isEqualToNumber(*XQueryNumber::nan());
  }
}

bool effectiveBooleanValueOfItem(const NSObject& item) {
  switch (item.kind()) {
    case Kind::Null:
      return false;
    case Kind::String:
    case Kind::TypedString:
      return cast<NSString>(&item)->length() != 0;
    case Kind::Number:
    case Kind::DecimalNumber:
    case Kind::TypedNumber:
      return !isFalseNumber(*cast<NSNumber>(&item));
    default:
      return true;
  }
}

}  // namespace

Value XQueryTypedValue(const Value& item, XQueryContext& context) {
  if (XQueryIsNode(item.get())) return XQueryNodeTypedValue(cast<NSXMLNode>(item));
  if (XQueryIsAtomicType(item.get())) return item;
  XQueryRaise(context, XQueryErrors::invalidType.error());
}

Value XQueryAtomization(const Value& value, XQueryContext& context) {
  return XQueryAtomizationCheckingOccurrence(value, XQueryOccurrenceAny, context);
}

Value XQueryAtomizationCheckingOccurrence(const Value& value, int code, XQueryContext& context) {
  const NSArray* sequence = dyn_cast<NSArray>(value.get());
  if (isa<NSNull>(value) || (sequence && sequence->count() == 0)) {
    if (code >= XQueryOccurrenceExactlyOne) raiseWrongCount(context);
    return NSNull::null();
  }
  if (!sequence) return XQueryTypedValue(value, context);
  if (sequence->count() == 1) return XQueryTypedValue(sequence->objects().front(), context);
  if (code == XQueryOccurrenceExactlyOne) raiseWrongCount(context);
  return typedValues(value, context);
}

// A sequence of several atomic values counts as true: this is lenient on purpose.
Value XQueryEffectiveBooleanValue(const Value& value, XQueryContext&) {
  const NSObject* item = value.get();
  if (item == NSNumber::trueValue() || item == NSNumber::falseValue()) return value;
  while (const NSArray* sequence = dyn_cast<NSArray>(item)) {
    if (sequence->count() != 1) return NSNumber::numberWithBool(sequence->count() > 1);
    item = sequence->objects().front().get();
  }
  if (isa<XQueryError>(item)) return Value(const_cast<NSObject*>(item));
  return NSNumber::numberWithBool(!item || effectiveBooleanValueOfItem(*item));
}

}  // namespace xquery
