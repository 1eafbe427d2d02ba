#include "Engine/Streams/XQueryStreamFolding.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Functions/Aggregate.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValues.h"

namespace xquery {

namespace {

Ref<NSString> textApart(const Ref<NSString>& text) {
  return text ? NSString::stringWithView(text->view()) : nullptr;
}

// The same atomic value without a text that lies in a tree.
Value apartFromDocument(Value item) {
  if (const auto* typed = dyn_cast<XQueryString>(item.get())) {
    return make<XQueryString>(typed->view(), typed->typeID());
  }
  if (const auto* text = dyn_cast<NSString>(item.get())) {
    return NSString::stringWithView(text->view());
  }
  if (const auto* name = dyn_cast<XQueryQName>(item.get())) {
    return XQueryQName::qname(textApart(name->XQueryStringValue()),
                              textApart(name->namespaceURI()));
  }
  return item;
}

}  // namespace

bool XQueryStreamFolding::fold(const Value& value) {
  switch (_part.fold) {
    case XQueryStreamFold::Items:
      return emitAll(value);
    case XQueryStreamFold::Part:
      return emitPart(value);
    case XQueryStreamFold::Distinct:
      return emitDistinct(value);
    case XQueryStreamFold::Sum:
    case XQueryStreamFold::Least:
    case XQueryStreamFold::Greatest:
      return carryOn(value);
    case XQueryStreamFold::Average:
      return addToAverage(value);
    case XQueryStreamFold::Count:
      return count(value, false);
    case XQueryStreamFold::Exists:
    case XQueryStreamFold::Empty:
      return count(value, true);
    case XQueryStreamFold::Some:
      return decide(value, true);
    case XQueryStreamFold::Every:
      return decide(value, false);
  }
  return false;
}

bool XQueryStreamFolding::emitAll(const Value& value) {
  const XQueryItemList items(value.get());
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    if (!_emit(items[index])) return false;
  }
  return true;
}

bool XQueryStreamFolding::emitPart(const Value& value) {
  const XQueryItemList items(value.get());
  for (size_t index = 0; index < items.count() && _count < _part.last; ++index) {
    checkWork();
    if (++_count >= _part.first && !_emit(items[index])) return false;
  }
  return _count < _part.last;
}

// As the function does: an untyped item has the text of the string that takes its place.
bool XQueryStreamFolding::emitDistinct(const Value& value) {
  const Value values = XQueryAtomization(value, _context);
  const XQueryItemList items(values.get());
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    Value item = items[index];
    if (XQueryObjectTypeID(item.get()) == XQueryTypeUntypedAtomic) {
      item = XQueryString::stringWithView(cast<NSString>(item.get())->view());
    } else {
      item = apartFromDocument(std::move(item));
    }
    if (!_met.insert(*item)) continue;
    _distinct.push_back(item);
    if (_emit && !_emit(item)) return false;
  }
  return true;
}

// What the function is called with.
Value XQueryStreamFolding::withFormer(const Value& value) const {
  XQueryGatherer gathered;
  if (_value) gathered.add(_value);
  gathered.add(value);
  return normalised(gathered.value());
}

bool XQueryStreamFolding::carryOn(const Value& value) {
  if (XQueryItemList(value.get()).count() == 0) return true;
  const Value items = withFormer(value);
  _value = _part.call->callBuiltInWith(&items, 1, _context);
  if (_value) _value = apartFromDocument(std::move(_value));
  return static_cast<bool>(_value);
}

bool XQueryStreamFolding::addToAverage(const Value& value) {
  const size_t number = XQueryItemList(value.get()).count();
  if (number == 0) return true;
  _count += number;
  const Value items = withFormer(value);
  _value = fn_sum(&items, 1, _context);
  if (!_value) static_cast<void>(_part.call->failInvalidArguments(_context));
  return static_cast<bool>(_value);
}

bool XQueryStreamFolding::count(const Value& value, bool endsAtFirst) {
  _count += XQueryItemList(value.get()).count();
  return !endsAtFirst || _count == 0;
}

// An error record is an answer as well.
bool XQueryStreamFolding::decide(const Value& value, bool deciding) {
  const auto* truth = dyn_cast<NSNumber>(value.get());
  if (truth && XQueryIsTrue(value) != deciding) return true;
  _value = value;
  return false;
}

Value XQueryStreamFolding::allDistinct() const {
  XQueryGatherer gathered;
  for (const Value& item : _distinct) gathered.add(item);
  return normalised(gathered.value());
}

Value XQueryStreamFolding::result() {
  const Value empty = NSNull::null();
  switch (_part.fold) {
    case XQueryStreamFold::Items:
    case XQueryStreamFold::Part:
      return empty;
    case XQueryStreamFold::Distinct:
      return _emit ? empty : allDistinct();
    case XQueryStreamFold::Sum:
    case XQueryStreamFold::Least:
    case XQueryStreamFold::Greatest:
      return _value ? _value : _part.call->callBuiltInWith(&empty, 1, _context);
    case XQueryStreamFold::Average:
      return _value ? XQueryAverageOf(_value, _count, _context) : empty;
    case XQueryStreamFold::Count:
      return XQueryNumber::integerWithInt64(static_cast<int64_t>(_count));
    case XQueryStreamFold::Exists:
      return NSNumber::numberWithBool(_count > 0);
    case XQueryStreamFold::Empty:
      return NSNumber::numberWithBool(_count == 0);
    case XQueryStreamFold::Some:
      return _value ? _value : Value(NSNumber::numberWithBool(false));
    case XQueryStreamFold::Every:
      return _value ? _value : Value(NSNumber::numberWithBool(true));
  }
  return empty;
}

}  // namespace xquery
