#include "Engine/Streams/XQueryStreamProgram.h"

#include "Plan/FactsAnalysis.h"
#include "Plan/Plan.h"
#include "Plan/Program.h"
#include "Plan/Rules/PlaceInside.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

namespace xquery {

namespace {

// Told like an error of compiling, so of the module in which the place is.
Ref<XQueryError> refusalOf(const XQueryProgram& program, const XQueryStreamPlan& plan,
                           const XQueryProlog& main) {
  const XQueryExpr& expr = *program[plan.refusedAt].expr;
  const auto error = XQueryErrorTrace::error(
      *XQueryErrors::notAStream.errorAtLine(expr.exprLine(), plan.reason),
      XQueryErrorTrace::traceInPlaces(main.modules().places(), expr.exprPlace()));
  const XQueryProlog* prolog = program.bodyOf(plan.refusedAt).prolog;
  if (!prolog || prolog == &main || !prolog->moduleURL()) return error;
  return XQueryError::errorInModule(*error, prolog->moduleURL()->absoluteString());
}

std::unique_ptr<XQueryStreamProgram> programOf(const XQueryProgram& program,
                                               const XQueryStreamPlan& plan) {
  auto result = std::make_unique<XQueryStreamProgram>();
  for (const XQueryStreamStep& step : plan.record) {
    result->record.push_back(
        {step.isAnywhere, Ref<XQueryNameTest>(const_cast<XQueryNameTest*>(step.name))});
  }
  result->fold = plan.fold;
  result->description = plan.description();
  result->first = plan.first;
  result->last = plan.last;
  result->each = Ref<XQueryExpr>(program[plan.each].expr);
  const XQueryPlaceID body = XQueryPlaceInside(program, program.bodies().back().place);
  result->call = Ref<XQueryFunctionCall>(dyn_cast<XQueryFunctionCall>(program[body].expr));
  return result;
}

}  // namespace

std::unique_ptr<const XQueryStreamProgram> XQueryStreamProgram::of(const XQueryProlog& prolog,
                                                                   const Ref<XQueryExpr>& body,
                                                                   Ref<XQueryError>& refusal) {
  std::unique_ptr<XQueryStreamProgram> result;
  if (!body) {
    refusal = XQueryErrors::notAStream.error("there is nothing to evaluate");
    return result;
  }
  {
    const XQueryProgram program(prolog, body);
    const XQueryStreamPlan plan = XQueryPlanStream(program, XQueryFactTable(program));
    if (!plan.isPossible()) {
      refusal = refusalOf(program, plan, prolog);
      return result;
    }
    result = programOf(program, plan);
  }
  if (XQueryPlanIsEnabled()) result->each = XQueryPlanned(prolog, result->each);
  return result;
}

}  // namespace xquery
