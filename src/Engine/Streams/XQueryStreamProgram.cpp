#include "Engine/Streams/XQueryStreamProgram.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLists.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "Plan/Plan.h"
#include "Plan/Program.h"
#include "Plan/Rules/PlaceInside.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryErrors.h"

#include <algorithm>
#include <string_view>
#include <utility>

namespace xquery {

namespace {

// Told like an error of compiling.
Ref<XQueryError> refusalAt(const XQueryExpr& expr, std::string_view reason,
                           const XQueryProlog& main) {
  return XQueryErrorTrace::error(
      *XQueryErrors::notAStream.errorAtLine(expr.exprLine(), reason),
      XQueryErrorTrace::traceInPlaces(main.modules().places(), expr.exprPlace()));
}

// Of the module in which the place is.
Ref<XQueryError> refusalOf(const XQueryProgram& program, const XQueryStreamPlan& plan,
                           const XQueryProlog& main) {
  const auto error = refusalAt(*program[plan.refusedAt].expr, plan.reason, main);
  const XQueryProlog* prolog = program.bodyOf(plan.refusedAt).prolog;
  if (!prolog || prolog == &main || !prolog->moduleURL()) return error;
  return XQueryError::errorInModule(*error, prolog->moduleURL()->absoluteString());
}

bool isKnownIn(const XQueryContextInternal& context, const XQueryNameTest& test) {
  if (!test.mayRaise()) return true;
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  XQueryQName::parseQNameString(test.name(), prefix, localPart);
  return prefix && context.contextNamespaceForPrefix(prefix->view());
}

// In the place of a fold, when all else is evaluated: the value that it has come to, or its
// failure. In an evaluation that is not one of a stream it is the fold.
class FoldedExpr final : public XQueryPlannedExpr {
 public:
  FoldedExpr(Ref<XQueryExpr> plain, int64_t variable)
      : XQueryPlannedExpr(std::move(plain)), _variable(variable) {}

  Value computeValue(XQueryContext& context) const override {
    auto& dynamic = _internal(context);
    const Value value = dynamic.variableForID(_variable);
    if (!value) return plain().evaluateWithContext(context);
    auto* const error = dyn_cast<XQueryError>(dynamic.variableForID(_variable + 1));
    return error ? dynamic.fail(Ref<XQueryError>(error), 0) : value;
  }

 private:
  const int64_t _variable;
};

// Behind all that the program has.
int64_t firstFreeVariable(const XQueryProgram& program) {
  int64_t last = 0;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const XQueryExpr* const expr = program[place].expr;
    if (const auto* clause = dyn_cast<XQueryBindingExpr>(expr)) {
      last = std::max(last, clause->varID());
    }
    if (const auto* clause = dyn_cast<XQueryForExpr>(expr)) {
      last = std::max(last, clause->posVarID());
    }
  }
  return last + 1;
}

XQueryStreamProgram::Part partOf(const XQueryProgram& program, const XQueryStreamPart& part) {
  return {part.fold,
          part.first,
          part.last,
          part.isSure,
          Ref<XQueryExpr>(program[part.each].expr),
          Ref<XQueryFunctionCall>(dyn_cast<XQueryFunctionCall>(program[part.place].expr))};
}

std::unique_ptr<XQueryStreamProgram> programOf(XQueryProgram& program,
                                               const XQueryStreamPlan& plan) {
  auto result = std::make_unique<XQueryStreamProgram>();
  result->description = plan.description();
  for (auto part = plan.parts.begin(); part != plan.parts.end(); ++part) {
    result->parts.push_back(partOf(program, *part));
    const auto isSame = [&](const XQueryStreamPart& other) { return other.record == part->record; };
    if (std::any_of(plan.parts.begin(), part, isSame)) continue;
    auto& path = result->records.emplace_back();
    for (const XQueryStreamStep& step : part->record) {
      path.push_back(
          {step.isAnywhere, Ref<XQueryNameTest>(const_cast<XQueryNameTest*>(step.name))});
    }
  }
  if (plan.around == XQueryNoPlace) return result;
  result->firstVariable = firstFreeVariable(program);
  int64_t variable = result->firstVariable;
  for (const XQueryStreamPart& part : plan.parts) {
    program.replace(part.place,
                    make<FoldedExpr>(Ref<XQueryExpr>(program[part.place].expr), variable));
    variable += 2;
  }
  result->around = program.install();
  return result;
}

// All at once, since what they have in common, declarations, is planned with them. What stands
// around them is evaluated once, as it is written.
void planParts(const XQueryProlog& prolog, XQueryStreamProgram& program) {
  if (program.parts.size() == 1) {
    Ref<XQueryExpr>& each = program.parts.front().each;
    each = XQueryPlanned(prolog, each);
    return;
  }
  const Ref<XQueryExprList> list = XQueryExprList::exprList();
  for (const XQueryStreamProgram::Part& part : program.parts) list->addObject(part.each);
  const Ref<XQueryExpr> planned = XQueryPlanned(prolog, list);
  const auto* const parts = dyn_cast<XQueryExprList>(planned.get());
  if (!parts || parts->count() != program.parts.size()) return;
  for (size_t index = 0; index < parts->count(); ++index) {
    program.parts[index].each = Ref<XQueryExpr>(parts->objectAtIndex(index));
  }
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
    XQueryProgram program(prolog, body);
    const XQueryStreamPlan plan = XQueryPlanStream(program, XQueryFactTable(program));
    if (!plan.isPossible()) {
      refusal = refusalOf(program, plan, prolog);
      return result;
    }
    result = programOf(program, plan);
  }
  if (XQueryPlanIsEnabled()) planParts(prolog, *result);
  return result;
}

// Prefixes that the query does not declare are looked up in the main module alone, where all of the
// ways to the records are.
Ref<XQueryError> XQueryStreamProgram::refusalIn(const XQueryContext& context,
                                                const XQueryProlog& prolog) const {
  for (const std::vector<Step>& record : records) {
    for (const Step& step : record) {
      if (!step.name || isKnownIn(_internal(context), *step.name)) continue;
      return refusalAt(*step.name, "a prefix on the way to the records is not declared", prolog);
    }
  }
  return {};
}

}  // namespace xquery
