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
// is decided by the extremes of both sides, equality by a binary search.
#include "Plan/Operators/XQueryQuickComparison.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryComparand.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryString.h"
#include "xquery/Collection.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <optional>
#include <vector>

namespace xquery {
namespace {

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

// Exactly xs:integer, in a machine word.
const NSDecimal* smallInteger(const XQueryNumber& number) {
  if (number.typeID() != XQueryTypeInteger) return nullptr;
  const NSDecimal* decimal = number.storedDecimal();
  return decimal && decimal->isSmallInteger() ? decimal : nullptr;
}

// Null unless both operands are typed numbers (which the durations are not). Numbers are compared
// by their order, no relation holding for NaN; comparing integers in a word is that for them.
Value compareTypedNumbers(XQueryRelation relation, const NSObject* left, const NSObject* right) {
  const auto* a = dyn_cast<XQueryNumber>(left);
  const auto* b = a ? dyn_cast<XQueryNumber>(right) : nullptr;
  if (!b) return Value();
  const NSDecimal* x = smallInteger(*a);
  const NSDecimal* y = x ? smallInteger(*b) : nullptr;
  if (y) {
    return NSNumber::numberWithBool(relation.holds(orderOf(x->smallInteger(), y->smallInteger())));
  }
  if (!XQueryIsNumericTypeID(a->typeID()) || !XQueryIsNumericTypeID(b->typeID())) return Value();
  if (XQueryIsNaN(*a) || XQueryIsNaN(*b)) return NSNumber::numberWithBool(false);
  return NSNumber::numberWithBool(relation.holds(a->compare(*b)));
}

// Whether every item is one that atomizing accepts as it stands.
bool arePossible(const XQueryItemList& items) {
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    if (!XQueryComparand::isPossible(items[index])) return false;
  }
  return true;
}

// An operand of any number of items.
class Side {
 public:
  explicit Side(const XQueryItemList& items) {
    _items.reserve(items.count());
    WorkPacer pacer;
    for (size_t index = 0; index < items.count(); ++index) {
      pacer.turn();
      _items.emplace_back(items[index]);
    }
  }

  size_t count() const { return _items.size(); }
  XQueryComparand& operator[](size_t index) { return _items[index]; }

  template <class Condition>
  bool all(Condition condition) {
    WorkPacer pacer;
    return std::all_of(_items.begin(), _items.end(), [&](XQueryComparand& item) {
      pacer.turn();
      return condition(item);
    });
  }

 private:
  std::vector<XQueryComparand> _items;
};

Answer compareTexts(XQueryRelation relation, NSStringView a, NSStringView b) {
  if (relation.test == XQueryRelation::Equal) return answered(a.equals(b) != relation.negated);
  return answered(relation.holds(a.compare(b)));
}

Answer compareNumbers(XQueryRelation relation, XQueryComparand& a, XQueryComparand& b) {
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

Answer compareWithoutCasting(XQueryRelation relation, XQueryComparand& a, XQueryComparand& b) {
  const bool asStrings = (a.isText() && b.isText()) || (a.isStringType() && b.isStringType());
  if (asStrings) return compareTexts(relation, a.text(), b.text());
  if (a.isNumeric() || b.isNumeric()) return compareNumbers(relation, a, b);
  return Answer::Unknown;
}

Value comparePair(int code, XQueryComparand& a, XQueryComparand& b, XQueryContext& context) {
  const Answer answer = compareWithoutCasting(XQueryRelationForCode(code), a, b);
  if (answer != Answer::Unknown) return NSNumber::numberWithBool(answer == Answer::Yes);
  const XQueryPairTargets targets = XQueryGeneralComparisonTargets(a.type(), b.type());
  const Value x = a.valueAs(targets.left, context);
  const Value y = b.valueAs(targets.right, context);
  return XQueryOperatorExpr::compareValue(x, y, code, context);
}

// Most lists are compared with one item: they are looked at where they are.
Value compareWithEach(int code, const XQueryItemList& left, const XQueryItemList& right,
                      XQueryContext& context) {
  const bool isLeft = left.count() == 1;
  const XQueryItemList& others = isLeft ? right : left;
  XQueryComparand one(isLeft ? left[0] : right[0]);
  for (size_t index = 0; index < others.count(); ++index) {
    XQueryComparand other(others[index]);
    Value answer = comparePair(code, isLeft ? one : other, isLeft ? other : one, context);
    if (!(answer.get() == NSNumber::falseValue())) return answer;
  }
  return NSNumber::falseValue();
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
  const auto isText = [](XQueryComparand& item) { return item.isText(); };
  if (left.all(isText) && right.all(isText)) {
    return compareByKeys<NSStringView>(relation, left, right,
                                       [](XQueryComparand& item) { return item.text(); });
  }
  const auto isSmallInteger = [](XQueryComparand& item) {
    return item.asSmallInteger().has_value();
  };
  if (left.all(isSmallInteger) && right.all(isSmallInteger)) {
    return compareByKeys<int64_t>(relation, left, right,
                                  [](XQueryComparand& item) { return *item.asSmallInteger(); });
  }
  // By double when every pair has a double: one side is all doubles (or untyped, with numbers on
  // the other side only).
  const auto isDouble = [](XQueryComparand& item) {
    return item.type() == XQueryTypeDouble && item.number().storage() == NSNumber::Storage::Double;
  };
  const auto isUntyped = [](XQueryComparand& item) { return item.isUntyped(); };
  const auto isNumeric = [](XQueryComparand& item) { return item.isNumeric(); };
  const bool byDouble = (left.all(isUntyped) && right.all(isNumeric)) ||
                        (left.all(isNumeric) && right.all(isUntyped)) ||
                        (left.all(isDouble) && right.all(isDouble));
  const auto isOrdered = [](XQueryComparand& item) {
    const std::optional<double> value = item.asDouble();
    return value && !std::isnan(*value);
  };
  if (!byDouble || !left.all(isOrdered) || !right.all(isOrdered)) return Answer::Unknown;
  return compareByKeys<double>(relation, left, right,
                               [](XQueryComparand& item) { return *item.asDouble(); });
}

bool hasText(const NSObject* operand) {
  return XQueryIsUntyped(operand) || isa<XQueryString>(operand);
}

}  // namespace

Value XQueryQuickValueComparison(int type, const Value& left, const Value& right, XQueryContext&) {
  const XQueryRelation relation = XQueryRelationForCode(type);
  // An untyped operand is compared as a string, and so is every string type.
  if (hasText(left.get()) && hasText(right.get())) {
    const XQueryUntypedText a(*left);
    const XQueryUntypedText b(*right);
    return NSNumber::numberWithBool(compareTexts(relation, a.view(), b.view()) == Answer::Yes);
  }
  return compareTypedNumbers(relation, left.get(), right.get());
}

Value XQueryQuickGeneralComparison(int type, const Value& left, const Value& right,
                                   XQueryContext& context) {
  if (!left || !right) return Value();
  const int code = type + XQueryOperatorEq - XQueryOperatorEqual;
  // Most comparisons are of two single numbers, which need no conversion.
  const XQueryRelation relation = XQueryRelationForCode(code);
  if (Value truth = compareTypedNumbers(relation, left.get(), right.get())) return truth;
  // Most operands are single items, which need no list.
  if (XQueryComparand::isPossible(left.get()) && XQueryComparand::isPossible(right.get())) {
    XQueryComparand a(left.get());
    XQueryComparand b(right.get());
    return comparePair(code, a, b, context);
  }
  const XQueryItemList leftItems(left.get());
  const XQueryItemList rightItems(right.get());
  if (!arePossible(leftItems) || !arePossible(rightItems)) return Value();
  if (leftItems.count() == 0 || rightItems.count() == 0) return NSNull::null();
  const bool areMany = leftItems.count() >= manyPairs / rightItems.count();
  if (!areMany && (leftItems.count() == 1 || rightItems.count() == 1)) {
    return compareWithEach(code, leftItems, rightItems, context);
  }
  Side leftSide(leftItems);
  Side rightSide(rightItems);
  if (areMany) {
    const Answer answer = compareManyPairs(relation, leftSide, rightSide);
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

}  // namespace xquery
