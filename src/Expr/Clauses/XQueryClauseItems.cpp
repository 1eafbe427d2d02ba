#include "Expr/Clauses/XQueryClauseItems.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryItemFold.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Operators/XQueryRange.h"
#include "Expr/XQueryBinding.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryNumber.h"

namespace xquery {

XQueryClauseItems::XQueryClauseItems(const XQueryExpr* expr, XQueryContext& context)
    : _list(nullptr) {
  if (const XQueryOperatorExpr* range = XQueryOperatorExpr::rangeIn(expr)) {
    const XQueryRangeBounds bounds = range->rangeBounds(context);
    if (!bounds.areIntegers) {
      _haveFailed = XQueryHasFailed(bounds.answer, context);
      return;
    }
    _count = XQueryRangeCount(bounds, context, range->exprPlace());
    _first = bounds.first;
    _isRange = true;
    return;
  }
  _value = XQueryEvaluateOrEmpty(expr, context);
  _haveFailed = XQueryHasFailed(_value, context);
  _list = XQueryItemList(_value.get());
  _count = _list.count();
}

void XQueryClauseItems::flatten() {
  if (_isRange) return;
  _value = flattened(std::move(_value));
  _list = XQueryItemList(_value.get());
  _count = _list.count();
}

bool XQueryClauseItems::pick(const XQueryPicker* picker, XQueryContext& context,
                             XQueryPicks& picks) const {
  if (!picker || _isRange) return false;
  const auto listItems = [this](std::vector<Value>& items) {
    return XQueryListItems(_list, items);
  };
  return picker->pick(_value, listItems, context, picks);
}

void XQueryClauseItems::fetchBehind(size_t index) const {
  constexpr size_t ahead = 2;
  constexpr size_t lineBytes = 64;
  constexpr size_t lines = 8;
  if (_isRange || ahead >= _count - index) return;
  const auto item = reinterpret_cast<uintptr_t>(_list[index + ahead]);
  for (size_t line = 0; line < lines; ++line) {
    __builtin_prefetch(reinterpret_cast<const void*>(item + line * lineBytes));
  }
}

void XQueryClauseItems::setIntegerAt(size_t index, int64_t varID,
                                     XQueryContextInternal& context) const {
  auto* former = dyn_cast<XQueryNumber>(context.variableForID(varID));
  if (former && former->becomeInteger(integerAt(index))) return;
  context.setVariable(XQueryNumber::integerWithInt64(integerAt(index)), varID);
}

void XQueryClauseItems::foldIntegers(XQueryItemFold& fold) const {
  WorkPacer pacer;
  for (size_t index = 0; index < _count; ++index) {
    pacer.turn();
    fold.addInteger(integerAt(index));
  }
}

Value XQueryClauseItems::operator[](size_t index) const {
  if (!_isRange) return _list[index];
  return XQueryNumber::integerWithInt64(integerAt(index));
}

}  // namespace xquery
