// Binary operators, and the unary signs.
//
// The class methods work on values that are evaluated already; functions that add, divide or
// compare call them as well. They take the operator code, the left and the right value.
#pragma once

#include "Expr/XQueryExpr.h"

namespace xquery {

enum XQueryOperatorCode : int {
  XQueryOperatorOr = 1,
  XQueryOperatorAnd = 2,
  XQueryOperatorPlus = 3,
  XQueryOperatorMinus = 4,
  XQueryOperatorMultiply = 5,
  XQueryOperatorDiv = 6,
  XQueryOperatorIDiv = 7,
  XQueryOperatorMod = 8,
  XQueryOperatorUnion = 9,
  XQueryOperatorIntersect = 10,
  XQueryOperatorExcept = 11,
  XQueryOperatorTo = 12,
  XQueryOperatorEqual = 13,
  XQueryOperatorNotEqual = 14,
  XQueryOperatorLess = 15,
  XQueryOperatorLessEqual = 16,
  XQueryOperatorGreater = 17,
  XQueryOperatorGreaterEqual = 18,
  XQueryOperatorEq = 19,
  XQueryOperatorNe = 20,
  XQueryOperatorLt = 21,
  XQueryOperatorLe = 22,
  XQueryOperatorGt = 23,
  XQueryOperatorGe = 24,
  XQueryOperatorIs = 25,
  XQueryOperatorBefore = 26,
  XQueryOperatorAfter = 27,
};

struct XQueryRangeBounds;

// What the class methods below would answer, told sooner of the operands that it knows; null of all
// others. A sign has no left operand: null.
using XQueryQuickAnswer = Value (*)(int type, const Value& left, const Value& right,
                                    XQueryContext& context);

class XQueryOperatorExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::OperatorExpr; }

  // A null operand (one that is absent from the query) is the empty sequence.
  [[nodiscard]] static Ref<XQueryOperatorExpr> operatorExpr(int type,
                                                            Ref<XQueryExpr> withRightExpr);
  // Plus and minus whose left operand was never set are the unary signs. A null argument is a left
  // operand that is absent from the query: it is set, to the empty sequence, so that a binary
  // operator with an absent operand is not taken for a sign.
  void setLeftExpr(Ref<XQueryExpr> left);
  // Null until set.
  XQueryExpr* left() const { return _left.get(); }
  XQueryExpr* right() const { return _right.get(); }
  int operatorType() const { return _type; }
  // Unary plus or minus.
  bool isSign() const {
    return !_left && (_type == XQueryOperatorPlus || _type == XQueryOperatorMinus);
  }

  // Asks `quickly` first. Set while a query is planned, before it is evaluated.
  void answerQuickly(XQueryQuickAnswer quickly) { _quickly = quickly; }

  // The range operator that an expression is, in parentheses or not; null for any other
  // expression, which may be null.
  static const XQueryOperatorExpr* rangeIn(const XQueryExpr* expr);
  // What the operands of a range operator come to; no answer for one that has failed or is invalid.
  XQueryRangeBounds rangeBounds(XQueryContext& context) const;

  // What the operator answers for operands that have been evaluated; what cannot be answered is an
  // error of the expression.
  Value answerFor(const Value& left, const Value& right, XQueryContext& context) const;

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

  // 1 logical, 2 arithmetic, 3 range, 4 sequence, 5 value, 6 general, 7 node comparison; else 0.
  static int operatorClassification(int type);
  // Dispatches on the class. Invalid operands raise error 6 "invalid type for operator", and an
  // error record among the answers is raised.
  static Value evaluateOperator(int type, const Value& withLeft, const Value& right,
                                XQueryContext& forContext);
  // One class each. They answer a value shape or an error record, or null for invalid operands.
  static Value logicalOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                       XQueryContext& forContext);
  static Value arithmeticOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                          XQueryContext& forContext);
  static Value rangeOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                     XQueryContext& forContext);
  static Value sequenceOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                        XQueryContext& forContext);
  static Value valueComparisonOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                               XQueryContext& forContext);
  static Value generalComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                 const Value& right, XQueryContext& forContext);
  static Value nodeComparisonOperatorEvaluate(int type, const Value& withLeft, const Value& right,
                                              XQueryContext& forContext);
  // Two single atomic values and a value comparison code.
  static Value compareValue(const Value& a, const Value& withValue, int forType,
                            XQueryContext& withContext);

 protected:
  XQueryOperatorExpr(int type, Ref<XQueryExpr> right)
      : XQueryExpr(Kind::OperatorExpr), _type(type), _right(std::move(right)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  // Out of line: the list of a chain's operators is no part of a recursion's frames otherwise.
  [[gnu::noinline]] Value evaluateChain(XQueryContext& context) const;
  Value evaluateAlone(XQueryContext& context) const;
  Value evaluateWithLeftValue(const Value& left, XQueryContext& context) const;
  Value evaluateWithRange(const Value& left, const XQueryOperatorExpr& range,
                          XQueryContext& context) const;
  const XQueryOperatorExpr* rangeToCompareWith() const;
  const Value& leftOrEmpty(const Value& left) const;

  int _type;
  XQueryQuickAnswer _quickly = nullptr;
  Ref<XQueryExpr> _left;
  Ref<XQueryExpr> _right;
};

}  // namespace xquery
