// Binary (and unary) operators.
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

class XQueryOperatorExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::OperatorExpr; }

  // A null operand (one that is absent from the query) is the empty sequence.
  [[nodiscard]] static Ref<XQueryOperatorExpr> operatorExpr(int type, Ref<XQueryExpr> withRightExpr);
  // Plus and minus whose left operand was never set are the unary signs. A null argument is a left
  // operand that is absent from the query: it is set, to the empty sequence, so that a binary
  // operator with an absent operand is not taken for a sign.
  void setLeftExpr(Ref<XQueryExpr> left);
  // Null until set.
  XQueryExpr* left() const { return _left.get(); }
  XQueryExpr* right() const { return _right.get(); }
  int operatorType() const { return _type; }

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value evaluateWithContext(XQueryContext& context) const override;

  // 1 logical, 2 arithmetic, 3 range, 4 sequence, 5 value, 6 general, 7 node comparison; else 0.
  static int operatorClassification(int type);
  // Work on evaluated operands. They answer a value shape, or null when the operands are invalid.
  static Value evaluateOperator(int type, const Value& withLeft, const Value& right,
                                XQueryContext& forContext);
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
  int _type;
  Ref<XQueryExpr> _left;
  Ref<XQueryExpr> _right;
};

}  // namespace xquery
