// Who picks the items that a condition can hold for, so that it is not asked of every item.
//
// Clauses, quantifiers and steps ask each item in turn. One of them may be given a picker, which
// knows beforehand which items are worth asking. Whoever gives one answers for it that nobody can
// tell: that asking the items left out would neither have failed nor left anything behind.
#pragma once

#include "xquery/Object.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <vector>

namespace xquery {

class XQueryContext;

struct XQueryPick {
  uint32_t position;  // of the item, counted from 0
  bool isSure;        // the condition holds; otherwise it has to be asked
  bool operator==(const XQueryPick&) const = default;
};

struct XQueryPicks {
  // Set beforehand: of the sure ones the first is enough.
  bool wantsFirst = false;
  // Set beforehand: where all that are chosen are sure, their number is enough. Of nodes that is
  // the number of different ones.
  enum class Number : uint8_t { Unwanted, OfItems, OfNodes } wantedNumber = Number::Unwanted;
  std::shared_ptr<const std::vector<Value>> items;  // all of them
  std::vector<XQueryPick> chosen;                   // in the order of the items, each once
  std::optional<uint64_t> number;                   // in place of the list of those, if wanted
};

class XQueryPicker {
 public:
  XQueryPicker() = default;
  XQueryPicker(const XQueryPicker&) = delete;
  XQueryPicker& operator=(const XQueryPicker&) = delete;
  virtual ~XQueryPicker() = default;

  // Lists the items; false when there are unusual ones.
  using Lister = std::function<bool(std::vector<Value>& items)>;
  // Picks, for the variables and the focus as they are now; false when every item has to be asked.
  // `source` is all that the items depend on. Variables of the clause may be left set to any of the
  // items.
  virtual bool pick(const Value& source, const Lister& listItems, XQueryContext& context,
                    XQueryPicks& picks) const = 0;
};

}  // namespace xquery
