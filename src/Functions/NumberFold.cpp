#include "Functions/NumberFold.h"

#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"

#include <cmath>
#include <utility>

namespace xquery {

// --- sums ----------------------------------------------------------------------------------------

void XQuerySumming::add(const XQueryNumericOperand& operand) {
  if (operand.form == XQueryNumericOperand::Double) return addDouble(operand.number);
  if (!_isExact) return addDouble(XQueryNumericOperand::asDouble(*operand.exact));
  _isInteger = _isInteger && operand.isInteger;
  _isEmpty = false;
  int64_t sum = 0;
  if (_exact.isSmallInteger() && operand.exact->isSmallInteger() &&
      !__builtin_add_overflow(_exact.smallInteger(), operand.exact->smallInteger(), &sum)) {
    _exact = NSDecimal(sum);
  } else {
    _exact = _exact.add(*operand.exact);
  }
}

void XQuerySumming::addInteger(int64_t number) {
  const NSDecimal exact(number);
  XQueryNumericOperand operand;
  operand.form = XQueryNumericOperand::Exact;
  operand.isInteger = true;
  operand.exact = &exact;
  add(operand);
}

void XQuerySumming::addDouble(double number) {
  if (_isExact && !_isEmpty) _number = XQueryNumericOperand::asDouble(_exact);
  _number = _isEmpty ? number : _number + number;
  _isExact = false;
  _isEmpty = false;
}

Value XQuerySumming::value() const {
  if (!_isExact) return XQueryNumber::numberWithDouble(_number);
  return _isInteger ? XQueryNumber::integerWithDecimal(_exact)
                    : XQueryNumber::numberWithDecimal(_exact);
}

// --- the fold ------------------------------------------------------------------------------------

void XQueryNumberFold::add(Value value) {
  const auto* items = dyn_cast<NSArray>(value);
  if (!items) {
    if (value && !isNull(value)) addItem(std::move(value));
    return;
  }
  // Any other array may hold arrays, or nothing.
  if (!isa<XQuerySequence>(items)) {
    goOnAsList();
    _list->add(std::move(value));
    return;
  }
  WorkPacer pacer;
  for (const Value& item : items->objects()) {
    pacer.turn();
    addItem(item);
  }
}

void XQueryNumberFold::addInteger(int64_t number) {
  if (_list || _aim != Aim::Sum || _taken == 0 || !_sum.isShort()) {
    return addItem(XQueryNumber::integerWithInt64(number));
  }
  _sum.addInteger(number);
  ++_taken;
}

void XQueryNumberFold::addDouble(double number) {
  if (_list || _aim != Aim::Sum || _taken == 0 || !_sum.isShort() || std::isnan(number)) {
    return addItem(XQueryNumber::numberWithDouble(number));
  }
  _sum.addDouble(number);
  ++_taken;
}

void XQueryNumberFold::addItem(Value item) {
  if (!_list && takes(item)) return;
  goOnAsList();
  _list->add(std::move(item));
}

// False for what only the function itself can deal with.
bool XQueryNumberFold::takes(const Value& item) {
  const auto operand = XQueryNumericOperand::of(item.get());
  if (operand.form == XQueryNumericOperand::Other) return false;
  if (operand.form == XQueryNumericOperand::Double && std::isnan(operand.number)) return false;
  if (_aim != Aim::Sum) {
    const auto candidate = XQueryCandidate::of(item.get(), operand);
    if (_taken == 0 || candidate.order(_best) == (_aim == Aim::Greatest ? 1 : -1)) {
      _best = candidate;
      _item = item;
    }
  } else {
    const bool isLong = operand.form == XQueryNumericOperand::Exact && !operand.exact->isShort();
    if (isLong || !_sum.isShort()) return false;
    if (_taken == 0) _item = item;
    _sum.add(operand);
  }
  ++_taken;
  return true;
}

void XQueryNumberFold::goOnAsList() {
  if (_list) return;
  _list.emplace();
  if (_taken > 0) _list->add(kept());
}

// The sum of one item is that item itself.
Value XQueryNumberFold::kept() const {
  return _aim == Aim::Sum && _taken > 1 ? _sum.value() : _item;
}

Value XQueryNumberFold::argument() {
  if (!_list) return _taken > 0 ? kept() : Value(NSNull::null());
  if (!_gathered) _gathered = _list->value();
  return _gathered;
}

uint64_t XQueryNumberFold::count() {
  if (!_list) return _taken;
  const uint64_t listed = XQueryItemList(argument().get()).count();
  return _taken > 0 ? listed - 1 + _taken : listed;
}

}  // namespace xquery
