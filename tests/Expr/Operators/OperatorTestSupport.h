// Values, and a readable form of answers, for the tests of the operators.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <string>
#include <string_view>
#include <vector>

namespace xquery::operatortest {

inline constexpr int Plus = XQueryOperatorPlus;
inline constexpr int Minus = XQueryOperatorMinus;
inline constexpr int Times = XQueryOperatorMultiply;
inline constexpr int Div = XQueryOperatorDiv;
inline constexpr int IDiv = XQueryOperatorIDiv;
inline constexpr int Mod = XQueryOperatorMod;

inline Value integer(int64_t value) {
  return XQueryNumber::integerWithInt64(value);
}
inline Value number(double value) {
  return XQueryNumber::numberWithDouble(value);
}
inline Value untyped(std::string_view text) {
  return NSString::stringWithUTF8(text);
}
inline Value string(std::string_view text) {
  return XQueryString::stringWithString(*NSString::stringWithUTF8(text));
}
inline Value boolean(bool value) {
  return NSNumber::numberWithBool(value);
}
inline Value empty() {
  return NSNull::null();
}
inline Value sequence(std::vector<Value> items) {
  return NSArray::arrayWithObjects(std::move(items));
}
inline Value months(int64_t count) {
  return XQueryNumber::yearMonthDurationWithMonths(count);
}
inline Value seconds(double count) {
  return XQueryNumber::dayTimeDurationWithSeconds(count);
}
inline Value nan() {
  return XQueryNumber::nan();
}
inline Value infinity() {
  return XQueryNumber::posInf();
}
inline Value minusInfinity() {
  return XQueryNumber::negInf();
}

// A value of any type, from its text.
inline Value typed(XQueryTypeID type, std::string_view text) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  return XQueryCastAs(string(text), type, *context);
}
inline Value decimal(std::string_view text) {
  return typed(XQueryTypeDecimal, text);
}
inline Value single(std::string_view text) {
  return typed(XQueryTypeFloat, text);
}

// "integer 3", "true", "()", "(integer 1, integer 2)", "node a", "record 6 message", "null".
inline std::string show(const Value& value) {
  if (!value) return "null";
  if (value->kind() == Kind::Null) return "()";
  if (value.get() == NSNumber::trueValue()) return "true";
  if (value.get() == NSNumber::falseValue()) return "false";
  if (const auto* error = dyn_cast<XQueryError>(value)) {
    return "record " + std::to_string(error->err()) + " " + error->msg()->utf8();
  }
  if (const auto* array = dyn_cast<NSArray>(value)) {
    std::string text = "(";
    for (const Value& item : array->objects()) text += (text.size() > 1 ? ", " : "") + show(item);
    return text + ")";
  }
  if (value->isNode()) return "node " + cast<NSXMLNode>(value)->nameView().utf8();
  const Ref<XQueryQName> type = XQueryQNameForTypeID(XQueryObjectTypeID(value.get()));
  return (type ? type->localPart()->utf8() : "?") + " " + XQueryStringValue(*value)->utf8();
}

// What `work` answers, or "error 6 message" when it raises.
template <class Work>
std::string outcome(Work work) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  try {
    return show(work(*context));
  } catch (const NSException& exception) {
    const Ref<XQueryError>& error = _internal(*context).error();
    if (!error) return "exception " + exception.name();
    return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
  }
}

inline std::string evaluate(int code, const Value& left, const Value& right) {
  return outcome([&](XQueryContext& context) {
    return XQueryOperatorExpr::evaluateOperator(code, left, right, context);
  });
}

inline constexpr std::string_view invalidOperands = "error 6 invalid type for operator";
inline constexpr std::string_view invalidCast = "error 6 value does not match a required type";
inline constexpr std::string_view divideByZero = "error 6 divide by zero";
inline constexpr std::string_view divisionByZero = "error 6 Division by zero";

// The root element of a document. Its tree lives as long as the answer.
inline Value elementFrom(std::string_view xml) {
  const Ref<NSXMLDocument> document =
      NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
  return document ? Value(document->rootElement()) : Value();
}

}  // namespace xquery::operatortest
