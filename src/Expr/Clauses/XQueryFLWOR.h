// The FLWOR expression and the expressions that switch the ordering mode.
#pragma once

#include "Expr/XQueryBinding.h"
#include "Expr/XQueryExpr.h"
#include "Expr/XQuerySequence.h"
#include "Expr/XQueryTruthTeller.h"

#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryClauseItems;
class XQueryExprList;
class XQueryItemFold;
class XQueryItemYielder;
struct XQueryFLWORResults;
struct XQuerySortList;

class XQueryForExpr : public XQueryBindingExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ForExpr; }

  // `type` may be null; `position` is the name after "at", null or empty without one.
  [[nodiscard]] static Ref<XQueryForExpr> exprWithName(Ref<NSString> name,
                                                       Ref<XQueryTypeDeclaration> type,
                                                       Ref<NSString> position,
                                                       Ref<XQueryExpr> expr);

  // Null or empty without a positional variable.
  const Ref<NSString>& posVarName() const { return _posVarName; }
  // 0 without a positional variable.
  int64_t posVarID() const { return _posVarID; }
  void bindInfoForProlog(XQueryProlog& prolog) override;

 protected:
  XQueryForExpr(Ref<NSString> name, Ref<XQueryTypeDeclaration> type, Ref<NSString> position,
                Ref<XQueryExpr> expr);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _posVarName;
  int64_t _posVarID = 0;
};

class XQueryLetExpr : public XQueryBindingExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::LetExpr; }

  [[nodiscard]] static Ref<XQueryLetExpr> exprWithName(Ref<NSString> name,
                                                       Ref<XQueryTypeDeclaration> type,
                                                       Ref<XQueryExpr> expr);
  void bindInfoForProlog(XQueryProlog& prolog) override;

 protected:
  using XQueryBindingExpr::XQueryBindingExpr;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);
};

// One key of an order by clause.
class XQueryOrderSpec : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::OrderSpec; }

  enum EmptyOrder : int { EmptyUnspecified, EmptyLeast, EmptyGreatest };

  // An unspecified empty order takes the prolog's when the query is bound. The collation may be
  // null; it is kept and not consulted.
  [[nodiscard]] static Ref<XQueryOrderSpec> orderSpec(Ref<XQueryExpr> expr, bool ascending,
                                                      EmptyOrder emptyLeast,
                                                      Ref<NSString> collation);

  XQueryExpr* expr() const { return _expr.get(); }
  void setExpr(Ref<XQueryExpr> expr) { _expr = std::move(expr); }
  bool ascending() const { return _ascending; }
  bool emptyLeast() const { return _emptyOrder != EmptyGreatest; }
  const Ref<NSString>& collation() const { return _collation; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryOrderSpec(Ref<XQueryExpr> expr, bool ascending, EmptyOrder emptyOrder,
                  Ref<NSString> collation);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryExpr> _expr;
  bool _ascending;
  EmptyOrder _emptyOrder;
  Ref<NSString> _collation;
};

// Tuples are produced by recursion over the clauses and never gathered. With order by keys each
// result item is kept together with the keys of its tuple and everything is sorted once at the end.
class XQueryFLWORExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::FLWORExpr; }

  using Clauses = std::vector<Ref<XQueryBindingExpr>>;  // XQueryForExpr and XQueryLetExpr
  using OrderSpecs = std::vector<Ref<XQueryOrderSpec>>;

  // `whereExpr` may be null, `orderSpecs` empty.
  [[nodiscard]] static Ref<XQueryFLWORExpr> exprWithForLet(Clauses forLet,
                                                           Ref<XQueryExpr> whereExpr,
                                                           OrderSpecs orderSpecs,
                                                           Ref<XQueryExpr> returnExpr);

  const Clauses& forLet() const { return _forLet; }
  // Null without one.
  const XQueryExpr* whereExpr() const { return _whereExpr.get(); }
  const OrderSpecs& orderSpecs() const { return _orderSpecs; }
  // Where the return clause asks the condition by which items are picked: what it answers for those
  // for which the condition holds, and for those for which it does not, of which two count for any
  // number. Null: the return clause, and nothing.
  void setReturnOfPicks(Ref<XQueryExpr> ofSure, Ref<XQueryExpr> ofOthers) {
    _sureReturn = std::move(ofSure);
    _otherReturn = std::move(ofOthers);
  }
  // What is known of each item that is picked for certain: that it yields one item, or the same
  // summand, and nobody can tell whether that is evaluated.
  struct Yield {
    bool isOneItem = false;
    std::optional<int64_t> summand;  // where the value is summed, and nothing else
  };
  void setYieldOfPicks(Yield yield) { _yield = yield; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  // How many items the value has, or `most` where there are more, having looked no further than
  // that takes. None after an error. For one without order specs.
  std::optional<uint64_t> countItems(uint64_t most, XQueryContext& context) const;
  // Adds what its value consists of to the fold, in order; false after an error. For one without
  // order specs.
  bool foldItems(XQueryItemFold& fold, XQueryContext& context) const;
  // What the return clause is for a fold: what stands there, or in parentheses there.
  void setYielder(Ref<XQueryExpr> expr, const XQueryItemYielder* yielder) {
    _yieldingExpr = std::move(expr);
    _yielder = yielder;
  }
  // Tells of the where clause, which holds the teller.
  void setTeller(const XQueryTruthTeller* ofWhere) { _teller = ofWhere; }
  // Its value, of which only the first so many items are wanted: others may be left out.
  Value firstItems(uint64_t most, XQueryContext& context) const;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryFLWORExpr(Clauses forLet, Ref<XQueryExpr> whereExpr, OrderSpecs orderSpecs,
                  Ref<XQueryExpr> returnExpr);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  // These answer false when an error has come up, or nothing more is wanted.
  bool evaluateStartingAt(size_t clause, XQueryFLWORResults& toResults,
                          XQueryContext& withContext) const;
  bool evaluateFor(const XQueryForExpr& clause, size_t index, XQueryFLWORResults& toResults,
                   XQueryContext& withContext) const;
  bool evaluateRange(const XQueryForExpr& clause, size_t index, const XQueryClauseItems& items,
                     XQueryFLWORResults& toResults, XQueryContext& withContext) const;
  bool evaluateBehind(const XQueryForExpr& clause, size_t index, XQueryFLWORResults& toResults,
                      XQueryContext& withContext) const;
  bool evaluateGiven(const XQueryForExpr& clause, size_t index, XQueryFLWORResults& toResults,
                     XQueryContext& withContext) const;
  bool evaluateItem(const XQueryForExpr& clause, size_t index, Value item, size_t position,
                    XQueryFLWORResults& toResults, XQueryContext& withContext) const;
  bool processItem(XQueryFLWORResults& toResults, XQueryContext& withContext) const;
  bool addTuple(const XQueryExpr* returned, XQueryFLWORResults& toResults,
                XQueryContext& withContext) const;
  bool addList(const XQueryExprList& list, XQueryFLWORResults& toResults,
               XQueryContext& withContext) const;
  bool addSortItems(Value value, XQuerySortList& toList, XQueryContext& context) const;
  bool isOfType(const XQueryBindingExpr& clause, const NSObject* value,
                XQueryContext& context) const;
  static bool dropsTuple(const XQueryBindingExpr& clause, XQueryContext& context);

  bool evaluatePicks(const XQueryForExpr& clause, size_t index, const XQueryPicks& picks,
                     XQueryFLWORResults& toResults, XQueryContext& withContext) const;
  bool wantsNumberOfPicks(const XQueryFLWORResults& results) const;
  bool addPicks(uint64_t number, XQueryFLWORResults& toResults, XQueryContext& withContext) const;
  static void setTuple(const XQueryForExpr& clause, Value item, size_t position,
                       XQueryContext& context);

  Clauses _forLet;
  Ref<XQueryExpr> _whereExpr;
  OrderSpecs _orderSpecs;
  Ref<XQueryExpr> _returnExpr;
  Ref<XQueryExpr> _sureReturn;
  Ref<XQueryExpr> _otherReturn;
  Yield _yield;
  Ref<XQueryExpr> _yieldingExpr;  // keeps the yielder
  const XQueryItemYielder* _yielder = nullptr;
  const XQueryTruthTeller* _teller = nullptr;
};

// "ordered {...}" and "unordered {...}": the ordering mode for the extent of the operand.
class XQueryOrderExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::OrderExpr; }

  // `expr` may be null: the empty sequence.
  [[nodiscard]] static Ref<XQueryOrderExpr> orderExpr(Ref<XQueryExpr> expr, bool ordered);

  bool ordered() const { return _ordered; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryOrderExpr(Ref<XQueryExpr> expr, bool ordered)
      : XQueryExpr(Kind::OrderExpr), _expr(std::move(expr)), _ordered(ordered) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryExpr> _expr;
  bool _ordered;
};

}  // namespace xquery
