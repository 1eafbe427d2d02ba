#include "Plan/FactsAnalysis.h"

#include "Platform/Base/WorkMeter.h"

#include <array>
#include <cstddef>

namespace xquery {
namespace {

struct Row {
  Kind kind;
  XQueryConclude conclude;
  // Whether it may fail where none of its parts has failed.
  bool mayFail;
};

constexpr std::array rows = {
    Row{Kind::Literal, XQueryFactsOfLiteral, false},
    Row{Kind::Variable, XQueryFactsOfVariable, false},
    Row{Kind::ContextItemExpr, XQueryFactsOfContextItem, false},
    Row{Kind::QNameReference, XQueryFactsOfQNameReference, true},
    Row{Kind::NameTest, XQueryFactsOfNoValue, false},
    Row{Kind::WildCardNameTest, XQueryFactsOfNoValue, false},
    Row{Kind::TypeDeclaration, XQueryFactsOfNoValue, false},
    Row{Kind::Args, XQueryFactsOfNoValue, false},
    Row{Kind::ExprList, XQueryFactsOfList, false},
    Row{Kind::OperatorExpr, XQueryFactsOfOperator, false},
    Row{Kind::InstanceOfExpr, XQueryFactsOfTruth, true},
    Row{Kind::CastableExpr, XQueryFactsOfTruth, true},
    Row{Kind::TreatExpr, XQueryFactsOfTreat, true},
    Row{Kind::CastExpr, XQueryFactsOfCast, true},
    Row{Kind::RootStepExpr, XQueryFactsOfRoot, false},
    Row{Kind::PathExpr, XQueryFactsOfPath, false},
    Row{Kind::ForExpr, XQueryFactsOfBinding, false},
    Row{Kind::LetExpr, XQueryFactsOfBinding, false},
    Row{Kind::QuantifiedItem, XQueryFactsOfBinding, false},
    Row{Kind::CaseClause, XQueryFactsOfCase, false},
    Row{Kind::OrderSpec, XQueryFactsOfOrderSpec, true},
    Row{Kind::OrderExpr, XQueryFactsOfList, false},
    Row{Kind::FLWORExpr, XQueryFactsOfFLWOR, false},
    Row{Kind::QuantifiedExpr, XQueryFactsOfQuantifier, false},
    Row{Kind::ConditionalExpr, XQueryFactsOfConditional, false},
    Row{Kind::TypeswitchExpr, XQueryFactsOfTypeswitch, true},
    Row{Kind::ElementExpr, XQueryFactsOfConstructor, true},
    Row{Kind::AttributeExpr, XQueryFactsOfConstructor, true},
    Row{Kind::ComputedAttributeExpr, XQueryFactsOfConstructor, true},
    Row{Kind::TextExpr, XQueryFactsOfConstructor, true},
    Row{Kind::CommentExpr, XQueryFactsOfConstructor, true},
    Row{Kind::ProcessingInstructionExpr, XQueryFactsOfConstructor, true},
    Row{Kind::DocumentExpr, XQueryFactsOfConstructor, true},
    Row{Kind::NamespaceExpr, XQueryFactsOfConstructor, true},
    Row{Kind::FunctionCall, XQueryFactsOfCall, false},
};

using RowsByKind = std::array<const Row*, 256>;

const RowsByKind& rowsByKind() {
  static const RowsByKind table = [] {
    RowsByKind found{};
    for (const Row& row : rows) found[static_cast<size_t>(row.kind)] = &row;
    return found;
  }();
  return table;
}

constexpr XQueryFacts anything() {
  XQueryFacts facts;
  facts.deeds = XQueryDeeds::IsUnrepeatable | XQueryDeeds::MayFail;
  return facts;
}

// What all the parts of a place read and do.
XQueryFacts deedsOfParts(const XQueryFactsAt& at) {
  XQueryFacts facts;
  at.forEachPart([&](XQueryPlaceID part) {
    const XQueryRoleTraits traits = XQueryTraitsOf(at.program[part].role);
    if (traits.isNoValue) return;
    if (traits.hasOwnFocus) {
      facts.addDeedsWithin(at.table[part]);
    } else {
      facts.addDeeds(at.table[part]);
      if (!traits.isOptional && at.table[part].findsRoot) facts.findsRoot = true;
    }
  });
  return facts;
}

XQueryFacts factsAt(const XQueryFactsAt& at) {
  const Row* row = rowsByKind()[static_cast<size_t>(at.here().expr->kind())];
  if (!row) return anything();
  XQueryFacts facts = deedsOfParts(at);
  if (row->mayFail) facts.deeds |= XQueryDeeds::MayFail;
  row->conclude(at, facts);
  facts.settle();
  return facts;
}

}  // namespace

XQueryFactTable::XQueryFactTable(const XQueryProgram& program)
    : _program(program), _facts(program.placeCount()) {
  for (const XQueryProgramBody& body : program.bodies()) {
    if (body.function) _functions.emplace(body.function, XQueryFacts::nothingYet());
  }
  analyse();
  // Each round makes some summary say less, of which there is little to be said; programs that need
  // more rounds than this are known too little about to wait for.
  constexpr int mostRounds = 12;
  for (int round = 0; summarize(); ++round) {
    if (round == mostRounds) {
      for (auto& summary : _functions) summary.second = anything();
      analyse();
      return;
    }
    analyse();
  }
}

void XQueryFactTable::analyse() {
  WorkPacer pacer;
  for (const XQueryPlaceID place : _program.partsFirst()) {
    pacer.turn();
    _facts[place] = factsAt(XQueryFactsAt(_program, *this, place));
  }
}

// Takes the facts of the bodies for those of the functions; false when no summary has changed.
bool XQueryFactTable::summarize() {
  bool hasChanged = false;
  for (const XQueryProgramBody& body : _program.bodies()) {
    if (!body.function) continue;
    XQueryFacts summary = _facts[body.place];
    // A call has variables of its own, and the caller's focus.
    summary.reads = {};
    summary.assigns = {};
    XQueryFacts& known = _functions[body.function];
    hasChanged = hasChanged || !(summary == known);
    known = summary;
  }
  return hasChanged;
}

const XQueryFacts& XQueryFactTable::ofFunction(const XQueryFunctionDecl* function) const {
  static const XQueryFacts unknown = anything();
  const auto found = _functions.find(function);
  return found == _functions.end() ? unknown : found->second;
}

bool XQueryFactTable::isSurelySet(XQueryPlaceID variable) const {
  const XQueryPlaceID binder = _program[variable].binder;
  if (binder == XQueryNoPlace) return false;
  switch (_program[binder].expr->kind()) {
    case Kind::QuantifiedItem:
      return variable < _program[_program[binder].parent].end && setsSurely(binder);
    case Kind::CaseClause:
      return variable < _program[binder].end;
    default:
      return true;
  }
}

// It is not set when its clause had no items: the next one is tried in its place. The condition is
// asked for an item of the last clause only.
bool XQueryFactTable::setsSurely(XQueryPlaceID clause) const {
  const XQueryFacts& items = _facts[clause];
  if (items.least > 0 && !items.mayBe(XQueryItems::Other)) return true;
  const XQueryPlaceID next = _program.nextPart(clause);
  return next == XQueryNoPlace || _program[next].role != XQueryRole::Clause;
}

}  // namespace xquery
