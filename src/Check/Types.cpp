// Sequence types where they are looked at: "instance of", "treat as", "typeswitch", and the
// variables of for, let and quantifiers.
#include "Check/Checking.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Labels.h"

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

bool isKindTest(const XQueryTypeDeclaration& type) {
  return type.type() >= XQueryTypeDeclaration::DocumentTest;
}

bool takesSeveral(const XQueryTypeDeclaration& type) {
  return type.occuranceType() == XQueryTypeDeclaration::ZeroOrMore ||
         type.occuranceType() == XQueryTypeDeclaration::OneOrMore;
}

// Whether a value of which so much is known can be of the type at all.
bool isPossible(const XQueryTypeDeclaration& type, const XQueryFacts& value) {
  if (value.least > 0 && value.most == 0) return true;  // it never answers
  if (type.type() == XQueryTypeDeclaration::Empty) return value.least == 0;
  if (value.least == 0 && type.acceptsCount(0)) return true;
  if (value.most == 0) return false;
  // A test that looks into documents is told of by itself, and so is a name of no type.
  if (isKindTest(type) && type.data()) return true;
  if (type.type() == XQueryTypeDeclaration::Atomic && type.typeID() == XQueryTypeNone) return true;
  if (value.mayBe(Other)) return true;
  XQueryFacts restricted = value;
  restricted.least = 0;
  XQueryRestrictToType(&type, restricted);
  return restricted.kinds != None;
}

bool isPosition(const XQueryChecking& checking, XQueryPlaceID operand) {
  if (operand == XQueryNoPlace) return false;
  const XQueryPlaceID inner = checking.program.withoutParentheses(operand);
  const auto* variable = checking.as<XQueryVariable>(inner);
  const auto* clause = variable ? checking.as<XQueryForExpr>(checking.at(inner).binder) : nullptr;
  return clause && variable->varID() != 0 && clause->posVarID() == variable->varID();
}

bool isInteger(const XQueryTypeDeclaration& type) {
  return type.type() == XQueryTypeDeclaration::Atomic && type.typeID() != XQueryTypeNone &&
         XQueryIsKindOfType(type.typeID(), XQueryTypeInteger);
}

bool isString(const XQueryTypeDeclaration& type) {
  return type.type() == XQueryTypeDeclaration::Atomic && type.typeID() == XQueryTypeString;
}

// Names the value, where that says more than the type; false where there is nothing to say.
bool warnOfOperand(XQueryChecking& checking, XQueryPlaceID place, const XQueryTypeDeclaration& type,
                   XQueryPlaceID operand) {
  if (isInteger(type) && isPosition(checking, operand)) {
    checking.warn(place, ID::PositionIsDouble,
                  {checking.inside<XQueryVariable>(operand)->name()->utf8(), XQueryLabelOf(type)});
    return true;
  }
  if (!checking.givesUntypedText(operand) || !isString(type)) return false;
  checking.warn(place, ID::UntypedText,
                {std::string(checking.functionCalledIn(operand)), "is no " + XQueryLabelOf(type)});
  return true;
}

void checkType(XQueryChecking& checking, XQueryPlaceID place, const XQueryTypeDeclaration& type,
               const XQueryFacts& value, XQueryPlaceID operand) {
  if (warnOfOperand(checking, place, type, operand)) return;
  if (!isPossible(type, value)) {
    checking.warn(place, ID::ImpossibleType, {XQueryLabelOf(type)});
    return;
  }
  const bool isPlus = type.occuranceType() == XQueryTypeDeclaration::OneOrMore;
  if (isPlus && value.least < XQueryFacts::many && value.most > 0) {
    checking.warn(place, ID::PlusType);
  }
  if (isKindTest(type) && takesSeveral(type) && value.most > 1 && value.mayBe(Node)) {
    checking.warn(place, ID::NodeSequenceType, {XQueryLabelOf(type)});
  }
  constexpr XQueryItemKinds typed = Atomic & ~Untyped;
  if (type.typeID() == XQueryTypeUntypedAtomic && value.mayBe(typed)) {
    checking.warn(place, ID::UntypedType, {XQueryLabelOf(type)});
  }
}

}  // namespace

void XQueryCheckAnyType(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& type = *checking.as<XQueryTypeDeclaration>(place);
  if (type.type() == XQueryTypeDeclaration::Atomic && type.typeID() == XQueryTypeNone) {
    checking.warn(place, ID::UnknownType, {XQueryLabelOf(type)});
  }
  if (type.type() == XQueryTypeDeclaration::DocumentTest && type.data()) {
    checking.warn(place, ID::DocumentTest);
  }
}

void XQueryCheckTypedExpr(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& expr = *checking.as<XQueryTypedExpr>(place);
  XQueryPlaceID operand = checking.program.part(place, XQueryRole::Operand);
  if (operand == XQueryNoPlace) operand = checking.program.part(place, XQueryRole::Element);
  const XQueryFacts value =
      operand == XQueryNoPlace ? XQueryFacts::none() : checking.factsOf(operand);
  checkType(checking, place, expr.type(), value, operand);
}

void XQueryCheckBindingType(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& clause = *checking.as<XQueryBindingExpr>(place);
  const XQueryPlaceID bound = checking.program.part(place, XQueryRole::Bound);
  if (!clause.type() || bound == XQueryNoPlace) return;
  XQueryFacts value = checking.factsOf(bound);
  const bool isWhole = clause.kind() == Kind::LetExpr;
  if (!isWhole) value.least = value.most = std::min<uint8_t>(value.most, 1);
  checkType(checking, place, *clause.type(), value, isWhole ? bound : XQueryNoPlace);
}

void XQueryCheckTypeswitch(XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryPlaceID operand = checking.program.part(place, XQueryRole::Switched);
  const XQueryFacts value =
      operand == XQueryNoPlace ? XQueryFacts::none() : checking.factsOf(operand);
  for (XQueryPlaceID part = checking.program.firstPart(place); part != XQueryNoPlace;
       part = checking.program.nextPart(part)) {
    const auto* clause = checking.as<XQueryBindingExpr>(part);
    if (clause && clause->type()) checkType(checking, part, *clause->type(), value, operand);
  }
}

}  // namespace xquery
