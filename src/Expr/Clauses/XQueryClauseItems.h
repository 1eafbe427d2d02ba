// The items that a for clause or a quantified clause walks, one at a time.
//
// The integers of a range such as "1 to 1000000" are made when they are asked for: a loop over
// them then needs no memory but for what it keeps. Nothing can tell the difference, since making an
// integer has no effect and a range of too many items is refused beforehand all the same.
#pragma once

#include "Expr/XQueryPicker.h"
#include "Expr/XQuerySequence.h"

#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryContext;
class XQueryContextInternal;
class XQueryItemFold;
class XQueryExpr;

class XQueryClauseItems {
 public:
  // Evaluates the expression, which may be null: no items. The elements of an array are the items.
  XQueryClauseItems(const XQueryExpr* expr, XQueryContext& context);
  // From now on arrays inside an array are walked, and NSNull in it is no item.
  void flatten();

  // An error has come up instead of the items.
  bool haveFailed() const { return _haveFailed; }
  size_t count() const { return _count; }
  // Whether they are the integers of a range, of which these are some.
  bool areIntegers() const { return _isRange; }
  // Sets a variable to one of these. Where nobody else has kept the integer that it holds, as a
  // result or in another variable, that becomes the new one.
  void setIntegerAt(size_t index, int64_t varID, XQueryContextInternal& context) const;
  // Adds these to a fold.
  void foldIntegers(XQueryItemFold& fold) const;
  // What the picker of the clause picks of them; false when each has to be asked.
  bool pick(const XQueryPicker* picker, XQueryContext& context, XQueryPicks& picks) const;
  Value operator[](size_t index) const;
  // The items that follow soon begin to come into the cache, with what lies behind them: of an
  // element, its attributes and first children. In a large document each would be waited for.
  void fetchBehind(size_t index) const;

 private:
  int64_t integerAt(size_t index) const {
    // Added as unsigned numbers: the last integer may be the greatest there is.
    return static_cast<int64_t>(static_cast<uint64_t>(_first) + static_cast<uint64_t>(index));
  }

  Value _value;          // of anything but a range
  XQueryItemList _list;  // over the value
  bool _isRange = false;
  bool _haveFailed = false;
  int64_t _first = 0;
  size_t _count = 0;
};

}  // namespace xquery
