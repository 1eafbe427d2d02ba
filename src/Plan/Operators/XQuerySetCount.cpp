#include "Plan/Operators/XQuerySetCount.h"

#include "Context/XQueryContextInternal.h"
#include "Platform/Tree/TreeIndexes.h"

#include <algorithm>
#include <iterator>

namespace xquery {
namespace {

using Ways = NSXMLNameIndex::Ways;

// Of two sorted lists without repetition.
Ways combined(int type, const Ways& left, const Ways& right) {
  Ways result;
  const auto into = std::back_inserter(result);
  if (type == XQueryOperatorUnion) {
    std::set_union(left.begin(), left.end(), right.begin(), right.end(), into);
  } else if (type == XQueryOperatorIntersect) {
    std::set_intersection(left.begin(), left.end(), right.begin(), right.end(), into);
  } else {
    std::set_difference(left.begin(), left.end(), right.begin(), right.end(), into);
  }
  return result;
}

}  // namespace

std::optional<uint64_t> XQuerySetCount::countFrom(const NSXMLDocument& document,
                                                  XQueryContext& context) const {
  const NSXMLIndexedWays known = NSXMLIndexedWays::of(&document);
  if (!known.elements) return std::nullopt;
  std::vector<Ways> sets;
  for (const Term& term : _terms) {
    if (term.path) {
      auto ways = term.path->waysFrom(*known.elements, context);
      if (!ways) return std::nullopt;
      sets.push_back(*std::move(ways));
    } else {
      const Ways right = std::move(sets.back());
      sets.pop_back();
      sets.back() = combined(term.operatorType, sets.back(), right);
    }
  }
  return known.elements->countOn(sets.back());
}

Value XQuerySetCount::computeValue(XQueryContext& context) const {
  auto& dynamic = _internal(context);
  // Diagnostics show every error that a predicate meets.
  auto* item = dynamic.showsErrors() ? nullptr : dyn_cast<NSXMLNode>(dynamic.contextItem());
  const auto* document = item ? dyn_cast<NSXMLDocument>(item->rootNode()) : nullptr;
  const auto count = document ? countFrom(*document, context) : std::nullopt;
  return count ? _question.answer(*count) : plain().evaluateWithContext(context);
}

}  // namespace xquery
