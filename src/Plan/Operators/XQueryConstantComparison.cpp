#include "Plan/Operators/XQueryConstantComparison.h"

#include "Platform/Numbers/NumberText.h"
#include "Types/XQueryUntypedText.h"
#include "xquery/Number.h"

#include <cmath>

namespace xquery {

// No answer where the text of the node is no number and has to be one, which is an error.
std::optional<bool> XQueryConstantComparison::holdsOf(const NSXMLNode& node) const {
  const XQueryUntypedText text(node);
  if (_constant.text) {
    if (_relation.test == XQueryRelation::Equal) {
      return text.view().equals(_constant.text->view()) != _relation.negated;
    }
    return _relation.holds(text.view().compare(_constant.text->view()));
  }
  double number = 0;
  if (!scanDouble(text.view(), number)) return std::nullopt;
  if (std::isnan(number)) return false;
  return _relation.holds(number < _constant.number ? -1 : number > _constant.number ? 1 : 0);
}

XQueryConstantComparison::Answer XQueryConstantComparison::answerFrom(NSXMLNode* start) const {
  size_t count = 0;
  std::optional<bool> answer;
  _walk.visit(start, [&](const NSXMLNode* found) {
    ++count;
    answer = holdsOf(*found);
    // The first pair that holds decides, and so does the first one that cannot be compared. A
    // value comparison wants to know that there is no second node.
    return _isValueComparison ? count == 1 : answer == false;
  });
  if (count == 0) return {!_isValueComparison, std::nullopt};
  return {answer.has_value() && (!_isValueComparison || count == 1), answer};
}

Value XQueryConstantComparison::computeValue(XQueryContext& context) const {
  NSXMLNode* start = _walk.start(context);
  const Answer answer = start ? answerFrom(start) : Answer{false, std::nullopt};
  if (!answer.isKnown) return plain().evaluateWithContext(context);
  return answer.holds ? Value(NSNumber::numberWithBool(*answer.holds)) : Value(NSNull::null());
}

std::optional<bool> XQueryConstantComparison::holdsFor(NSXMLNode* node,
                                                       const XQueryContext& context) const {
  if (!_walk.isOpen(context)) return std::nullopt;
  const Answer answer = answerFrom(node);
  return answer.isKnown ? std::optional(answer.holds.value_or(false)) : std::nullopt;
}

}  // namespace xquery
