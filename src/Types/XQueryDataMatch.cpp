#include "Types/XQueryDataMatch.h"

#include "xquery/Collection.h"

#include <cstring>

namespace xquery {

namespace {

using Range = std::optional<XQueryDataRange>;
using Matcher = Range (*)(std::string_view data, std::string_view pattern, size_t from);

std::string_view bytesOf(const NSObject* pattern) {
  const NSData* data = dyn_cast<NSData>(pattern);
  return data ? data->bytes() : std::string_view();
}

Range matchAny(Matcher matcher, std::string_view data, const NSObject* patterns, size_t from) {
  const NSArray* alternatives = dyn_cast<NSArray>(patterns);
  if (!alternatives) return matcher(data, bytesOf(patterns), from);
  for (const Value& pattern : alternatives->objects()) {
    if (const Range found = matcher(data, bytesOf(pattern.get()), from)) return found;
  }
  return std::nullopt;
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
  if (data.empty()) return std::nullopt;
  const Range first = matchAny(DataMatchStart, data, start, from);
  if (!first) return std::nullopt;
  const Range last = matchAny(DataMatchEnd, data, end, first->end());
  if (!last) return std::nullopt;
  return XQueryDataRange{first->position, last->end() - first->position};
}

Value XQueryDataMatch(const NSData& data, const NSObject* start, const NSObject* end, bool all) {
  size_t position = 0;
  if (!all) {
    const Range range = DataMatch(data.bytes(), start, end, position);
    return range ? sliceOf(data, *range) : nullptr;
  }
  std::vector<Value> slices;
  while (const Range range = DataMatch(data.bytes(), start, end, position)) {
    if (range->length == 0 || range->end() <= position) break;
    slices.push_back(sliceOf(data, *range));
    position = range->end();
  }
  if (slices.empty()) return nullptr;
  return NSArray::arrayWithObjects(std::move(slices));
}

}  // namespace xquery
