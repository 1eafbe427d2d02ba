// Clauses that XQuery 1.0 takes otherwise: "order by" and quantifiers of several variables.
#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

void checkKey(XQueryChecking& checking, XQueryPlaceID spec) {
  const XQueryPlaceID key = checking.program.part(spec, XQueryRole::OrderKey);
  if (key == XQueryNoPlace) return;
  constexpr XQueryItemKinds ordered = Node | Untyped | String | Boolean | Numeric | Other;
  const XQueryFacts& facts = checking.factsOf(key);
  if (facts.most == 0 || facts.mayBe(ordered)) return;
  checking.warn(key, ID::OrderKey, {XQueryNameOfKinds(facts.kinds)});
}

}  // namespace

void XQueryCheckFLWOR(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& specs = checking.as<XQueryFLWORExpr>(place)->orderSpecs();
  if (specs.empty()) return;
  const XQueryOrderSpec& first = *specs.front();
  for (XQueryPlaceID part = checking.program.firstPart(place); part != XQueryNoPlace;
       part = checking.program.nextPart(part)) {
    const auto* spec = checking.as<XQueryOrderSpec>(part);
    if (!spec) continue;
    if (spec->ascending() != first.ascending()) checking.warn(part, ID::OrderDirections);
    if (spec->emptyLeast() != first.emptyLeast()) checking.warn(part, ID::OrderEmpty);
    if (spec->collation() && !XQueryIsCodepointCollation(spec->collation()->utf8())) {
      checking.warn(part, ID::Collation, {"\"" + spec->collation()->utf8() + "\""});
    }
    checkKey(checking, part);
  }
}

namespace {

bool readsAnyOf(const XQueryChecking& checking, XQueryPlaceID place, int64_t varID) {
  XQueryVariableSet variable;
  variable.add(varID);
  return checking.factsOf(place).reads.meets(variable);
}

// With a variable that has no value the condition is hardly ever true: "some" answers as in XQuery
// 1.0 then, where the condition or a later clause reads it.
bool isHarmless(const XQueryChecking& checking, XQueryPlaceID whole, XQueryPlaceID clause) {
  if (checking.as<XQueryQuantifiedExpr>(whole)->every()) return false;
  const int64_t varID = checking.as<XQueryBindingExpr>(clause)->varID();
  for (XQueryPlaceID later = checking.program.nextPart(clause); later != XQueryNoPlace;
       later = checking.program.nextPart(later)) {
    if (readsAnyOf(checking, later, varID)) return true;
  }
  return false;
}

bool mayWellBeEmpty(const XQueryChecking& checking, XQueryPlaceID clause) {
  const XQueryPlaceID bound = checking.program.part(clause, XQueryRole::Bound);
  return bound == XQueryNoPlace || checking.mayWellBeEmpty(bound);
}

}  // namespace

void XQueryCheckQuantifier(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& expr = *checking.as<XQueryQuantifiedExpr>(place);
  if (expr.items().size() < 2) return;
  for (XQueryPlaceID part = checking.program.firstPart(place); part != XQueryNoPlace;
       part = checking.program.nextPart(part)) {
    const bool isLast = checking.at(part).expr == expr.items().back().get();
    if (isLast || checking.at(part).role != XQueryRole::Clause) continue;
    if (!mayWellBeEmpty(checking, part) || isHarmless(checking, place, part)) continue;
    checking.warn(part, ID::QuantifierClauses, {expr.every() ? "every" : "some"});
  }
}

}  // namespace xquery
