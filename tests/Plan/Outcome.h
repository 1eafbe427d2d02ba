// What a query comes to, in texts that can be compared.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Engine/ErrorPlaceText.h"
#include "xquery/xquery.h"

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

inline Outcome outcomeIn(XQueryContext& context, const XQuery& query, const Value& contextItem,
                         const XQueryVariables& constants = {}) {
  Outcome outcome;
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, constants, contextItem, &error);
  if (error) {
    outcome.lines.push_back("error " + std::to_string(error->err()) + " line " +
                            std::to_string(error->line()) + " " +
                            (error->msg() ? error->msg()->utf8() : ""));
    outcome.lines.push_back(placeText(*error));
  }
  if (items) {
    std::unordered_map<const NSObject*, size_t> places;
    for (const Value& item : items->objects()) {
      const auto [first, isNew] = places.try_emplace(item.get(), outcome.lines.size());
      std::string line = shownItem(*item);
      if (!isNew) line += " as " + std::to_string(first->second);
      outcome.lines.push_back(std::move(line));
    }
  }
  const auto& left = _internal(context);
  if (left.contextItem()) {
    outcome.lines.push_back("left " + shownItem(*left.contextItem()) + " at " +
                            std::to_string(left.position()) + " of " + std::to_string(left.last()));
  }
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
