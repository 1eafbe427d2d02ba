// Facts of literals, variables, "." and what stands in a query without being evaluated.
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQuerySequence.h"
#include "Plan/FactsAnalysis.h"

namespace xquery {
namespace {

XQueryFacts factsOfValue(const Value& value) {
  const XQueryItemList items(value.get());
  XQueryFacts facts = XQueryFacts::none();
  for (size_t i = 0; i < items.count(); ++i) {
    facts.appendItems(XQueryFacts::one(XQueryKindsOfItem(*items[i])));
  }
  return facts;
}

// One of the items of the value. An array among them, which only a host makes, may be anything.
XQueryFacts oneItemOf(const XQueryFacts& value) {
  if (value.mayBe(XQueryItems::Other)) return {};
  XQueryFacts facts = XQueryFacts::one(value.kinds);
  if (facts.are(XQueryItems::Node)) facts.tree = value.tree;
  return facts;
}

XQueryFacts valueOfBinder(const XQueryFactsAt& at, XQueryPlaceID binder, int64_t varID) {
  const XQueryExpr* clause = at.program[binder].expr;
  const XQueryFacts& bound = at.table[binder];
  switch (clause->kind()) {
    case Kind::ForExpr:
      if (cast<XQueryForExpr>(clause)->posVarID() == varID) {
        return XQueryFacts::one(XQueryItems::Numeric);
      }
      // The values of a for clause are flattened: no array is left among the items.
      return XQueryFacts::one(bound.kinds);
    case Kind::QuantifiedItem:
      return oneItemOf(bound);
    case Kind::LetExpr:
      return bound;
    case Kind::CaseClause: {
      // Its own facts are those of what it answers; the variable has the operand's.
      const XQueryPlaceID whole = at.program[binder].parent;
      XQueryFacts facts = at.table[at.program.part(whole, XQueryRole::Switched)];
      const XQueryPlaceID type = at.program.part(binder, XQueryRole::Type);
      if (type != XQueryNoPlace) XQueryRestrictToType(at.program[type].expr, facts);
      return facts;
    }
    default:
      return {};
  }
}

}  // namespace

void XQueryFactsOfLiteral(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.setItems(factsOfValue(at.expr<XQueryLiteral>().literalValue()));
}

void XQueryFactsOfVariable(const XQueryFactsAt& at, XQueryFacts& facts) {
  const int64_t varID = at.expr<XQueryVariable>().varID();
  if (varID == 0) {
    facts.deeds |= XQueryDeeds::ReadsGlobals | XQueryDeeds::MayFail;
    return;
  }
  facts.reads.add(varID);
  const XQueryPlaceID binder = at.here().binder;
  if (!at.table.isSurelySet(at.place)) {
    facts.deeds |= XQueryDeeds::MayFail;
    return;
  }
  facts.setItems(valueOfBinder(at, binder, varID));
  // What was found in one focus says nothing of the tree of another one.
  if (at.program[binder].focus != at.here().focus && facts.tree == XQueryTreeFact::OfContext) {
    facts.tree = XQueryTreeFact::Any;
  }
}

XQueryFacts XQueryFactsAt::itemOfFocus(XQueryPlaceID focus) const {
  if (focus == XQueryNoPlace) return {};
  const XQueryPlace& setter = program[focus];
  if (setter.role == XQueryRole::Step) {
    // What reaches a later filter step are nodes, but for the items of the first step.
    const XQueryStep* first = cast<XQueryPathExpr>(program[setter.parent].expr)->step();
    const bool areNodes = isa<XQueryAxisStep>(first) || first->next() != setter.step;
    if (areNodes) return XQueryFacts::one(XQueryItems::Node);
    const XQueryFacts item = oneItemOf(table[program.part(setter.parent, XQueryRole::FirstStep)]);
    return item.are(XQueryItems::Node) ? XQueryFacts::one(XQueryItems::Node) : item;
  }
  if (const auto* step = dyn_cast<XQueryAxisStep>(setter.step)) {
    return XQueryFacts::one(XQueryKindsOfStep(*step));
  }
  // A predicate of a filter step is asked for the items of its expression.
  for (XQueryPlaceID part = program.firstPart(setter.parent); part != focus;
       part = program.nextPart(part)) {
    const bool isPrimary =
        program[part].role == XQueryRole::FirstStep || program[part].role == XQueryRole::Step;
    if (isPrimary && program[part].step == setter.step) return oneItemOf(table[part]);
  }
  return {};
}

void XQueryFactsOfContextItem(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.deeds |= XQueryDeeds::ReadsItem;
  facts.setItems(at.itemOfFocus(at.here().focus));
  if (facts.are(XQueryItems::Node)) facts.tree = XQueryTreeFact::OfContext;
}

void XQueryFactsOfQNameReference(const XQueryFactsAt&, XQueryFacts& facts) {
  facts.deeds |= XQueryDeeds::ReadsStatic;
  facts.setItems(XQueryItems::QName, 1, 1);
}

void XQueryFactsOfNoValue(const XQueryFactsAt&, XQueryFacts&) {}

}  // namespace xquery
