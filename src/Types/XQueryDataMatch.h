// Finding slices of bytes between a start and an end pattern.
#pragma once

#include "xquery/Data.h"
#include "xquery/Object.h"

#include <optional>
#include <string_view>

namespace xquery {

struct XQueryDataRange {
  size_t position;
  size_t length;
  size_t end() const { return position + length; }
};

// The first occurrence of the pattern within [from, from + length) of the data. None when that
// range lies outside the data or is shorter than the pattern.
std::optional<XQueryDataRange> DataFind(std::string_view data, std::string_view pattern,
                                        size_t from, size_t length);
// An empty pattern matches at `from` with length 0.
std::optional<XQueryDataRange> DataMatchStart(std::string_view data, std::string_view pattern,
                                              size_t from);
// An empty pattern matches at the end of the data with length 0.
std::optional<XQueryDataRange> DataMatchEnd(std::string_view data, std::string_view pattern,
                                            size_t from);
// From the start match to the end of the end match, both included. A pattern is null (which is an
// empty pattern), an NSData, or an NSArray of NSData tried in order until one matches.
std::optional<XQueryDataRange> DataMatch(std::string_view data, const NSObject* start,
                                         const NSObject* end, size_t from);

// The first matching slice (an NSData), or, with `all`, every one (an NSArray of NSData). Null when
// there is none.
Value XQueryDataMatch(const NSData& data, const NSObject* start, const NSObject* end, bool all);

}  // namespace xquery
