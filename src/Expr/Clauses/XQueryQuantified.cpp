#include "Expr/Clauses/XQueryQuantified.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryClauseItems.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQueryParts.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"

namespace xquery {

Ref<XQueryQuantifiedExprItem> XQueryQuantifiedExprItem::quantifiedExpr(
    Ref<XQueryExpr> expr, Ref<NSString> forVar, Ref<XQueryTypeDeclaration> type) {
  return make<XQueryQuantifiedExprItem>(Kind::QuantifiedItem, std::move(forVar), std::move(type),
                                        std::move(expr));
}

void XQueryQuantifiedExprItem::bindInfoForProlog(XQueryProlog& prolog) {
  bindExpr(prolog);
  bindType(prolog);
  declareVariable(prolog);
}

XQueryQuantifiedExpr::XQueryQuantifiedExpr(Items items, Ref<XQueryExpr> satisfies, bool every)
    : XQueryExpr(Kind::QuantifiedExpr),
      _items(std::move(items)),
      _satisfies(std::move(satisfies)),
      _every(every) {}

Ref<XQueryQuantifiedExpr> XQueryQuantifiedExpr::someExpr(Items items, Ref<XQueryExpr> satisfies) {
  return make<XQueryQuantifiedExpr>(std::move(items), std::move(satisfies), false);
}

Ref<XQueryQuantifiedExpr> XQueryQuantifiedExpr::everyExpr(Items items, Ref<XQueryExpr> satisfies) {
  return make<XQueryQuantifiedExpr>(std::move(items), std::move(satisfies), true);
}

// The variables keep their IDs for the rest of the module: the scope is not put back.
void XQueryQuantifiedExpr::bindInfoForProlog(XQueryProlog& prolog) {
  if (!XQueryCheckStack(prolog)) return;
  for (const auto& item : _items) item->bindInfoForProlog(prolog);
  if (_satisfies) _satisfies->bindInfoForProlog(prolog);
}

void XQueryQuantifiedExpr::visitParts(XQueryPartVisitor& visitor) {
  for (const auto& item : _items) visitor.ownPart(item.get(), XQueryRole::Clause);
  visitor.part(_satisfies, XQueryRole::Satisfies);
}

Value XQueryQuantifiedExpr::computeValue(XQueryContext& context) const {
  Value answer = evaluatePostion(0, context);
  if (answer || _internal(context).isFailing()) return answer;
  return _internal(context).fail(XQueryErrors::invalidType.errorAtLine(exprLine()), exprPlace());
}

Value XQueryQuantifiedExpr::evaluatePostion(size_t index, XQueryContext& withContext) const {
  XQueryCheckStack(withContext);
  if (index == _items.size()) {
    const Value value = XQueryEvaluateOrEmpty(_satisfies.get(), withContext);
    if (XQueryHasFailed(value, withContext)) return {};
    return XQueryEffectiveBooleanValue(value, withContext);
  }
  // A clause without items does not decide: the next one is tried in its place, and goes on with
  // the clause after this one.
  for (size_t clause = index; clause < _items.size(); ++clause) {
    Value answer = evaluateItems(clause, index, withContext);
    if (answer || _internal(withContext).isFailing()) return answer;
  }
  return undecided();
}

// The answer over the items of one clause; null when it has none.
Value XQueryQuantifiedExpr::evaluateItems(size_t clause, size_t index,
                                          XQueryContext& context) const {
  const XQueryQuantifiedExprItem& binding = *_items[clause];
  if (binding.giver()) return evaluateGiven(clause, index, context);
  const XQueryClauseItems items(binding.expr(), context);
  if (items.haveFailed()) return {};
  XQueryPicks picks;
  picks.wantsFirst = clause + 1 == _items.size();
  // In the place of a clause without items it is only tried: the next one sets its variable again.
  if (clause == index && items.pick(binding.picker(), context, picks)) {
    return evaluatePicks(clause, picks, context);
  }
  const Value open = undecided();
  Value answer;
  const bool areIntegers = items.areIntegers() && !binding.type();
  for (size_t i = 0; i < items.count(); ++i) {
    if (areIntegers) {
      items.setIntegerAt(i, binding.varID(), _internal(context));
      answer = evaluatePostion(index + 1, context);
    } else {
      answer = evaluateItem(clause, index, items[i], context);
    }
    if (answer != open) break;
  }
  return answer;
}

// The answer for one item of a clause.
Value XQueryQuantifiedExpr::evaluateItem(size_t clause, size_t index, Value item,
                                         XQueryContext& context) const {
  const XQueryQuantifiedExprItem& binding = *_items[clause];
  if (binding.type() && !XQueryInstanceOf(item.get(), *binding.type(), &context)) {
    const auto error = XQueryErrors::invalidType.errorAtLine(binding.exprLine());
    return _internal(context).placed(error, binding.exprPlace());
  }
  _internal(context).setVariable(std::move(item), binding.varID());
  return evaluatePostion(index + 1, context);
}

// The same as for a list of the items.
Value XQueryQuantifiedExpr::evaluateGiven(size_t clause, size_t index,
                                          XQueryContext& context) const {
  class Asking final : public XQueryItemGiver::Taker {
   public:
    Asking(const XQueryQuantifiedExpr& quantifier, size_t clause, size_t index,
           XQueryContext& context)
        : _quantifier(quantifier), _clause(clause), _index(index), _context(context) {}
    Value answer;

    bool take(Value item) override {
      answer = XQueryAsk(_quantifier, _context, [&] {
        return _quantifier.evaluateItem(_clause, _index, std::move(item), _context);
      });
      return answer == _quantifier.undecided();
    }

   private:
    const XQueryQuantifiedExpr& _quantifier;
    const size_t _clause;
    const size_t _index;
    XQueryContext& _context;
  };
  Asking asking(*this, clause, index, context);
  if (!_items[clause]->giver()->giveItems(context, asking)) return {};
  return std::move(asking.answer);
}

// The same of the items that may decide; there are others.
Value XQueryQuantifiedExpr::evaluatePicks(size_t clause, const XQueryPicks& picks,
                                          XQueryContext& context) const {
  const int64_t varID = _items[clause]->varID();
  const bool isLast = clause + 1 == _items.size();
  const Value open = undecided();
  for (const XQueryPick& pick : picks.chosen) {
    checkWork();
    _internal(context).setVariable((*picks.items)[pick.position], varID);
    if (pick.isSure && isLast) return NSNumber::numberWithBool(!_every);
    Value answer = evaluatePostion(clause + 1, context);
    if (answer != open) return answer;
  }
  _internal(context).setVariable(picks.items->back(), varID);
  return open;
}

}  // namespace xquery
