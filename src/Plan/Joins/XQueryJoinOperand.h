// What a key or a probe of a join is compared as.
#pragma once

#include "Types/XQueryUntypedText.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

struct XQueryJoinOperand {
  enum Kind : uint8_t { Other, Untyped, Text, Floating, ExactDecimal, InexactDecimal };
  Kind kind = Other;
  XQueryUntypedText text;  // of an untyped one and a text
  double number = 0;       // of a number; of an untyped one once it is scanned

  explicit XQueryJoinOperand(NSObject* item);
  // Whether what is made of the item will be a text; null is none.
  static bool hasText(const NSObject* item);
  bool isText() const { return kind == Untyped || kind == Text; }
  bool isDecimal() const { return kind == ExactDecimal || kind == InexactDecimal; }
  bool isNumber() const { return kind == Floating || isDecimal(); }
  bool isNaN() const;
  // A text that does not end with half of a character: those that begin with it stand in a row when
  // they are sorted.
  bool isWholeText() const;
  // Makes an untyped one a number; false when it begins with none.
  bool scan();
};

}  // namespace xquery
