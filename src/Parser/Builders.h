// The builders: what the productions of the grammar call to make expressions, prolog items and
// lists.
//
// Every argument and result is owned by the current parser's autorelease pool. The grammar decides
// which class an argument has, so a builder casts without asking; null stands for a part that the
// query does not have. A line is that of the construct's first token, counted from 0. A list is an
// array; each ...Add builder appends to the list it is given and answers that same list.
#pragma once

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Platform/Base/XQueryPlaces.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

// --- modules and prolog (BuildersProlog.cpp) -----------------------------------------------------

NSObject* XQMainModule(NSObject* version, NSObject* prologItems, NSObject* body);
NSObject* XQLibraryModule(NSObject* version, NSObject* moduleNamespace, NSObject* prologItems);
NSObject* XQVersion(NSObject* version);
NSObject* XQModuleNamespace(NSObject* prefix, NSObject* URI, int64_t line);
// One list of both lists' items, setters first.
NSObject* XQProlog(NSObject* setters, NSObject* nonSetters);
NSObject* XQPrologItems(NSObject* item);
// One item or the items of a list.
NSObject* XQPrologItemsAppend(NSObject* items, NSObject* itemOrItems);
NSObject* XQVariableDeclaration(NSObject* name, NSObject* type, NSObject* expr, bool isExternal,
                                int64_t line);
NSObject* XQXMLSpacePreserve(bool preserve, int64_t line);
NSObject* XQOrdered(bool ordered, int64_t line);
NSObject* XQDeclareConstructionPreserve(bool preserve, int64_t line);
NSObject* XQDeclareDefaultOrderEmptyLeast(bool emptyLeast, int64_t line);
NSObject* XQDeclareInheritNamespaces(bool inherit, int64_t line);
NSObject* XQDeclareDefaultCollation(NSObject* URI, int64_t line);
NSObject* XQDeclareDefaultBaseURI(NSObject* URI, int64_t line);
NSObject* XQDeclareNamespace(NSObject* prefix, NSObject* URI, int64_t line);
NSObject* XQDeclareDefaultElementNamespace(NSObject* URI, int64_t line);
NSObject* XQDeclareDefaultFunctionNamespace(NSObject* URI, int64_t line);
NSObject* XQFunctionDecl(NSObject* name, NSObject* params, NSObject* type, NSObject* expr,
                         bool isExternal, int64_t line);
// No production calls it.
NSObject* XQDeclareValidationSchemaMode(int32_t mode, int64_t line);
// Null locations and an empty list are different things.
NSObject* XQModuleImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line);
NSObject* XQSchemaImport(NSObject* URI, NSObject* locations, NSObject* prefix, int64_t line);
NSObject* XQSchemaImportDefaultElement(NSObject* URI, NSObject* locations, int64_t line);
NSObject* XQImportList(NSObject* location);
// One location or the locations of a list.
NSObject* XQImportListAdd(NSObject* locations, NSObject* locationOrLocations);
NSObject* XQParam(NSObject* name, NSObject* type, int64_t line);
NSObject* XQParamList(NSObject* param);
NSObject* XQParamListAdd(NSObject* params, NSObject* param);

// --- expressions (BuildersExpressions.cpp) -------------------------------------------------------

NSObject* XQExpr(NSObject* expr, int64_t line);
NSObject* XQExprAdd(NSObject* list, NSObject* expr);
// `orderSpecs` and `whereExpr` may be null.
NSObject* XQFLWRExpr(NSObject* clauses, NSObject* whereExpr, NSObject* orderSpecs,
                     NSObject* returnExpr, int64_t line);
NSObject* XQForLetClauses(NSObject* clauses);
NSObject* XQForLetClausesAdd(NSObject* clauses, NSObject* more);
NSObject* XQForClause(NSObject* name, NSObject* type, NSObject* position, NSObject* expr,
                      int64_t line);
NSObject* XQForClauseItems(NSObject* clause);
NSObject* XQForClauseItemsAdd(NSObject* clauses, NSObject* clause);
NSObject* XQLetClause(NSObject* name, NSObject* type, NSObject* expr, int64_t line);
NSObject* XQLetClauseItems(NSObject* clause);
NSObject* XQLetClauseItemsAdd(NSObject* clauses, NSObject* clause);
NSObject* XQWhereClause(NSObject* expr);
// Whether the order is stable is not kept.
NSObject* XQOrderByClause(NSObject* specs);
NSObject* XQOrderSpecList(NSObject* spec);
NSObject* XQOrderSpecListAdd(NSObject* specs, NSObject* spec);
NSObject* XQOrderSpec(NSObject* expr, NSObject* modifier, int64_t line);
// What an order modifier says of empty values; without a word the prolog decides.
NSObject* XQOrderModifier(bool ascending, XQueryOrderSpec::EmptyOrder emptyOrder,
                          NSObject* collation, int64_t line);
NSObject* XQSome(NSObject* items, NSObject* condition, int64_t line);
NSObject* XQEvery(NSObject* items, NSObject* condition, int64_t line);
NSObject* XQQuantifiedExprItem(NSObject* name, NSObject* type, NSObject* expr, int64_t line);
NSObject* XQQuantifiedExprItems(NSObject* item);
NSObject* XQQuantifiedExprItemsAdd(NSObject* items, NSObject* item);
NSObject* XQTypeswitchExpr(NSObject* operand, NSObject* clauses, int64_t line);
NSObject* XQCaseClause(NSObject* name, NSObject* type, NSObject* expr, int64_t line);
NSObject* XQCaseClauses(NSObject* clause);
NSObject* XQCaseClausesAdd(NSObject* clauses, NSObject* clause);
NSObject* XQIfThenElse(NSObject* condition, NSObject* thenExpr, NSObject* elseExpr, int64_t line);
NSObject* XQOperator(int token, NSObject* right, int64_t line);
// Attaches the operand at the left end of a chain of operators, and answers the chain.
NSObject* XQOperatorSetLeft(NSObject* chain, NSObject* left);
NSObject* XQInstanceOfExpr(NSObject* expr, NSObject* type, int64_t line);
NSObject* XQTreatExpr(NSObject* expr, NSObject* type, int64_t line);
NSObject* XQCastableExpr(NSObject* expr, NSObject* type, int64_t line);
NSObject* XQCastExpr(NSObject* expr, NSObject* type, int64_t line);
NSObject* XQContextExpr();
NSObject* XQVarNameReference(NSObject* name, int64_t line);
NSObject* XQIntegerLiteral(NSObject* text, int64_t line);
NSObject* XQDecimalLiteral(NSObject* text, int64_t line);
NSObject* XQDoubleLiteral(NSObject* text, int64_t line);
NSObject* XQStringLiteral(NSObject* text, int64_t line);
NSObject* XQEmptyLiteral(int64_t line);
NSObject* XQOrderedExpr(NSObject* expr, bool ordered, int64_t line);
// `args` may be null.
NSObject* XQFunctionCall(NSObject* name, NSObject* args, int64_t line);
NSObject* XQFunctionArgs(NSObject* expr);
NSObject* XQFunctionArgsAdd(NSObject* args, NSObject* expr);
// Nothing is validated: the empty sequence, whatever stands in the braces.
NSObject* XQValidateExpr(int64_t line);
NSObject* XQOperatorLeft(NSObject* expr);
NSObject* XQOperatorRight(NSObject* expr);
int XQOperatorType(NSObject* expr);
int64_t XQExprLine(NSObject* expr);
NSObject* XQExprSetLine(NSObject* expr, int64_t line);

// --- paths (BuildersPaths.cpp) -------------------------------------------------------------------

// A lone filter step without predicates is its own expression.
NSObject* XQRelativePath(NSObject* firstStep, int64_t line);
NSObject* XQRelativePathItemSetNext(NSObject* step, NSObject* next);
NSObject* XQRelativePathItemSetPredicates(NSObject* step, NSObject* predicates);
NSObject* XQPredicates(NSObject* expr);
NSObject* XQPredicatesAdd(NSObject* predicates, NSObject* expr);
NSObject* XQueryFilterStepRoot();
NSObject* XQFilterStep(NSObject* expr);
NSObject* XQNodeTest(NSObject* test, int axisToken);
NSObject* XQNameTest(NSObject* name, int64_t line);
NSObject* XQNodeName(NSObject* name, int64_t line);
NSObject* XQLocalName(NSObject* name, int64_t line);
// A null prefix means any namespace, a null local name any name.
NSObject* XQWildCardNameTest(NSObject* prefix, NSObject* localName, int64_t line);

// --- types (BuildersTypes.cpp) -------------------------------------------------------------------

// "*" in a kind test is no name test at all.
NSObject* XQNodeNameWildCard();
NSObject* XQTypeName(NSObject* name);
NSObject* XQTypeNameWildCard();
NSObject* XQAnyKindTest(int64_t line);
// The type and the nillable mark have no effect: nothing is ever validated.
NSObject* XQElementTest(NSObject* name, NSObject* type, bool nillable, int64_t line);
// Notes schema-element(NAME) and schema-attribute(NAME), which are tests of the name.
void XQSchemaTest(NSObject* name, int64_t line);
NSObject* XQAttributeTest(NSObject* name, NSObject* type, int64_t line);
NSObject* XQPITest(NSObject* target, int64_t line);
NSObject* XQDocumentTest(NSObject* elementTest, int64_t line);
NSObject* XQCommentTest(int64_t line);
NSObject* XQTextTest(int64_t line);
NSObject* XQAtomicType(NSObject* name, int64_t line);
NSObject* XQAnyItemType(int64_t line);
NSObject* XQSequenceTypeEmpty(int64_t line);
// The occurrence token; 0 for none.
NSObject* XQSingleType(NSObject* type, int occurrenceToken);
NSObject* XQSequenceType(NSObject* type, int occurrenceToken);

// --- constructors (BuildersConstructors.cpp) -----------------------------------------------------

NSObject* XQElementConstructor(NSObject* name, NSObject* attributes, NSObject* content,
                               int64_t line);
// Notes an end tag that has another name than the start tag.
void XQEndTag(NSObject* startName, NSObject* endName, int64_t line, XQuerySpan endNameAt);
// Notes a reference to a tab or a line end, which an attribute does not keep.
void XQCharRefInAttribute(char16_t unit, int64_t line);
NSObject* XQAttributeList(NSObject* item);
NSObject* XQAttributeListAdd(NSObject* list, NSObject* item);
NSObject* XQAttributeListItem(NSObject* name, NSObject* items, int quoteToken, int64_t line);
// Lists of text runs and enclosed expressions: a character joins the run at the end of the list.
NSObject* XQAttributeValueCharsWithUnicode(char16_t unit);
NSObject* XQAttributeValueCharsAddUnicode(NSObject* items, char16_t unit);
NSObject* XQAttributeValueCharsWithExpr(NSObject* expr);
NSObject* XQAttributeValueCharsAddExpr(NSObject* items, NSObject* expr);
NSObject* XQElementContent(NSObject* item);
NSObject* XQElementContentAdd(NSObject* items, NSObject* item);
NSObject* XQElementContentWithUnicode(char16_t unit);
NSObject* XQElementContentAddUnicode(NSObject* items, char16_t unit);
NSObject* XQElementContentWhiteSpace(char16_t unit);
NSObject* XQElementContentAddWhiteSpace(NSObject* items, char16_t unit);
// Text of comments, processing instructions and CDATA sections.
NSObject* XQChars(char16_t unit);
NSObject* XQCharsAdd(NSObject* text, char16_t unit);
NSObject* XQCdataSection(NSObject* text, int64_t line);
NSObject* XQXmlComment(NSObject* text, int64_t line);
NSObject* XQXmlPI(NSObject* target, NSObject* content, int64_t line);
NSObject* XQCompDocConstructor(NSObject* expr, int64_t line);
// The name is a string, or an expression that gives it.
NSObject* XQCompElemConstructor(NSObject* name, NSObject* content, int64_t line);
NSObject* XQCompAttrConsructor(NSObject* name, NSObject* value, int64_t line);
NSObject* XQComputedPI(NSObject* name, NSObject* value, int64_t line);
NSObject* XQComputedXmlComment(NSObject* value, int64_t line);
NSObject* XQCompTextConstructor(NSObject* value, int64_t line);
// No production calls it.
NSObject* XQCompNSConstructor(NSObject* prefix, NSObject* URI, int64_t line);

}  // namespace xquery
