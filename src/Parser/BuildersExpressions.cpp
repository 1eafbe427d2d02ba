#include "Expr/XQueryLists.h"
#include "Expr/XQueryOperatorExpr.h"
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

constexpr const char* flwor = "FLWOR expressions";
constexpr const char* quantified = "quantified expressions";
constexpr const char* typeswitch = "typeswitch expressions";

// A literal of more digits than a decimal holds is an error of the query, never another number.
NSObject* XQDigits(Ref<XQueryLiteral> literal, int64_t line) {
  if (literal) return XQAtLine(std::move(literal), line);
  XQueryParser::currentParser()->setError(XQueryErrors::tooManyDigits.errorAtLine(line));
  return XQEmptyLiteral(line);
}

}  // namespace

NSObject* XQExpr(NSObject* expr, int64_t line) {
  Ref<XQueryExprList> list = XQueryExprList::exprList();
  list->addObject(XQRef<XQueryExpr>(expr));
  return XQAtLine(std::move(list), line);
}

NSObject* XQExprAdd(NSObject* list, NSObject* expr) {
  cast<XQueryExprList>(list)->addObject(XQRef<XQueryExpr>(expr));
  return list;
}

NSObject* XQFLWRExpr(NSObject*, NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(flwor, line);
}

NSObject* XQForLetClauses(NSObject* clauses) {
  return XQListAddAll(XQList(nullptr), clauses);
}

NSObject* XQForLetClausesAdd(NSObject* clauses, NSObject* more) {
  return XQListAddAll(clauses, more);
}

NSObject* XQForClause(NSObject*, NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(flwor, line);
}

NSObject* XQForClauseItems(NSObject* clause) {
  return XQList(clause);
}

NSObject* XQForClauseItemsAdd(NSObject* clauses, NSObject* clause) {
  return XQListAdd(clauses, clause);
}

NSObject* XQLetClause(NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(flwor, line);
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

NSObject* XQOrderSpec(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(flwor, line);
}

NSObject* XQOrderModifier(bool, XQueryEmptyOrder, NSObject*, int64_t line) {
  return XQUnavailable(flwor, line);
}

NSObject* XQSome(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(quantified, line);
}

NSObject* XQEvery(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(quantified, line);
}

NSObject* XQQuantifiedExprItem(NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(quantified, line);
}

NSObject* XQQuantifiedExprItems(NSObject* item) {
  return XQList(item);
}

NSObject* XQQuantifiedExprItemsAdd(NSObject* items, NSObject* item) {
  return XQListAdd(items, item);
}

NSObject* XQTypeswitchExpr(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(typeswitch, line);
}

NSObject* XQCaseClause(NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable(typeswitch, line);
}

NSObject* XQCaseClauses(NSObject* clause) {
  return XQList(clause);
}

NSObject* XQCaseClausesAdd(NSObject* clauses, NSObject* clause) {
  return XQListAdd(clauses, clause);
}

NSObject* XQIfThenElse(NSObject*, NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("conditional expressions", line);
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
  while (end->left()) end = cast<XQueryOperatorExpr>(end->left());
  end->setLeftExpr(XQRef<XQueryExpr>(left));
  return chain;
}

NSObject* XQInstanceOfExpr(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("instance of expressions", line);
}

NSObject* XQTreatExpr(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("treat as expressions", line);
}

NSObject* XQCastableExpr(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("castable as expressions", line);
}

NSObject* XQCastExpr(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("cast as expressions", line);
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

NSObject* XQOrderedExpr(NSObject*, bool, int64_t line) {
  return XQUnavailable("ordered and unordered expressions", line);
}

NSObject* XQFunctionCall(NSObject*, NSObject*, int64_t line) {
  return XQUnavailable("function calls", line);
}

NSObject* XQFunctionArgs(NSObject* expr) {
  return XQFunctionArgsAdd(XQueryParserAutoRelease(XQueryArgs::args()), expr);
}

NSObject* XQFunctionArgsAdd(NSObject* args, NSObject* expr) {
  cast<XQueryArgs>(args)->addObject(XQRef<XQueryExpr>(expr));
  return args;
}

NSObject* XQValidateExpr() {
  return nullptr;
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
