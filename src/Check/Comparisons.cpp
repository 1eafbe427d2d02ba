// Operators whose operands do not go together, or go together otherwise than in XQuery 1.0.
#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Labels.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Number.h"

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

constexpr int classArithmetic = 2;
constexpr int classRange = 3;
constexpr int classSequence = 4;
constexpr int classValue = 5;
constexpr int classGeneral = 6;
constexpr int classNode = 7;

constexpr XQueryItemKinds instants = DateTime | Date | Time;
constexpr XQueryItemKinds laterInstants = instants | Gregorian;  // on the right

struct Sides {
  XQueryPlaceID left;
  XQueryPlaceID right;
  int type;
  bool isGeneral;

  // As a value comparison.
  int test() const { return isGeneral ? type + (XQueryOperatorEq - XQueryOperatorEqual) : type; }
  bool isEquality() const { return test() == XQueryOperatorEq || test() == XQueryOperatorNe; }
};

// Whether values of one kind each can be compared. Kinds are single bits, of atomized values.
bool canBeCompared(XQueryItemKinds a, XQueryItemKinds b, const Sides& sides) {
  if (sides.isGeneral && ((a | b) & Untyped)) return true;  // cast to the type of the other side
  if (a == Untyped) a = PlainString;
  if (b == Untyped) b = PlainString;
  const auto are = [&](XQueryItemKinds kinds) { return (a & kinds) && (b & kinds); };
  if (are(Numeric) || are(String) || are(Boolean)) return true;
  if (are(OrderedDuration)) return a == b;
  if (sides.isEquality()) return a == b && a != PlainDuration;
  // The left side alone decides how values are ordered; true is 1 beside a number.
  if (a & Boolean) return true;
  if (a & Numeric) return (b & Boolean) != 0;
  return (a & instants) && (b & laterInstants);
}

template <class Judge>
bool anyPair(XQueryItemKinds left, XQueryItemKinds right, Judge judge) {
  for (XQueryItemKinds a = left; a != 0; a &= a - 1) {
    for (XQueryItemKinds b = right; b != 0; b &= b - 1) {
      if (judge(a & -a, b & -b)) return true;
    }
  }
  return false;
}

void warnOfFailure(XQueryChecking& checking, XQueryPlaceID place, const Sides& sides,
                   XQueryItemKinds left, XQueryItemKinds right) {
  const std::string sign = XQueryLabelOf(*checking.at(place).expr);
  constexpr XQueryItemKinds texts = String | Untyped | URI;
  const bool hasURI = (left & ~URI) == 0 || (right & ~URI) == 0;
  if (hasURI && ((left | right) & ~texts) == 0) {
    const XQueryItemKinds other = (left & ~URI) == 0 ? right : left;
    checking.warn(place, ID::URIComparison, {XQueryNameOfKinds(other), sign});
  } else if (((left | right) & ~Duration) == 0) {
    checking.warn(place, ID::DurationComparison,
                  {XQueryNameOfKinds(left), XQueryNameOfKinds(right), sign});
  } else {
    checking.warn(sides.left, ID::ComparisonFails,
                  {XQueryNameOfKinds(left), XQueryNameOfKinds(right), sign});
  }
}

// --- NaN -----------------------------------------------------------------------------------------

bool isSameVariable(const XQueryChecking& checking, XQueryPlaceID a, XQueryPlaceID b) {
  const auto* left = checking.inside<XQueryVariable>(a);
  const auto* right = checking.inside<XQueryVariable>(b);
  return left && right && left->name()->isEqualToString(*right->name());
}

bool mayBeNaN(const XQueryChecking& checking, XQueryPlaceID place) {
  if (checking.functionCalledIn(place) != "number") return false;
  const XQueryPlaceID argument = checking.argument(checking.program.withoutParentheses(place), 0);
  return argument == XQueryNoPlace || !checking.factsOf(argument).are(AnyDecimal);
}

void checkNaN(XQueryChecking& checking, XQueryPlaceID place, const Sides& sides) {
  if (sides.test() != XQueryOperatorNe) return;
  const bool isIdiom = isSameVariable(checking, sides.left, sides.right);
  if (isIdiom || mayBeNaN(checking, sides.left) || mayBeNaN(checking, sides.right)) {
    checking.warn(place, ID::NaNComparison, {XQueryLabelOf(*checking.at(place).expr)});
  }
}

// --- texts that are untyped ----------------------------------------------------------------------

void checkUntypedText(XQueryChecking& checking, XQueryPlaceID text, XQueryPlaceID other) {
  if (text == XQueryNoPlace || other == XQueryNoPlace) return;
  // The values of these nodes are strings in XQuery 1.0.
  const XQueryFacts& facts = checking.factsOf(text);
  const bool areRemarks = facts.most > 0 && facts.are(Comment | Instruction);
  if (!areRemarks && !checking.givesUntypedText(text)) return;
  const XQueryItemKinds kinds = checking.atomicKinds(other);
  if (kinds == None || (kinds & ~Numeric) != 0) return;
  const std::string giver =
      areRemarks ? XQueryNameOfKinds(facts.kinds) : std::string(checking.functionCalledIn(text));
  checking.warn(text, ID::UntypedText, {giver, "is a number beside numbers"});
}

// --- truth values and floats ---------------------------------------------------------------------

// A truth value on the left is ordered with anything, one on the right with numbers. An untyped
// value is cast to one by "<" and its like, and is a string for "lt" and its like.
void checkTruthOrder(XQueryChecking& checking, XQueryPlaceID place, const Sides& sides,
                     XQueryItemKinds left, XQueryItemKinds right) {
  const XQueryItemKinds fitting = sides.isGeneral ? Boolean | Untyped : Boolean;
  if (sides.isEquality() || (left != Boolean && right != Boolean)) return;
  const XQueryItemKinds other = left == Boolean ? right : left;
  if ((other & fitting) != 0) return;
  checking.warn(place, ID::TruthOrder,
                {XQueryLabelOf(*checking.at(place).expr), XQueryNameOfKinds(other)});
}

// As doubles a float and a decimal differ where the decimal is no float: 0.1 is none, 0.5 is one.
void checkFloat(XQueryChecking& checking, XQueryPlaceID place, XQueryPlaceID side,
                XQueryPlaceID other) {
  const auto* number = dyn_cast<NSNumber>(checking.literalIn(other));
  const XQueryItemKinds kinds = checking.atomicKinds(side);
  const bool isFloat = (kinds & Float) != 0 && (kinds & ~(Float | Double)) == 0;
  if (!number || !isFloat || !checking.factsOf(other).are(AnyDecimal)) return;
  const double value = number->doubleValue();
  if (static_cast<double>(static_cast<float>(value)) == value) return;
  checking.warn(place, ID::FloatAsDouble,
                {XQueryLabelOf(*checking.at(place).expr), checking.labelOf(other)});
}

// --- comparisons ---------------------------------------------------------------------------------

// What xs:duration makes of a text is neither of the ordered durations.
XQueryItemKinds kindsOfSide(const XQueryChecking& checking, XQueryPlaceID side) {
  const XQueryItemKinds kinds = checking.atomicKinds(side);
  const auto* call = checking.inside<XQueryFunctionCall>(side);
  if (!call || !call->builtIn() || kinds != Duration) return kinds;
  const auto& row = call->builtIn()->row();
  const XQueryPlaceID operand = checking.argument(checking.program.withoutParentheses(side), 0);
  const bool isPlain = row.namespaceID == XQueryNamespaceXS && row.localName == "duration" &&
                       operand != XQueryNoPlace &&
                       checking.factsOf(operand).are(String | Untyped | Node);
  return isPlain ? PlainDuration : kinds;
}

void checkComparison(XQueryChecking& checking, XQueryPlaceID place, const Sides& sides) {
  if (sides.isGeneral) {
    checkUntypedText(checking, sides.left, sides.right);
    checkUntypedText(checking, sides.right, sides.left);
  }
  checkNaN(checking, place, sides);
  checkFloat(checking, place, sides.left, sides.right);
  checkFloat(checking, place, sides.right, sides.left);
  const XQueryItemKinds left = kindsOfSide(checking, sides.left);
  const XQueryItemKinds right = kindsOfSide(checking, sides.right);
  if (left == None || right == None) return;
  const bool isPossible =
      anyPair(left, right, [&](auto a, auto b) { return canBeCompared(a, b, sides); });
  if (!isPossible) return warnOfFailure(checking, place, sides, left, right);
  checkTruthOrder(checking, place, sides, left, right);
  const bool areInstants = (left & ~instants) == 0 && (right & ~laterInstants) == 0;
  if (areInstants && (left & right) == 0) {
    checking.warn(place, ID::DateAndTime,
                  {XQueryLabelOf(*checking.at(place).expr), XQueryNameOfKinds(left),
                   XQueryNameOfKinds(right)});
  }
}

// --- arithmetic ----------------------------------------------------------------------------------

bool checkOperand(XQueryChecking& checking, XQueryPlaceID whole, XQueryPlaceID operand) {
  constexpr XQueryItemKinds possible = Numeric | Untyped | instants | Duration;
  const XQueryItemKinds kinds = checking.atomicKinds(operand);
  if (kinds == None || (kinds & possible) != 0) return true;
  checking.warn(operand, ID::OperandFails,
                {XQueryNameOfKinds(kinds), XQueryLabelOf(*checking.at(whole).expr)});
  return false;
}

void checkArithmetic(XQueryChecking& checking, XQueryPlaceID place, int type) {
  const XQueryPlaceID left = checking.leftOperand(place);
  if (left == XQueryNoPlace) {
    const XQueryPlaceID only = checking.program.firstPart(place);
    if (only != XQueryNoPlace) checkOperand(checking, place, only);
    return;
  }
  const XQueryPlaceID right = checking.rightOperand(place);
  if (!checkOperand(checking, place, left) || !checkOperand(checking, place, right)) return;
  checkUntypedText(checking, left, right);
  checkUntypedText(checking, right, left);
  if (type != XQueryOperatorIDiv) return;
  const auto isUntyped = [&](XQueryPlaceID operand) {
    const XQueryFacts& facts = checking.factsOf(operand);
    return facts.most > 0 && facts.are(Node | Untyped);
  };
  if (isUntyped(left) || isUntyped(right)) checking.warn(place, ID::UntypedIdiv);
}

// Of "union" and its kin, and of "is" and its kin.
void checkNodes(XQueryChecking& checking, XQueryPlaceID place) {
  for (const XQueryPlaceID side : {checking.leftOperand(place), checking.rightOperand(place)}) {
    if (side == XQueryNoPlace) continue;
    const XQueryFacts& facts = checking.factsOf(side);
    if (facts.most == 0 || !facts.are(Atomic)) continue;
    checking.warn(side, ID::OperandFails,
                  {XQueryNameOfKinds(facts.kinds), XQueryLabelOf(*checking.at(place).expr)});
  }
}

void checkRange(XQueryChecking& checking, XQueryPlaceID place) {
  for (const XQueryPlaceID bound : {checking.leftOperand(place), checking.rightOperand(place)}) {
    if (bound == XQueryNoPlace) continue;
    const XQueryFacts& facts = checking.factsOf(bound);
    if (facts.most > 0 && facts.are(Decimal | Double | Float)) {
      checking.warn(bound, ID::RangeOfFractions);
    }
  }
}

}  // namespace

void XQueryCheckOperator(XQueryChecking& checking, XQueryPlaceID place) {
  const int type = checking.as<XQueryOperatorExpr>(place)->operatorType();
  const int operatorClass = XQueryOperatorExpr::operatorClassification(type);
  if (operatorClass == classArithmetic) return checkArithmetic(checking, place, type);
  if (operatorClass == classRange) return checkRange(checking, place);
  if (operatorClass == classSequence || operatorClass == classNode) {
    return checkNodes(checking, place);
  }
  if (operatorClass != classValue && operatorClass != classGeneral) return;
  const Sides sides{checking.leftOperand(place), checking.rightOperand(place), type,
                    operatorClass == classGeneral};
  if (sides.left != XQueryNoPlace) checkComparison(checking, place, sides);
}

// --- comparisons with nothing --------------------------------------------------------------------

void XQueryCheckEmptyComparisons(XQueryChecking& checking, const XQueryUses& uses) {
  WorkPacer pacer;
  for (XQueryPlaceID place = 0; place < checking.program.placeCount(); ++place) {
    pacer.turn();
    const auto* expr = checking.as<XQueryOperatorExpr>(place);
    if (!expr || XQueryOperatorExpr::operatorClassification(expr->operatorType()) != classGeneral) {
      continue;
    }
    const XQueryPlaceID left = checking.leftOperand(place);
    const XQueryPlaceID right = checking.rightOperand(place);
    if (left == XQueryNoPlace) continue;
    if (!checking.mayWellBeEmpty(left) && !checking.mayWellBeEmpty(right)) continue;
    if (!uses.isAskedForTruthOnly(place)) checking.warn(place, ID::EmptyComparison);
  }
}

}  // namespace xquery
