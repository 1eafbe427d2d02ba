// Nobody can tell the table from looking through the list: the list is compared by identity, and
// what its nodes hold by a stamp; an item or a value of which it is not certain what it equals
// leaves everything to the call, whose arguments can be repeated.
#include "Plan/Operators/XQueryPositionLookup.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinKeyOrder.h"
#include "Plan/Operators/XQueryComparand.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryUntypedText.h"
#include "Types/XQueryValues.h"
#include "xquery/Collection.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

namespace xquery {
namespace {

// A shorter list is looked through as quickly.
constexpr size_t fewItems = 16;

bool isText(const NSObject& item) {
  return item.isNode() || isa<NSString>(&item);
}

bool isNaN(const NSObject& item) {
  const auto* number = dyn_cast<NSNumber>(&item);
  return number && std::isnan(number->doubleValue());
}

// Equal ones have the same. Of texts and numbers.
uint32_t hashOf(const NSObject& item) {
  if (isText(item)) return XQueryHashOfKey(XQueryUntypedText(item).view());
  return XQueryHashOfKey(cast<NSNumber>(&item)->doubleValue());
}

// Of an item to the value that is looked for, which is no node.
bool isEqual(const NSObject& item, const NSObject& wanted) {
  if (!item.isNode()) return XQueryObjectsEqual(item, wanted);
  return isa<NSString>(&wanted) &&
         XQueryUntypedText(item).view().equals(XQueryUntypedText(wanted).view());
}

}  // namespace

// Texts and numbers by their hash. Other values equal neither.
class XQueryPositionLookup::Table final : public XQueryKeptValue {
 public:
  // Null for a list with an item that atomizing may refuse, or a NaN.
  static std::shared_ptr<Table> of(const NSArray& list) {
    auto table = std::make_shared<Table>();
    WorkPacer pacer;
    for (size_t index = 0; index < list.count(); ++index) {
      pacer.turn();
      const NSObject* item = list.objectAtIndex(index);
      if (!XQueryComparand::isPossible(item) || isNaN(*item)) return nullptr;
      if (!isText(*item) && !isa<NSNumber>(item)) continue;
      table->_entries.push_back({hashOf(*item), static_cast<uint32_t>(index)});
    }
    std::sort(table->_entries.begin(), table->_entries.end(), [&](const Entry& a, const Entry& b) {
      pacer.turn();
      return a.hash != b.hash ? a.hash < b.hash : a.index < b.index;
    });
    table->_bytes = table->_entries.size() * sizeof(Entry);
    countValueBytes(table->_bytes);
    return table;
  }
  ~Table() override { uncountValueBytes(_bytes); }

  Value positionsOf(const NSObject& wanted, const NSArray& list) const {
    XQueryGatherer positions;
    const uint32_t hash = hashOf(wanted);
    auto entry =
        std::lower_bound(_entries.begin(), _entries.end(), hash,
                         [](const Entry& each, uint32_t sought) { return each.hash < sought; });
    WorkPacer pacer;
    for (; entry != _entries.end() && entry->hash == hash; ++entry) {
      pacer.turn();
      if (!isEqual(*list.objectAtIndex(entry->index), wanted)) continue;
      positions.add(XQueryNumber::integerWithInt64(int64_t{entry->index} + 1));
    }
    return positions.value();
  }

 private:
  struct Entry {
    uint32_t hash;
    uint32_t index;
  };
  std::vector<Entry> _entries;
  size_t _bytes = 0;
};

// Null for the plain way.
std::shared_ptr<const XQueryPositionLookup::Table> XQueryPositionLookup::tableOf(
    const Value& list, XQueryContext& context) const {
  const auto* array = dyn_cast<NSArray>(list);
  if (!array || array->count() < fewItems || array->count() > UINT32_MAX) return nullptr;
  auto& keptValues = _internal(context).keptValues();
  if (keptValues.looksAway(*this)) return nullptr;
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = keptValues.use(*this, {&list, 1}, false, kept);
  if (use == XQueryKeptValues::Use::Second) {
    kept = Table::of(*array);
    keptValues.keep(*this, {&list, 1}, kept);
  }
  return std::static_pointer_cast<const Table>(kept);
}

Value XQueryPositionLookup::computeValue(XQueryContext& context) const {
  // Diagnostics show each error once.
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  const Value list = _list->evaluateWithContext(context);
  if (XQueryHasFailed(list, context)) return {};
  const auto table = tableOf(list, context);
  if (!table) return plain().evaluateWithContext(context);
  const Value wanted = normalised(_wanted->evaluateWithContext(context));
  if (XQueryHasFailed(wanted, context)) return {};
  // What is looked for is not atomized, and the items are no nodes then.
  if (wanted && wanted->isNode()) return NSNull::null();
  const bool isKnown =
      wanted && (isa<NSString>(wanted) || isa<NSNumber>(wanted)) && !isNaN(*wanted);
  if (!isKnown) return plain().evaluateWithContext(context);
  return table->positionsOf(*wanted, *cast<NSArray>(list.get()));
}

}  // namespace xquery
