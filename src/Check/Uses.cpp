#include "Check/Uses.h"

#include "Check/Checking.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryFunctionCall.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <array>

namespace xquery {
namespace {

// An ID of a local variable is given again once its clause has ended; with the clause it is one of
// a kind.
uint64_t keyOf(XQueryPlaceID binder, int64_t varID) {
  return uint64_t{binder} << 32 | static_cast<uint32_t>(varID);
}

const std::vector<XQueryPlaceID>& found(const auto& table, const auto& key) {
  static const std::vector<XQueryPlaceID> none;
  const auto entry = table.find(key);
  return entry == table.end() ? none : entry->second;
}

// Functions that hand on the items of their first argument, or tell where in it an item stands.
// Not "reverse": who calls it knows the order.
constexpr auto showingOrder = std::to_array<std::string_view>(
    {"subsequence", "insert-before", "remove", "index-of", "string-join", "data", "trace",
     "one-or-more", "zero-or-one", "exactly-one", "deep-equal"});

// How many places a question follows a value to.
constexpr size_t mostPlaces = 200;

void handOn(const std::vector<XQueryPlaceID>& to, std::vector<XQueryPlaceID>& next) {
  const size_t count = std::min(to.size(), mostPlaces + 1);
  next.insert(next.end(), to.begin(), to.begin() + static_cast<ptrdiff_t>(count));
}

}  // namespace

XQueryUses::XQueryUses(const XQueryChecking& checking)
    : _checking(checking), _program(checking.program) {
  WorkPacer pacer;
  for (XQueryPlaceID place = 0; place < _program.placeCount(); ++place) {
    pacer.turn();
    if (const auto* call = checking.as<XQueryFunctionCall>(place)) {
      if (call->functionDecl()) _calls[call->functionDecl()].push_back(place);
    }
    const auto* variable = checking.as<XQueryVariable>(place);
    if (!variable) continue;
    if (const auto* global = globalReadIn(place)) {
      _globals[global].push_back(place);
    } else if (variable->varID() != 0) {
      const XQueryPlaceID binder = _program[place].binder;
      const bool isParameter = binder == XQueryNoPlace;
      const XQueryPlaceID owner = isParameter ? _program.bodyOf(place).place : binder;
      _locals[keyOf(owner, variable->varID())].push_back(place);
    }
  }
}

const XQueryVarDecl* XQueryUses::globalReadIn(XQueryPlaceID place) const {
  const auto* variable = _checking.as<XQueryVariable>(place);
  if (!variable || variable->varID() != 0) return nullptr;
  const XQueryProlog& prolog = *_program.bodyOf(place).prolog;
  const auto qName = prolog.variableQNameFromString(variable->name());
  return qName ? prolog.variableInfoForQName(qName) : nullptr;
}

const std::vector<XQueryPlaceID>& XQueryUses::callsOf(const XQueryFunctionDecl* function) const {
  return found(_calls, function);
}

const std::vector<XQueryPlaceID>& XQueryUses::readsOf(const XQueryVarDecl* variable) const {
  return found(_globals, variable);
}

const std::vector<XQueryPlaceID>& XQueryUses::readsOf(XQueryPlaceID binder, int64_t varID) const {
  return found(_locals, keyOf(binder, varID));
}

bool XQueryUses::isAskedForTruthOnly(XQueryPlaceID place) const {
  return isHidden(place, Question::Truth);
}

bool XQueryUses::showsOrder(XQueryPlaceID place) const {
  return !isHidden(place, Question::Order);
}

bool XQueryUses::isHidden(XQueryPlaceID place, Question question) const {
  std::vector<XQueryPlaceID> places{place};
  for (size_t index = 0; index < places.size(); ++index) {
    std::vector<XQueryPlaceID> next;
    const Taken taken = takerOf(places[index], question, next);
    if (taken == Taken::Shown) return false;
    for (const XQueryPlaceID each : next) {
      if (std::find(places.begin(), places.end(), each) == places.end()) places.push_back(each);
    }
    if (places.size() > mostPlaces) return true;
  }
  return true;
}

XQueryUses::Taken XQueryUses::takerOf(XQueryPlaceID place, Question question,
                                      std::vector<XQueryPlaceID>& next) const {
  const XQueryPlace& at = _program[place];
  switch (at.role) {
    case XQueryRole::Test:
    case XQueryRole::Where:
    case XQueryRole::Satisfies:
    case XQueryRole::Predicate:
      return Taken::Hidden;
    case XQueryRole::LaterOperand:
      return Taken::Hidden;
    case XQueryRole::Operand: {
      if (question == Question::Order) return Taken::Hidden;
      const auto* whole = _checking.as<XQueryOperatorExpr>(at.parent);
      const bool isLogical =
          whole && XQueryOperatorExpr::operatorClassification(whole->operatorType()) == 1;
      return isLogical ? Taken::Hidden : Taken::Shown;
    }
    case XQueryRole::Element:
      // One of several is a part of a longer value.
      if (const auto* list = _checking.as<XQueryExprList>(at.parent);
          list && list->count() > 1 && question == Question::Truth) {
        return Taken::Shown;
      }
      next.push_back(at.parent);
      return Taken::HandedOn;
    case XQueryRole::Branch:
      next.push_back(at.parent);
      return Taken::HandedOn;
    case XQueryRole::Case:
      next.push_back(_program[at.parent].parent);
      return Taken::HandedOn;
    case XQueryRole::Argument:
      return takenByCall(place, question, next);
    case XQueryRole::Body:
      return takenByBody(place, next);
    case XQueryRole::Return:
    case XQueryRole::Bound:
      return takenByClause(place, question, next);
    case XQueryRole::FirstStep:
      return question == Question::Truth ? Taken::Shown : takenByPath(place, next);
    default:
      return Taken::Shown;
  }
}

XQueryUses::Taken XQueryUses::takenByCall(XQueryPlaceID place, Question question,
                                          std::vector<XQueryPlaceID>& next) const {
  const XQueryPlaceID list = _program[place].parent;
  const XQueryPlaceID whole = _program[list].parent;
  const auto* call = _checking.as<XQueryFunctionCall>(whole);
  if (!call) return Taken::Shown;
  if (const auto* function = call->functionDecl()) {
    size_t index = 0;
    for (XQueryPlaceID each = _program.firstPart(list); each != place && each != XQueryNoPlace;
         each = _program.nextPart(each)) {
      ++index;
    }
    const auto* body = _checking.bodyOf(function);
    if (!body || index >= function->params().size()) return Taken::Hidden;
    const auto& reads = readsOf(body->place, function->params()[index]->varID());
    handOn(reads, next);
    return Taken::HandedOn;
  }
  const std::string_view name = _checking.functionCalledIn(whole);
  if (question == Question::Truth) {
    return name == "not" || name == "boolean" ? Taken::Hidden : Taken::Shown;
  }
  const bool isShowing =
      std::find(showingOrder.begin(), showingOrder.end(), name) != showingOrder.end();
  return isShowing ? Taken::Shown : Taken::Hidden;
}

XQueryUses::Taken XQueryUses::takenByBody(XQueryPlaceID place,
                                          std::vector<XQueryPlaceID>& next) const {
  const XQueryProgramBody& body = _program.bodyOf(place);
  if (!body.function && !body.variable) return Taken::Shown;
  const auto& users = body.function ? callsOf(body.function) : readsOf(body.variable);
  handOn(users, next);
  return Taken::HandedOn;
}

XQueryUses::Taken XQueryUses::takenByClause(XQueryPlaceID place, Question question,
                                            std::vector<XQueryPlaceID>& next) const {
  const XQueryPlaceID whole = _program[place].parent;
  if (_program[place].role == XQueryRole::Return) {
    const bool isOne = _checking.factsOf(whole).most <= 1;
    if (question == Question::Truth && !isOne) return Taken::Shown;
    const auto* flwor = _checking.as<XQueryFLWORExpr>(whole);
    const bool isSorted = flwor && !flwor->orderSpecs().empty();
    if (isSorted && question == Question::Order) return Taken::Hidden;
    next.push_back(whole);
    return Taken::HandedOn;
  }
  const auto* clause = _checking.as<XQueryBindingExpr>(whole);
  if (clause && clause->kind() == Kind::LetExpr) {
    const auto& reads = readsOf(whole, clause->varID());
    handOn(reads, next);
    return Taken::HandedOn;
  }
  if (question == Question::Truth) return Taken::Shown;
  if (clause && clause->kind() == Kind::QuantifiedItem) return Taken::Hidden;
  // The items of a for clause are taken one after another: the order shows in what is returned.
  const XQueryPlaceID flwor = _program[whole].parent;
  const auto* expr = _checking.as<XQueryFLWORExpr>(flwor);
  if (!expr || !expr->orderSpecs().empty()) return Taken::Hidden;
  next.push_back(flwor);
  return Taken::HandedOn;
}

// Nodes are sorted again behind the next axis step.
XQueryUses::Taken XQueryUses::takenByPath(XQueryPlaceID place,
                                          std::vector<XQueryPlaceID>& next) const {
  const XQueryPlaceID whole = _program[place].parent;
  const auto* path = _checking.as<XQueryPathExpr>(whole);
  if (!path || !path->step()) return Taken::Shown;
  if (!path->step()->predicates().empty()) return Taken::Shown;
  for (const XQueryStep* step = path->step()->next(); step; step = step->next()) {
    if (isa<XQueryAxisStep>(step)) return Taken::Hidden;
  }
  next.push_back(whole);
  return Taken::HandedOn;
}

}  // namespace xquery
