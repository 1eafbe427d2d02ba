// Items that meet two comparisons, the first of them an equality, by both at once: the keys of the
// second in rows, a row for each value of the first, sorted. Which items of a row meet a probe of
// the second is then found by binary search. Of "$b/@currency = $a/@currency and $b/price >
// $a/price" either table alone picks a large part of all the books for each $a.
//
// Or both are orders of the same keys: then these are one row, of which the first comparison leaves
// a stretch, and the second a stretch of that, as in "$b/price > $a/low and $b/price < $a/high".
#pragma once

#include "Plan/Joins/XQueryJoinTable.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

namespace xquery {

class XQueryJoinPair {
 public:
  using Table = XQueryJoinTable;
  using Question = Table::Question;

  // The tables are of the same items and outlive the pair; null where they do not make one.
  static std::unique_ptr<XQueryJoinPair> of(Table& first, const Question& askedOfFirst,
                                            Table& second, const Question& askedOfSecond);
  ~XQueryJoinPair();
  XQueryJoinPair(const XQueryJoinPair&) = delete;
  XQueryJoinPair& operator=(const XQueryJoinPair&) = delete;

  // Whether a table may be the first one.
  static bool isOfRows(const Table& table) {
    return table._relation.test == XQueryRelation::Equal && !table._isComplement;
  }
  static bool isOfOrder(const Table& table) {
    return table._relation.test != XQueryRelation::Equal && !table._isComplement &&
           !table._isPrefix && !table._isIdentity;
  }
  // Whether the questions are of the kinds that it was made for.
  bool answersFor(const Question& first, const Question& second) const;
  // How many items meet both.
  uint64_t numberFor(const Question& first, const Question& second);
  // Puts them into the list, which is empty, in the order of the items; with `wantsFirst`, the
  // first of them alone.
  void select(const Question& first, const Question& second, bool areSure, bool wantsFirst,
              Table::Selection& selection);

 private:
  XQueryJoinPair(Table& first, Table::Way firstWay, Table& second, Table::Way secondWay)
      : _first(first), _second(second), _firstWay(firstWay), _secondWay(secondWay) {}

  bool takesStretches(const Question& first);
  template <class FirstKey, class SecondKey>
  void fill(Table::Form<FirstKey>& first, const Table::Form<SecondKey>& second);
  template <class Key>
  void sortRows(const std::vector<Key>& keys);
  // Calls visit(keys) with the keys of the second table whose items meet both.
  template <class Visit>
  void forEachMet(const Question& first, const Question& second, Visit visit);

  Table& _first;
  Table& _second;
  const Table::Way _firstWay;
  const Table::Way _secondWay;
  // Of the row of each key of the first table that is the first of its value, and the end.
  std::vector<uint32_t> _starts;
  std::vector<uint32_t> _keys;  // of the second table, row after row
  bool _areStretches = false;
  size_t _countedBytes = 0;
};

}  // namespace xquery
