// Expressions in a few words, for people who look at a plan.
#pragma once

#include "Expr/XQueryParts.h"
#include "Plan/Facts.h"

#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class XQueryExpr;

// The expression itself without its parts, much as it is written: "for $x at $i in",
// "//item[...]/@id", "local:f(...)", "+". UTF-8; long literals are cut.
std::string XQueryLabelOf(const XQueryExpr& expr);
// What a part is to its whole, where the label of the whole does not say it: "where", "then".
// Empty for most.
std::string_view XQueryLabelOf(XQueryRole role);

// "one string", "any number of elements in document order", "nothing".
std::string XQueryLabelOfItems(const XQueryFacts& facts);
// What evaluating may read and do: "reads the context item", "makes nodes".
std::vector<std::string_view> XQueryLabelsOfDeeds(unsigned deeds);

}  // namespace xquery
