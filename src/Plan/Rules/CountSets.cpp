// How many nodes there are in sets of what paths find.
//
// Pattern     count(A | B), count(A intersect B), count(A except B), of any number of paths, in
//             parentheses or not; exists(), empty(), not() and boolean() of the same
// Facts       the paths begin at the document, in the same focus, and count their nodes: they can
//             be repeated and cannot fail once the document is there
// Operator    XQuerySetCount: the index of the tree knows the ways of names that lead to what each
//             path finds, and how many elements lie on them
// Why         all elements on a way are in a set or none is, and each lies on one way
#include "Plan/Operators/XQuerySetCount.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/NumberQuestions.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace xquery {
namespace {

constexpr size_t mostTerms = 64;

bool isSetOperator(const XQueryExpr& expr) {
  const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr);
  const int type = operation && operation->left() && operation->right() ? operation->operatorType()
                                                                        : XQueryOperatorAnd;
  return type == XQueryOperatorUnion || type == XQueryOperatorIntersect ||
         type == XQueryOperatorExcept;
}

// The paths below an operator and the operators themselves, operands first; empty where there is
// anything else.
XQuerySetCount::Terms termsOf(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  // From the last operand to the first, and turned around.
  XQuerySetCount::Terms terms;
  std::vector<XQueryPlaceID> waiting = {place};
  while (!waiting.empty()) {
    const XQueryPlaceID each = XQueryPlaceInside(program, waiting.back());
    waiting.pop_back();
    if (terms.size() == mostTerms) return {};
    const Ref<XQueryExpr> there = planning.exprAt(each);
    if (planning.isOpen(each) && isSetOperator(*there)) {
      terms.push_back({nullptr, cast<XQueryOperatorExpr>(there.get())->operatorType()});
      waiting.push_back(program.firstPart(each));
      waiting.push_back(program.nextPart(program.firstPart(each)));
      continue;
    }
    XQueryWalkedPath* path = XQueryWalkedPathAt(planning, each);
    const bool isFromDocument = path && path->start() && isa<XQueryRootStep>(path->start()) &&
                                path->start()->predicates().empty() && path->countsNodes();
    if (!isFromDocument) return {};
    terms.push_back({Ref<XQueryWalkedPath>(path), 0});
  }
  std::reverse(terms.begin(), terms.end());
  return terms;
}

}  // namespace

void XQueryCountSets(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto asks =
        planning.isOpen(place) ? XQueryNumberQuestionOf(*program[place].expr) : std::nullopt;
    if (!asks) continue;
    const XQueryPlaceID set =
        XQueryPlaceInside(program, program.firstPart(program.firstPart(place)));
    if (!isSetOperator(*program[set].expr)) continue;
    auto terms = termsOf(planning, set);
    if (terms.size() < 3) continue;
    planning.wrap(place, XQuerySetCount::exprWithPlain(planning.exprAt(place), std::move(terms),
                                                       asks->question));
  }
}

}  // namespace xquery
