#include "Plan/Plan.h"

#include "Plan/Planning.h"

#include <cstdlib>
#include <string_view>

namespace xquery {

bool XQueryPlanIsEnabled() {
  const char* value = std::getenv("XQUERY_PLAN");
  return !value || std::string_view(value) != "0";
}

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              std::span<const XQueryRule> rules) {
  XQueryProgram program(prolog, body);
  // Most queries of a line or two hold nothing that any rule could change.
  if (program.placeCount() < 2) return body;
  XQueryPlanning planning(program);
  for (const XQueryRule& rule : rules) rule.apply(planning);
  return program.install();
}

}  // namespace xquery
