#include "Expr/XQueryJoin.h"

#include "Eval/XQueryContextInternal.h"
#include "Expr/XQueryClauseItems.h"
#include "Expr/XQueryFLWOR.h"
#include "Expr/XQueryJoinMemo.h"
#include "Expr/XQueryPath.h"
#include "Expr/XQuerySequence.h"
#include "Platform/NSLog.h"
#include "xquery/Number.h"

#include <array>
#include <utility>

namespace xquery {
namespace {

// Joins whose items depend on more variables are left alone.
constexpr size_t mostVariables = 6;

// Evaluates what the plain way may not have come to evaluate yet: null for an error, which leaves
// nothing behind.
Value valueOrNull(const XQueryExpr& expr, XQueryContext& context) {
  auto& dynamic = context._internal();
  const Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  const Ref<XQueryError> error = dynamic.error();
  try {
    return expr.evaluateWithContext(context);
  } catch (const NSException&) {
    if (XQueryIsLimit(dynamic.error().get())) throw;
    dynamic.setError(error, false);
    dynamic.setContextItem(item, position);
    dynamic.setLast(last);
    return {};
  }
}

// Asks the memo, makes the table when it is worth it, and asks the table.
template <class MakeTable>
std::shared_ptr<XQueryJoinTable> selectFromMemo(const XQueryExpr& owner,
                                                std::span<const Value> dependencies,
                                                const XQueryExpr& probe, XQueryContext& context,
                                                XQueryJoinTable::Selection& selection,
                                                MakeTable makeTable) {
  if (XQueryLogEnabled()) return nullptr;
  std::shared_ptr<XQueryJoinTable> table;
  switch (context._internal().joinMemo().use(owner, dependencies, table)) {
    case XQueryJoinMemo::Use::First:
      return nullptr;
    case XQueryJoinMemo::Use::Second:
      table = makeTable();
      context._internal().joinMemo().keep(owner, table);
      break;
    case XQueryJoinMemo::Use::Further:
      break;
  }
  if (!table || !table->select(valueOrNull(probe, context), selection)) return nullptr;
  return table;
}

bool isWorthATable(const std::vector<Value>& items) {
  return items.size() >= XQueryJoinTable::fewestItems && items.size() <= XQueryJoinTable::mostItems;
}

}  // namespace

// --- for clauses ---------------------------------------------------------------------------------

std::unique_ptr<const XQueryForJoin> XQueryForJoin::joinOf(const XQueryForExpr& clause,
                                                           const XQueryExpr* where) {
  if (!where || !clause.expr() || clause.type() || clause.varID() == 0) return nullptr;
  const int64_t varID = clause.varID();
  const auto isKey = [varID](const XQueryExpr& expr) {
    const XQueryReads reads = XQueryReadsOf(expr);
    return reads.isRepeatable && !reads.focus && !reads.outside && !reads.globals &&
           reads.variables == std::vector<int64_t>{varID};
  };
  const auto isProbe = [&clause](const XQueryExpr& expr) {
    const XQueryReads reads = XQueryReadsOf(expr);
    return reads.isRepeatable && !reads.readsVariable(clause.varID()) &&
           !(clause.posVarID() && reads.readsVariable(clause.posVarID()));
  };
  const auto condition = XQueryJoinCondition::in(where, false, isKey, isProbe);
  if (!condition.key) return nullptr;
  XQueryReads itemReads = XQueryReadsOf(*clause.expr());
  const bool isSettled =
      itemReads.isRepeatable && !itemReads.outside && itemReads.variables.size() <= mostVariables;
  if (!isSettled) return nullptr;
  return std::unique_ptr<const XQueryForJoin>(
      new XQueryForJoin(clause, condition, std::move(itemReads)));
}

std::shared_ptr<XQueryJoinTable> XQueryForJoin::select(
    const XQueryExpr& owner, XQueryContext& context, XQueryJoinTable::Selection& selection) const {
  const auto& dynamic = context._internal();
  std::array<Value, mostVariables + 2> dependencies;
  size_t count = 0;
  dependencies[count++] = NSNumber::numberWithBool(dynamic.ordered());
  if (_itemReads.focus) dependencies[count++] = dynamic.contextItem();
  for (const int64_t varID : _itemReads.variables) {
    dependencies[count++] = dynamic.variableForID(varID);
  }
  return selectFromMemo(owner, {dependencies.data(), count}, *_condition.probe, context, selection,
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
  if (!isWorthATable(items)) return nullptr;
  const auto keyOf = [&](size_t position) {
    context._internal().setVariable(items[position], _clause.varID());
    return valueOrNull(*_condition.key, context);
  };
  return std::make_shared<XQueryJoinTable>(_condition, items, keyOf);
}

// --- paths ---------------------------------------------------------------------------------------

std::unique_ptr<const XQueryPathJoin> XQueryPathJoin::joinOf(const XQueryStep* firstStep) {
  const auto isKey = [](const XQueryExpr& expr) {
    const XQueryReads reads = XQueryReadsOf(expr);
    return reads.isRepeatable && reads.focus && !reads.outside && !reads.globals &&
           reads.variables.empty();
  };
  const auto isProbe = [](const XQueryExpr& expr) {
    const XQueryReads reads = XQueryReadsOf(expr);
    return reads.isRepeatable && !reads.focus;
  };
  const XQueryStep* firstAxisStep = isa<XQueryAxisStep>(firstStep) ? firstStep : nullptr;
  for (const XQueryStep* step = firstStep; step; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep && step != firstStep) return nullptr;
    if (axisStep && axisStep->testMayRaise()) return nullptr;
    if (axisStep && !firstAxisStep) firstAxisStep = step;
    if (step->predicates().size() != 1) continue;
    const auto condition =
        XQueryJoinCondition::in(step->predicates().front().get(), true, isKey, isProbe);
    if (!condition.key) continue;
    if (axisStep) {
      if (step->next() && !isa<XQueryAxisStep>(step->next())) return nullptr;
      const XQueryReads reads = XQueryReadsOfSteps(*firstAxisStep, *step);
      const bool isSettled = reads.isRepeatable && !reads.outside && reads.variables.empty();
      if (!isSettled) return nullptr;
    }
    return std::unique_ptr<const XQueryPathJoin>(new XQueryPathJoin(*step, condition));
  }
  return nullptr;
}

std::shared_ptr<XQueryJoinTable> XQueryPathJoin::select(
    const XQueryExpr& owner, const Value& start, const ItemLister& listItems,
    XQueryContext& context, XQueryJoinTable::Selection& selection) const {
  const auto makeTable = [&]() -> std::shared_ptr<XQueryJoinTable> {
    std::vector<Value> items;
    if (!listItems(items) || !isWorthATable(items)) return nullptr;
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
  return selectFromMemo(owner, {&start, 1}, *_condition.probe, context, selection, makeTable);
}

}  // namespace xquery
