// Sets of kinds of items: what is known of the items of a value before there is one.
//
//   bits 0 to 6    the seven kinds of nodes
//   from bit 7 on  the families of atomic values: a primitive type with all that derives from it,
//                  where strings as such, decimals without the integers, and each of the three
//                  durations, are families of their own
//   the last bit   what is no item by its type: error records, raw data, arrays of a host that
//                  stand inside an array
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

using XQueryItemKinds = uint32_t;

namespace XQueryItems {

inline constexpr XQueryItemKinds None = 0;
inline constexpr XQueryItemKinds Document = 1U << 0;
inline constexpr XQueryItemKinds Element = 1U << 1;
inline constexpr XQueryItemKinds Attribute = 1U << 2;
inline constexpr XQueryItemKinds Namespace = 1U << 3;
inline constexpr XQueryItemKinds Instruction = 1U << 4;
inline constexpr XQueryItemKinds Comment = 1U << 5;
inline constexpr XQueryItemKinds Text = 1U << 6;
inline constexpr XQueryItemKinds Node = (1U << 7) - 1;

inline constexpr XQueryItemKinds Untyped = 1U << 7;
inline constexpr XQueryItemKinds PlainString = 1U << 8;  // exactly a string
inline constexpr XQueryItemKinds Boolean = 1U << 9;
inline constexpr XQueryItemKinds Integer = 1U << 10;
inline constexpr XQueryItemKinds Decimal = 1U << 11;
inline constexpr XQueryItemKinds Float = 1U << 12;
inline constexpr XQueryItemKinds Double = 1U << 13;
inline constexpr XQueryItemKinds URI = 1U << 14;
inline constexpr XQueryItemKinds QName = 1U << 15;
inline constexpr XQueryItemKinds DateTime = 1U << 16;
inline constexpr XQueryItemKinds Date = 1U << 17;
inline constexpr XQueryItemKinds Time = 1U << 18;
inline constexpr XQueryItemKinds Gregorian = 1U << 19;  // gYear and its kin
inline constexpr XQueryItemKinds PlainDuration = 1U << 20;
inline constexpr XQueryItemKinds YearMonthDuration = 1U << 21;
inline constexpr XQueryItemKinds DayTimeDuration = 1U << 22;
inline constexpr XQueryItemKinds HexBinary = 1U << 23;
inline constexpr XQueryItemKinds Base64Binary = 1U << 24;
inline constexpr XQueryItemKinds Notation = 1U << 25;
inline constexpr XQueryItemKinds DerivedString = 1U << 26;  // a token and its kin
inline constexpr XQueryItemKinds Other = 1U << 27;

inline constexpr XQueryItemKinds String = PlainString | DerivedString;
inline constexpr XQueryItemKinds AnyDecimal = Integer | Decimal;
inline constexpr XQueryItemKinds Numeric = AnyDecimal | Float | Double;
inline constexpr XQueryItemKinds OrderedDuration = YearMonthDuration | DayTimeDuration;
inline constexpr XQueryItemKinds Duration = PlainDuration | OrderedDuration;
inline constexpr XQueryItemKinds Any = (Other << 1) - 1;
inline constexpr XQueryItemKinds Atomic = Any & ~Node & ~Other;

}  // namespace XQueryItems

// The kind of one item.
XQueryItemKinds XQueryKindsOfItem(const NSObject& item);
// The kinds of the values that are of an atomic type, the abstract ones included; none for an
// identifier of no type.
XQueryItemKinds XQueryKindsOfType(XQueryTypeID type);
// Those of the values that atomizing items of such kinds gives.
constexpr XQueryItemKinds XQueryAtomizedKinds(XQueryItemKinds kinds) {
  const XQueryItemKinds atomic = kinds & XQueryItems::Atomic;
  return kinds & XQueryItems::Node ? atomic | XQueryItems::Untyped : atomic;
}

}  // namespace xquery
