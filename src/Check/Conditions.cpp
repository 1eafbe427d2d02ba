// Conditions: those that are always alike, and values that are no conditions in XQuery 1.0.
#include "Check/Checking.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Types/XQueryValues.h"
#include "xquery/Number.h"

#include <optional>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

std::optional<bool> truthOfLiteral(const NSObject& value) {
  if (value.kind() == Kind::Null) return false;
  if (const auto* text = dyn_cast<NSString>(&value)) return text->length() > 0;
  if (const auto* number = dyn_cast<NSNumber>(&value)) return number->doubleValue() != 0;
  return std::nullopt;
}

// What the condition is whenever it is asked.
std::optional<bool> truthOf(const XQueryChecking& checking, XQueryPlaceID place, int levels = 0) {
  if (place == XQueryNoPlace || levels > XQueryChecking::mostLevels) return std::nullopt;
  const XQueryPlaceID inner = checking.program.withoutParentheses(place);
  if (const NSObject* value = checking.literalIn(inner)) return truthOfLiteral(*value);
  const std::string_view name = checking.functionCalledIn(inner);
  if (name == "true" || name == "false") return name == "true";
  if (name == "not" || name == "boolean") {
    const auto truth = truthOf(checking, checking.argument(inner, 0), levels + 1);
    return truth && name == "not" ? !*truth : truth;
  }
  const XQueryFacts& facts = checking.factsOf(inner);
  // What never answers has nothing for a value as well.
  if (facts.most == 0 && facts.least == 0) return false;
  if (facts.least > 0 && facts.most > 0 && facts.are(Node)) return true;
  return std::nullopt;
}

bool isCondition(const XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryPlace& at = checking.at(place);
  switch (at.role) {
    case XQueryRole::Test:
    case XQueryRole::Where:
    case XQueryRole::Satisfies:
    case XQueryRole::Predicate:
    case XQueryRole::LaterOperand:
      return true;
    case XQueryRole::Operand: {
      const auto* whole = checking.as<XQueryOperatorExpr>(at.parent);
      return whole && XQueryOperatorExpr::operatorClassification(whole->operatorType()) == 1;
    }
    case XQueryRole::Argument: {
      const std::string_view name = checking.functionCalledIn(checking.at(at.parent).parent);
      return name == "not" || name == "boolean";
    }
    default:
      return false;
  }
}

const char* consequenceOf(const XQueryPlace& at, bool truth) {
  switch (at.role) {
    case XQueryRole::Test:
      return truth ? "the part behind else is never reached"
                   : "the part behind then is never reached";
    case XQueryRole::Where:
      return truth ? "where is of no use" : "nothing is ever returned";
    case XQueryRole::Predicate:
      return truth ? "the predicate is of no use" : "nothing is ever selected";
    default:
      return "the other side decides, or nothing does";
  }
}

// A number in a predicate is a position. The operand of "not" is told of with the condition that it
// makes.
void warnOfConstant(XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryPlace& at = checking.at(place);
  if (at.role == XQueryRole::Argument || at.role == XQueryRole::Satisfies) return;
  if (at.role == XQueryRole::Predicate && checking.factsOf(place).mayBe(Numeric)) return;
  const auto truth = truthOf(checking, place);
  if (!truth) return;
  checking.warn(place, ID::ConstantCondition,
                {*truth ? "true" : "false", consequenceOf(at, *truth)});
}

void warnOfKinds(XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryFacts& facts = checking.factsOf(place);
  if (facts.most == 0 || checking.literalIn(place)) return;
  constexpr XQueryItemKinds withoutTruth =
      DateTime | Date | Time | Duration | Gregorian | QName | HexBinary | Base64Binary | Notation;
  if (facts.are(Atomic) && facts.most > 1) {
    checking.warn(place, ID::TruthOfSeveral);
  } else if (facts.are(URI)) {
    checking.warn(place, ID::TruthOfURI);
  } else if (facts.are(withoutTruth)) {
    checking.warn(place, ID::TruthOfValue, {XQueryNameOfKinds(facts.kinds)});
  }
}

}  // namespace

void XQueryCheckTest(XQueryChecking& checking, XQueryPlaceID place) {
  if (!isCondition(checking, place)) return;
  warnOfConstant(checking, place);
  warnOfKinds(checking, place);
}

}  // namespace xquery
