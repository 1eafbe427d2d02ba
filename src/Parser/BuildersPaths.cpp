#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Parser/BuilderSupport.h"
#include "Parser/XQueryTokens.h"

#include <algorithm>

namespace xquery {
namespace {

struct AxisCode {
  int token;
  int code;
};

constexpr AxisCode axisCodes[] = {
    {kTokenChildColonColon, XQueryAxisChild},
    {kTokenDescendantColonColon, XQueryAxisDescendant},
    {kTokenDescendantOrSelfColonColon, XQueryAxisDescendantOrSelf},
    {kTokenAttributeColonColon, XQueryAxisAttribute},
    {kTokenSelfColonColon, XQueryAxisSelf},
    {kTokenFollowingSiblingColonColon, XQueryAxisFollowingSibling},
    {kTokenFollowingColonColon, XQueryAxisFollowing},
    {kTokenAncestorColonColon, XQueryAxisAncestor},
    {kTokenParentColonColon, XQueryAxisParent},
    {kTokenPrecedingColonColon, XQueryAxisPreceding},
    {kTokenPrecedingSiblingColonColon, XQueryAxisPrecedingSibling},
    {kTokenAncestorOrSelfColonColon, XQueryAxisAncestorOrSelf},
};

int axisCode(int token) {
  const auto* row = std::find_if(std::begin(axisCodes), std::end(axisCodes),
                                 [token](const AxisCode& code) { return code.token == token; });
  return row == std::end(axisCodes) ? 0 : row->code;
}

}  // namespace

NSObject* XQRelativePath(NSObject* firstStep, int64_t line) {
  XQueryStep* step = cast<XQueryStep>(firstStep);
  const bool isLone = !step->next() && step->predicates().empty();
  if (isLone && step->kind() == Kind::FilterStep) return step->expr();
  return XQAtLine(XQueryPathExpr::pathExprWithStep(Ref<XQueryStep>(step)), line);
}

NSObject* XQRelativePathItemSetNext(NSObject* step, NSObject* next) {
  cast<XQueryStep>(step)->setLast(XQRef<XQueryStep>(next));
  return step;
}

NSObject* XQRelativePathItemSetPredicates(NSObject* step, NSObject* predicates) {
  cast<XQueryStep>(step)->setPredicates(XQVector<XQueryExpr>(predicates));
  return step;
}

NSObject* XQPredicates(NSObject* expr) {
  return XQList(expr);
}

NSObject* XQPredicatesAdd(NSObject* predicates, NSObject* expr) {
  return XQListAdd(predicates, expr);
}

NSObject* XQueryFilterStepRoot() {
  return XQueryParserAutoRelease(XQueryRootStep::rootStep());
}

NSObject* XQFilterStep(NSObject* expr) {
  return XQueryParserAutoRelease(XQueryFilterStep::filterStepWithExpr(XQRef<XQueryExpr>(expr)));
}

NSObject* XQNodeTest(NSObject* test, int axisToken) {
  return XQueryParserAutoRelease(
      XQueryAxisStep::axisStepWithAxis(axisCode(axisToken), XQRef<XQueryExpr>(test)));
}

NSObject* XQNameTest(NSObject* name, int64_t line) {
  return XQAtLine(XQueryNameTest::nameTest(XQRef<NSString>(name)), line);
}

NSObject* XQNodeName(NSObject* name, int64_t line) {
  return XQNameTest(name, line);
}

NSObject* XQLocalName(NSObject* name, int64_t line) {
  return XQNameTest(name, line);
}

NSObject* XQWildCardNameTest(NSObject* prefix, NSObject* localName, int64_t line) {
  return XQAtLine(
      XQueryWildCardNameTest::nameTest(XQRef<NSString>(prefix), XQRef<NSString>(localName)), line);
}

}  // namespace xquery
