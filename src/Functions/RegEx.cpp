#include "Functions/RegEx.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Functions/XQueryRegExCache.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryTypeTable.h"

#include <array>
#include <memory>

namespace xquery {
namespace {

// The arguments as strings, an omitted last one as the empty string.
template <size_t most>
class Strings {
 public:
  Strings(const Value* arguments, size_t count, XQueryContext& context) {
    for (size_t index = 0; index < count; ++index) {
      _values[index] = XQueryPromoteToString(arguments[index], context);
    }
    if (count < most) _values[most - 1] = NSString::empty();
  }

  const NSString* operator[](size_t index) const { return cast<NSString>(_values[index].get()); }
  NSStringView view(size_t index) const { return (*this)[index]->view(); }

 private:
  std::array<Value, most> _values;
};

// What compiling and searching take at most: so much, and so much more for each open group, of
// which there are never more than a limit.
size_t stackFor(NSStringView pattern) {
  constexpr size_t always = 40 * 1024;
  constexpr size_t perGroup = 768;
  constexpr size_t mostGroups = 250;
  static_assert(always + mostGroups * perGroup <= XQueryMostLibraryStack);
  size_t groups = 0;
  for (uint32_t at = pattern.find(u'('); at != NSStringView::notFound && groups < mostGroups;
       at = pattern.find(u'(', at + 1)) {
    ++groups;
  }
  return always + groups * perGroup;
}

Ref<XQueryRegEx> compiled(NSStringView pattern, NSStringView flags, XQueryContext& context) {
  XQueryCheckStackFor(_internal(context), stackFor(pattern));
  std::shared_ptr<XQueryRegExCache>& cache = _internal(context).regExCache();
  if (!cache) cache = std::make_shared<XQueryRegExCache>();
  return cache->regExp(pattern, flags);
}

}  // namespace

Value fn_matches(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const Strings<3> strings(arguments, count, context);
  const auto regEx = compiled(strings.view(1), strings.view(2), context);
  return regEx ? regEx->hasMatch(strings[0]) : Value();
}

Value fn_replace(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 3 || count > 4) return Value();
  const Strings<4> strings(arguments, count, context);
  const auto regEx = compiled(strings.view(1), strings.view(3), context);
  return regEx ? regEx->replace(strings[0], strings.view(2)) : Value();
}

// The empty input is answered before the pattern is looked at.
Value fn_tokenize(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 2 || count > 3) return Value();
  const Strings<3> strings(arguments, count, context);
  if (strings.view(0).isEmpty()) {
    return XQueryCastAsTypeForContext(NSString::empty(), XQueryTypeString, context);
  }
  const auto regEx = compiled(strings.view(1), strings.view(2), context);
  return regEx ? regEx->tokenize(strings[0]) : Value();
}

}  // namespace xquery
