// A compiled query: prolog, body and the errors found while compiling.
#pragma once

#include "Engine/Streams/XQueryStreamProgram.h"
#include "Expr/XQueryExpr.h"
#include "xquery/Error.h"
#include "xquery/Loading.h"
#include "xquery/String.h"
#include "xquery/Warnings.h"
#include "xquery/XQuery.h"

#include <chrono>
#include <memory>
#include <vector>

namespace xquery {

class XQueryPlanReport;
struct XQueryProfiledProgram;
struct XQueryProjectionPlan;
class XQueryProlog;

class XQueryInternal {
 public:
  // Compiles. Parse errors leave prolog and body null.
  explicit XQueryInternal(const Ref<NSString>& initWithSource, const XQueryLoading& loading = {},
                          XQueryWay way = XQueryWay::Planned);
  // A query that failed before it could be parsed.
  explicit XQueryInternal(Ref<XQueryError> error);
  // A query put together by hand, for the tests of the expression tree.
  XQueryInternal(Ref<XQueryProlog> prolog, Ref<XQueryExpr> body);
  ~XQueryInternal();

  XQueryProlog* prolog() const;
  XQueryExpr* body() const;
  const std::vector<Ref<XQueryError>>& errors() const { return _errors; }
  bool isError() const { return !_errors.empty(); }
  // Of a query that was compiled to be explained, and without errors; else null.
  const XQueryPlanReport* planReport() const { return _planReport.get(); }
  // Of a query that was compiled to be explained, in the order of its text.
  const std::vector<XQueryWarning>& warnings() const { return _warnings; }
  // Of a query that was planned, and without errors; else null.
  const XQueryProjectionPlan* projectionPlan() const { return _projectionPlan.get(); }
  // Of a query that was compiled to be streamed, and without errors; else null.
  const XQueryStreamProgram* streamProgram() const { return _streamProgram.get(); }
  // Of a query that was compiled to be profiled, and without errors; else null.
  const std::shared_ptr<const XQueryProfiledProgram>& profiledProgram() const {
    return _profiledProgram;
  }

 private:
  void compile(const Ref<NSString>& source, const XQueryLoading& loading, XQueryWay way);
  void plan(XQueryWay way);
  void planStream();
  void planToProfile();
  void completeProfiledProgram(const Ref<NSString>& source, std::chrono::nanoseconds taken);

  Ref<XQueryProlog> _prolog;
  Ref<XQueryExpr> _body;
  std::vector<Ref<XQueryError>> _errors;
  std::unique_ptr<const XQueryPlanReport> _planReport;
  std::vector<XQueryWarning> _warnings;
  std::unique_ptr<const XQueryProjectionPlan> _projectionPlan;
  std::unique_ptr<const XQueryStreamProgram> _streamProgram;
  std::shared_ptr<const XQueryProfiledProgram> _profiledProgram;
};

// What a query is to the engine.
struct XQueryShell {
  static XQueryInternal& internal(const XQuery& query) { return *query._private; }
};
inline XQueryInternal& _internal(const XQuery& query) {
  return XQueryShell::internal(query);
}

}  // namespace xquery
