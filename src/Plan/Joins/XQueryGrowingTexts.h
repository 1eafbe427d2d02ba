// The texts of a list of items, as a set that reads no more of the list than it is asked for.
//
// Most questions whether a text is among many end at one that stands near the beginning, as many
// items have few values: "//speaker = $name". So items are read, and put into the set, when a text
// is looked for that none of those before has.
#pragma once

#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryUntypedText.h"
#include "xquery/Object.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace xquery {

class XQueryGrowingTexts {
 public:
  // Null where not every item is an untyped one or a text, so that what comparing it with a text
  // comes to depends on more than its text. The texts are those that the items have when they are
  // read: nothing may change them.
  [[nodiscard]] static std::unique_ptr<XQueryGrowingTexts> of(Value items);

  // Whether one of the items has the text; nothing where the set would take much of the memory that
  // is left to the evaluation.
  std::optional<bool> contains(NSStringView text);
  // How many of the items have been looked at.
  size_t readCount() const { return _readCount; }

 private:
  template <class T>
  using List = std::vector<T, ValueAllocator<T>>;
  struct Place {
    uint32_t hash = 0;
    uint32_t text = 0;  // its number, from 1 on; 0 for none
  };
  static constexpr size_t smallestTable = 16;

  explicit XQueryGrowingTexts(Value items) : _items(std::move(items)), _list(_items.get()) {}
  // The place of the text, or the free one where it belongs.
  size_t placeOf(NSStringView text, uint32_t hash) const;
  void grow();
  bool isTooLarge() const;

  const Value _items;
  const XQueryItemList _list;
  size_t _readCount = 0;
  List<XQueryUntypedText> _texts;  // each once
  List<Place> _table{smallestTable};
  int64_t _gatheredBytes = 0;  // of texts that had to be put together
};

}  // namespace xquery
