// What the scanner hands to the grammar with each token, and what every symbol on the grammar's
// stack carries.
//
// The record is copied bytewise by the generated parser, so its references do not count: every
// object in it is owned by the autorelease pool of the current parser and lives until that pool is
// drained at the end of the parse.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

struct XQueryTokenValue {
  int32_t line;   // counted from 0; for a nonterminal the line of its first token
  int32_t token;  // the token code; 0 for a built object
  union {
    NSObject* value;  // null for none
    char16_t unit;    // of the character-valued tokens
  };
  NSObject* source;  // the raw text of the token, only while token sources are logged
};

// Where a symbol on the grammar's stack stands. It is copied bytewise as well. The generated parser
// begins with a location of four numbers, which are line and column of start and end to it.
struct XQueryLocation {
  XQueryLocation() = default;
  XQueryLocation(int, int, int, int) : span() {}
  explicit XQueryLocation(XQuerySpan at) : span(at) {}

  XQuerySpan span;
};

}  // namespace xquery
