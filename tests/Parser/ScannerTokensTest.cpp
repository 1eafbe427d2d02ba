// Every token of the list, in a state that yields it, with the state and the stack after it.
#include "Parser/ScannerHarness.h"

#include <gtest/gtest.h>

#include <ostream>
#include <set>

namespace xquery {
namespace {

constexpr int D = XQueryStateDEFAULT;
constexpr int O = XQueryStateOPERATOR;
constexpr int ND = XQueryStateNAMESPACEDECL;
constexpr int NK = XQueryStateNAMESPACEKEYWORD;
constexpr int XS = XQueryStateXMLSPACE_DECL;
constexpr int IT = XQueryStateITEMTYPE;
constexpr int ST = XQueryStateSINGLETYPE;
constexpr int KT = XQueryStateKINDTEST;
constexpr int KTPI = XQueryStateKINDTESTFORPI;
constexpr int VN = XQueryStateVARNAME;
constexpr int TAG = XQueryStateSTART_TAG;
constexpr int END = XQueryStateEND_TAG;
constexpr int COM = XQueryStateXML_COMMENT;
constexpr int PI = XQueryStatePROCESSING_INSTRUCTION;
constexpr int PIC = XQueryStatePROCESSING_INSTRUCTION_CONTENT;
constexpr int CD = XQueryStateCDATA_SECTION;
constexpr int EC = XQueryStateELEMENT_CONTENT;
constexpr int QA = XQueryStateQUOT_ATTRIBUTE_CONTENT;
constexpr int AA = XQueryStateAPOS_ATTRIBUTE_CONTENT;
constexpr int OI = XQueryStateOCCURRENCEINDICATOR;
constexpr int CK = XQueryStateCLOSEKINDTEST;

struct Row {
  int state;         // the state that the text is scanned in
  const char* text;  // its first token is looked at
  int token;
  const char* value;              // the token's value; a character token's as text
  int next;                       // the state after it
  std::vector<int> stack = {EC};  // after it; before it the stack holds one ELEMENT_CONTENT
};

std::ostream& operator<<(std::ostream& out, const Row& row) {
  return out << sXQueryStateStrings[row.state] << " \"" << row.text << '"';
}

const Row rows[] = {
    {D, "ancestor::a", kTokenAncestorColonColon, "", D},
    {D, "ancestor-or-self::a", kTokenAncestorOrSelfColonColon, "", D},
    {O, "and b", kTokenAnd, "", D},
    {TAG, "'x", kTokenApos, "", AA},
    {AA, "'", kTokenApos, "", TAG},
    {AA, "''", kTokenAposApos, "", AA},
    {AA, "x", kTokenAposAttContentChar, "x", AA},
    {AA, "\"", kTokenAposAttContentChar, "\"", AA},
    {O, "as xs:int", kTokenAs, "", IT},
    {O, "ascending", kTokenAscending, "", O},
    {D, "*", kTokenAsterisk, "", O},
    {O, "*", kTokenAsterisk, "", D},
    {KT, "*", kTokenAsterisk, "", CK},
    {OI, "*", kTokenAsterisk, "", O},
    {D, "*:name", kTokenAsteriskColonNCName, "name", O},
    {O, "at $p", kTokenAt, "", D},
    {D, "@a", kTokenAtSign, "", D},
    {D, "at \"loc\" ", kTokenAtStringLiteral, "loc", D},
    {D, "at 'loc'", kTokenAtStringLiteral, "loc", D},
    {D, "attribute::a", kTokenAttributeColonColon, "", D},
    {D, "attribute {", kTokenAttributeCurlyBraceLeft, "", D, {EC, O}},
    {D, "attribute(", kTokenAttributeParenLeft, "", KT, {EC, O}},
    {IT, "attribute (", kTokenAttributeParenLeft, "", KT, {EC, OI}},
    {D, "attribute p:a {", kTokenAttributeQNameCurlyBraceLeft, "p:a", D, {EC, O}},
    {O, "[", kTokenBraceLeft, "", D},
    {D, "]", kTokenBraceRight, "", O},
    {O, "]", kTokenBraceRight, "", O},
    {CD, "]]>", kTokenCDATAEnd, "", EC, {}},
    {D, "<![CDATA[", kTokenCDATAStart, "", CD, {EC, O}},
    {EC, "<![CDATA[", kTokenCDATAStart, "", CD, {EC, EC}},
    {O, "case $x", kTokenCase, "", IT},
    {O, "cast as xs:int", kTokenCastAs, "", ST},
    {O, "castable as xs:int", kTokenCastableAs, "", ST},
    {COM, "-", kTokenChar, "-", COM},
    {PIC, "?", kTokenChar, "?", PIC},
    {CD, "<", kTokenChar, "<", CD},
    {EC, "&#65;", kTokenCharRef, "A", EC},
    {QA, "&#x41;", kTokenCharRef, "A", QA},
    {AA, "&#x3b1;", kTokenCharRef, "\xCE\xB1", AA},
    {D, "child::a", kTokenChildColonColon, "", D},
    {O, "collation \"u\"", kTokenCollation, "", O},
    {O, ":=", kTokenColonEqual, "", D},
    {D, ",", kTokenComma, "", D},
    {O, ",", kTokenComma, "", D},
    {CK, ",", kTokenComma, "", KT},
    {D, "comment {", kTokenCommentCurlyBraceLeft, "", D, {EC, O}},
    {D, "comment(", kTokenCommentParenLeft, "", KT, {EC, O}},
    {IT, "comment(", kTokenCommentParenLeft, "", KT, {EC, OI}},
    {D, "{", kTokenCurlyBraceLeft, "", D, {EC, O}},
    {O, "{", kTokenCurlyBraceLeft, "", D, {EC, O}},
    {EC, "{", kTokenCurlyBraceLeft, "", D, {EC, EC}},
    {QA, "{", kTokenCurlyBraceLeft, "", D, {EC, QA}},
    {AA, "{", kTokenCurlyBraceLeft, "", D, {EC, AA}},
    {EC, "{{", kTokenCurlyBraceLeftCurlyBraceLeft, "{", EC},
    {QA, "{{", kTokenCurlyBraceLeftCurlyBraceLeft, "{", QA},
    {AA, "{{", kTokenCurlyBraceLeftCurlyBraceLeft, "{", AA},
    {D, "}", kTokenCurlyBraceRight, "", EC, {}},
    {O, "}", kTokenCurlyBraceRight, "", EC, {}},
    {EC, "}}", kTokenCurlyBraceRightCurlyBraceRight, "}", EC},
    {QA, "}}", kTokenCurlyBraceRightCurlyBraceRight, "}", QA},
    {AA, "}}", kTokenCurlyBraceRightCurlyBraceRight, "}", AA},
    {D, ".5", kTokenDecimalLiteral, ".5", O},
    {D, "5.", kTokenDecimalLiteral, "5.", O},
    {D, "5.25", kTokenDecimalLiteral, "5.25", O},
    {D, "declare base-uri 'u'", kTokenDeclareBaseURI, "", ND},
    {D, "declare construction strip", kTokenDeclareConstruction, "", O},
    {D, "declare default collation 'u'", kTokenDeclareDefaultCollation, "", ND},
    {D, "declare default element namespace", kTokenDeclareDefaultElement, "", NK},
    {D, "declare default function namespace", kTokenDeclareDefaultFunction, "", NK},
    {D, "declare function f()", kTokenDeclareFunction, "", D},
    {D, "declare namespace p", kTokenDeclareNamespace, "", ND},
    {D, "declare ordering ordered", kTokenDeclareOrdering, "", O},
    {D, "declare variable $x", kTokenDeclareVariableDollarSign, "", VN},
    {D, "declare xmlspace strip", kTokenDeclareXMLSpace, "", XS},
    {D, "declare default order empty greatest;", kTokenDeclareDefaultOrderEmptyGreatest, "", D},
    {D, "declare default order empty least;", kTokenDeclareDefaultOrderEmptyLeast, "", D},
    {D, "declare inherit-namespaces yes;", kTokenDeclareInheritNamespacesYes, "", D},
    {D, "declare inherit-namespaces no;", kTokenDeclareInheritNamespacesNo, "", D},
    {D, "encoding \"utf-8\";", kTokenEncodingStringLiteral, "utf-8", D},
    {O, "default return", kTokenDefault, "", O},
    {NK, "default element", kTokenDefaultElement, "", NK},
    {D, "descendant::a", kTokenDescendantColonColon, "", D},
    {D, "descendant-or-self::a", kTokenDescendantOrSelfColonColon, "", D},
    {O, "descending", kTokenDescending, "", O},
    {O, "div 2", kTokenDiv, "", D},
    {D, "document {", kTokenDocumentCurlyBraceLeft, "", D, {EC, O}},
    {D, "document-node(", kTokenDocumentNodeParenLeft, "", KT, {EC, O}},
    {IT, "document-node(", kTokenDocumentNodeParenLeft, "", KT, {EC, OI}},
    {D, "$x", kTokenDollarSign, "", VN},
    {O, "$x", kTokenDollarSign, "", VN},
    {IT, "$x", kTokenDollarSign, "", VN},
    {D, "1e3", kTokenDoubleLiteral, "1e3", O},
    {D, ".5E-3", kTokenDoubleLiteral, ".5E-3", O},
    {D, "5.e+3", kTokenDoubleLiteral, "5.e+3", O},
    {EC, "x", kTokenElementContentChar, "x", EC},
    {EC, " ", kTokenElementContentCharWS, " ", EC},
    {EC, "\t", kTokenElementContentCharWS, "\t", EC},
    {EC, "\r", kTokenElementContentCharWS, "\n", EC},
    {EC, "\n", kTokenElementContentCharWS, "\n", EC},
    {D, "element {", kTokenElementCurlyBraceLeft, "", D, {EC, O}},
    {D, "element (", kTokenElementParenLeft, "", KT, {EC, O}},
    {IT, "element(", kTokenElementParenLeft, "", KT, {EC, OI}},
    {KT, "element(", kTokenElementParenLeft, "", KT, {EC, KT}},
    {D, "element a {", kTokenElementQNameCurlyBraceLeft, "a", D, {EC, O}},
    {O, "else 1", kTokenElse, "", D},
    {O, "empty greatest", kTokenEmptyGreatest, "", O},
    {O, "empty least", kTokenEmptyLeast, "", O},
    {IT, "empty()", kTokenEmptyParenLeftParenRight, "", O},
    {IT, "empty ( )", kTokenEmptyParenLeftParenRight, "", O},
    {O, "eq 1", kTokenEq, "", D},
    {O, "=", kTokenEqual, "", D},
    {ND, "=", kTokenEqual, "", ND},
    {TAG, "=", kTokenEqual, "", TAG},
    {D, "every $x", kTokenEveryDollarSign, "", VN},
    {O, "except b", kTokenExcept, "", D},
    {O, "external", kTokenExternal, "", D},
    {D, "following::a", kTokenFollowingColonColon, "", D},
    {D, "following-sibling::a", kTokenFollowingSiblingColonColon, "", D},
    {D, "for $x", kTokenForDollarSign, "", VN},
    {O, "for $x", kTokenForDollarSign, "", VN},
    {O, "ge 1", kTokenGe, "", D},
    {O, ">", kTokenGreaterThan, "", D},
    {TAG, ">", kTokenGreaterThan, "", EC},
    {END, ">", kTokenGreaterThan, "", EC, {}},
    {O, ">=", kTokenGreaterThanEqual, "", D},
    {O, ">>", kTokenGreaterThanGreaterThan, "", D},
    {O, "gt 1", kTokenGt, "", D},
    {O, "idiv 2", kTokenIDiv, "", D},
    {D, "if (", kTokenIfParenLeft, "", D},
    {D, "import module 'u'", kTokenImportModule, "", NK},
    {D, "import schema 'u'", kTokenImportSchema, "", NK},
    {O, "in a", kTokenIn, "", D},
    {O, "instance of xs:int", kTokenInstanceOf, "", IT},
    {D, "12", kTokenIntegerLiteral, "12", O},
    {O, "intersect b", kTokenIntersect, "", D},
    {O, "is b", kTokenIs, "", D},
    {IT, "item()", kTokenItemParenLeftParenRight, "", OI},
    {O, "le 1", kTokenLe, "", D},
    {O, "<", kTokenLessThanCompare, "", D},
    {D, "<a", kTokenLessThanConstructor, "", TAG, {EC, O}},
    {EC, "<a", kTokenLessThanConstructor, "", TAG, {EC, EC}},
    {O, "<=", kTokenLessThanEqual, "", D},
    {O, "<<", kTokenLessThanLessThan, "", D},
    {EC, "</a", kTokenLessThanSolidus, "", END},
    {D, "let $x", kTokenLetDollarSign, "", VN},
    {O, "let $x", kTokenLetDollarSign, "", VN},
    {O, "lt 1", kTokenLt, "", D},
    {D, "-", kTokenMinus, "", D},
    {O, "-", kTokenMinus, "", D},
    {O, "mod 2", kTokenMod, "", D},
    {D, "module namespace p", kTokenModuleNamespace, "", ND},
    {ND, "p =", kTokenNCName, "p", ND},
    {KTPI, "t)", kTokenNCName, "t", KTPI},
    {D, "p:*", kTokenNCNameColonAsterisk, "p", O},
    {NK, "namespace 'u'", kTokenNamespace, "", ND},
    {O, "ne 1", kTokenNe, "", D},
    {D, "node(", kTokenNodeParenLeft, "", KT, {EC, O}},
    {IT, "node(", kTokenNodeParenLeft, "", KT, {EC, OI}},
    {O, "!=", kTokenNotEqual, "", D},
    {O, "or b", kTokenOr, "", D},
    {O, "order by", kTokenOrderBy, "", D},
    {O, "ordered;", kTokenOrdered, "", D},
    {D, "ordered {", kTokenOrderedCurlyBraceLeft, "", D, {EC, O}},
    {D, "processing-instruction {", kTokenPICurlyBraceLeft, "", D, {EC, O}},
    {PI, "?>", kTokenPIEnd, "", EC, {}},
    {PIC, "?>", kTokenPIEnd, "", EC, {}},
    {D, "processing-instruction t {", kTokenPINCNameCurlyBraceLeft, "t", D, {EC, O}},
    {D, "<?t", kTokenPIStart, "", PI, {EC, O}},
    {EC, "<?t", kTokenPIStart, "", PI, {EC, EC}},
    {PI, "target ", kTokenPITarget, "target", PI},
    {D, "(", kTokenParenLeft, "", D},
    {D, ")", kTokenParenRight, "", O},
    {O, ")", kTokenParenRight, "", O},
    {KT, ")", kTokenParenRight, "", EC, {}},
    {KTPI, ")", kTokenParenRight, "", EC, {}},
    {CK, ")", kTokenParenRight, "", EC, {}},
    {D, ") as xs:int", kTokenParenRightAs, "", IT},
    {O, ")as xs:int", kTokenParenRightAs, "", IT},
    {D, "parent::a", kTokenParentColonColon, "", D},
    {D, ".", kTokenPeriod, "", O},
    {D, "..", kTokenPeriodPeriod, "", O},
    {D, "+", kTokenPlus, "", D},
    {O, "+", kTokenPlus, "", D},
    {OI, "+", kTokenPlus, "", O},
    {D, "preceding::a", kTokenPrecedingColonColon, "", D},
    {D, "preceding-sibling::a", kTokenPrecedingSiblingColonColon, "", D},
    {EC, "&amp;", kTokenPredefinedEntityRef, "&", EC},
    {QA, "&lt;", kTokenPredefinedEntityRef, "<", QA},
    {AA, "&gt;", kTokenPredefinedEntityRef, ">", AA},
    {EC, "&apos;", kTokenPredefinedEntityRef, "'", EC},
    {EC, "&quot;", kTokenPredefinedEntityRef, "\"", EC},
    {O, "preserve;", kTokenPreserve, "", D},
    {XS, "preserve;", kTokenPreserve, "", D},
    {D, "processing-instruction(", kTokenProcessingInstructionParenLeft, "", KTPI, {EC, O}},
    {IT, "processing-instruction(", kTokenProcessingInstructionParenLeft, "", KTPI, {EC, OI}},
    {D, "p:a", kTokenQName, "p:a", O},
    {D, "a", kTokenQName, "a", O},
    {IT, "xs:int", kTokenQName, "xs:int", OI},
    {ST, "xs:int", kTokenQName, "xs:int", O},
    {KT, "a", kTokenQName, "a", CK},
    {TAG, "p:a", kTokenQName, "p:a", TAG},
    {END, "p:a", kTokenQName, "p:a", END},
    {D, "p:f (", kTokenQNameParenLeft, "p:f", D},
    {O, "?", kTokenQuestionMark, "", O},
    {CK, "?", kTokenQuestionMark, "", CK},
    {OI, "?", kTokenQuestionMark, "", O},
    {QA, "x", kTokenQuoteAttContentChar, "x", QA},
    {QA, "'", kTokenQuoteAttContentChar, "'", QA},
    {TAG, "\"", kTokenQuote, "", QA},
    {QA, "\"", kTokenQuote, "", TAG},
    {QA, "\"\"", kTokenQuoteQuote, "", QA},
    {O, "return 1", kTokenReturn, "", D},
    {O, "satisfies 1", kTokenSatisfies, "", D},
    {D, "schema-element(", kTokenSchemaElementParenLeft, "", KT, {EC, O}},
    {IT, "schema-element(", kTokenSchemaElementParenLeft, "", KT, {EC, OI}},
    {KT, "schema-element(", kTokenSchemaElementParenLeft, "", KT, {EC, KT}},
    {D, "schema-attribute(", kTokenSchemaAttributeParenLeft, "", KT, {EC, O}},
    {IT, "schema-attribute(", kTokenSchemaAttributeParenLeft, "", KT, {EC, OI}},
    {D, "self::a", kTokenSelfColonColon, "", D},
    {D, ";", kTokenSemicolon, "", D},
    {O, ";", kTokenSemicolon, "", D},
    {D, "/", kTokenSolidus, "", D},
    {O, "/", kTokenSolidus, "", D},
    {TAG, "/>", kTokenSolidusGreaterThan, "", EC, {}},
    {D, "//", kTokenSolidusSolidus, "", D},
    {O, "//", kTokenSolidusSolidus, "", D},
    {D, "some $x", kTokenSomeDollarSign, "", VN},
    {O, "stable order by", kTokenStableOrderBy, "", D},
    {D, "\"s\"", kTokenStringLiteral, "s", O},
    {D, "'s'", kTokenStringLiteral, "s", O},
    {O, "'s'", kTokenStringLiteral, "s", O},
    {ND, "'s'", kTokenStringLiteral, "s", D},
    {NK, "\"s\"", kTokenStringLiteral, "s", D},
    {KTPI, "'s'", kTokenStringLiteral, "s", KTPI},
    {O, "strip;", kTokenStrip, "", D},
    {XS, "strip;", kTokenStrip, "", D},
    {D, "text {", kTokenTextCurlyBraceLeft, "", D, {EC, O}},
    {D, "text(", kTokenTextParenLeft, "", KT, {EC, O}},
    {IT, "text(", kTokenTextParenLeft, "", KT, {EC, OI}},
    {O, "then 1", kTokenThen, "", D},
    {O, "to 1", kTokenTo, "", D},
    {O, "treat as xs:int", kTokenTreatAs, "", IT},
    {D, "typeswitch (", kTokenTypeswitchParenLeft, "", D},
    {O, "union b", kTokenUnion, "", D},
    {O, "| b", kTokenUnion, "", D},
    {O, "unordered;", kTokenUnordered, "", D},
    {D, "unordered {", kTokenUnorderedCurlyBraceLeft, "", D, {EC, O}},
    {D, "validate {", kTokenValidateCurlyBraceLeft, "", D, {EC, O}},
    {D, "validate lax {", kTokenValidateModeLax, "", D, {EC, O}},
    {D, "validate strict {", kTokenValidateModeStrict, "", D, {EC, O}},
    {VN, "p:x", kTokenVarName, "p:x", O},
    {O, "where 1", kTokenWhere, "", D},
    {COM, "-->", kTokenXMLCommentEnd, "", EC, {}},
    {D, "<!--", kTokenXMLCommentStart, "", COM, {EC, O}},
    {EC, "<!--", kTokenXMLCommentStart, "", COM, {EC, EC}},
    {D, "xquery version \"1.0\"", kTokenXQueryVersionStringLiteral, "1.0", D},
};

class ScannerTokens : public testing::TestWithParam<Row> {};

TEST_P(ScannerTokens, IsScannedAndSetsTheState) {
  const Row& row = GetParam();
  const Scanned scanned(row.text, row.state, {EC});
  ASSERT_FALSE(scanned.tokens.empty());
  const ScannedToken& token = scanned.tokens.front();
  EXPECT_EQ(token.name(), XQTokenName(row.token));
  EXPECT_EQ(token.text, row.value);
  EXPECT_EQ(token.line, 0);
  EXPECT_STREQ(sXQueryStateStrings[token.state], sXQueryStateStrings[row.next]);
  EXPECT_EQ(token.stack, row.stack);
}

INSTANTIATE_TEST_SUITE_P(All, ScannerTokens, testing::ValuesIn(rows));

TEST(ScannerTokens, EveryTokenIsScannedButTheNineThatNoQueryYields) {
  std::set<std::string> missing;
  for (int code = 257; code <= 434; ++code) missing.insert(XQTokenName(code));
  EXPECT_EQ(missing.size(), 178u);
  for (const Row& row : rows) missing.erase(XQTokenName(row.token));
  const std::set<std::string> expected = {
      "kTokenContext",         "kTokenElementWS", "kTokenError",        "kTokenLax",
      "kTokenNillable",        "kTokenNo",        "kTokenQNameSolidus", "kTokenStrict",
      "kTokenValidateContext", "kTokenYes"};
  EXPECT_EQ(missing, expected);
  EXPECT_EQ(Scanned("#").tokens.front().code, kTokenError);
}

TEST(ScannerTokens, CodesAreFixed) {
  EXPECT_EQ(kTokenAncestorColonColon, 257);
  EXPECT_EQ(kTokenError, 332);
  EXPECT_EQ(kTokenQName, 395);
  EXPECT_EQ(kTokenYes, 434);
  EXPECT_STREQ(XQTokenName(305), "kTokenDeclareDefaultOrderEmptyGreatest");
  EXPECT_STREQ(XQTokenName(399), "kTokenQuoteAttContentChar");
}

TEST(ScannerTokens, NamesOutsideTheListAreEmpty) {
  for (const int code : {-1, 0, 65, 256, 435, 100000}) EXPECT_STREQ(XQTokenName(code), "");
}

TEST(ScannerTokens, StatesHaveTheirNumbersAndNames) {
  EXPECT_EQ(XQueryStateCount, 30);
  const char* const names[] = {"INITIAL",
                               "DEFAULT",
                               "OPERATOR",
                               "NAMESPACEDECL",
                               "NAMESPACEKEYWORD",
                               "XMLSPACE_DECL",
                               "ITEMTYPE",
                               "SINGLETYPE",
                               "KINDTEST",
                               "KINDTESTFORPI",
                               "VARNAME",
                               "START_TAG",
                               "END_TAG",
                               "XML_COMMENT",
                               "PROCESSING_INSTRUCTION",
                               "PROCESSING_INSTRUCTION_CONTENT",
                               "CDATA_SECTION",
                               "ELEMENT_CONTENT",
                               "QUOT_ATTRIBUTE_CONTENT",
                               "APOS_ATTRIBUTE_CONTENT",
                               "EXPR_COMMENT",
                               "EXT_KEY",
                               "EXT_NAME",
                               "PRAG_NAME",
                               "EXT_CONTENT",
                               "PRAG_CONTENT",
                               "OCCURRENCEINDICATOR",
                               "CLOSEKINDTEST",
                               "STRING_LITERAL_QUOTE",
                               "STRING_LITERAL_APOS"};
  for (int state = 0; state < XQueryStateCount; ++state) {
    EXPECT_STREQ(sXQueryStateStrings[state], names[state]);
  }
}

}  // namespace
}  // namespace xquery
