// The order of keys, and sorting by it.
//
// The plain comparison looks at the types of both keys every time. The sort asks it only where it
// must: before the sort every key gets a rank, a 64-bit number, such that of two keys with
// different ranks the one with the lower rank comes first. Each column of keys (one per order spec)
// is ranked by what all its keys have in common:
//
//   numbers    by value as a double, into which exact numbers go without changing their order; a
//              tie is decided by the exact comparison, unless the column holds only numbers that
//              are doubles or integers that a double holds exactly
//   booleans   as the numbers 0 and 1
//   strings    by the eight characters after what all of them begin with, up to the first that is
//              not ASCII; a tie is decided by the whole strings, unless no string of the column has
//              more than what is ranked
//   any other  all alike, so that the plain comparison decides
//
// Empty keys rank below or above all others of their column, as the empty order says; where that
// leaves a tie with a key that is not empty, the plain comparison decides. For a descending order
// the ranks are complemented. So every single comparison has the plain one's answer, and both sorts
// are the same algorithm. Where only the first few items are wanted, and every two keys of a column
// are known to have an order that does not contradict itself, these are picked without sorting the
// others.
#include "Expr/Clauses/XQueryFLWORSort.h"

#include "Expr/Clauses/StableMergeSort.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/NSDecimal.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/String.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <functional>
#include <limits>
#include <utility>

namespace xquery {
namespace {

XQueryTypeID primitiveTypeOf(const NSObject& key) {
  return XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(&key));
}

bool isEmptyKey(const NSObject& key) {
  return key.kind() == Kind::Null;
}

// --- the plain comparison ------------------------------------------------------------------------

class KeyOrder {
 public:
  KeyOrder(const XQuerySortList& list, bool ascending, bool emptyLeast)
      : _list(list), _ascending(ascending), _emptyLeast(emptyLeast) {}

  // Below, at or above zero in the order asked for.
  int compare(const XQuerySortItem& a, const XQuerySortItem& b) {
    for (size_t k = 0; k < _list.keyCount; ++k) {
      if (const int answer = compare(a, b, k)) return answer;
    }
    return 0;
  }
  int compare(const XQuerySortItem& a, const XQuerySortItem& b, size_t k) {
    const int raw = compareKeys(_list.key(a, k), _list.key(b, k));
    return _ascending ? raw : -raw;
  }
  bool isComparable() const { return _isComparable; }
  bool ascending() const { return _ascending; }
  bool emptyLeast() const { return _emptyLeast; }

 private:
  int compareKeys(const NSObject& a, const NSObject& b) {
    if (isEmptyKey(a) && isEmptyKey(b)) return 0;
    if (isEmptyKey(a)) return _emptyLeast ? -1 : 1;
    if (isEmptyKey(b)) return _emptyLeast ? 1 : -1;
    switch (commonType(a, b)) {
      case XQueryTypeString:
        return cast<NSString>(&a)->compare(*cast<NSString>(&b));
      case XQueryTypeBoolean:
      case XQueryTypeDouble:
      case XQueryTypeFloat:
      case XQueryTypeDecimal:
        return cast<NSNumber>(&a)->compare(*cast<NSNumber>(&b));
      default:
        // Some order, so that the sort ends; its result is thrown away.
        _isComparable = false;
        return std::less<>()(&a, &b) ? -1 : 1;
    }
  }

  static XQueryTypeID commonType(const NSObject& a, const NSObject& b) {
    const XQueryTypeID typeA = primitiveTypeOf(a);
    const XQueryTypeID typeB = primitiveTypeOf(b);
    return typeA == typeB ? typeA : XQueryLeastCommonNumericType(typeA, typeB);
  }

  const XQuerySortList& _list;
  bool _ascending;
  bool _emptyLeast;
  bool _isComparable = true;
};

// --- ranks ---------------------------------------------------------------------------------------

constexpr uint64_t lowestRank = 0;
constexpr uint64_t highestRank = std::numeric_limits<uint64_t>::max();

// The bits of a double, turned so that they order as the numbers do. NaN is below every number but
// above an empty key that is least.
uint64_t rankOfNumber(double number) {
  if (std::isnan(number)) return lowestRank + 1;
  constexpr uint64_t signBit = uint64_t{1} << 63;
  const auto bits = std::bit_cast<uint64_t>(number == 0 ? 0.0 : number);
  return bits & signBit ? ~bits : bits | signBit;
}

// Ranks strings that all begin with the same `from` units by the ones that follow. The order beyond
// ASCII is left to the comparison of the whole strings: there the rank ends.
constexpr uint32_t rankedUnits = 8;
constexpr uint32_t beyondASCII = 0x80;

uint64_t rankOfString(NSStringView text, uint32_t from) {
  uint64_t rank = 0;
  const uint32_t count = std::min(text.length() - from, rankedUnits);
  for (uint32_t index = 0; index < count; ++index) {
    const uint32_t unit = std::min<uint32_t>(text[from + index], beyondASCII);
    rank |= uint64_t{unit} << (8 * (rankedUnits - 1 - index));
    if (unit == beyondASCII) break;
  }
  return rank;
}

// Whether only an equal string can have the same rank.
bool isExactlyRanked(NSStringView text, uint32_t from) {
  if (text.length() - from > rankedUnits) return false;
  for (uint32_t index = from; index < text.length(); ++index) {
    if (text[index] == 0 || text[index] >= beyondASCII) return false;
  }
  return true;
}

enum class Family : uint8_t { None, Numbers, Booleans, Strings, Other };

Family familyOf(const NSObject& key) {
  switch (primitiveTypeOf(key)) {
    case XQueryTypeString:
      return Family::Strings;
    case XQueryTypeBoolean:
      return Family::Booleans;
    case XQueryTypeDouble:
    case XQueryTypeFloat:
    case XQueryTypeDecimal:
      return Family::Numbers;
    default:
      return Family::Other;
  }
}

// What all keys of a column that are not empty belong to; None without such keys.
Family familyOfColumn(const XQuerySortList& list, size_t k) {
  Family family = Family::None;
  WorkPacer pacer;
  for (const XQuerySortItem& item : list.items) {
    pacer.turn();
    const NSObject& key = list.key(item, k);
    if (isEmptyKey(key)) continue;
    const Family own = familyOf(key);
    if (own == Family::Other || (family != Family::None && family != own)) return Family::Other;
    family = own;
  }
  return family;
}

// Whether numbers that are equal as doubles are equal.
bool isExactAsDouble(const NSNumber& number) {
  constexpr int64_t bound = int64_t{1} << std::numeric_limits<double>::digits;
  const NSDecimal* decimal = number.storedDecimal();
  if (!decimal) {
    const NSNumber::Storage storage = number.storage();
    return storage != NSNumber::Storage::Int64 && storage != NSNumber::Storage::UInt64;
  }
  return decimal->isSmallInteger() && decimal->smallInteger() >= -bound &&
         decimal->smallInteger() <= bound;
}

// How many units all the strings of a column begin with.
uint32_t commonPrefix(const XQuerySortList& list, size_t k) {
  NSStringView prefix;
  bool isFirst = true;
  constexpr uint32_t unitsPerStep = 4096;
  for (const XQuerySortItem& item : list.items) {
    const NSObject& key = list.key(item, k);
    if (isEmptyKey(key)) continue;
    const NSStringView text = cast<NSString>(&key)->view();
    if (std::exchange(isFirst, false)) prefix = text;
    const uint32_t most = std::min(prefix.length(), text.length());
    uint32_t shared = 0;
    while (shared < most && prefix[shared] == text[shared] && text[shared] < beyondASCII) ++shared;
    checkWork(1 + shared / unitsPerStep);
    prefix = prefix.substring(0, shared);
    if (shared == 0) break;
  }
  return prefix.length();
}

// The ranks of one column, by item.
class Column {
 public:
  Column(const XQuerySortList& list, size_t k, const KeyOrder& order)
      : _family(familyOfColumn(list, k)), _tiesAreEqual(_family != Family::Other) {
    if (_family == Family::Strings) _prefix = commonPrefix(list, k);
    _ranks.reserve(list.items.size());
    WorkPacer pacer;
    for (const XQuerySortItem& item : list.items) {
      pacer.turn();
      const uint64_t rank = rankOf(list.key(item, k), order.emptyLeast());
      _ranks.push_back(order.ascending() ? rank : ~rank);
    }
  }
  uint64_t rank(size_t item) const { return _ranks[item]; }
  bool tiesAreEqual() const { return _tiesAreEqual; }
  // Whether the order is one of all keys. An exact number may be equal to a double to which two
  // exact numbers are equal that are not equal to each other.
  bool isTotal() const { return _family != Family::Other && !(_hasDoubles && !_tiesAreEqual); }

 private:
  uint64_t rankOf(const NSObject& key, bool emptyLeast) {
    if (_family == Family::Other) return lowestRank;
    if (isEmptyKey(key)) {
      // The empty string has the lowest rank too.
      if (_family == Family::Strings && emptyLeast) _tiesAreEqual = false;
      return emptyLeast ? lowestRank : highestRank;
    }
    if (_family == Family::Strings) {
      const NSStringView text = cast<NSString>(&key)->view();
      _tiesAreEqual = _tiesAreEqual && isExactlyRanked(text, _prefix);
      return rankOfString(text, _prefix);
    }
    const auto& number = *cast<NSNumber>(&key);
    _tiesAreEqual = _tiesAreEqual && isExactAsDouble(number);
    _hasDoubles = _hasDoubles || !number.storedDecimal();
    return rankOfNumber(number.doubleValue());
  }

  Family _family;
  bool _tiesAreEqual;
  bool _hasDoubles = false;  // numbers that are not stored as decimals
  uint32_t _prefix = 0;
  std::vector<uint64_t> _ranks;
};

// An item in the sort: its place, and its rank in the first column, which decides most comparisons.
struct Entry {
  uint64_t rank;
  size_t index;
};

class RankedOrder {
 public:
  RankedOrder(const XQuerySortList& list, KeyOrder& order) : _list(list), _order(order) {
    _columns.reserve(list.keyCount);
    for (size_t k = 0; k < list.keyCount; ++k) _columns.emplace_back(list, k, order);
  }

  std::vector<Entry> entries() const {
    std::vector<Entry> entries;
    entries.reserve(_list.items.size());
    WorkPacer pacer;
    for (size_t i = 0; i < _list.items.size(); ++i) {
      pacer.turn();
      entries.push_back({_columns.empty() ? lowestRank : _columns.front().rank(i), i});
    }
    return entries;
  }

  bool isTotal() const {
    return std::all_of(_columns.begin(), _columns.end(),
                       [](const auto& each) { return each.isTotal(); });
  }

  bool isBefore(const Entry& a, const Entry& b) {
    return a.rank != b.rank ? a.rank < b.rank : isTiedBefore(a.index, b.index);
  }

 private:
  bool isTiedBefore(size_t a, size_t b) {
    for (size_t k = 0; k < _columns.size(); ++k) {
      const Column& column = _columns[k];
      if (column.rank(a) != column.rank(b)) return column.rank(a) < column.rank(b);
      if (column.tiesAreEqual()) continue;
      if (const int answer = _order.compare(_list.items[a], _list.items[b], k)) return answer < 0;
    }
    return false;
  }

  const XQuerySortList& _list;
  KeyOrder& _order;
  std::vector<Column> _columns;
};

// Leaves the first `most` entries in their order. Of equal ones the earlier is the first.
void keepFirst(std::vector<Entry>& entries, size_t most, RankedOrder& order) {
  WorkPacer pacer;
  const auto isBefore = [&](const Entry& a, const Entry& b) {
    pacer.turn();
    if (order.isBefore(a, b)) return true;
    return !order.isBefore(b, a) && a.index < b.index;
  };
  std::vector<Entry> kept(entries.begin(), entries.begin() + static_cast<std::ptrdiff_t>(most));
  std::make_heap(kept.begin(), kept.end(), isBefore);
  for (size_t i = most; i < entries.size(); ++i) {
    if (!isBefore(entries[i], kept.front())) continue;
    std::pop_heap(kept.begin(), kept.end(), isBefore);
    kept.back() = entries[i];
    std::push_heap(kept.begin(), kept.end(), isBefore);
  }
  std::sort_heap(kept.begin(), kept.end(), isBefore);
  entries.swap(kept);
}

}  // namespace

bool XQueryFLWORSort(XQuerySortList& list, bool ascending, bool emptyLeast) {
  return XQueryFLWORSortFirst(list, ascending, emptyLeast, SIZE_MAX);
}

bool XQueryFLWORSortFirst(XQuerySortList& list, bool ascending, bool emptyLeast, size_t most) {
  if (list.items.size() < 2) return true;
  KeyOrder order(list, ascending, emptyLeast);
  RankedOrder ranked(list, order);
  std::vector<Entry> entries = ranked.entries();
  // For more of them the heap is no quicker than sorting.
  constexpr size_t part = 8;
  if (most > 0 && most <= entries.size() / part && ranked.isTotal()) {
    keepFirst(entries, most, ranked);
  } else {
    stableMergeSort(entries, [&](const Entry& a, const Entry& b) { return ranked.isBefore(a, b); });
  }
  std::vector<XQuerySortItem> sorted;
  sorted.reserve(entries.size());
  WorkPacer pacer;
  for (const Entry& entry : entries) {
    pacer.turn();
    sorted.push_back(std::move(list.items[entry.index]));
  }
  list.items.swap(sorted);
  return order.isComparable();
}

bool XQueryFLWORSortPlainly(XQuerySortList& list, bool ascending, bool emptyLeast) {
  KeyOrder order(list, ascending, emptyLeast);
  stableMergeSort(list.items, [&](const XQuerySortItem& a, const XQuerySortItem& b) {
    return order.compare(a, b) < 0;
  });
  return order.isComparable();
}

}  // namespace xquery
