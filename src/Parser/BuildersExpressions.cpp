#include "Expr/Clauses/XQueryConditional.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"
#include "Expr/TypeTests/XQueryTypeswitch.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryFunctionCall.h"
#include "Parser/BuilderSupport.h"
#include "Parser/XQueryTokens.h"
#include "Types/XQueryErrors.h"

#include <algorithm>

namespace xquery {
namespace {

struct OperatorCode {
  int token;
  int code;
};

constexpr OperatorCode operatorCodes[] = {
    {kTokenOr, XQueryOperatorOr},
    {kTokenAnd, XQueryOperatorAnd},
    {kTokenPlus, XQueryOperatorPlus},
    {kTokenMinus, XQueryOperatorMinus},
    {kTokenAsterisk, XQueryOperatorMultiply},
    {kTokenDiv, XQueryOperatorDiv},
    {kTokenIDiv, XQueryOperatorIDiv},
    {kTokenMod, XQueryOperatorMod},
    {kTokenUnion, XQueryOperatorUnion},
    {kTokenIntersect, XQueryOperatorIntersect},
    {kTokenExcept, XQueryOperatorExcept},
    {kTokenTo, XQueryOperatorTo},
    {kTokenEqual, XQueryOperatorEqual},
    {kTokenNotEqual, XQueryOperatorNotEqual},
    {kTokenLessThanCompare, XQueryOperatorLess},
    {kTokenLessThanEqual, XQueryOperatorLessEqual},
    {kTokenGreaterThan, XQueryOperatorGreater},
    {kTokenGreaterThanEqual, XQueryOperatorGreaterEqual},
    {kTokenEq, XQueryOperatorEq},
    {kTokenNe, XQueryOperatorNe},
    {kTokenLt, XQueryOperatorLt},
    {kTokenLe, XQueryOperatorLe},
    {kTokenGt, XQueryOperatorGt},
    {kTokenGe, XQueryOperatorGe},
    {kTokenIs, XQueryOperatorIs},
    {kTokenLessThanLessThan, XQueryOperatorBefore},
    {kTokenGreaterThanGreaterThan, XQueryOperatorAfter},
};

int operatorCode(int token) {
  const auto* row = std::find_if(std::begin(operatorCodes), std::end(operatorCodes),
                                 [token](const OperatorCode& code) { return code.token == token; });
  return row == std::end(operatorCodes) ? 0 : row->code;
}

// A literal of more digits than a decimal holds is an error of the query, never another number.
NSObject* XQDigits(Ref<XQueryLiteral> literal, int64_t line) {
  if (literal) return XQAtLine(std::move(literal), line);
  XQueryParser& parser = *XQueryParser::currentParser();
  parser.setError(XQueryErrors::tooManyDigits.errorAtLine(line), parser.span());
  return XQEmptyLiteral(line);
}

// An operator ends with its right operand and begins with its left one, which the production at
// work begins with.
void XQExtendToStart(XQueryOperatorExpr& expr) {
  XQueryParser& parser = *XQueryParser::currentParser();
  const uint32_t end = parser.places()->span(expr.exprPlace()).end;
  parser.setPlace(expr, {parser.span().start, end});
}

}  // namespace

NSObject* XQExpr(NSObject* expr, int64_t line) {
  Ref<XQueryExprList> list = XQueryExprList::exprList();
  list->addObject(XQRef<XQueryExpr>(expr));
  return XQAtLine(std::move(list), line);
}

NSObject* XQExprAdd(NSObject* list, NSObject* expr) {
  cast<XQueryExprList>(list)->addObject(XQRef<XQueryExpr>(expr));
  return XQPlace(list);
}

NSObject* XQFLWRExpr(NSObject* clauses, NSObject* whereExpr, NSObject* orderSpecs,
                     NSObject* returnExpr, int64_t line) {
  return XQAtLine(XQueryFLWORExpr::exprWithForLet(
                      XQVector<XQueryBindingExpr>(clauses), XQRef<XQueryExpr>(whereExpr),
                      XQVector<XQueryOrderSpec>(orderSpecs), XQRef<XQueryExpr>(returnExpr)),
                  line);
}

NSObject* XQForLetClauses(NSObject* clauses) {
  return XQListAddAll(XQList(nullptr), clauses);
}

NSObject* XQForLetClausesAdd(NSObject* clauses, NSObject* more) {
  return XQListAddAll(clauses, more);
}

NSObject* XQForClause(NSObject* name, NSObject* type, NSObject* position, NSObject* expr,
                      int64_t line) {
  return XQAtLine(
      XQueryForExpr::exprWithName(XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type),
                                  XQRef<NSString>(position), XQRef<XQueryExpr>(expr)),
      line);
}

NSObject* XQForClauseItems(NSObject* clause) {
  return XQList(clause);
}

NSObject* XQForClauseItemsAdd(NSObject* clauses, NSObject* clause) {
  return XQListAdd(clauses, clause);
}

NSObject* XQLetClause(NSObject* name, NSObject* type, NSObject* expr, int64_t line) {
  return XQAtLine(
      XQueryLetExpr::exprWithName(XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type),
                                  XQRef<XQueryExpr>(expr)),
      line);
}

NSObject* XQLetClauseItems(NSObject* clause) {
  return XQList(clause);
}

NSObject* XQLetClauseItemsAdd(NSObject* clauses, NSObject* clause) {
  return XQListAdd(clauses, clause);
}

NSObject* XQWhereClause(NSObject* expr) {
  return expr;
}

NSObject* XQOrderByClause(NSObject* specs) {
  return specs;
}

NSObject* XQOrderSpecList(NSObject* spec) {
  return XQList(spec);
}

NSObject* XQOrderSpecListAdd(NSObject* specs, NSObject* spec) {
  return XQListAdd(specs, spec);
}

NSObject* XQOrderSpec(NSObject* expr, NSObject* modifier, int64_t line) {
  if (!modifier) {
    return XQAtLine(XQueryOrderSpec::orderSpec(XQRef<XQueryExpr>(expr), true,
                                               XQueryOrderSpec::EmptyUnspecified, nullptr),
                    line);
  }
  auto* spec = cast<XQueryOrderSpec>(modifier);
  spec->setExpr(XQRef<XQueryExpr>(expr));
  spec->setExprLine(line);
  return XQPlace(spec);
}

NSObject* XQOrderModifier(bool ascending, XQueryOrderSpec::EmptyOrder emptyOrder,
                          NSObject* collation, int64_t line) {
  return XQAtLine(
      XQueryOrderSpec::orderSpec(nullptr, ascending, emptyOrder, XQRef<NSString>(collation)), line);
}

NSObject* XQSome(NSObject* items, NSObject* condition, int64_t line) {
  return XQAtLine(XQueryQuantifiedExpr::someExpr(XQVector<XQueryQuantifiedExprItem>(items),
                                                 XQRef<XQueryExpr>(condition)),
                  line);
}

NSObject* XQEvery(NSObject* items, NSObject* condition, int64_t line) {
  return XQAtLine(XQueryQuantifiedExpr::everyExpr(XQVector<XQueryQuantifiedExprItem>(items),
                                                  XQRef<XQueryExpr>(condition)),
                  line);
}

NSObject* XQQuantifiedExprItem(NSObject* name, NSObject* type, NSObject* expr, int64_t line) {
  return XQAtLine(
      XQueryQuantifiedExprItem::quantifiedExpr(XQRef<XQueryExpr>(expr), XQRef<NSString>(name),
                                               XQRef<XQueryTypeDeclaration>(type)),
      line);
}

NSObject* XQQuantifiedExprItems(NSObject* item) {
  return XQList(item);
}

NSObject* XQQuantifiedExprItemsAdd(NSObject* items, NSObject* item) {
  return XQListAdd(items, item);
}

NSObject* XQTypeswitchExpr(NSObject* expr, NSObject* caseClauses, int64_t line) {
  return XQAtLine(XQueryTypeswitchExpr::expr(XQRef<XQueryExpr>(expr),
                                             XQVector<XQueryCaseClauseExpr>(caseClauses)),
                  line);
}

NSObject* XQCaseClause(NSObject* name, NSObject* type, NSObject* expr, int64_t line) {
  return XQAtLine(
      XQueryCaseClauseExpr::exprWithName(XQRef<NSString>(name), XQRef<XQueryTypeDeclaration>(type),
                                         XQRef<XQueryExpr>(expr)),
      line);
}

NSObject* XQCaseClauses(NSObject* clause) {
  return XQList(clause);
}

NSObject* XQCaseClausesAdd(NSObject* clauses, NSObject* clause) {
  return XQListAdd(clauses, clause);
}

NSObject* XQIfThenElse(NSObject* test, NSObject* thenExpr, NSObject* elseExpr, int64_t line) {
  return XQAtLine(
      XQueryConditionalExpr::condionalExpr(XQRef<XQueryExpr>(test), XQRef<XQueryExpr>(thenExpr),
                                           XQRef<XQueryExpr>(elseExpr)),
      line);
}

NSObject* XQOperator(int token, NSObject* right, int64_t line) {
  return XQAtLine(XQueryOperatorExpr::operatorExpr(operatorCode(token), XQRef<XQueryExpr>(right)),
                  line);
}

NSObject* XQOperatorSetLeft(NSObject* chain, NSObject* left) {
  // Only the operator at the left end of a chain still waits for its operand. The grammar calls
  // this once per operator with a chain of one, and once per chain with its first operand, so
  // walking the chain costs no more than building it.
  XQueryOperatorExpr* end = cast<XQueryOperatorExpr>(chain);
  XQExtendToStart(*end);
  while (end->left()) {
    end = cast<XQueryOperatorExpr>(end->left());
    XQExtendToStart(*end);
  }
  end->setLeftExpr(XQRef<XQueryExpr>(left));
  return chain;
}

NSObject* XQInstanceOfExpr(NSObject* expr, NSObject* type, int64_t line) {
  return XQAtLine(XQueryInstanceOfExpr::instanceOfExpr(XQRef<XQueryExpr>(expr),
                                                       XQRef<XQueryTypeDeclaration>(type)),
                  line);
}

NSObject* XQTreatExpr(NSObject* expr, NSObject* type, int64_t line) {
  return XQAtLine(
      XQueryTreatExpr::treatExpr(XQRef<XQueryExpr>(expr), XQRef<XQueryTypeDeclaration>(type)),
      line);
}

NSObject* XQCastableExpr(NSObject* expr, NSObject* type, int64_t line) {
  return XQAtLine(
      XQueryCastableExpr::castableExpr(XQRef<XQueryExpr>(expr), XQRef<XQueryTypeDeclaration>(type)),
      line);
}

NSObject* XQCastExpr(NSObject* expr, NSObject* type, int64_t line) {
  return XQAtLine(
      XQueryCastExpr::castExpr(XQRef<XQueryExpr>(expr), XQRef<XQueryTypeDeclaration>(type)), line);
}

// The context item is one shared object and carries no line.
NSObject* XQContextExpr() {
  return XQueryContextItem::contextItem();
}

NSObject* XQVarNameReference(NSObject* name, int64_t line) {
  return XQAtLine(XQueryVariable::variableWithName(XQRef<NSString>(name)), line);
}

NSObject* XQIntegerLiteral(NSObject* text, int64_t line) {
  return XQDigits(XQueryLiteral::integerLiteralWithString(XQRef<NSString>(text)), line);
}

NSObject* XQDecimalLiteral(NSObject* text, int64_t line) {
  return XQDigits(XQueryLiteral::decimalLiteralWithString(XQRef<NSString>(text)), line);
}

NSObject* XQDoubleLiteral(NSObject* text, int64_t line) {
  return XQAtLine(XQueryLiteral::doubleLiteralWithString(XQRef<NSString>(text)), line);
}

NSObject* XQStringLiteral(NSObject* text, int64_t line) {
  return XQAtLine(XQueryLiteral::stringLiteralWithString(XQRef<NSString>(text)), line);
}

NSObject* XQEmptyLiteral(int64_t line) {
  return XQAtLine(XQueryLiteral::literalWithValue(Value(NSNull::null())), line);
}

NSObject* XQOrderedExpr(NSObject* expr, bool ordered, int64_t line) {
  return XQAtLine(XQueryOrderExpr::orderExpr(XQRef<XQueryExpr>(expr), ordered), line);
}

NSObject* XQFunctionCall(NSObject* name, NSObject* args, int64_t line) {
  return XQAtLine(
      XQueryFunctionCall::functionCallWithName(XQRef<NSString>(name), XQRef<XQueryArgs>(args)),
      line);
}

NSObject* XQFunctionArgs(NSObject* expr) {
  return XQFunctionArgsAdd(XQueryParserAutoRelease(XQueryArgs::args()), expr);
}

NSObject* XQFunctionArgsAdd(NSObject* args, NSObject* expr) {
  cast<XQueryArgs>(args)->addObject(XQRef<XQueryExpr>(expr));
  return XQPlace(args);
}

NSObject* XQValidateExpr(int64_t line) {
  XQRemark(XQueryRemark::Matter::Validate, line);
  return XQEmptyLiteral(line);
}

NSObject* XQOperatorLeft(NSObject* expr) {
  return cast<XQueryOperatorExpr>(expr)->left();
}

NSObject* XQOperatorRight(NSObject* expr) {
  return cast<XQueryOperatorExpr>(expr)->right();
}

int XQOperatorType(NSObject* expr) {
  return cast<XQueryOperatorExpr>(expr)->operatorType();
}

int64_t XQExprLine(NSObject* expr) {
  return cast<XQueryExpr>(expr)->exprLine();
}

NSObject* XQExprSetLine(NSObject* expr, int64_t line) {
  cast<XQueryExpr>(expr)->setExprLine(line);
  return expr;
}

}  // namespace xquery
