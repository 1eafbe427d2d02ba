// What the tests of the makers and readers share.
#pragma once

#include "xquery/Values.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery::testing {

// "xs:byte 12", or the error's text behind "error ".
inline std::string shown(const XQueryResult<Value>& made) {
  if (!made) {
    EXPECT_EQ(made.error()->number(), XQueryErrorNumber::Type);
    EXPECT_EQ(made.error()->category(), XQueryErrorCategory::Values);
    return "error " + made.error()->msg()->utf8();
  }
  return XQueryItemTypeName(**made) + " " + XQueryItemStringValue(**made);
}

inline std::string shownFrom(XQueryItemType type, std::string_view text) {
  return shown(XQueryMakeFromText(type, text));
}

// The text of the error of a reader that was given an item of another type.
template <class T>
std::string refusal(const XQueryResult<T>& read) {
  if (read) return "read";
  EXPECT_EQ(read.error()->number(), XQueryErrorNumber::Type);
  return read.error()->msg()->utf8();
}

}  // namespace xquery::testing
