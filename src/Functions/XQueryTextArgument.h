// String arguments of functions, read where they lie.
//
// Promoting an argument makes a typed string of it, which a function that only looks at the text
// throws away again. A node's text and a string's are read in place instead, which is the same text
// since their promotion cannot fail; everything else is promoted as the rule says.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "Types/XQueryUntypedText.h"
#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class XQueryContext;

class XQueryTextArgument {
 public:
  // Raises what XQueryPromoteToString raises. The argument must outlive the text.
  XQueryTextArgument(const Value& argument, XQueryContext& context);

  NSStringView view() const { return _promoted ? _promoted->view() : _text.view(); }

 private:
  XQueryUntypedText _text;
  Ref<NSString> _promoted;  // where the text could not be read in place
};

// The optional argument at the index names a collation: it must be a string, and has no effect,
// since all texts are ordered by code point.
void XQueryCheckCollation(const Value* arguments, size_t count, size_t index,
                          XQueryContext& context);

// The only argument, or the context item without one. Null when there is neither, and for more
// arguments than one.
Value XQueryArgumentOrContextItem(const Value* arguments, size_t count, XQueryContext& context);

}  // namespace xquery
