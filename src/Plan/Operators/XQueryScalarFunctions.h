// Built-in functions over numbers, texts and lists that are no objects.
//
// A part of a text or a list is where it begins and ends in the one that it is taken from, so that
// substring($s, 2), subsequence($l, 2) and $l[$n] make nothing. Each function answers what the
// built-in one does, or Unknown where there would be an error or an argument is not what it knows.
#pragma once

#include "Plan/Operators/XQueryScalar.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

namespace xquery {

class XQueryFunctionCall;

enum class XQueryScalarFunction : uint8_t {
  Empty,
  Exists,
  Count,
  Subsequence,
  StringLength,
  Substring,
  SubstringBefore,
  SubstringAfter,
  Contains,
  StartsWith,
  EndsWith,
  Concat,
  ToInteger,
  ToDouble,
  Absolute,
  Floor,
  Ceiling,
  // Predicates: of a list and what stands in brackets, or is compared with position().
  Item,
  ItemFromBack,  // how many stand behind it
  ItemsAbove,
  ItemsFrom,
  ItemsBelow,
  ItemsUpTo,
};

// More arguments than this are left to the plain way.
inline constexpr size_t XQueryMostScalarArguments = 12;

// The function that is called, where it is one of these and takes so many arguments.
std::optional<XQueryScalarFunction> XQueryScalarFunctionOf(const XQueryFunctionCall& call);

XQueryScalar XQueryScalarAnswer(XQueryScalarFunction function,
                                std::span<const XQueryScalar> arguments, XQueryScalarsMade& made);

}  // namespace xquery
