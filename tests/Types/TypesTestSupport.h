// What the tests of this folder share.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery::testing {

inline Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

inline Ref<NSString> text(std::u16string_view units) {
  return NSString::stringWithUTF16(units);
}

inline NSStringView view(std::string_view ascii) {
  return NSStringView::ascii(ascii);
}

inline Ref<XQueryString> xsString(std::string_view utf8) {
  return XQueryString::stringWithString(*text(utf8));
}

inline Ref<XQueryNumber> integer(int64_t value) {
  return XQueryNumber::integerWithInt64(value);
}

inline Ref<XQueryNumber> decimal(std::string_view digits) {
  NSDecimal value;
  EXPECT_TRUE(NSDecimal::scan(view(digits), value)) << digits;
  return XQueryNumber::numberWithDecimal(value);
}

inline Value sequence(std::vector<Value> items) {
  return NSArray::arrayWithObjects(std::move(items));
}

inline std::string utf8(const Ref<NSString>& string) {
  return string ? string->utf8() : "(null)";
}

// The string value of an atomic value.
inline std::string printed(const Value& value) {
  return value ? utf8(XQueryStringValue(*value)) : "(null)";
}

// A tree that keeps its white space.
inline Ref<NSXMLDocument> parse(std::string_view xml) {
  NSXMLParseError error;
  Ref<NSXMLDocument> document =
      NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace, &error);
  EXPECT_TRUE(document) << error.message;
  return document;
}

// Calls what must raise; the answer is "number message", or "no error".
template <class Function>
std::string raised(XQueryContext& context, Function function) {
  _internal(context).setError(nullptr, false);
  try {
    function();
  } catch (const NSException& exception) {
    EXPECT_EQ(exception.name(), "XQueryError");
    const Ref<XQueryError>& error = _internal(context).error();
    if (!error) return "exception without a record";
    return std::to_string(error->err()) + " " + utf8(error->msg());
  }
  return "no error";
}

}  // namespace xquery::testing
