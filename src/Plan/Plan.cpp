#include "Plan/Plan.h"

#include "Plan/Planning.h"
#include "Plan/Profile/XQueryProfiledProgram.h"

#include <cstdlib>
#include <string_view>

namespace xquery {

bool XQueryPlanIsEnabled() {
  const char* value = std::getenv("XQUERY_PLAN");
  return !value || std::string_view(value) != "0";
}

namespace {

void applyRules(XQueryPlanning& planning, std::span<const XQueryRule> rules,
                std::vector<XQueryPlanNote>* notes) {
  for (const XQueryRule& rule : rules) {
    planning.beginRule(rule, notes);
    rule.apply(planning);
  }
}

}  // namespace

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              std::span<const XQueryRule> rules) {
  XQueryProgram program(prolog, body);
  // Most queries of a line or two hold nothing that any rule could change.
  if (program.placeCount() < 2) return body;
  XQueryPlanning planning(program);
  applyRules(planning, rules, nullptr);
  return program.install();
}

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection) {
  XQueryProgram program(prolog, body);
  if (program.placeCount() < 2) {
    projection = XQueryPlanProjection(program, XQueryFactTable(program));
    return body;
  }
  XQueryPlanning planning(program);
  projection = XQueryPlanProjection(program, planning.facts);
  applyRules(planning, XQueryRules(), nullptr);
  return program.install();
}

Ref<XQueryExpr> XQueryPlanned(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                              XQueryProjectionPlan& projection, XQueryPlanReport& report) {
  XQueryProgram program(prolog, body);
  XQueryPlanning planning(program);
  projection = XQueryPlanProjection(program, planning.facts);
  std::vector<XQueryPlanNote> notes;
  applyRules(planning, XQueryRules(), &notes);
  report = XQueryPlanReport(planning, prolog, std::move(notes));
  report.addInput(planning, prolog, projection);
  return program.install();
}

Ref<XQueryExpr> XQueryProfiled(const XQueryProlog& prolog, const Ref<XQueryExpr>& body,
                               std::optional<XQueryProjectionPlan>& projection,
                               XQueryProfiledProgram& profiled) {
  XQueryProgram program(prolog, body);
  XQueryPlanning planning(program);
  std::vector<XQueryPlanNote> notes;
  if (XQueryPlanIsEnabled()) {
    projection = XQueryPlanProjection(program, planning.facts);
    applyRules(planning, XQueryRules(), &notes);
  }
  const XQueryPlanReport report(planning, prolog, std::move(notes));
  XQueryProfileProgram(planning, report, prolog, profiled);
  return program.install();
}

}  // namespace xquery
