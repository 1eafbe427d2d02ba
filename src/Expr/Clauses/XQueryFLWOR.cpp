#include "Expr/Clauses/XQueryFLWOR.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryClauseItems.h"
#include "Expr/Clauses/XQueryFLWORSort.h"
#include "Expr/Clauses/XQueryItemFold.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQueryParts.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"
#include "xquery/Number.h"

#include <algorithm>

namespace xquery {

// What the tuples have yielded: values, or their number where that is all that is asked for, or
// what a fold makes of them, or items with their keys when there are order specs.
struct XQueryFLWORResults {
  XQueryGatherer values;
  std::optional<XQueryItemTally> tally;
  XQueryItemFold* fold = nullptr;              // takes the values, where there is one
  const XQueryItemYielder* yielder = nullptr;  // what it asks in place of the return clause
  XQuerySortList sortList;
  uint64_t wanted = UINT64_MAX;  // so many items at most, without order specs
  uint64_t gathered = 0;         // of them

  // Of a tuple, without order specs.
  void add(Value value) {
    if (fold) return fold->add(std::move(value));
    if (tally) return tally->add(value);
    values.add(std::move(value));
  }
  bool mayEndEarly() const { return wanted != UINT64_MAX || (tally && tally->mayEndEarly()); }
  bool areComplete() const { return gathered >= wanted || (tally && tally->isComplete()); }
};

namespace {

// `position` counts from 0.
void setPosition(size_t position, int64_t varID, XQueryContextInternal& context) {
  context.setVariable(NSNumber::numberWithLongLong(static_cast<int64_t>(position) + 1), varID);
}

}  // namespace

// --- clauses -------------------------------------------------------------------------------------

XQueryForExpr::XQueryForExpr(Ref<NSString> name, Ref<XQueryTypeDeclaration> type,
                             Ref<NSString> position, Ref<XQueryExpr> expr)
    : XQueryBindingExpr(Kind::ForExpr, std::move(name), std::move(type), std::move(expr)),
      _posVarName(std::move(position)) {}

Ref<XQueryForExpr> XQueryForExpr::exprWithName(Ref<NSString> name, Ref<XQueryTypeDeclaration> type,
                                               Ref<NSString> position, Ref<XQueryExpr> expr) {
  return make<XQueryForExpr>(std::move(name), std::move(type), std::move(position),
                             std::move(expr));
}

// The variable is declared last, so that the clause's own expression still sees an outer one of the
// same name.
void XQueryForExpr::bindInfoForProlog(XQueryProlog& prolog) {
  bindType(prolog);
  bindExpr(prolog);
  declareVariable(prolog);
  _posVarID = XQueryDeclareLocalVariable(_posVarName, prolog);
}

Ref<XQueryLetExpr> XQueryLetExpr::exprWithName(Ref<NSString> name, Ref<XQueryTypeDeclaration> type,
                                               Ref<XQueryExpr> expr) {
  return make<XQueryLetExpr>(Kind::LetExpr, std::move(name), std::move(type), std::move(expr));
}

void XQueryLetExpr::bindInfoForProlog(XQueryProlog& prolog) {
  bindType(prolog);
  bindExpr(prolog);
  declareVariable(prolog);
}

XQueryOrderSpec::XQueryOrderSpec(Ref<XQueryExpr> expr, bool ascending, EmptyOrder emptyOrder,
                                 Ref<NSString> collation)
    : XQueryExpr(Kind::OrderSpec),
      _expr(std::move(expr)),
      _ascending(ascending),
      _emptyOrder(emptyOrder),
      _collation(std::move(collation)) {}

Ref<XQueryOrderSpec> XQueryOrderSpec::orderSpec(Ref<XQueryExpr> expr, bool ascending,
                                                EmptyOrder emptyLeast, Ref<NSString> collation) {
  return make<XQueryOrderSpec>(std::move(expr), ascending, emptyLeast, std::move(collation));
}

void XQueryOrderSpec::bindInfoForProlog(XQueryProlog& prolog) {
  if (_emptyOrder == EmptyUnspecified) {
    _emptyOrder = prolog.emptyLeast() ? EmptyLeast : EmptyGreatest;
  }
  if (_expr) _expr->bindInfoForProlog(prolog);
}

Value XQueryOrderSpec::computeValue(XQueryContext& context) const {
  return XQueryEvaluateOrEmpty(_expr.get(), context);
}

void XQueryOrderSpec::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_expr, XQueryRole::OrderKey);
}

// --- the expression ------------------------------------------------------------------------------

XQueryFLWORExpr::XQueryFLWORExpr(Clauses forLet, Ref<XQueryExpr> whereExpr, OrderSpecs orderSpecs,
                                 Ref<XQueryExpr> returnExpr)
    : XQueryExpr(Kind::FLWORExpr),
      _forLet(std::move(forLet)),
      _whereExpr(std::move(whereExpr)),
      _orderSpecs(std::move(orderSpecs)),
      _returnExpr(std::move(returnExpr)) {}

Ref<XQueryFLWORExpr> XQueryFLWORExpr::exprWithForLet(Clauses forLet, Ref<XQueryExpr> whereExpr,
                                                     OrderSpecs orderSpecs,
                                                     Ref<XQueryExpr> returnExpr) {
  return make<XQueryFLWORExpr>(std::move(forLet), std::move(whereExpr), std::move(orderSpecs),
                               std::move(returnExpr));
}

void XQueryFLWORExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  // The variables end with the expression: later siblings use their IDs again.
  const auto scope = prolog.localScope();
  for (const auto& clause : _forLet) clause->bindInfoForProlog(prolog);
  if (_whereExpr) _whereExpr->bindInfoForProlog(prolog);
  for (const auto& spec : _orderSpecs) spec->bindInfoForProlog(prolog);
  if (_returnExpr) _returnExpr->bindInfoForProlog(prolog);
  prolog.restoreLocalScope(scope);
}

void XQueryFLWORExpr::visitParts(XQueryPartVisitor& visitor) {
  for (const auto& clause : _forLet) visitor.ownPart(clause.get(), XQueryRole::Clause);
  visitor.part(_whereExpr, XQueryRole::Where);
  for (const auto& spec : _orderSpecs) visitor.ownPart(spec.get(), XQueryRole::Clause);
  visitor.part(_returnExpr, XQueryRole::Return);
}

bool XQueryFLWORExpr::isOfType(const XQueryBindingExpr& clause, const NSObject* value,
                               XQueryContext& context) const {
  if (!clause.type() || XQueryInstanceOf(value, *clause.type(), &context)) return true;
  _internal(context).fail(XQueryErrors::invalidType.errorAtLine(clause.exprLine()),
                          clause.exprPlace());
  return false;
}

// Whether a condition that is asked behind the clause does not hold, or was not answered.
bool XQueryFLWORExpr::dropsTuple(const XQueryBindingExpr& clause, XQueryContext& context) {
  if (clause.conditions().empty() || _internal(context).showsErrors()) return false;
  for (const auto& condition : clause.conditions()) {
    const Value holds = condition->evaluateWithContext(context);
    if (XQueryHasFailed(holds, context)) return true;
    if (XQueryEffectiveBooleanValue(holds, context) == NSNumber::falseValue()) return true;
  }
  return false;
}

bool XQueryFLWORExpr::evaluateStartingAt(size_t clause, XQueryFLWORResults& toResults,
                                         XQueryContext& withContext) const {
  XQueryCheckStack(withContext);
  for (; clause < _forLet.size(); ++clause) {
    const XQueryBindingExpr& binding = *_forLet[clause];
    if (const auto* forExpr = dyn_cast<XQueryForExpr>(&binding)) {
      return evaluateFor(*forExpr, clause, toResults, withContext);
    }
    Value value = binding.evaluateWithContext(withContext);
    if (XQueryHasFailed(value, withContext)) return false;
    if (!isOfType(binding, value.get(), withContext)) return false;
    _internal(withContext).setVariable(std::move(value), binding.varID());
    if (dropsTuple(binding, withContext)) return !_internal(withContext).isFailing();
  }
  return _forLet.empty() || processItem(toResults, withContext);
}

bool XQueryFLWORExpr::evaluateFor(const XQueryForExpr& clause, size_t index,
                                  XQueryFLWORResults& toResults, XQueryContext& withContext) const {
  if (clause.giver() && toResults.mayEndEarly()) {
    return evaluateGiven(clause, index, toResults, withContext);
  }
  const bool isLast = index + 1 == _forLet.size();
  XQueryClauseItems items(clause.expr(), withContext);
  if (items.haveFailed()) return false;
  XQueryPicks picks;
  if (isLast && wantsNumberOfPicks(toResults)) picks.wantedNumber = XQueryPicks::Number::OfItems;
  if (items.pick(clause.picker(), withContext, picks)) {
    return evaluatePicks(clause, index, picks, toResults, withContext);
  }
  if (items.areIntegers() && !clause.type()) {
    return evaluateRange(clause, index, items, toResults, withContext);
  }
  items.flatten();
  for (size_t k = 0; k < items.count(); ++k) {
    items.fetchBehind(k);
    if (!evaluateItem(clause, index, items[k], k, toResults, withContext)) return false;
  }
  return true;
}

// `position` counts from 0.
bool XQueryFLWORExpr::evaluateItem(const XQueryForExpr& clause, size_t index, Value item,
                                   size_t position, XQueryFLWORResults& toResults,
                                   XQueryContext& withContext) const {
  checkWork();
  if (!isOfType(clause, item.get(), withContext)) return false;
  setTuple(clause, std::move(item), position, withContext);
  return evaluateBehind(clause, index, toResults, withContext);
}

// The variables of the clause are set.
bool XQueryFLWORExpr::evaluateBehind(const XQueryForExpr& clause, size_t index,
                                     XQueryFLWORResults& toResults,
                                     XQueryContext& withContext) const {
  if (dropsTuple(clause, withContext)) return !_internal(withContext).isFailing();
  return index + 1 == _forLet.size() ? processItem(toResults, withContext)
                                     : evaluateStartingAt(index + 1, toResults, withContext);
}

// Over the integers of a range.
bool XQueryFLWORExpr::evaluateRange(const XQueryForExpr& clause, size_t index,
                                    const XQueryClauseItems& items, XQueryFLWORResults& toResults,
                                    XQueryContext& withContext) const {
  auto& dynamic = _internal(withContext);
  for (size_t k = 0; k < items.count(); ++k) {
    checkWork();
    items.setIntegerAt(k, clause.varID(), dynamic);
    if (clause.posVarID()) setPosition(k, clause.posVarID(), dynamic);
    if (!evaluateBehind(clause, index, toResults, withContext)) return false;
  }
  return true;
}

// The same as for a list of the items, of which those behind the last wanted one are not found.
bool XQueryFLWORExpr::evaluateGiven(const XQueryForExpr& clause, size_t index,
                                    XQueryFLWORResults& toResults,
                                    XQueryContext& withContext) const {
  class Taking final : public XQueryItemGiver::Taker {
   public:
    Taking(const XQueryFLWORExpr& flwor, const XQueryForExpr& clause, size_t index,
           XQueryFLWORResults& toResults, XQueryContext& context)
        : _flwor(flwor), _clause(clause), _index(index), _results(toResults), _context(context) {}
    bool goesOn = true;

    bool take(Value item) override {
      goesOn = XQueryAsk(_flwor, _context, [&] {
        return _flwor.evaluateItem(_clause, _index, std::move(item), _position++, _results,
                                   _context);
      });
      return goesOn;
    }

   private:
    const XQueryFLWORExpr& _flwor;
    const XQueryForExpr& _clause;
    const size_t _index;
    size_t _position = 0;
    XQueryFLWORResults& _results;
    XQueryContext& _context;
  };
  Taking taking(*this, clause, index, toResults, withContext);
  return clause.giver()->giveItems(withContext, taking) && taking.goesOn;
}

// `position` counts from 0.
void XQueryFLWORExpr::setTuple(const XQueryForExpr& clause, Value item, size_t position,
                               XQueryContext& context) {
  auto& dynamic = _internal(context);
  dynamic.setVariable(std::move(item), clause.varID());
  if (clause.posVarID()) setPosition(position, clause.posVarID(), dynamic);
}

bool XQueryFLWORExpr::evaluatePicks(const XQueryForExpr& clause, size_t index,
                                    const XQueryPicks& picks, XQueryFLWORResults& toResults,
                                    XQueryContext& withContext) const {
  const bool isLast = index + 1 == _forLet.size();
  const auto& items = *picks.items;
  const XQueryExpr* sureReturn = _sureReturn ? _sureReturn.get() : _returnExpr.get();
  const uint64_t number = picks.number.value_or(picks.chosen.size());
  if (picks.number && !addPicks(number, toResults, withContext)) return false;
  for (const XQueryPick& pick : picks.chosen) {
    checkWork();
    setTuple(clause, items[pick.position], pick.position, withContext);
    if (dropsTuple(clause, withContext)) {
      if (_internal(withContext).isFailing()) return false;
      continue;
    }
    const bool goesOn = !isLast       ? evaluateStartingAt(index + 1, toResults, withContext)
                        : pick.isSure ? addTuple(sureReturn, toResults, withContext)
                                      : processItem(toResults, withContext);
    if (!goesOn) return false;
  }
  constexpr size_t two = 2;
  const size_t others = _otherReturn ? std::min(two, items.size() - number) : 0;
  for (size_t k = 0; k < others; ++k) {
    if (!addTuple(_otherReturn.get(), toResults, withContext)) return false;
  }
  // Where the ID is used again by a variable that is never set, the last item can be read.
  setTuple(clause, items.back(), items.size() - 1, withContext);
  return true;
}

bool XQueryFLWORExpr::wantsNumberOfPicks(const XQueryFLWORResults& results) const {
  return results.tally ? _yield.isOneItem : _yield.summand.has_value();
}

// Adds what so many items yield of which each is picked for certain.
bool XQueryFLWORExpr::addPicks(uint64_t number, XQueryFLWORResults& toResults,
                               XQueryContext& withContext) const {
  if (toResults.tally) {
    toResults.tally->addItems(number);
    return !toResults.areComplete();
  }
  if (number == 0) return true;
  // The sum of one item is that item itself.
  if (number == 1) {
    return addTuple(_sureReturn ? _sureReturn.get() : _returnExpr.get(), toResults, withContext);
  }
  const auto sum = static_cast<int64_t>(number) * *_yield.summand;
  for (const int64_t part : {sum, int64_t{0}}) {
    if (toResults.fold) {
      toResults.fold->addInteger(part);
    } else {
      toResults.values.add(XQueryNumber::integerWithInt64(part));
    }
  }
  return true;
}

bool XQueryFLWORExpr::processItem(XQueryFLWORResults& toResults, XQueryContext& withContext) const {
  const auto holds = _teller ? _teller->truth(withContext) : std::nullopt;
  if (holds && !*holds) return true;
  if (_whereExpr && !holds) {
    const Value where = _whereExpr->evaluateWithContext(withContext);
    if (XQueryHasFailed(where, withContext)) return false;
    // Only false drops the tuple: an error record lets it through.
    if (XQueryEffectiveBooleanValue(where, withContext) == NSNumber::falseValue()) return true;
  }
  return addTuple(_returnExpr.get(), toResults, withContext);
}

bool XQueryFLWORExpr::addTuple(const XQueryExpr* returned, XQueryFLWORResults& toResults,
                               XQueryContext& withContext) const {
  if (toResults.yielder && returned == _returnExpr.get()) {
    return toResults.yielder->yieldTo(*toResults.fold, withContext);
  }
  const auto* list = dyn_cast<XQueryExprList>(returned);
  if (list && list->count() > 1 && _orderSpecs.empty() && !toResults.mayEndEarly()) {
    return addList(*list, toResults, withContext);
  }
  Value value = XQueryEvaluateOrEmpty(returned, withContext);
  if (XQueryHasFailed(value, withContext)) return false;
  if (!_orderSpecs.empty()) {
    return addSortItems(std::move(value), toResults.sortList, withContext);
  }
  if (toResults.wanted != UINT64_MAX) toResults.gathered += XQueryItemList(value.get()).count();
  toResults.add(std::move(value));
  return !toResults.areComplete();
}

// What stands between commas is added one after the other, without a list for each tuple.
bool XQueryFLWORExpr::addList(const XQueryExprList& list, XQueryFLWORResults& toResults,
                              XQueryContext& withContext) const {
  XQueryCheckStack(withContext);
  for (size_t index = 0; index < list.count(); ++index) {
    Value value = list.objectAtIndex(index)->evaluateWithContext(withContext);
    if (XQueryHasFailed(value, withContext)) return false;
    toResults.add(std::move(value));
  }
  return true;
}

// Adds every item of the value with the keys of the tuple.
bool XQueryFLWORExpr::addSortItems(Value value, XQuerySortList& toList,
                                   XQueryContext& context) const {
  const size_t sortInfo = toList.keys.size();
  for (const auto& spec : _orderSpecs) {
    const Value keyValue = spec->evaluateWithContext(context);
    if (XQueryHasFailed(keyValue, context)) return false;
    Value key = XQueryAtomizationCheckingOccurrence(keyValue, XQueryOccurrenceAnyAlso, context);
    if (XQueryObjectTypeID(key.get()) == XQueryTypeUntypedAtomic) {
      key = XQueryCastAsTypeForContext(key, XQueryTypeString, context);
    }
    toList.keys.push_back(std::move(key));
  }
  Value flat = flattened(std::move(value));
  const XQueryItemList items(flat.get());
  if (items.count() == 0) toList.keys.resize(sortInfo);
  if (items.count() == 1 && !isa<NSArray>(flat)) {
    toList.items.push_back({std::move(flat), sortInfo, 0});
    return true;
  }
  WorkPacer pacer;
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    toList.items.push_back({items[i], sortInfo, i});
  }
  return true;
}

std::optional<uint64_t> XQueryFLWORExpr::countItems(uint64_t most, XQueryContext& context) const {
  XQueryFLWORResults results;
  results.tally.emplace(most);
  if (!evaluateStartingAt(0, results, context) && !results.areComplete()) return std::nullopt;
  return std::min(results.tally->count(), most);
}

bool XQueryFLWORExpr::foldItems(XQueryItemFold& fold, XQueryContext& context) const {
  XQueryFLWORResults results;
  results.fold = &fold;
  // A profile counts what stands in the return clause.
  if (!_internal(context).profile()) results.yielder = _yielder;
  return evaluateStartingAt(0, results, context);
}

Value XQueryFLWORExpr::computeValue(XQueryContext& context) const {
  return firstItems(UINT64_MAX, context);
}

Value XQueryFLWORExpr::firstItems(uint64_t most, XQueryContext& context) const {
  XQueryFLWORResults results;
  results.sortList.keyCount = _orderSpecs.size();
  results.wanted = _orderSpecs.empty() ? most : UINT64_MAX;
  if (!evaluateStartingAt(0, results, context) && !results.areComplete()) return {};
  if (_orderSpecs.empty()) return results.values.value();

  const XQueryOrderSpec& first = *_orderSpecs.front();
  if (!XQueryFLWORSortFirst(results.sortList, first.ascending(), first.emptyLeast(), most)) {
    // Of several keys it is not known which.
    const XQueryPlaceNumber at = _orderSpecs.size() == 1 ? first.exprPlace() : exprPlace();
    return _internal(context).fail(XQueryErrors::invalidType.errorAtLine(exprLine()), at);
  }
  auto sorted = XQuerySequence::sequence();
  sorted->objects().reserve(results.sortList.items.size());
  WorkPacer pacer;
  for (XQuerySortItem& item : results.sortList.items) {
    pacer.turn();
    sorted->objects().push_back(std::move(item.value));
  }
  return normalised(std::move(sorted));
}

// --- ordering mode -------------------------------------------------------------------------------

Ref<XQueryOrderExpr> XQueryOrderExpr::orderExpr(Ref<XQueryExpr> expr, bool ordered) {
  return make<XQueryOrderExpr>(std::move(expr), ordered);
}

void XQueryOrderExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (_expr && XQueryCheckStack(prolog)) _expr->bindInfoForProlog(prolog);
}

void XQueryOrderExpr::visitParts(XQueryPartVisitor& visitor) {
  visitor.part(_expr, XQueryRole::Element);
}

Value XQueryOrderExpr::computeValue(XQueryContext& context) const {
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  const bool saved = dynamic.ordered();
  dynamic.setOrdered(_ordered);
  Value value = XQueryEvaluateOrEmpty(_expr.get(), context);
  dynamic.setOrdered(saved);
  return value;
}

}  // namespace xquery
