// The regular expressions that a context compiled last, so that a pattern in a loop is compiled
// once.
#pragma once

#include "Functions/XQueryRegEx.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace xquery {

class XQueryRegExCache {
 public:
  static constexpr size_t mostEntries = 64;
  // Of compiled patterns together; the newest is kept whatever its size.
  static constexpr size_t mostBytes = size_t{1} << 20;

  // As XQueryRegEx answers it. A failure is not kept.
  [[nodiscard]] Ref<XQueryRegEx> regExp(NSStringView pattern, NSStringView withFlags);

  size_t count() const { return _entries.size(); }
  size_t byteCount() const { return _bytes; }

 private:
  struct Entry {
    uint32_t hash;
    Ref<NSString> pattern;  // as written: what it is translated to follows from it
    Ref<XQueryRegEx> regEx;
  };

  std::vector<Entry> _entries;  // the last used first
  size_t _bytes = 0;
};

}  // namespace xquery
