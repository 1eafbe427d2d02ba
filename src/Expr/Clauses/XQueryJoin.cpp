#include "Expr/Clauses/XQueryJoin.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryClauseItems.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "xquery/Number.h"

#include <algorithm>
#include <array>
#include <utility>

namespace xquery {
namespace {

// Joins whose items depend on more variables are left alone.
constexpr size_t mostVariables = 6;

// Evaluates what the plain way may not have come to evaluate yet, and may never: null for an error,
// which leaves nothing behind. That goes for limits as well, such as a range of too many items; one
// that ends the whole evaluation is reached again at the next look at the work.
Value valueOrNull(const XQueryExpr& expr, XQueryContext& context) {
  auto& dynamic = context._internal();
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  const Ref<XQueryError> error = dynamic.error();
  Value value = expr.evaluateWithContext(context);
  if (!XQueryHasFailed(value, context)) return value;
  dynamic.passOverFailure(error);
  dynamic.setContextItem(item, position);
  dynamic.setLast(last);
  return {};
}

// Where it has to be known for every round.
bool isBrieflySettledAround(const Value& value) {
  constexpr size_t mostItems = 4096;
  return XQueryItemList(value.get()).count() <= mostItems && XQueryAreSettled({&value, 1}, true);
}

// Whether what probe and guards find outside their nodes is the same for the whole round, whatever
// is constructed meanwhile.
bool staysInRound(const XQueryJoinCondition& condition, XQueryContext& context) {
  const auto& dynamic = context._internal();
  return std::all_of(
      condition.outward.begin(), condition.outward.end(), [&](const XQueryReads& reads) {
        if (reads.globals) return false;
        if (reads.focus && !isBrieflySettledAround(dynamic.contextItem())) return false;
        return std::all_of(reads.variables.begin(), reads.variables.end(), [&](int64_t varID) {
          return isBrieflySettledAround(dynamic.variableForID(varID));
        });
      });
}

enum class Answer : uint8_t { No, Yes, Failure };

// What the conditions, joined by "and", come to.
Answer answerOf(const std::vector<const XQueryExpr*>& conditions, XQueryContext& context) {
  for (const XQueryExpr* condition : conditions) {
    const Value value = valueOrNull(*condition, context);
    if (!value) return Answer::Failure;
    if (!XQueryIsTrue(XQueryEffectiveBooleanValue(value, context))) return Answer::No;
  }
  return Answer::Yes;
}

bool looksAway(const XQueryExpr& owner, XQueryContext& context) {
  return XQueryLogEnabled() || context._internal().keptValues().looksAway(owner);
}

// Asks for the table kept, makes one when it is worth it, and asks the table.
template <class MakeTable>
std::shared_ptr<XQueryJoinTable> selectFromKept(
    const XQueryExpr& owner, std::span<const Value> dependencies, bool looksAround,
    const XQueryJoinCondition& condition, XQueryContext& context,
    XQueryJoinTable::Selection& selection, MakeTable makeTable) {
  std::shared_ptr<XQueryKeptValue> kept;
  std::shared_ptr<XQueryJoinTable> table;
  switch (context._internal().keptValues().use(owner, dependencies, looksAround, kept)) {
    case XQueryKeptValues::Use::First:
      return nullptr;
    case XQueryKeptValues::Use::Second:
      table = makeTable();
      if (table && !table->isComplete()) table = nullptr;
      context._internal().keptValues().keep(owner, table);
      break;
    case XQueryKeptValues::Use::Further:
      table = std::static_pointer_cast<XQueryJoinTable>(kept);
      break;
  }
  if (!table || !staysInRound(condition, context)) return nullptr;
  const Answer guards = answerOf(condition.guards, context);
  if (guards == Answer::Failure) return nullptr;
  // Without a probe nothing is met, but what may be an error has still to be asked.
  const Value probe =
      guards == Answer::Yes ? valueOrNull(*condition.probe, context) : Value(NSNull::null());
  return table->select(probe, selection) ? table : nullptr;
}

bool isWorthATable(const std::vector<Value>& items) {
  return items.size() >= XQueryJoinTable::fewestItems && items.size() <= XQueryJoinTable::mostItems;
}

}  // namespace

// --- for clauses ---------------------------------------------------------------------------------

std::unique_ptr<const XQueryForJoin> XQueryForJoin::joinOf(const XQueryForExpr& clause,
                                                           const XQueryExpr* where) {
  if (!where || !clause.expr() || clause.type() || clause.varID() == 0) return nullptr;
  const auto reads = [&clause](const XQueryExpr& expr) {
    const XQueryReads read = XQueryReadsOf(expr);
    if (!read.isRepeatable) return XQueryJoinReads::Unknown;
    const bool readsItem = read.readsVariable(clause.varID());
    const bool readsPosition = clause.posVarID() && read.readsVariable(clause.posVarID());
    if (!readsItem && !readsPosition) return XQueryJoinReads::Round;
    const bool readsMore = read.variables.size() > 1 || read.focus || read.globals || readsPosition;
    return readsMore ? XQueryJoinReads::Unknown : XQueryJoinReads::Item;
  };
  auto condition = XQueryJoinCondition::in(where, false, reads);
  if (!condition.key) return nullptr;
  // The integers of a range have no keys that a table could keep.
  if (XQueryOperatorExpr::rangeIn(clause.expr())) return nullptr;
  XQueryReads itemReads = XQueryReadsOf(*clause.expr());
  const bool isSettled = itemReads.isRepeatable && !(itemReads.outside && itemReads.globals) &&
                         itemReads.variables.size() <= mostVariables;
  if (!isSettled) return nullptr;
  return std::unique_ptr<const XQueryForJoin>(
      new XQueryForJoin(clause, std::move(condition), std::move(itemReads)));
}

std::shared_ptr<XQueryJoinTable> XQueryForJoin::select(
    const XQueryExpr& owner, XQueryContext& context, XQueryJoinTable::Selection& selection) const {
  if (looksAway(owner, context)) return nullptr;
  const auto& dynamic = context._internal();
  std::array<Value, mostVariables + 2> dependencies;
  size_t count = 0;
  dependencies[count++] = NSNumber::numberWithBool(dynamic.ordered());
  if (_itemReads.focus) dependencies[count++] = dynamic.contextItem();
  for (const int64_t varID : _itemReads.variables) {
    dependencies[count++] = dynamic.variableForID(varID);
  }
  const std::span<const Value> known(dependencies.data(), count);
  return selectFromKept(owner, known, _itemReads.outside, _condition, context, selection,
                        [&] { return makeTable(context); });
}

std::shared_ptr<XQueryJoinTable> XQueryForJoin::makeTable(XQueryContext& context) const {
  // An error comes up where it always does.
  const Value value = valueOrNull(*_clause.expr(), context);
  if (!value) return nullptr;
  const Value flat = flattened(value);
  const XQueryItemList list(flat.get());
  // Evaluated again, anything but a node or what a variable holds is another object.
  const bool keepsIdentity = _clause.expr()->kind() == Kind::Variable;
  std::vector<Value> items;
  items.reserve(list.count());
  for (size_t i = 0; i < list.count(); ++i) {
    if (!keepsIdentity && !list[i]->isNode()) return nullptr;
    items.emplace_back(list[i]);
  }
  if (!isWorthATable(items) || (_condition.looksOutOfItems && !XQueryAreSettled(items, true))) {
    return nullptr;
  }
  const auto keyOf = [&](size_t position) {
    context._internal().setVariable(items[position], _clause.varID());
    switch (answerOf(_condition.filters, context)) {
      case Answer::Yes:
        return valueOrNull(*_condition.key, context);
      case Answer::No:  // as an item without a key, it meets nothing
        return Value(NSNull::null());
      default:
        return Value();
    }
  };
  return std::make_shared<XQueryJoinTable>(_condition, items, keyOf);
}

// --- paths ---------------------------------------------------------------------------------------

std::unique_ptr<const XQueryPathJoin> XQueryPathJoin::joinOf(const XQueryStep* firstStep) {
  const auto itemReads = [](const XQueryExpr& expr) {
    const XQueryReads read = XQueryReadsOf(expr);
    if (!read.isRepeatable) return XQueryJoinReads::Unknown;
    if (!read.focus) return XQueryJoinReads::Round;
    const bool readsMore = read.globals || !read.variables.empty();
    return readsMore ? XQueryJoinReads::Unknown : XQueryJoinReads::Item;
  };
  const XQueryStep* firstAxisStep = isa<XQueryAxisStep>(firstStep) ? firstStep : nullptr;
  for (const XQueryStep* step = firstStep; step; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep && step != firstStep) return nullptr;
    if (axisStep && axisStep->testMayRaise()) return nullptr;
    if (axisStep && !firstAxisStep) firstAxisStep = step;
    if (step->predicates().size() != 1) continue;
    auto condition = XQueryJoinCondition::in(step->predicates().front().get(), true, itemReads);
    if (!condition.key) continue;
    bool looksOut = false;
    if (axisStep) {
      if (step->next() && !isa<XQueryAxisStep>(step->next())) return nullptr;
      // All of the nodes are filtered before the next step sees one, and as if by their own.
      if (!XQueryIsRepeatable(*step->predicates().front())) return nullptr;
      const XQueryReads reads = XQueryReadsOfSteps(*firstAxisStep, *step);
      const bool isSettled =
          reads.isRepeatable && !(reads.outside && reads.globals) && reads.variables.empty();
      if (!isSettled) return nullptr;
      looksOut = reads.outside;
    }
    return std::unique_ptr<const XQueryPathJoin>(
        new XQueryPathJoin(*step, std::move(condition), looksOut));
  }
  return nullptr;
}

std::shared_ptr<XQueryJoinTable> XQueryPathJoin::select(
    const XQueryExpr& owner, const Value& start, const ItemLister& listItems,
    XQueryContext& context, XQueryJoinTable::Selection& selection) const {
  if (looksAway(owner, context)) return nullptr;
  const auto makeTable = [&]() -> std::shared_ptr<XQueryJoinTable> {
    std::vector<Value> items;
    if (!listItems(items) || !isWorthATable(items)) return nullptr;
    if (_condition.looksOutOfItems && !XQueryAreSettled(items, true)) return nullptr;
    auto& dynamic = context._internal();
    const Value item = dynamic.contextItem();
    const int64_t position = dynamic.position();
    const auto keyOf = [&](size_t index) {
      dynamic.setContextItem(items[index], static_cast<int64_t>(index) + 1);
      return valueOrNull(*_condition.key, context);
    };
    auto table = std::make_shared<XQueryJoinTable>(_condition, items, keyOf);
    dynamic.setContextItem(item, position);
    return table;
  };
  return selectFromKept(owner, {&start, 1}, _looksOutOfStart, _condition, context, selection,
                        makeTable);
}

}  // namespace xquery
