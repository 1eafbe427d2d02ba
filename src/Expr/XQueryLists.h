// Lists of expressions: the comma operator and the arguments of a call.
#pragma once

#include "Expr/SingleOrArray.h"
#include "Expr/XQueryExpr.h"

namespace xquery {

class XQueryListPart;

// The comma operator, and any ordered list of sub-expressions.
class XQueryExprList : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ExprList || object.kind() == Kind::Args;
  }

  [[nodiscard]] static Ref<XQueryExprList> exprList() { return make<XQueryExprList>(); }

  size_t count() const { return _storage.count(); }
  XQueryExpr* objectAtIndex(size_t index) const { return _storage.objectAtIndex(index); }
  // A null element becomes an empty-sequence literal.
  void addObject(Ref<XQueryExpr> element);
  // Into a list of exactly one element the new one goes in twice: once at the end, once at the
  // index. That is how the list has always behaved and callers count on it.
  void insertObject(const Ref<XQueryExpr>& element, size_t atIndex);
  void removeLastObject() { _storage.removeLast(); }
  void removeObjectAtIndex(size_t index) { _storage.removeAtIndex(index); }
  void replaceObjectAtIndex(size_t index, Ref<XQueryExpr> withObject);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  explicit XQueryExprList(Kind kind = Kind::ExprList) : XQueryExpr(kind) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

  SingleOrArray<XQueryExpr> _storage;

 private:
  // False after an error.
  bool gather(XQueryListPart& part, XQueryContext& context) const;
};

// What stands in parentheses, however many; anything else, null included, is the answer itself.
const XQueryExpr* XQueryWithoutParentheses(const XQueryExpr* expr);

// The argument list of a call: its value has one entry per argument, each in any shape.
class XQueryArgs : public XQueryExprList {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Args; }

  [[nodiscard]] static Ref<XQueryArgs> args() { return make<XQueryArgs>(); }
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryArgs() : XQueryExprList(Kind::Args) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

}  // namespace xquery
