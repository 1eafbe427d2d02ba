// What a query may do that its author hardly wants, found without evaluating it.
//
// A query that compiles is none the worse for warnings: they tell what fails whenever it is reached
// (functions and variables that do not exist, sides of an operator that do not go together), what
// is never used, never reached or never found, and where this language answers otherwise than the
// final XQuery 1.0. docs/warnings.md has each of them, with what to write instead.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XQuery.h"

#include <cstdint>
#include <string_view>
#include <vector>

namespace xquery {

struct XQueryWarning {
  std::string_view identifier;  // "unknown-function" and so on; they stay what they are
  Ref<NSString> text;           // one line for people, which may change
  Ref<NSString> name;           // of the function, variable or prefix it is about; null for others
  Ref<NSString> module;         // URL of the library module it is in; null for the query itself
  int64_t line = 0;             // in that module, counted from 1; 0 where it is not known
  int64_t column = 0;           // in characters, counted from 1; 0 where it is not known
  int64_t length = 0;           // of what it is about, in characters; 0 where it is not known
};

// The warnings of a query that was compiled to be explained, in the order of its text and behind
// them those of the modules that it imports, one after another. None for a query that was compiled
// in another way and for one with errors; at most 10,000. They are found while the query is
// compiled, within the limits of the compilation.
//
//   auto query = XQuery::xqueryWithSource("let $a := 1 return 2", XQueryLoading(), XQueryLimits(),
//                                         XQueryWay::Explained);
//   for (const XQueryWarning& warning : XQueryWarnings(*query)) {
//     show(warning.line, warning.text->utf8(), warning.identifier);
//   }
XQUERY_EXPORT std::vector<XQueryWarning> XQueryWarnings(const XQuery& query);

}  // namespace xquery
