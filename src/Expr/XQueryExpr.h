// The base of the expression tree.
//
// A compiled query is a tree of expressions. Every node answers two messages: bindInfoForProlog,
// run once after parsing to resolve names against the static context, and evaluateWithContext, run
// per evaluation. Evaluation never changes an expression, so one tree serves several threads.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>

namespace xquery {

class XQueryContext;
class XQueryProlog;

class XQueryExpr : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() >= Kind::ExprFirst; }

  // Line of the expression's first token, counted from 0; 0 until set.
  int64_t exprLine() const { return _line; }
  void setExprLine(int64_t line) { _line = line; }

  // Problems are added to the prolog's errors, never thrown.
  virtual void bindInfoForProlog(XQueryProlog& prolog) = 0;
  // A value in one of the four shapes; raises through the context.
  virtual Value evaluateWithContext(XQueryContext& context) const = 0;
  // For diagnostics.
  virtual Ref<NSString> description() const;

 protected:
  explicit XQueryExpr(Kind kind, int64_t initWithLine = 0) : NSCounted(kind), _line(initWithLine) {}

  int64_t _line;
};

}  // namespace xquery
