// What a query comes to, in texts that can be compared.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Engine/ErrorPlaceText.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery::plantest {

// The outcome of one evaluation, told in full: the items with their types, which of them are the
// same object, the error with its number, line and text, and the focus that is left.
struct Outcome {
  std::vector<std::string> lines;
  bool operator==(const Outcome&) const = default;
};

inline std::string shownItem(const NSObject& item) {
  std::string text = XQueryItemTypeName(item) + " ";
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) {
    node->appendXMLTo(text);
  } else {
    text += XQueryItemStringValue(item);
  }
  return text;
}

// Of what fails.
inline Outcome outcomeOf(const XQueryError& error) {
  const std::string message = error.msg() ? error.msg()->utf8() : "";
  return {{"error " + std::to_string(error.err()) + " line " + std::to_string(error.line()) + " " +
               message,
           placeText(error)}};
}

inline Outcome outcomeIn(XQueryContext& context, const XQuery& query, const Value& contextItem,
                         const XQueryVariables& constants = {}) {
  Outcome outcome;
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, constants, contextItem, &error);
  if (error) outcome = outcomeOf(*error);
  if (items) {
    std::unordered_map<const NSObject*, size_t> places;
    for (const Value& item : items->objects()) {
      const auto [first, isNew] = places.try_emplace(item.get(), outcome.lines.size());
      outcome.lines.push_back(shownItem(*item));
      if (!isNew) outcome.lines.push_back("same as " + std::to_string(first->second));
    }
  }
  const auto& left = _internal(context);
  if (left.contextItem()) {
    outcome.lines.push_back("left " + shownItem(*left.contextItem()) + " at " +
                            std::to_string(left.position()) + " of " + std::to_string(left.last()));
  }
  return outcome;
}

// Some programs go on for hours. What ends at its limit is compared with nothing.
inline XQueryLimits boundedBy(std::chrono::milliseconds duration,
                              uint64_t memoryCeiling = uint64_t{256} << 20) {
  XQueryLimits limits;
  limits.duration = duration;
  limits.memoryCeiling = memoryCeiling;
  return limits;
}

inline bool endedAtLimit(const Outcome& outcome) {
  return std::any_of(outcome.lines.begin(), outcome.lines.end(), [](const std::string& line) {
    return line.starts_with("error 0 ") && line.find("limit: ") != line.npos;
  });
}

// Without the focus that is left, whose document may be less than whole.
inline Outcome withoutFocus(Outcome outcome) {
  std::erase_if(outcome.lines, [](const std::string& line) { return line.starts_with("left "); });
  return outcome;
}

// Nor which items are the same object.
inline Outcome withoutIdentity(Outcome outcome) {
  std::erase_if(outcome.lines,
                [](const std::string& line) { return line.starts_with("same as "); });
  return outcome;
}

// In a context of its own.
inline Outcome outcomeOf(const XQuery& query, const Value& contextItem,
                         const XQueryVariables& constants = {}, const XQueryLimits& limits = {}) {
  const auto context = XQueryContext::xqueryContext();
  context->contextSetLimits(limits);
  return outcomeIn(*context, query, contextItem, constants);
}

}  // namespace xquery::plantest
