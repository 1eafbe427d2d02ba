#include "Functions/XQueryRegExCache.h"

#include <algorithm>

namespace xquery {

Ref<XQueryRegEx> XQueryRegExCache::regExp(NSStringView pattern, NSStringView withFlags) {
  uint32_t flags = 0;
  if (!XQueryRegEx::flagsFromString(withFlags, flags)) return nullptr;
  const uint32_t hash = pattern.hash();
  const auto found = std::find_if(_entries.begin(), _entries.end(), [&](const Entry& entry) {
    return entry.hash == hash && entry.regEx->flags() == flags && entry.pattern->view() == pattern;
  });
  if (found != _entries.end()) {
    std::rotate(_entries.begin(), found, found + 1);
    return _entries.front().regEx;
  }
  Ref<XQueryRegEx> regEx = XQueryRegEx::regExp(pattern, flags);
  if (!regEx) return nullptr;
  _bytes += regEx->byteCount();
  _entries.insert(_entries.begin(), {hash, NSString::stringWithView(pattern), regEx});
  while (_entries.size() > 1 && (_entries.size() > mostEntries || _bytes > mostBytes)) {
    _bytes -= _entries.back().regEx->byteCount();
    _entries.pop_back();
  }
  return regEx;
}

}  // namespace xquery
