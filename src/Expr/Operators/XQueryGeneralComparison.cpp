// General comparisons without a value per item and a cast per pair.
//
// Each operand is read once into a list of comparands: a node's text is looked at where it lies, an
// untyped text is scanned as a number once, and a cast to any other type is kept. Then the pairs
// are compared in the plain algorithm's order, left by right, so that the first pair to answer or
// to fail is the same one. A pair is compared without casting
//
//   as strings   when each item is untyped or exactly xs:string (casting to xs:string keeps the
//                text), or when both are of string types (which are compared as they are);
//   as numbers   when both are numeric, or one is and the other is an untyped text that scans as a
//                number (scanning is how it is cast, and a double is compared by double).
//
// When no pair can fail and there are many, not every pair has to be looked at: an order relation
// is decided by the extremes of both sides, equality by a binary search. A range of integers is not
// even made for that: an item is compared with its bounds.
#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Operators/XQueryUntypedText.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

constexpr int generalToValue = XQueryOperatorEq - XQueryOperatorEqual;

bool isGeneralComparison(int type) {
  return type >= XQueryOperatorEqual && type <= XQueryOperatorGreaterEqual;
}

enum class Answer : uint8_t { No, Yes, Unknown };

Answer answered(bool value) {
  return value ? Answer::Yes : Answer::No;
}

template <class T>
int orderOf(T a, T b) {
  return a < b ? -1 : a > b ? 1 : 0;
}
int orderOf(NSStringView a, NSStringView b) {
  return a.compare(b);
}

// One item of an operand, with what comparing it has found out.
class Comparand {
 public:
  // Nodes and atomic values.
  static bool isPossible(const NSObject* item) {
    return item && (item->isNode() || XQueryIsAtomicType(item));
  }

  explicit Comparand(NSObject* item)
      : _item(item),
        _type(item->isNode() ? XQueryTypeID{XQueryTypeUntypedAtomic} : XQueryObjectTypeID(item)),
        _primitive(XQueryPrimitiveTypeForTypeID(_type)) {
    if (isUntyped() || _primitive == XQueryTypeString) _text = XQueryUntypedText(*item);
  }

  XQueryTypeID type() const { return _type; }
  bool isUntyped() const { return _type == XQueryTypeUntypedAtomic; }
  bool isStringType() const { return _primitive == XQueryTypeString; }
  // Casting it to xs:string keeps its text.
  bool isText() const { return isUntyped() || _type == XQueryTypeString; }
  bool isNumeric() const {
    return _primitive >= XQueryTypeDouble && _primitive <= XQueryTypeDecimal;
  }
  // A number that has digits of its own.
  bool isExact() const {
    if (!isNumeric()) return false;
    const NSNumber::Storage storage = number().storage();
    return storage != NSNumber::Storage::Double && storage != NSNumber::Storage::Float;
  }
  const NSNumber& number() const { return *cast<NSNumber>(_item); }
  NSStringView text() const { return _text.view(); }

  // A number's value, or the number that an untyped text begins with; nothing when there is none.
  std::optional<double> asDouble() {
    if (!_scanned) {
      _scanned = true;
      if (isNumeric()) {
        _double = number().doubleValue();
      } else if (double value = 0; isUntyped() && scanDouble(text(), value)) {
        _double = value;
      }
    }
    return _double;
  }

  // Exactly xs:integer in a machine word.
  std::optional<int64_t> asSmallInteger() const {
    if (_type != XQueryTypeInteger) return std::nullopt;
    const NSDecimal* decimal = number().storedDecimal();
    if (!decimal || !decimal->isSmallInteger()) return std::nullopt;
    return decimal->smallInteger();
  }

  // The item's typed value, cast to `target` unless that is 0; each cast is done once.
  Value valueAs(XQueryTypeID target, XQueryContext& context) {
    if (!_typed) _typed = XQueryTypedValue(_item, context);
    if (target == XQueryTypeNone) return _typed;
    for (const auto& [type, value] : _casts) {
      if (type == target) return value;
    }
    Value value = XQueryCastAsTypeForContext(_typed, target, context);
    _casts.emplace_back(target, value);
    return value;
  }

 private:
  NSObject* _item;  // kept alive by the operand
  XQueryTypeID _type;
  XQueryTypeID _primitive;
  XQueryUntypedText _text;
  bool _scanned = false;
  std::optional<double> _double;
  Value _typed;
  std::vector<std::pair<XQueryTypeID, Value>> _casts;
};

// An operand of any number of items.
class Side {
 public:
  // Whether every item is one that atomizing accepts as it stands.
  bool read(const Value& operand) {
    const XQueryItemList items(operand.get());
    _items.reserve(items.count());
    WorkPacer pacer;
    for (size_t index = 0; index < items.count(); ++index) {
      pacer.turn();
      if (!Comparand::isPossible(items[index])) return false;
      _items.emplace_back(items[index]);
    }
    return true;
  }

  size_t count() const { return _items.size(); }
  Comparand& operator[](size_t index) { return _items[index]; }

  template <class Condition>
  bool all(Condition condition) {
    WorkPacer pacer;
    return std::all_of(_items.begin(), _items.end(), [&](Comparand& item) {
      pacer.turn();
      return condition(item);
    });
  }

 private:
  std::vector<Comparand> _items;
};

Answer compareTexts(XQueryRelation relation, NSStringView a, NSStringView b) {
  if (relation.test == XQueryRelation::Equal) return answered(a.equals(b) != relation.negated);
  return answered(relation.holds(a.compare(b)));
}

Answer compareNumbers(XQueryRelation relation, Comparand& a, Comparand& b) {
  if (a.isExact() && b.isExact()) {
    if (XQueryIsNaN(a.number()) || XQueryIsNaN(b.number())) return Answer::No;
    return answered(relation.holds(a.number().compare(b.number())));
  }
  const std::optional<double> x = a.asDouble();
  const std::optional<double> y = b.asDouble();
  if (!x || !y) return Answer::Unknown;
  if (std::isnan(*x) || std::isnan(*y)) return Answer::No;
  return answered(relation.holds(orderOf(*x, *y)));
}

Answer compareWithoutCasting(XQueryRelation relation, Comparand& a, Comparand& b) {
  const bool asStrings = (a.isText() && b.isText()) || (a.isStringType() && b.isStringType());
  if (asStrings) return compareTexts(relation, a.text(), b.text());
  if (a.isNumeric() || b.isNumeric()) return compareNumbers(relation, a, b);
  return Answer::Unknown;
}

Value comparePair(int code, Comparand& a, Comparand& b, XQueryContext& context) {
  const Answer answer = compareWithoutCasting(XQueryRelationForCode(code), a, b);
  if (answer != Answer::Unknown) return NSNumber::numberWithBool(answer == Answer::Yes);
  const XQueryPairTargets targets = XQueryGeneralComparisonTargets(a.type(), b.type());
  const Value x = a.valueAs(targets.left, context);
  const Value y = b.valueAs(targets.right, context);
  return XQueryOperatorExpr::compareValue(x, y, code, context);
}

// --- many pairs ----------------------------------------------------------------------------------

// Below this number of pairs looking at each costs less than preparing the sides.
constexpr size_t manyPairs = 64;

// Whether the relation holds for any pair of keys. Neither list is empty.
template <class Key>
bool holdsForAnyPair(XQueryRelation relation, std::vector<Key>& left, std::vector<Key>& right) {
  WorkPacer pacer;
  const auto below = [&pacer](const Key& a, const Key& b) {
    pacer.turn();
    return orderOf(a, b) < 0;
  };
  if (relation.test == XQueryRelation::Equal) {
    if (relation.negated) {
      // Some pair differs unless all keys of both sides are one and the same.
      const auto differs = [&](const Key& key) { return orderOf(key, left.front()) != 0; };
      return std::any_of(right.begin(), right.end(), differs) ||
             std::any_of(left.begin(), left.end(), differs);
    }
    std::vector<Key>& sorted = left.size() < right.size() ? left : right;
    const std::vector<Key>& sought = left.size() < right.size() ? right : left;
    std::sort(sorted.begin(), sorted.end(), below);
    return std::any_of(sought.begin(), sought.end(), [&](const Key& key) {
      return std::binary_search(sorted.begin(), sorted.end(), key, below);
    });
  }
  // Below, or not above: the smallest against the greatest decides; and the mirror image.
  const bool wantsSmallLeft = (relation.test == XQueryRelation::Less) != relation.negated;
  const auto [leftLeast, leftMost] = std::minmax_element(left.begin(), left.end(), below);
  const auto [rightLeast, rightMost] = std::minmax_element(right.begin(), right.end(), below);
  return relation.holds(wantsSmallLeft ? orderOf(*leftLeast, *rightMost)
                                       : orderOf(*leftMost, *rightLeast));
}

template <class Key, class KeyOf>
Answer compareByKeys(XQueryRelation relation, Side& left, Side& right, KeyOf keyOf) {
  const auto keysOf = [&keyOf](Side& side) {
    std::vector<Key> keys;
    keys.reserve(side.count());
    WorkPacer pacer;
    for (size_t index = 0; index < side.count(); ++index) {
      pacer.turn();
      keys.push_back(keyOf(side[index]));
    }
    return keys;
  };
  std::vector<Key> leftKeys = keysOf(left);
  std::vector<Key> rightKeys = keysOf(right);
  return answered(holdsForAnyPair(relation, leftKeys, rightKeys));
}

// Unknown when the sides are too mixed, or some pair may fail.
Answer compareManyPairs(XQueryRelation relation, Side& left, Side& right) {
  const auto isText = [](Comparand& item) { return item.isText(); };
  if (left.all(isText) && right.all(isText)) {
    return compareByKeys<NSStringView>(relation, left, right,
                                       [](Comparand& item) { return item.text(); });
  }
  const auto isSmallInteger = [](Comparand& item) { return item.asSmallInteger().has_value(); };
  if (left.all(isSmallInteger) && right.all(isSmallInteger)) {
    return compareByKeys<int64_t>(relation, left, right,
                                  [](Comparand& item) { return *item.asSmallInteger(); });
  }
  // By double when every pair has a double: one side is all doubles (or untyped, with numbers on
  // the other side only).
  const auto isDouble = [](Comparand& item) {
    return item.type() == XQueryTypeDouble && item.number().storage() == NSNumber::Storage::Double;
  };
  const auto isUntyped = [](Comparand& item) { return item.isUntyped(); };
  const auto isNumeric = [](Comparand& item) { return item.isNumeric(); };
  const bool byDouble = (left.all(isUntyped) && right.all(isNumeric)) ||
                        (left.all(isNumeric) && right.all(isUntyped)) ||
                        (left.all(isDouble) && right.all(isDouble));
  const auto isOrdered = [](Comparand& item) {
    const std::optional<double> value = item.asDouble();
    return value && !std::isnan(*value);
  };
  if (!byDouble || !left.all(isOrdered) || !right.all(isOrdered)) return Answer::Unknown;
  return compareByKeys<double>(relation, left, right,
                               [](Comparand& item) { return *item.asDouble(); });
}

// --- ranges --------------------------------------------------------------------------------------

// Every integer up to this magnitude is a double, and compares with doubles as itself.
constexpr int64_t exactIntegerBound = int64_t{1} << std::numeric_limits<double>::digits;

bool isWhole(int64_t) {
  return true;
}
bool isWhole(double value) {
  return value == std::trunc(value);
}

// Whether the relation holds between the value and any integer from `first` to `last`.
template <class Number>
bool holdsForRange(XQueryRelation relation, Number value, int64_t first, int64_t last) {
  const auto low = static_cast<Number>(first);
  const auto high = static_cast<Number>(last);
  switch (relation.test) {
    case XQueryRelation::Equal:
      if (relation.negated) return first != last || value != low;
      return value >= low && value <= high && isWhole(value);
    case XQueryRelation::Less:
      return relation.negated ? value >= low : value < high;
    case XQueryRelation::Greater:
      return relation.negated ? value <= high : value > low;
  }
  return false;
}

Answer compareWithRange(XQueryRelation relation, Comparand& item, int64_t first, int64_t last) {
  if (const auto value = item.asSmallInteger()) {
    return answered(holdsForRange(relation, *value, first, last));
  }
  const bool isDouble = item.isUntyped() || item.type() == XQueryTypeDouble;
  const std::optional<double> value = isDouble ? item.asDouble() : std::nullopt;
  if (!value) return Answer::Unknown;
  return answered(!std::isnan(*value) && holdsForRange(relation, *value, first, last));
}

}  // namespace

Value XQueryGeneralComparisonShortcut(int type, const Value& left, const Value& right,
                                      XQueryContext& context) {
  if (!isGeneralComparison(type) || !left || !right) return Value();
  const int code = type + generalToValue;
  // Most operands are single items, which need no list.
  if (Comparand::isPossible(left.get()) && Comparand::isPossible(right.get())) {
    Comparand a(left.get());
    Comparand b(right.get());
    return comparePair(code, a, b, context);
  }
  Side leftSide;
  Side rightSide;
  if (!leftSide.read(left) || !rightSide.read(right)) return Value();
  if (leftSide.count() == 0 || rightSide.count() == 0) return NSNull::null();
  if (leftSide.count() >= manyPairs / rightSide.count()) {
    const Answer answer = compareManyPairs(XQueryRelationForCode(code), leftSide, rightSide);
    if (answer != Answer::Unknown) return NSNumber::numberWithBool(answer == Answer::Yes);
  }
  WorkPacer pacer;
  for (size_t i = 0; i < leftSide.count(); ++i) {
    for (size_t j = 0; j < rightSide.count(); ++j) {
      pacer.turn();
      Value answer = comparePair(code, leftSide[i], rightSide[j], context);
      if (!(answer.get() == NSNumber::falseValue())) return answer;
    }
  }
  return NSNumber::falseValue();
}

Value XQueryGeneralComparisonWithRange(int type, const Value& left, int64_t first, int64_t last) {
  if (!isGeneralComparison(type) || first < -exactIntegerBound || last > exactIntegerBound) {
    return Value();
  }
  const XQueryRelation relation = XQueryRelationForCode(type + generalToValue);
  const XQueryItemList items(left.get());
  if (items.count() == 0) return left ? Value(NSNull::null()) : Value();
  // An item that cannot be atomized fails before any pair is looked at.
  WorkPacer pacer;
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    if (!Comparand::isPossible(items[i])) return Value();
  }
  for (size_t i = 0; i < items.count(); ++i) {
    pacer.turn();
    Comparand item(items[i]);
    const Answer answer = compareWithRange(relation, item, first, last);
    if (answer == Answer::Unknown) return Value();
    if (answer == Answer::Yes) return NSNumber::trueValue();
  }
  return NSNumber::falseValue();
}

}  // namespace xquery
