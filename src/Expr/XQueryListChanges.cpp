#include "Expr/XQueryListChanges.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace xquery {
namespace {

// A reference is a pointer and knows nothing of where it stands: it is moved by moving its bytes,
// and null by being zero.
static_assert(sizeof(Value) == sizeof(void*));

constexpr size_t bytesPerStep = 65536;

void moveItems(std::vector<Value>& items, size_t from, size_t to, size_t count) {
  if (count == 0) return;
  checkWork(count * sizeof(Value) / bytesPerStep);
  void* const target = items.data() + to;
  std::memmove(target, items.data() + from, count * sizeof(Value));
}

// For places whose references have been moved elsewhere.
void makeNull(std::vector<Value>& items, size_t first, size_t count) {
  if (count == 0) return;
  void* const target = items.data() + first;
  std::memset(target, 0, count * sizeof(Value));
}

}  // namespace

NSArray* XQueryOwnArray(const Value& value) {
  auto* array = dyn_cast<NSArray>(value);
  return array && NSCounting::hasOneReference(*array) ? array : nullptr;
}

void XQueryAppendItems(const std::vector<Value>& items, size_t first, size_t count,
                       std::vector<Value>& to) {
  constexpr size_t copiesPerStep = 4096;
  const size_t needed = to.size() + count;
  if (to.capacity() < needed) to.reserve(std::max(needed, 2 * to.capacity()));
  for (auto from = items.begin() + static_cast<std::ptrdiff_t>(first); count > 0;) {
    checkWork();
    const auto some = static_cast<std::ptrdiff_t>(std::min(copiesPerStep, count));
    to.insert(to.end(), from, from + some);
    from += some;
    count -= static_cast<size_t>(some);
  }
}

void XQueryInsertItems(std::vector<Value>& items, size_t before, std::vector<Value> inserted) {
  const size_t behind = items.size() - before;
  items.resize(items.size() + inserted.size());
  moveItems(items, before, before + inserted.size(), behind);
  makeNull(items, before, inserted.size());
  WorkPacer pacer;
  for (size_t index = 0; index < inserted.size(); ++index) {
    pacer.turn();
    items[before + index] = std::move(inserted[index]);
  }
}

void XQueryEraseItems(std::vector<Value>& items, size_t first, size_t count) {
  WorkPacer pacer;
  for (size_t index = first; index < first + count; ++index) {
    pacer.turn();
    items[index] = Value();
  }
  const size_t left = items.size() - count;
  moveItems(items, first + count, first, left - first);
  makeNull(items, left, count);
  items.resize(left);
  constexpr size_t mostEmptyShare = 4;
  if (items.capacity() / mostEmptyShare > left) items.shrink_to_fit();
}

}  // namespace xquery
