// Conditions on the name of the context item: "name() = 'a'", "local-name(.) eq 'a'".
#pragma once

#include "Plan/Paths/XQueryNameChoice.h"
#include "xquery/String.h"

#include <optional>
#include <vector>

namespace xquery {

class XQueryExpr;

struct XQueryNameCondition {
  XQueryNameChoice::By by;           // a text
  std::vector<Ref<NSString>> texts;  // one at least; the name is one of them
};

// What the expression compares the name of the context item with: a string or, with "=", several.
std::optional<XQueryNameCondition> XQueryNameConditionIn(const XQueryExpr& expr);

}  // namespace xquery
