#include "Types/XQueryDataMatch.h"

#include "Platform/Base/WorkMeter.h"
#include "xquery/Collection.h"

#include <cstring>
#include <vector>

namespace xquery {

namespace {

// Of a search, which is as fast as memory is read.
constexpr size_t bytesPerStep = 4096;

using Range = std::optional<XQueryDataRange>;
using Matcher = Range (*)(std::string_view data, std::string_view pattern, size_t from);

std::string_view bytesOf(const NSObject* pattern) {
  const NSData* data = dyn_cast<NSData>(pattern);
  return data ? data->bytes() : std::string_view();
}

// Patterns tried in order. The searches of one object must be from positions that never decrease: a
// pattern that is not found is not there from any later position either and is not looked for
// again, so that all searches together take time in proportion to the data.
class Alternatives {
 public:
  explicit Alternatives(const NSObject* patterns) {
    if (const NSArray* array = dyn_cast<NSArray>(patterns)) {
      for (const Value& pattern : array->objects()) _patterns.push_back(bytesOf(pattern.get()));
    } else {
      _patterns.push_back(bytesOf(patterns));
    }
  }

  Range match(Matcher matcher, std::string_view data, size_t from) {
    for (; _next < _patterns.size(); ++_next) {
      if (const Range found = matcher(data, _patterns[_next], from)) return found;
    }
    return std::nullopt;
  }

 private:
  std::vector<std::string_view> _patterns;
  size_t _next = 0;  // the first pattern that may still be found
};

Range matchBetween(std::string_view data, Alternatives& start, Alternatives& end, size_t from) {
  if (data.empty()) return std::nullopt;
  const Range first = start.match(DataMatchStart, data, from);
  if (!first) return std::nullopt;
  const Range last = end.match(DataMatchEnd, data, first->end());
  if (!last) return std::nullopt;
  return XQueryDataRange{first->position, last->end() - first->position};
}

Value sliceOf(const NSData& data, const XQueryDataRange& range) {
  return data.subdataWithRange(range.position, range.length);
}

}  // namespace

Range DataFind(std::string_view data, std::string_view pattern, size_t from, size_t length) {
  if (from > data.size() || length > data.size() - from || length < pattern.size()) {
    return std::nullopt;
  }
  if (pattern.empty()) return XQueryDataRange{from, 0};
  const void* found = memmem(data.data() + from, length, pattern.data(), pattern.size());
  if (!found) return std::nullopt;
  const auto position = static_cast<size_t>(static_cast<const char*>(found) - data.data());
  return XQueryDataRange{position, pattern.size()};
}

Range DataMatchStart(std::string_view data, std::string_view pattern, size_t from) {
  if (pattern.empty()) return XQueryDataRange{from, 0};
  if (from >= data.size()) return std::nullopt;
  return DataFind(data, pattern, from, data.size() - from);
}

Range DataMatchEnd(std::string_view data, std::string_view pattern, size_t from) {
  if (data.empty() || from > data.size()) return std::nullopt;
  if (pattern.empty()) return XQueryDataRange{data.size(), 0};
  return DataFind(data, pattern, from, data.size() - from);
}

Range DataMatch(std::string_view data, const NSObject* start, const NSObject* end, size_t from) {
  Alternatives starts(start);
  Alternatives ends(end);
  return matchBetween(data, starts, ends, from);
}

Value XQueryDataMatch(const NSData& data, const NSObject* start, const NSObject* end, bool all) {
  if (!all) {
    const Range range = DataMatch(data.bytes(), start, end, 0);
    return range ? sliceOf(data, *range) : nullptr;
  }
  Alternatives starts(start);
  Alternatives ends(end);
  std::vector<Value> slices;
  size_t position = 0;
  while (const Range range = matchBetween(data.bytes(), starts, ends, position)) {
    if (range->length == 0 || range->end() <= position) break;
    checkWork(1 + range->length / bytesPerStep);
    slices.push_back(sliceOf(data, *range));
    position = range->end();
  }
  if (slices.empty()) return nullptr;
  return NSArray::arrayWithObjects(std::move(slices));
}

}  // namespace xquery
