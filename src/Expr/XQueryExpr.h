// The base of the expression tree.
//
// A compiled query is a tree of expressions. Every node answers two messages: bindInfoForProlog,
// run once after parsing to resolve names against the static context, and evaluateWithContext, run
// per evaluation. Evaluation never changes an expression, so one tree serves several threads.
//
// An error leaves the recursion of evaluation as a value does, by returning: the expression that
// meets it records it in the context and answers null, and so does every expression around it:
//
//   const Value left = _left->evaluateWithContext(context);
//   if (XQueryHasFailed(left, context)) return {};
//
// What does not evaluate expressions (casts, built-in functions, collectors, looks at the limits)
// raises an NSException instead. That gets as far as the expression that was being evaluated, which
// evaluateWithContext answers null for: unwinding takes microseconds for each frame and a
// recursion of a million frames would take seconds to end.
#pragma once

#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <exception>

namespace xquery {

class XQueryContext;
class XQueryPartVisitor;
class XQueryProlog;

class XQueryExpr : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() >= Kind::ExprFirst; }

  // Line of the expression's first token, counted from 0; 0 until set.
  int64_t exprLine() const { return _line; }
  void setExprLine(int64_t line) { _line = static_cast<int32_t>(line); }
  // Where it stands, from its first character to its last one, in the table of its program; 0 for
  // what no text says by itself. The line of an operator is that of its sign, its place begins with
  // its left operand.
  XQueryPlaceNumber exprPlace() const { return _place; }
  void setExprPlace(XQueryPlaceNumber place) { _place = place; }

  // Problems are added to the prolog's errors, never thrown.
  virtual void bindInfoForProlog(XQueryProlog& prolog) = 0;
  // A value in one of the four shapes. Null when an error is on its way out, which the context then
  // says (XQueryHasFailed), and for what has no value, such as "." without a focus. Throws nothing
  // but what a client of the host threw that is no NSException.
  [[gnu::always_inline]] Value evaluateWithContext(XQueryContext& context) const;
  // What evaluateWithContext answers: to be defined, and called by nobody else, since it lets
  // exceptions out.
  virtual Value computeValue(XQueryContext& context) const = 0;
  // Names the expressions that this one consists of, once it is bound: see XQueryParts.h.
  virtual void visitParts(XQueryPartVisitor& visitor) = 0;
  // For diagnostics.
  virtual Ref<NSString> description() const;

 protected:
  explicit XQueryExpr(Kind kind, int64_t initWithLine = 0, XQueryPlaceNumber place = 0)
      : NSCounted(kind), _line(static_cast<int32_t>(initWithLine)), _place(place) {}

  int32_t _line;

 private:
  XQueryPlaceNumber _place;
};

// Make an exception that an expression let out an error on its way out, which arose there. The
// second one, to be called by the handler, throws on what stands for no error of the query.
[[gnu::cold]] void XQueryCatchRaised(XQueryContext& context, const XQueryExpr& expr);
[[gnu::cold]] void XQueryCatchFailure(XQueryContext& context, const XQueryExpr& expr);

inline Value XQueryExpr::evaluateWithContext(XQueryContext& context) const {
  try {
    return computeValue(context);
  } catch (const NSException&) {
    XQueryCatchRaised(context, *this);
  } catch (const std::exception&) {
    XQueryCatchFailure(context, *this);
  }
  return {};
}

}  // namespace xquery
