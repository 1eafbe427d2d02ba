// Facts of operators, lists and type expressions.
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Plan/FactsAnalysis.h"
#include "Plan/Rules/PositionConditions.h"

namespace xquery {
namespace {

using namespace XQueryItems;

struct Operands {
  XQueryFacts left;
  XQueryFacts right;

  bool areThere() const { return left.least > 0 && right.least > 0; }
};

// An operand that the query leaves out is the empty sequence; a sign has none on its left.
Operands operandsOf(const XQueryFactsAt& at) {
  const auto& expr = at.expr<XQueryOperatorExpr>();
  Operands operands{XQueryFacts::none(), XQueryFacts::none()};
  at.forEachPart([&](XQueryPlaceID part) {
    const bool isLeft = at.program[part].expr == expr.left() && part == at.place + 1;
    (isLeft ? operands.left : operands.right) = at.table[part];
  });
  return operands;
}

XQueryItemKinds kindsOfArithmetic(const Operands& operands, bool isSign) {
  constexpr XQueryItemKinds numbers = Numeric | Untyped | Node;
  const bool areNumbers = operands.right.are(numbers) && (isSign || operands.left.are(numbers));
  return areNumbers ? Numeric : Numeric | DateTime | Date | Time | Duration;
}

void concludeSet(const Operands& operands, int type, XQueryFacts& facts) {
  const XQueryFacts& left = operands.left;
  const XQueryFacts& right = operands.right;
  XQueryFacts nodes = left;
  nodes.least = 0;
  if (type == XQueryOperatorUnion) {
    nodes.appendItems(right);
    nodes.least = std::max(left.least, right.least);
  } else if (type == XQueryOperatorIntersect) {
    nodes.kinds &= right.kinds;
    nodes.most = std::min(left.most, right.most);
  }
  nodes.kinds &= Node;
  // Sorted whatever the ordering mode is; nodes of one tree come in document order.
  nodes.inOrder = nodes.tree == XQueryTreeFact::OfContext;
  facts.setItems(nodes);
}

// Any two numbers can be compared, and so can any two texts, but that a general comparison casts
// what is untyped to the type of the other side: not every text is a token, say.
bool canBeCompared(const XQueryFacts& left, const XQueryFacts& right, bool isGeneral) {
  const auto are = [&](XQueryItemKinds kinds) { return left.are(kinds) && right.are(kinds); };
  if (are(Numeric)) return true;
  if (!are(Node | Untyped | String)) return false;
  const auto castsText = [](const XQueryFacts& text, const XQueryFacts& other) {
    return text.mayBe(Node | Untyped) && other.mayBe(DerivedString);
  };
  return !isGeneral || !(castsText(left, right) || castsText(right, left));
}

// A range between two literals that is not too long for any machine has so many integers.
bool isShortRange(const XQueryOperatorExpr& range, XQueryFacts& facts) {
  constexpr int64_t mostIntegers = int64_t{1} << 16;
  const auto first = XQuerySmallIntegerIn(range.left());
  const auto last = XQuerySmallIntegerIn(range.right());
  if (!first || !last || *last - *first >= mostIntegers) return false;
  const int64_t count = std::clamp<int64_t>(*last - *first + 1, 0, XQueryFacts::many);
  facts.setItems(Integer, static_cast<uint8_t>(count), static_cast<uint8_t>(count));
  return true;
}

}  // namespace

bool XQueryOperatorMayFail(int type, const XQueryFacts& left, const XQueryFacts& right) {
  switch (XQueryOperatorExpr::operatorClassification(type)) {
    case 1:  // logical: an error record takes the place of an answer
      return left.mayBe(Other) || right.mayBe(Other);
    case 5:  // value comparison
      return left.most > 1 || right.most > 1 || !canBeCompared(left, right, false);
    case 6:  // general comparison
      return !canBeCompared(left, right, true);
    case 7:  // node comparison
      return left.most > 1 || right.most > 1 || !left.are(Node) || !right.are(Node);
    default:
      return true;
  }
}

void XQueryFactsOfOperator(const XQueryFactsAt& at, XQueryFacts& facts) {
  const auto& expr = at.expr<XQueryOperatorExpr>();
  const Operands operands = operandsOf(at);
  const int operatorClass = XQueryOperatorExpr::operatorClassification(expr.operatorType());
  if (expr.operatorType() == XQueryOperatorTo && isShortRange(expr, facts)) return;
  if (XQueryOperatorMayFail(expr.operatorType(), operands.left, operands.right)) {
    facts.deeds |= XQueryDeeds::MayFail;
  }
  switch (operatorClass) {
    case 1:  // logical: an error record on the right is handed on
      facts.setItems(Boolean | (operands.right.kinds & Other), 1, 1);
      break;
    case 2:  // arithmetic
      facts.setItems(kindsOfArithmetic(operands, expr.isSign()), 0, 1);
      break;
    case 3:  // range
      facts.setItems(Integer, 0, XQueryFacts::many);
      break;
    case 4:  // sequence
      concludeSet(operands, expr.operatorType(), facts);
      break;
    case 5:  // value, general and node comparison
    case 6:
    case 7:
      facts.setItems(Boolean, operands.areThere() ? 1 : 0, 1);
      break;
    default:
      break;
  }
}

void XQueryFactsOfTruth(const XQueryFactsAt&, XQueryFacts& facts) {
  facts.setItems(Boolean, 1, 1);
}

// Also "ordered" and "unordered", which hand on what they hold.
void XQueryFactsOfList(const XQueryFactsAt& at, XQueryFacts& facts) {
  XQueryFacts items = XQueryFacts::none();
  at.forEachPart([&](XQueryPlaceID part) { items.appendItems(at.table[part]); });
  facts.setItems(items);
}

void XQueryFactsOfTreat(const XQueryFactsAt& at, XQueryFacts& facts) {
  facts.setItems(at.partOrNone(XQueryRole::Element));
  XQueryRestrictToType(&at.expr<XQueryTreatExpr>().type(), facts);
}

void XQueryFactsOfCast(const XQueryFactsAt& at, XQueryFacts& facts) {
  const XQueryTypeDeclaration& type = at.expr<XQueryCastExpr>().type();
  const bool mayBeEmpty = type.occuranceType() == XQueryTypeDeclaration::ZeroOrOne;
  XQueryItemKinds kinds = XQueryKindsOfType(type.typeID());
  // The shared infinities and NaN are doubles, and a cast to float answers them too.
  if ((kinds & Float) != 0) kinds |= Double;
  // A prefix is looked up where the cast stands.
  if ((kinds & QName) != 0) facts.deeds |= XQueryDeeds::ReadsStatic;
  facts.setItems(kinds, mayBeEmpty ? 0 : 1, 1);
}

void XQueryRestrictToType(const XQueryExpr* expr, XQueryFacts& facts) {
  const auto* type = dyn_cast<XQueryTypeDeclaration>(expr);
  if (!type) return;
  const auto restrict = [&facts](XQueryItemKinds kinds) { facts.kinds &= kinds; };
  switch (type->type()) {
    case XQueryTypeDeclaration::Atomic:
      restrict(XQueryKindsOfType(type->typeID()));
      break;
    case XQueryTypeDeclaration::Empty:
      restrict(None);
      break;
    case XQueryTypeDeclaration::DocumentTest:
      restrict(Document);
      break;
    case XQueryTypeDeclaration::ElementTest:
      restrict(Element);
      break;
    case XQueryTypeDeclaration::ProcessingInstructionTest:
      restrict(Instruction);
      break;
    case XQueryTypeDeclaration::AttributeTest:
      restrict(Attribute);
      break;
    case XQueryTypeDeclaration::CommentTest:
      restrict(Comment);
      break;
    case XQueryTypeDeclaration::TextTest:
      restrict(Text);
      break;
    case XQueryTypeDeclaration::AnyKindTest:
      restrict(Node);
      break;
    default:  // item()
      break;
  }
  if (!type->acceptsCount(0) && type->type() != XQueryTypeDeclaration::Empty) {
    facts.least = std::max<uint8_t>(facts.least, 1);
  }
  if (!type->acceptsCount(XQueryFacts::many)) facts.most = std::min<uint8_t>(facts.most, 1);
  if (facts.kinds == None) facts.most = 0;
  facts.settle();
}

}  // namespace xquery
