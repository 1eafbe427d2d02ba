// Facts of FLWOR and quantified expressions, conditionals and typeswitch.
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/TypeTests/XQueryTypeswitch.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/FactsAnalysis.h"

namespace xquery {
namespace {

// The variables of a clause are its own: who evaluates the whole need not have set them.
void declare(const XQueryBindingExpr& clause, bool isSurelySet, XQueryFacts& facts) {
  const auto declareID = [&](int64_t varID) {
    facts.assigns.add(varID);
    if (isSurelySet) facts.reads.remove(varID);
  };
  declareID(clause.varID());
  if (const auto* forExpr = dyn_cast<XQueryForExpr>(&clause)) declareID(forExpr->posVarID());
}

// How often a FLWOR goes round.
struct Tuples {
  uint8_t least = 1;
  uint8_t most = 1;
};

Tuples tuplesOf(const XQueryFactsAt& at, const XQueryFLWORExpr& expr) {
  Tuples tuples;
  at.forEachPart([&](XQueryPlaceID part) {
    if (at.program[part].expr->kind() != Kind::ForExpr) return;
    const XQueryFacts& bound = at.table[part];
    // An array of a host among the items holds items of its own.
    const bool isKnown = !bound.mayBe(XQueryItems::Other);
    tuples.least = isKnown ? std::min(tuples.least, bound.least) : 0;
    tuples.most = isKnown && tuples.most * bound.most <= 1
                      ? static_cast<uint8_t>(tuples.most * bound.most)
                      : XQueryFacts::many;
  });
  if (expr.whereExpr()) tuples.least = 0;
  if (expr.forLet().empty()) tuples.least = tuples.most = 0;
  return tuples;
}

// "for $x in P return $x" keeps the order of P.
bool handsOnItsItems(const XQueryFactsAt& at, const XQueryFLWORExpr& expr) {
  if (expr.forLet().size() != 1 || !expr.orderSpecs().empty()) return false;
  const XQueryPlaceID answer = at.program.part(at.place, XQueryRole::Return);
  const XQueryPlaceID clause = at.program.part(at.place, XQueryRole::Clause);
  if (answer == XQueryNoPlace || at.program[clause].expr->kind() != Kind::ForExpr) return false;
  const auto* variable = dyn_cast<XQueryVariable>(at.program[answer].expr);
  return variable && variable->varID() == expr.forLet().front()->varID();
}

// The first clause that loops is evaluated whatever there is, and so are those that take a value
// before it.
bool findsRootAtOnce(const XQueryFactsAt& at) {
  for (XQueryPlaceID part = at.program.firstPart(at.place);
       part != XQueryNoPlace && at.program[part].role == XQueryRole::Clause;
       part = at.program.nextPart(part)) {
    if (at.table[part].findsRoot) return true;
    if (at.program[part].expr->kind() != Kind::LetExpr) break;
  }
  return false;
}

}  // namespace

// Of a clause they are those of what its variable takes; an item of it, for those that take one
// after another.
void XQueryFactsOfBinding(const XQueryFactsAt& at, XQueryFacts& facts) {
  const XQueryFacts bound = at.partOrNone(XQueryRole::Bound);
  facts.setItems(bound);
  facts.findsRoot = bound.findsRoot;
  const auto& clause = at.expr<XQueryBindingExpr>();
  if (!clause.type()) return;
  facts.deeds |= XQueryDeeds::MayFail;
  if (clause.kind() == Kind::LetExpr) return XQueryRestrictToType(clause.type(), facts);
  XQueryFacts item = XQueryFacts::one(facts.kinds);
  XQueryRestrictToType(clause.type(), item);
  // An array inside an array may match as its items do.
  if (!facts.mayBe(XQueryItems::Other)) facts.kinds = item.kinds;
}

void XQueryFactsOfCase(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.setItems(at.partOrNone(XQueryRole::Case));
  declare(at.expr<XQueryCaseClauseExpr>(), true, facts);
}

void XQueryFactsOfOrderSpec(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.setItems(at.partOrNone(XQueryRole::OrderKey));
}

void XQueryFactsOfFLWOR(const XQueryFactsAt& at, XQueryFacts& facts) {
  const auto& expr = at.expr<XQueryFLWORExpr>();
  const Tuples tuples = tuplesOf(at, expr);
  XQueryFacts items = at.partOrNone(XQueryRole::Return);
  const uint8_t most = static_cast<uint8_t>(tuples.most * items.most);
  items.least = std::min<uint8_t>(XQueryFacts::many, tuples.least * items.least);
  items.most = std::min(most, XQueryFacts::many);
  items.inOrder = tuples.most <= 1 && expr.orderSpecs().empty() && items.inOrder;
  if (handsOnItsItems(at, expr)) {
    items.inOrder = at.table[at.program.part(at.place, XQueryRole::Clause)].inOrder;
  }
  facts.setItems(items);
  facts.findsRoot = findsRootAtOnce(at);
  for (const auto& clause : expr.forLet()) declare(*clause, true, facts);
}

void XQueryFactsOfQuantifier(const XQueryFactsAt& at, XQueryFacts& facts) {
  XQueryItemKinds kinds = XQueryItems::Boolean;
  // A binding of a wrong type makes an error record the answer.
  at.forEachPart([&](XQueryPlaceID part) {
    const auto* clause = dyn_cast<XQueryQuantifiedExprItem>(at.program[part].expr);
    if (!clause) return;
    if (clause->type()) kinds |= XQueryItems::Other;
    declare(*clause, at.table.setsSurely(part), facts);
  });
  kinds |= at.partOrNone(XQueryRole::Satisfies).kinds & XQueryItems::Other;
  if ((kinds & XQueryItems::Other) != 0) facts.deeds |= XQueryDeeds::MayFail;
  facts.setItems(kinds, 1, 1);
  facts.findsRoot = findsRootAtOnce(at);
}

void XQueryFactsOfConditional(const XQueryFactsAt& at, XQueryFacts& facts) {
  XQueryFacts items = XQueryFacts::nothingYet();
  int branches = 0;
  at.forEachPart([&](XQueryPlaceID part) {
    if (at.program[part].role != XQueryRole::Branch) return;
    items.orItems(at.table[part]);
    ++branches;
  });
  if (branches < 2) items.orItems(XQueryFacts::none());
  facts.setItems(items);
  // An error record is no truth, and what was never set no answer.
  const bool mayHoldErrors = at.partOrNone(XQueryRole::Test).mayBe(XQueryItems::Other);
  if (mayHoldErrors || items.mayBe(XQueryItems::Other)) facts.deeds |= XQueryDeeds::MayFail;
}

void XQueryFactsOfTypeswitch(const XQueryFactsAt& at, XQueryFacts& facts) {
  XQueryFacts items = XQueryFacts::nothingYet();
  at.forEachPart([&](XQueryPlaceID part) {
    if (at.program[part].role == XQueryRole::Clause) items.orItems(at.table[part]);
  });
  // An error record for an operand is the answer.
  const XQueryFacts operand = at.partOrNone(XQueryRole::Switched);
  if (operand.mayBe(XQueryItems::Other)) items.orItems(XQueryFacts::one(XQueryItems::Other));
  facts.setItems(items);
}

}  // namespace xquery
