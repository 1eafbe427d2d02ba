// Tables keyed by text that can be asked with borrowed text.
#pragma once

#include "xquery/String.h"

#include <cstddef>
#include <unordered_map>

namespace xquery {

struct StringTableHash {
  using is_transparent = void;
  size_t operator()(NSStringView text) const { return text.hash(); }
  size_t operator()(const Ref<NSString>& text) const { return text->hash(); }
};

struct StringTableEqual {
  using is_transparent = void;
  bool operator()(const Ref<NSString>& a, const Ref<NSString>& b) const {
    return a->isEqualToString(*b);
  }
  bool operator()(NSStringView a, const Ref<NSString>& b) const { return a.equals(b->view()); }
  bool operator()(const Ref<NSString>& a, NSStringView b) const { return a->view().equals(b); }
};

// The keys are never null.
template <class T>
using StringTable = std::unordered_map<Ref<NSString>, T, StringTableHash, StringTableEqual>;

}  // namespace xquery
