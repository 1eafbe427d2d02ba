/* The grammar: 421 productions that turn the token stream into expressions and prolog items.

   Every action calls builders (Builders.h) with the values of its symbols and the line of the token
   that begins the construct; nothing is evaluated here. A production without an action passes the
   value of its first symbol on. Precedence and associativity lie in the layering of the
   nonterminals alone. Three conflicts are the language's own, and shifting is right in all of them:
   "*" after a leading "/" is a name wildcard, and "*" or "+" after an item type is an occurrence
   indicator.

   The order of the productions is part of the interface: their numbers are what a trace prints. */

%define api.prefix {XQ}
%define api.pure full
%parse-param {xquery::XQueryParser& parser}
%lex-param {xquery::XQueryParser& parser}
%define api.value.type {xquery::XQueryTokenValue}
%define api.location.type {xquery::XQueryLocation}
%locations
%define parse.trace
%token-table
%expect 3

%code requires {
#include "Parser/XQueryTokenValue.h"

/* Both are copied bytewise. */
#define XQLTYPE_IS_TRIVIAL 1

namespace xquery {
class XQueryParser;
}
}

%code top {
#include "Parser/XQueryParser.h"

/* The parser's stacks belong to the parse: an exception that passes through the parser leaks
   nothing. */
#define YYMALLOC xquery::XQueryParserAllocate
#define YYFREE(block) static_cast<void>(block)

/* The nesting of a query is bounded by the memory for the symbols that wait on the stack, of which
   each took a byte of the query at least. Where there is none left, the query ends with the message
   "parser stack overflow". */
#define YYMAXDEPTH (1 << 30)
}

%code {
#include "Expr/Paths/XQueryPath.h"
#include "Parser/Builders.h"
#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"

using namespace xquery;

/* The generator's two messages in the words that users of the engine know. What the scanner has
   complained of is not complained of again. */
static void XQReport(const XQueryLocation*, XQueryParser& parser, std::string_view message) {
  if (parser.scanner().hasFailed()) return;
  if (message == "syntax error") message = "parse error";
  if (message == "memory exhausted") message = "parser stack overflow";
  xquery::XQerror(message.data());
}

/* The callback bears the name that the generator also gives to its error token. */
#undef yyerror
#define yyerror XQReport
#define XQerror XQtokentype::XQerror

static int XQlex(XQSTYPE* value, XQueryLocation* location, XQueryParser& parser) {
  const int token = parser.scanner().XQlex(*value);
  location->span = parser.scanner().span();
  return token;
}

/* A production stands for the text from its first symbol to its last one, an empty one for that
   behind the symbol before it. The builders that its action calls learn of it from the parser. */
static XQueryLocation XQProduction(XQueryParser& parser, const XQueryLocation* symbols,
                                   int count) {
  const uint32_t start = count > 0 ? symbols[1].span.start : symbols[0].span.end;
  const XQuerySpan span{start, symbols[count].span.end};
  parser.setSpan(span);
  return XQueryLocation(span);
}
#define YYLOCATION_PRINT(out, location) \
  fprintf(out, "%u-%u", (location)->span.start, (location)->span.end)
#define YYLLOC_DEFAULT(current, symbols, count) \
  ((current) = XQProduction(parser, &YYRHSLOC(symbols, 0), count))

static XQSTYPE XQValue(int32_t line, NSObject* value) {
  XQSTYPE result = {};
  result.line = line;
  result.value = value;
  return result;
}

/* An expression that is only a piece of what its production stands for. */
static NSObject* XQPiece(XQueryParser& parser, const XQueryLocation& first,
                         const XQueryLocation& last, NSObject* expr) {
  parser.setPlace(*cast<XQueryExpr>(expr), {first.span.start, last.span.end});
  return expr;
}

/* The step that a path begins with which begins with a slash, or two. */
static NSObject* XQRoot(XQueryParser& parser, const XQueryLocation& slash) {
  NSObject* const step = XQueryFilterStepRoot();
  XQPiece(parser, slash, slash, cast<XQueryStep>(step)->expr());
  return step;
}

static XQSTYPE XQUnit(int32_t line, char16_t unit) {
  XQSTYPE result = {};
  result.line = line;
  result.unit = unit;
  return result;
}
}

%token
  kTokenAncestorColonColon 257
  kTokenAncestorOrSelfColonColon 258
  kTokenAnd 259
  kTokenApos 260
  kTokenAposApos 261
  kTokenAposAttContentChar 262
  kTokenAs 263
  kTokenAscending 264
  kTokenAsterisk 265
  kTokenAsteriskColonNCName 266
  kTokenAt 267
  kTokenAtSign 268
  kTokenAtStringLiteral 269
  kTokenAttributeColonColon 270
  kTokenAttributeCurlyBraceLeft 271
  kTokenAttributeParenLeft 272
  kTokenAttributeQNameCurlyBraceLeft 273
  kTokenBraceLeft 274
  kTokenBraceRight 275
  kTokenCDATAEnd 276
  kTokenCDATAStart 277
  kTokenCase 278
  kTokenCastAs 279
  kTokenCastableAs 280
  kTokenChar 281
  kTokenCharRef 282
  kTokenChildColonColon 283
  kTokenCollation 284
  kTokenColonEqual 285
  kTokenComma 286
  kTokenCommentCurlyBraceLeft 287
  kTokenCommentParenLeft 288
  kTokenContext 289
  kTokenCurlyBraceLeft 290
  kTokenCurlyBraceLeftCurlyBraceLeft 291
  kTokenCurlyBraceRight 292
  kTokenCurlyBraceRightCurlyBraceRight 293
  kTokenDecimalLiteral 294
  kTokenDeclareBaseURI 295
  kTokenDeclareConstruction 296
  kTokenDeclareDefaultCollation 297
  kTokenDeclareDefaultElement 298
  kTokenDeclareDefaultFunction 299
  kTokenDeclareFunction 300
  kTokenDeclareNamespace 301
  kTokenDeclareOrdering 302
  kTokenDeclareVariableDollarSign 303
  kTokenDeclareXMLSpace 304
  kTokenDeclareDefaultOrderEmptyGreatest 305
  kTokenDeclareDefaultOrderEmptyLeast 306
  kTokenDeclareInheritNamespacesYes 307
  kTokenDeclareInheritNamespacesNo 308
  kTokenEncodingStringLiteral 309
  kTokenDefault 310
  kTokenDefaultElement 311
  kTokenDescendantColonColon 312
  kTokenDescendantOrSelfColonColon 313
  kTokenDescending 314
  kTokenDiv 315
  kTokenDocumentCurlyBraceLeft 316
  kTokenDocumentNodeParenLeft 317
  kTokenDollarSign 318
  kTokenDoubleLiteral 319
  kTokenElementWS 320
  kTokenElementContentChar 321
  kTokenElementContentCharWS 322
  kTokenElementCurlyBraceLeft 323
  kTokenElementParenLeft 324
  kTokenElementQNameCurlyBraceLeft 325
  kTokenElse 326
  kTokenEmptyGreatest 327
  kTokenEmptyLeast 328
  kTokenEmptyParenLeftParenRight 329
  kTokenEq 330
  kTokenEqual 331
  kTokenError 332
  kTokenEveryDollarSign 333
  kTokenExcept 334
  kTokenExternal 335
  kTokenFollowingColonColon 336
  kTokenFollowingSiblingColonColon 337
  kTokenForDollarSign 338
  kTokenGe 339
  kTokenGreaterThan 340
  kTokenGreaterThanEqual 341
  kTokenGreaterThanGreaterThan 342
  kTokenGt 343
  kTokenIDiv 344
  kTokenIfParenLeft 345
  kTokenImportModule 346
  kTokenImportSchema 347
  kTokenIn 348
  kTokenInstanceOf 349
  kTokenIntegerLiteral 350
  kTokenIntersect 351
  kTokenIs 352
  kTokenItemParenLeftParenRight 353
  kTokenLax 354
  kTokenLe 355
  kTokenLessThanCompare 356
  kTokenLessThanConstructor 357
  kTokenLessThanEqual 358
  kTokenLessThanLessThan 359
  kTokenLessThanSolidus 360
  kTokenLetDollarSign 361
  kTokenLt 362
  kTokenMinus 363
  kTokenMod 364
  kTokenModuleNamespace 365
  kTokenNCName 366
  kTokenNCNameColonAsterisk 367
  kTokenNamespace 368
  kTokenNe 369
  kTokenNillable 370
  kTokenNo 371
  kTokenNodeParenLeft 372
  kTokenNotEqual 373
  kTokenOr 374
  kTokenOrderBy 375
  kTokenOrdered 376
  kTokenOrderedCurlyBraceLeft 377
  kTokenPICurlyBraceLeft 378
  kTokenPIEnd 379
  kTokenPINCNameCurlyBraceLeft 380
  kTokenPIStart 381
  kTokenPITarget 382
  kTokenParenLeft 383
  kTokenParenRight 384
  kTokenParenRightAs 385
  kTokenParentColonColon 386
  kTokenPeriod 387
  kTokenPeriodPeriod 388
  kTokenPlus 389
  kTokenPrecedingColonColon 390
  kTokenPrecedingSiblingColonColon 391
  kTokenPredefinedEntityRef 392
  kTokenPreserve 393
  kTokenProcessingInstructionParenLeft 394
  kTokenQName 395
  kTokenQNameParenLeft 396
  kTokenQNameSolidus 397
  kTokenQuestionMark 398
  kTokenQuoteAttContentChar 399
  kTokenQuote 400
  kTokenQuoteQuote 401
  kTokenReturn 402
  kTokenSatisfies 403
  kTokenSchemaElementParenLeft 404
  kTokenSchemaAttributeParenLeft 405
  kTokenSelfColonColon 406
  kTokenSemicolon 407
  kTokenSolidus 408
  kTokenSolidusGreaterThan 409
  kTokenSolidusSolidus 410
  kTokenSomeDollarSign 411
  kTokenStableOrderBy 412
  kTokenStringLiteral 413
  kTokenStrict 414
  kTokenStrip 415
  kTokenTextCurlyBraceLeft 416
  kTokenTextParenLeft 417
  kTokenThen 418
  kTokenTo 419
  kTokenTreatAs 420
  kTokenTypeswitchParenLeft 421
  kTokenUnion 422
  kTokenUnordered 423
  kTokenUnorderedCurlyBraceLeft 424
  kTokenValidateContext 425
  kTokenValidateCurlyBraceLeft 426
  kTokenValidateModeLax 427
  kTokenValidateModeStrict 428
  kTokenVarName 429
  kTokenWhere 430
  kTokenXMLCommentEnd 431
  kTokenXMLCommentStart 432
  kTokenXQueryVersionStringLiteral 433
  kTokenYes 434

%%

XQuery:
    Module
      { parser.setResult($1.value); }
  | %empty
      { parser.setResult(nullptr); }
  ;

Module:
    MainModule
  | LibraryModule
  ;

MainModule:
    Version kTokenSemicolon Prolog QueryBody
      { $$ = XQValue($1.line, XQMainModule($1.value, $3.value, $4.value)); }
  | Version kTokenSemicolon QueryBody
      { $$ = XQValue($1.line, XQMainModule($1.value, nullptr, $3.value)); }
  | Prolog QueryBody
      { $$ = XQValue($1.line, XQMainModule(nullptr, $1.value, $2.value)); }
  | QueryBody
      { $$ = XQValue($1.line, XQMainModule(nullptr, nullptr, $1.value)); }
  ;

LibraryModule:
    Version kTokenSemicolon ModuleDecl kTokenSemicolon Prolog
      { $$ = XQValue($1.line, XQLibraryModule($1.value, $3.value, $5.value)); }
  | Version kTokenSemicolon ModuleDecl kTokenSemicolon
      { $$ = XQValue($1.line, XQLibraryModule($1.value, $3.value, nullptr)); }
  | ModuleDecl kTokenSemicolon Prolog
      { $$ = XQValue($1.line, XQLibraryModule(nullptr, $1.value, $3.value)); }
  | ModuleDecl kTokenSemicolon
      { $$ = XQValue($1.line, XQLibraryModule(nullptr, $1.value, XQProlog(nullptr, nullptr))); }
  ;

Version:
    kTokenXQueryVersionStringLiteral
      { $$ = XQValue($1.line, XQVersion($1.value)); }
  | kTokenXQueryVersionStringLiteral kTokenEncodingStringLiteral
      { $$ = XQValue($1.line, XQVersion($1.value)); }
  ;

ModuleDecl:
    kTokenModuleNamespace kTokenNCName kTokenEqual kTokenStringLiteral
      { $$ = XQValue($1.line, XQModuleNamespace($2.value, $4.value, $1.line)); }
  ;

Prolog:
    Setters NonSetters
      { $$ = XQValue($1.line, XQProlog($1.value, $2.value)); }
  | Setters
      { $$ = XQValue($1.line, XQProlog($1.value, nullptr)); }
  | NonSetters
      { $$ = XQValue($1.line, XQProlog(nullptr, $1.value)); }
  ;

NonSetters:
    NonSetters1 NonSetters2
      { $$ = XQValue($1.line, XQPrologItemsAppend($1.value, $2.value)); }
  | NonSetters1
  | NonSetters2
  ;

Setters:
    Setter
      { $$ = XQValue($1.line, XQPrologItems($1.value)); }
  | Setters Setter
      { $$ = XQValue($1.line, XQPrologItemsAppend($1.value, $2.value)); }
  ;

NonSetters1:
    NonSetter1
      { $$ = XQValue($1.line, XQPrologItems($1.value)); }
  | NonSetters1 NonSetter1
      { $$ = XQValue($1.line, XQPrologItemsAppend($1.value, $2.value)); }
  ;

NonSetters2:
    NonSetter2
      { $$ = XQValue($1.line, XQPrologItems($1.value)); }
  | NonSetters2 NonSetter2
      { $$ = XQValue($1.line, XQPrologItemsAppend($1.value, $2.value)); }
  ;

Setter:
    XMLSpaceDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterXMLSpace, $1.line);
        $$ = $1;
      }
  | DefaultCollationDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterDefaultCollation, $1.line);
        $$ = $1;
      }
  | BaseURIDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterBaseURI, $1.line);
        $$ = $1;
      }
  | ConstructionDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterConstruction, $1.line);
        $$ = $1;
      }
  | DefaultOrderingDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterOrdering, $1.line);
        $$ = $1;
      }
  | EmptyOrderingDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterEmptyOrdering, $1.line);
        $$ = $1;
      }
  | InheritNamespacesDecl kTokenSemicolon
      {
        parser.XQueryParserSetSetterFlag(XQuerySetterInheritNamespaces, $1.line);
        $$ = $1;
      }
  ;

NonSetter1:
    SchemaImport kTokenSemicolon
  | ModuleImport kTokenSemicolon
  | NamespaceDecl kTokenSemicolon
  | DefaultNamespaceDecl kTokenSemicolon
  ;

NonSetter2:
    VarDecl kTokenSemicolon
  | FunctionDecl kTokenSemicolon
  ;

ModuleImport:
    kTokenImportModule kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
        kTokenAtStringLiteral ImportList
      {
        $$ = XQValue($1.line, XQModuleImport($5.value, XQImportListAdd(XQImportList($6.value),
            $7.value), $3.value, $1.line));
      }
  | kTokenImportModule kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
        kTokenAtStringLiteral
      {
        $$ = XQValue($1.line, XQModuleImport($5.value, XQImportList($6.value), $3.value, $1.line));
      }
  | kTokenImportModule kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
      { $$ = XQValue($1.line, XQModuleImport($5.value, nullptr, $3.value, $1.line)); }
  | kTokenImportModule kTokenStringLiteral kTokenAtStringLiteral ImportList
      {
        $$ = XQValue($1.line, XQModuleImport($2.value, XQImportListAdd(XQImportList($3.value),
            $4.value), nullptr, $1.line));
      }
  | kTokenImportModule kTokenStringLiteral kTokenAtStringLiteral
      { $$ = XQValue($1.line, XQModuleImport($2.value, XQImportList($3.value), nullptr, $1.line)); }
  | kTokenImportModule kTokenStringLiteral
      { $$ = XQValue($1.line, XQModuleImport($2.value, nullptr, nullptr, $1.line)); }
  ;

SchemaImport:
    kTokenImportSchema kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
        kTokenAtStringLiteral ImportList
      {
        $$ = XQValue($1.line, XQSchemaImport($5.value, XQImportListAdd(XQImportList($6.value),
            $7.value), $3.value, $1.line));
      }
  | kTokenImportSchema kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
        kTokenAtStringLiteral
      {
        $$ = XQValue($1.line, XQSchemaImport($5.value, XQImportList($6.value), $3.value, $1.line));
      }
  | kTokenImportSchema kTokenDefaultElement kTokenNamespace kTokenStringLiteral
        kTokenAtStringLiteral ImportList
      {
        $$ = XQValue($1.line, XQSchemaImportDefaultElement($4.value,
            XQImportListAdd(XQImportList($5.value), $6.value), $1.line));
      }
  | kTokenImportSchema kTokenDefaultElement kTokenNamespace kTokenStringLiteral
        kTokenAtStringLiteral
      {
        $$ = XQValue($1.line, XQSchemaImportDefaultElement($4.value, XQImportList($5.value),
            $1.line));
      }
  | kTokenImportSchema kTokenNamespace kTokenNCName kTokenEqual kTokenStringLiteral
      { $$ = XQValue($1.line, XQSchemaImport($5.value, nullptr, $3.value, $1.line)); }
  | kTokenImportSchema kTokenDefaultElement kTokenNamespace kTokenStringLiteral
      { $$ = XQValue($1.line, XQSchemaImportDefaultElement($4.value, nullptr, $1.line)); }
  | kTokenImportSchema kTokenStringLiteral kTokenAtStringLiteral ImportList
      { $$ = XQValue($1.line, XQSchemaImport($2.value, XQImportList($3.value), nullptr, $1.line)); }
  | kTokenImportSchema kTokenStringLiteral kTokenAtStringLiteral
      { $$ = XQValue($1.line, XQSchemaImport($2.value, XQImportList($3.value), nullptr, $1.line)); }
  | kTokenImportSchema kTokenStringLiteral
      { $$ = XQValue($1.line, XQSchemaImport($2.value, nullptr, nullptr, $1.line)); }
  ;

ImportList:
    Import
      { $$ = XQValue($1.line, XQImportList($1.value)); }
  | ImportList Import
      { $$ = XQValue($1.line, XQImportListAdd($1.value, $2.value)); }
  ;

Import:
    kTokenComma kTokenStringLiteral
      { $$ = XQValue($1.line, $2.value); }
  ;

NamespaceDecl:
    kTokenDeclareNamespace kTokenNCName kTokenEqual kTokenStringLiteral
      { $$ = XQValue($1.line, XQDeclareNamespace($2.value, $4.value, $1.line)); }
  ;

XMLSpaceDecl:
    kTokenDeclareXMLSpace kTokenPreserve
      { $$ = XQValue($1.line, XQXMLSpacePreserve(true, $1.line)); }
  | kTokenDeclareXMLSpace kTokenStrip
      { $$ = XQValue($1.line, XQXMLSpacePreserve(false, $1.line)); }
  ;

DefaultNamespaceDecl:
    kTokenDeclareDefaultElement kTokenNamespace kTokenStringLiteral
      { $$ = XQValue($1.line, XQDeclareDefaultElementNamespace($3.value, $1.line)); }
  | kTokenDeclareDefaultFunction kTokenNamespace kTokenStringLiteral
      { $$ = XQValue($1.line, XQDeclareDefaultFunctionNamespace($3.value, $1.line)); }
  ;

DefaultOrderingDecl:
    kTokenDeclareOrdering kTokenOrdered
      { $$ = XQValue($1.line, XQOrdered(true, $1.line)); }
  | kTokenDeclareOrdering kTokenUnordered
      { $$ = XQValue($1.line, XQOrdered(false, $1.line)); }
  ;

DefaultCollationDecl:
    kTokenDeclareDefaultCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQDeclareDefaultCollation($2.value, $1.line)); }
  ;

BaseURIDecl:
    kTokenDeclareBaseURI kTokenStringLiteral
      { $$ = XQValue($1.line, XQDeclareDefaultBaseURI($2.value, $1.line)); }
  ;

VarDecl:
    kTokenDeclareVariableDollarSign kTokenVarName TypeDeclaration kTokenColonEqual ExprSingle
      {
        $$ = XQValue($1.line, XQVariableDeclaration($2.value, $3.value, $5.value, false, $1.line));
      }
  | kTokenDeclareVariableDollarSign kTokenVarName TypeDeclaration kTokenExternal
      { $$ = XQValue($1.line, XQVariableDeclaration($2.value, $3.value, nullptr, true, $1.line)); }
  | kTokenDeclareVariableDollarSign kTokenVarName kTokenColonEqual ExprSingle
      { $$ = XQValue($1.line, XQVariableDeclaration($2.value, nullptr, $4.value, false, $1.line)); }
  | kTokenDeclareVariableDollarSign kTokenVarName kTokenExternal
      { $$ = XQValue($1.line, XQVariableDeclaration($2.value, nullptr, nullptr, true, $1.line)); }
  ;

ConstructionDecl:
    kTokenDeclareConstruction kTokenPreserve
      { $$ = XQValue($1.line, XQDeclareConstructionPreserve(true, $1.line)); }
  | kTokenDeclareConstruction kTokenStrip
      { $$ = XQValue($1.line, XQDeclareConstructionPreserve(false, $1.line)); }
  ;

EmptyOrderingDecl:
    kTokenDeclareDefaultOrderEmptyGreatest
      { $$ = XQValue($1.line, XQDeclareDefaultOrderEmptyLeast(false, $1.line)); }
  | kTokenDeclareDefaultOrderEmptyLeast
      { $$ = XQValue($1.line, XQDeclareDefaultOrderEmptyLeast(true, $1.line)); }
  ;

InheritNamespacesDecl:
    kTokenDeclareInheritNamespacesYes
      { $$ = XQValue($1.line, XQDeclareInheritNamespaces(true, $1.line)); }
  | kTokenDeclareInheritNamespacesNo
      { $$ = XQValue($1.line, XQDeclareInheritNamespaces(false, $1.line)); }
  ;

FunctionDecl:
    kTokenDeclareFunction kTokenQNameParenLeft ParamList kTokenParenRightAs SequenceType
        EnclosedExpr
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, $3.value, $5.value, $6.value, false,
            $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft ParamList kTokenParenRight EnclosedExpr
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, $3.value, nullptr, $5.value, false,
            $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft kTokenParenRightAs SequenceType EnclosedExpr
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, nullptr, $4.value, $5.value, false,
            $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft kTokenParenRight EnclosedExpr
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, nullptr, nullptr, $4.value, false, $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft ParamList kTokenParenRightAs SequenceType
        kTokenExternal
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, $3.value, $5.value, nullptr, true, $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft ParamList kTokenParenRight kTokenExternal
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, $3.value, nullptr, nullptr, true, $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft kTokenParenRightAs SequenceType kTokenExternal
      {
        $$ = XQValue($1.line, XQFunctionDecl($2.value, nullptr, $4.value, nullptr, true, $1.line));
      }
  | kTokenDeclareFunction kTokenQNameParenLeft kTokenParenRight kTokenExternal
      { $$ = XQValue($1.line, XQFunctionDecl($2.value, nullptr, nullptr, nullptr, true, $1.line)); }
  ;

ParamList:
    Param
      { $$ = XQValue($1.line, XQParamList($1.value)); }
  | ParamList kTokenComma Param
      { $$ = XQValue($1.line, XQParamListAdd($1.value, $3.value)); }
  ;

Param:
    kTokenDollarSign kTokenVarName TypeDeclaration
      { $$ = XQValue($1.line, XQParam($2.value, $3.value, $1.line)); }
  | kTokenDollarSign kTokenVarName
      { $$ = XQValue($1.line, XQParam($2.value, nullptr, $1.line)); }
  ;

EnclosedExpr:
    kTokenCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, $2.value); }
  ;

QueryBody:
    Expr
  ;

Expr:
    ExprSingle
      { $$ = XQValue($1.line, XQExpr($1.value, $1.line)); }
  | Expr kTokenComma ExprSingle
      { $$ = XQValue($1.line, XQExprAdd($1.value, $3.value)); }
  ;

ExprSingle:
    FLWORExpr
  | QuantifiedExpr
  | TypeswitchExpr
  | IfExpr
  | OrExpr
  ;

FLWORExpr:
    ForLetClauses WhereClause OrderByClause kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQFLWRExpr($1.value, $2.value, $3.value, $5.value, $1.line)); }
  | ForLetClauses WhereClause kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQFLWRExpr($1.value, $2.value, nullptr, $4.value, $1.line)); }
  | ForLetClauses OrderByClause kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQFLWRExpr($1.value, nullptr, $2.value, $4.value, $1.line)); }
  | ForLetClauses kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQFLWRExpr($1.value, nullptr, nullptr, $3.value, $1.line)); }
  ;

ForLetClauses:
    ForClause
      { $$ = XQValue($1.line, XQForLetClauses($1.value)); }
  | LetClause
      { $$ = XQValue($1.line, XQForLetClauses($1.value)); }
  | ForLetClauses ForClause
      { $$ = XQValue($1.line, XQForLetClausesAdd($1.value, $2.value)); }
  | ForLetClauses LetClause
      { $$ = XQValue($1.line, XQForLetClausesAdd($1.value, $2.value)); }
  ;

ForClause:
    kTokenForDollarSign ForClauseItems
      { $$ = XQValue($1.line, $2.value); }
  ;

ForClauseItems:
    ForClauseItem
      { $$ = XQValue($1.line, XQForClauseItems($1.value)); }
  | ForClauseItems kTokenComma kTokenDollarSign ForClauseItem
      { $$ = XQValue($1.line, XQForClauseItemsAdd($1.value, $4.value)); }
  ;

ForClauseItem:
    kTokenVarName TypeDeclaration PositionalVar kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQForClause($1.value, $2.value, $3.value, $5.value, $1.line)); }
  | kTokenVarName TypeDeclaration kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQForClause($1.value, $2.value, nullptr, $4.value, $1.line)); }
  | kTokenVarName PositionalVar kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQForClause($1.value, nullptr, $2.value, $4.value, $1.line)); }
  | kTokenVarName kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQForClause($1.value, nullptr, nullptr, $3.value, $1.line)); }
  ;

PositionalVar:
    kTokenAt kTokenDollarSign kTokenVarName
      { $$ = XQValue($1.line, $3.value); }
  ;

LetClause:
    kTokenLetDollarSign LetClauseItems
      { $$ = XQValue($1.line, $2.value); }
  ;

LetClauseItems:
    LetClauseItem
      { $$ = XQValue($1.line, XQLetClauseItems($1.value)); }
  | LetClauseItems kTokenComma kTokenDollarSign LetClauseItem
      { $$ = XQValue($1.line, XQLetClauseItemsAdd($1.value, $4.value)); }
  ;

LetClauseItem:
    kTokenVarName TypeDeclaration kTokenColonEqual ExprSingle
      { $$ = XQValue($1.line, XQLetClause($1.value, $2.value, $4.value, $1.line)); }
  | kTokenVarName kTokenColonEqual ExprSingle
      { $$ = XQValue($1.line, XQLetClause($1.value, nullptr, $3.value, $1.line)); }
  ;

WhereClause:
    kTokenWhere ExprSingle
      { $$ = XQValue($1.line, XQWhereClause($2.value)); }
  ;

OrderByClause:
    kTokenOrderBy OrderSpecList
      { $$ = XQValue($1.line, XQOrderByClause($2.value)); }
  | kTokenStableOrderBy OrderSpecList
      { $$ = XQValue($1.line, XQOrderByClause($2.value)); }
  ;

OrderSpecList:
    OrderSpec
      { $$ = XQValue($1.line, XQOrderSpecList($1.value)); }
  | OrderSpecList kTokenComma OrderSpec
      { $$ = XQValue($1.line, XQOrderSpecListAdd($1.value, $3.value)); }
  ;

OrderSpec:
    ExprSingle OrderModifier
      { $$ = XQValue($1.line, XQOrderSpec($1.value, $2.value, $1.line)); }
  | ExprSingle
      { $$ = XQValue($1.line, XQOrderSpec($1.value, nullptr, $1.line)); }
  ;

OrderModifier:
    kTokenAscending kTokenEmptyGreatest kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyGreatest, $4.value, $1.line)); }
  | kTokenAscending kTokenEmptyLeast kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyLeast, $4.value, $1.line)); }
  | kTokenAscending kTokenEmptyGreatest
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyGreatest, nullptr, $1.line)); }
  | kTokenAscending kTokenEmptyLeast
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyLeast, nullptr, $1.line)); }
  | kTokenAscending kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyUnspecified, $3.value, $1.line)); }
  | kTokenAscending
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyUnspecified, nullptr, $1.line)); }
  | kTokenDescending kTokenEmptyGreatest kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyGreatest, $4.value, $1.line)); }
  | kTokenDescending kTokenEmptyLeast kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyLeast, $4.value, $1.line)); }
  | kTokenDescending kTokenEmptyGreatest
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyGreatest, nullptr, $1.line)); }
  | kTokenDescending kTokenEmptyLeast
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyLeast, nullptr, $1.line)); }
  | kTokenDescending kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyUnspecified, $3.value, $1.line)); }
  | kTokenDescending
      { $$ = XQValue($1.line, XQOrderModifier(false, XQueryOrderSpec::EmptyUnspecified, nullptr, $1.line)); }
  | kTokenEmptyGreatest kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyGreatest, $3.value, $1.line)); }
  | kTokenEmptyLeast kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyLeast, $3.value, $1.line)); }
  | kTokenEmptyGreatest
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyGreatest, nullptr, $1.line)); }
  | kTokenEmptyLeast
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyLeast, nullptr, $1.line)); }
  | kTokenCollation kTokenStringLiteral
      { $$ = XQValue($1.line, XQOrderModifier(true, XQueryOrderSpec::EmptyUnspecified, $2.value, $1.line)); }
  ;

QuantifiedExpr:
    kTokenSomeDollarSign QuantifiedExprItems kTokenSatisfies ExprSingle
      { $$ = XQValue($1.line, XQSome($2.value, $4.value, $1.line)); }
  | kTokenEveryDollarSign QuantifiedExprItems kTokenSatisfies ExprSingle
      { $$ = XQValue($1.line, XQEvery($2.value, $4.value, $1.line)); }
  ;

QuantifiedExprItems:
    QuantifiedExprItem
      { $$ = XQValue($1.line, XQQuantifiedExprItems($1.value)); }
  | QuantifiedExprItems kTokenComma kTokenDollarSign QuantifiedExprItem
      { $$ = XQValue($1.line, XQQuantifiedExprItemsAdd($1.value, $4.value)); }
  ;

QuantifiedExprItem:
    kTokenVarName TypeDeclaration kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQQuantifiedExprItem($1.value, $2.value, $4.value, $1.line)); }
  | kTokenVarName kTokenIn ExprSingle
      { $$ = XQValue($1.line, XQQuantifiedExprItem($1.value, nullptr, $3.value, $1.line)); }
  ;

TypeswitchExpr:
    kTokenTypeswitchParenLeft Expr kTokenParenRight CaseClauses kTokenDefault kTokenDollarSign
        kTokenVarName kTokenReturn ExprSingle
      {
        $$ = XQValue($1.line, XQTypeswitchExpr($2.value, XQCaseClausesAdd($4.value,
            XQPiece(parser, @5, @9, XQCaseClause($7.value, nullptr, $9.value, $5.line))),
            $1.line));
      }
  | kTokenTypeswitchParenLeft Expr kTokenParenRight CaseClauses kTokenDefault kTokenReturn
        ExprSingle
      {
        $$ = XQValue($1.line, XQTypeswitchExpr($2.value, XQCaseClausesAdd($4.value,
            XQPiece(parser, @5, @7, XQCaseClause(nullptr, nullptr, $7.value, $5.line))),
            $1.line));
      }
  ;

CaseClauses:
    CaseCluase
      { $$ = XQValue($1.line, XQCaseClauses($1.value)); }
  | CaseClauses CaseCluase
      { $$ = XQValue($1.line, XQCaseClausesAdd($1.value, $2.value)); }
  ;

CaseCluase:
    kTokenCase kTokenDollarSign kTokenVarName kTokenAs SequenceType kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQCaseClause($3.value, $5.value, $7.value, $1.line)); }
  | kTokenCase SequenceType kTokenReturn ExprSingle
      { $$ = XQValue($1.line, XQCaseClause(nullptr, $2.value, $4.value, $1.line)); }
  ;

IfExpr:
    kTokenIfParenLeft Expr kTokenParenRight kTokenThen ExprSingle kTokenElse ExprSingle
      { $$ = XQValue($1.line, XQIfThenElse($2.value, $5.value, $7.value, $1.line)); }
  ;

OrExpr:
    AndExpr OrExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | AndExpr
  ;

OrExprItem:
    kTokenOr AndExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

OrExprItems:
    OrExprItem
  | OrExprItems OrExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

AndExpr:
    ComparisonExpr AndExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | ComparisonExpr
  ;

AndExprItem:
    kTokenAnd ComparisonExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

AndExprItems:
    AndExprItem
  | AndExprItems AndExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

ComparisonExpr:
    RangeExpr ValueComp RangeExpr
      {
        $$ = XQValue($1.line, XQOperatorSetLeft(XQOperator($2.token, $3.value, $2.line), $1.value));
      }
  | RangeExpr GeneralComp RangeExpr
      {
        $$ = XQValue($1.line, XQOperatorSetLeft(XQOperator($2.token, $3.value, $2.line), $1.value));
      }
  | RangeExpr NodeComp RangeExpr
      {
        $$ = XQValue($1.line, XQOperatorSetLeft(XQOperator($2.token, $3.value, $2.line), $1.value));
      }
  | RangeExpr
  ;

RangeExpr:
    AdditiveExpr kTokenTo AdditiveExpr
      {
        $$ = XQValue($1.line, XQOperatorSetLeft(XQOperator($2.token, $3.value, $2.line), $1.value));
      }
  | AdditiveExpr
  ;

AdditiveExpr:
    MultiplicativeExpr AdditiveExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | MultiplicativeExpr
  ;

AdditiveExprItems:
    AdditiveExprItem
  | AdditiveExprItems AdditiveExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

AdditiveExprItem:
    kTokenPlus MultiplicativeExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | kTokenMinus MultiplicativeExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

MultiplicativeExpr:
    UnionExpr MultiplicativeExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | UnionExpr
  ;

MultiplicativeExprItems:
    MultiplicativeExprItem
  | MultiplicativeExprItems MultiplicativeExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

MultiplicativeExprItem:
    kTokenAsterisk UnionExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | kTokenDiv UnionExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | kTokenIDiv UnionExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | kTokenMod UnionExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

UnionExpr:
    IntersectExceptExpr UnionExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | IntersectExceptExpr
  ;

UnionExprItems:
    UnionExprItem
  | UnionExprItems UnionExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

UnionExprItem:
    kTokenUnion IntersectExceptExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

IntersectExceptExpr:
    InstanceOfExpr IntersectExceptExprItems
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  | InstanceOfExpr
  ;

IntersectExceptExprItems:
    IntersectExceptExprItem
  | IntersectExceptExprItems IntersectExceptExprItem
      { $$ = XQValue($1.line, XQOperatorSetLeft($2.value, $1.value)); }
  ;

IntersectExceptExprItem:
    kTokenIntersect InstanceOfExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | kTokenExcept InstanceOfExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  ;

InstanceOfExpr:
    TreatExpr kTokenInstanceOf SequenceType
      { $$ = XQValue($1.line, XQInstanceOfExpr($1.value, $3.value, $1.line)); }
  | TreatExpr
  ;

TreatExpr:
    CastableExpr kTokenTreatAs SequenceType
      { $$ = XQValue($1.line, XQTreatExpr($1.value, $3.value, $1.line)); }
  | CastableExpr
  ;

CastableExpr:
    CastExpr kTokenCastableAs SingleType
      { $$ = XQValue($1.line, XQCastableExpr($1.value, $3.value, $1.line)); }
  | CastExpr
  ;

CastExpr:
    UnaryExpr kTokenCastAs SingleType
      { $$ = XQValue($1.line, XQCastExpr($1.value, $3.value, $1.line)); }
  | UnaryExpr
  ;

UnaryExpr:
    UnaryExprOps ValueExpr
      { $$ = XQValue($1.line, XQOperator($1.token, $2.value, $1.line)); }
  | ValueExpr
  ;

UnaryExprOps:
    kTokenPlus
  | kTokenMinus
  | UnaryExprOps kTokenPlus
      { $$ = $1; }
  | UnaryExprOps kTokenMinus
      {
        $$ = $1;
        $$.token = $1.token == kTokenMinus ? kTokenPlus : kTokenMinus;
      }
  ;

ValueExpr:
    ValidateExpr
  | PathExpr
  ;

PathExpr:
    PathStart PathItems
      {
        $$ = XQValue($1.line, XQRelativePath(XQRelativePathItemSetNext($1.value, $2.value),
            $1.line));
      }
  | PathStart
      { $$ = XQValue($1.line, XQRelativePath($1.value, $1.line)); }
  ;

PathStart:
    kTokenSolidusSolidus StepExpr
      {
        NSObject* test = XQPiece(parser, @1, @1, XQAnyKindTest($1.line));
        NSObject* anyNodes = XQNodeTest(test, kTokenDescendantOrSelfColonColon);
        NSObject* steps = XQRelativePathItemSetNext(anyNodes, $2.value);
        $$ = XQValue($1.line, XQRelativePathItemSetNext(XQRoot(parser, @1), steps));
      }
  | kTokenSolidus StepExpr
      { $$ = XQValue($1.line, XQRelativePathItemSetNext(XQRoot(parser, @1), $2.value)); }
  | kTokenSolidus
      { $$ = XQValue($1.line, XQRoot(parser, @1)); }
  | StepExpr
  ;

PathItems:
    PathItem
  | PathItems PathItem
      { $$ = XQValue($1.line, XQRelativePathItemSetNext($1.value, $2.value)); }
  ;

PathItem:
    kTokenSolidusSolidus StepExpr
      {
        NSObject* test = XQPiece(parser, @1, @1, XQAnyKindTest($1.line));
        NSObject* anyNodes = XQNodeTest(test, kTokenDescendantOrSelfColonColon);
        $$ = XQValue($1.line, XQRelativePathItemSetNext(anyNodes, $2.value));
      }
  | kTokenSolidus StepExpr
      { $$ = XQValue($1.line, $2.value); }
  ;

StepExpr:
    AxisStep
  | FilterStep
  ;

AxisStep:
    ForwardStep Predicates
      { $$ = XQValue($1.line, XQRelativePathItemSetPredicates($1.value, $2.value)); }
  | ForwardStep
  | ReverseStep Predicates
      { $$ = XQValue($1.line, XQRelativePathItemSetPredicates($1.value, $2.value)); }
  | ReverseStep
  ;

FilterStep:
    PrimaryExpr Predicates
      { $$ = XQValue($1.line, XQRelativePathItemSetPredicates(XQFilterStep($1.value), $2.value)); }
  | PrimaryExpr
      { $$ = XQValue($1.line, XQFilterStep($1.value)); }
  ;

ContextItemExpr:
    kTokenPeriod
      { $$ = XQValue($1.line, XQContextExpr()); }
  ;

PrimaryExpr:
    Literal
  | kTokenDollarSign kTokenVarName
      { $$ = XQValue($1.line, XQVarNameReference($2.value, $1.line)); }
  | ParenthesizedExpr
  | ContextItemExpr
  | FunctionCall
  | Constructor
  | kTokenOrderedCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQOrderedExpr($2.value, true, $1.line)); }
  | kTokenUnorderedCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQOrderedExpr($2.value, false, $1.line)); }
  ;

Literal:
    kTokenIntegerLiteral
      { $$ = XQValue($1.line, XQIntegerLiteral($1.value, $1.line)); }
  | kTokenDecimalLiteral
      { $$ = XQValue($1.line, XQDecimalLiteral($1.value, $1.line)); }
  | kTokenDoubleLiteral
      { $$ = XQValue($1.line, XQDoubleLiteral($1.value, $1.line)); }
  | kTokenStringLiteral
      { $$ = XQValue($1.line, XQStringLiteral($1.value, $1.line)); }
  ;

Predicates:
    Predicate
      { $$ = XQValue($1.line, XQPredicates($1.value)); }
  | Predicates Predicate
      { $$ = XQValue($1.line, XQPredicatesAdd($1.value, $2.value)); }
  ;

Predicate:
    kTokenBraceLeft Expr kTokenBraceRight
      { $$ = XQValue($1.line, $2.value); }
  ;

ValidateExpr:
    kTokenValidateCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQValidateExpr($1.line)); }
  | kTokenValidateModeLax Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQValidateExpr($1.line)); }
  | kTokenValidateModeStrict Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQValidateExpr($1.line)); }
  ;

Constructor:
    DirectConstructor
  | ComputedConstructor
  ;

DirectConstructor:
    DirElemConstructor
  | DirCommentConstructor
  | DirPIConstructor
  ;

DirElemConstructor:
    kTokenLessThanConstructor kTokenQName DirAttributeList kTokenSolidusGreaterThan
      { $$ = XQValue($1.line, XQElementConstructor($2.value, $3.value, nullptr, $1.line)); }
  | kTokenLessThanConstructor kTokenQName kTokenSolidusGreaterThan
      { $$ = XQValue($1.line, XQElementConstructor($2.value, nullptr, nullptr, $1.line)); }
  | kTokenLessThanConstructor kTokenQName DirAttributeList kTokenGreaterThan DirElementContent
        kTokenLessThanSolidus kTokenQName kTokenGreaterThan
      {
        XQEndTag($2.value, $7.value, $7.line, @7.span);
        $$ = XQValue($1.line, XQElementConstructor($2.value, $3.value, $5.value, $1.line));
      }
  | kTokenLessThanConstructor kTokenQName kTokenGreaterThan DirElementContent kTokenLessThanSolidus
        kTokenQName kTokenGreaterThan
      {
        XQEndTag($2.value, $6.value, $6.line, @6.span);
        $$ = XQValue($1.line, XQElementConstructor($2.value, nullptr, $4.value, $1.line));
      }
  | kTokenLessThanConstructor kTokenQName DirAttributeList kTokenGreaterThan kTokenLessThanSolidus
        kTokenQName kTokenGreaterThan
      {
        XQEndTag($2.value, $6.value, $6.line, @6.span);
        $$ = XQValue($1.line, XQElementConstructor($2.value, $3.value, nullptr, $1.line));
      }
  | kTokenLessThanConstructor kTokenQName kTokenGreaterThan kTokenLessThanSolidus kTokenQName
        kTokenGreaterThan
      {
        XQEndTag($2.value, $5.value, $5.line, @5.span);
        $$ = XQValue($1.line, XQElementConstructor($2.value, nullptr, nullptr, $1.line));
      }
  ;

DirAttributeList:
    DirAttributeListItem
      { $$ = XQValue($1.line, XQAttributeList($1.value)); }
  | DirAttributeList DirAttributeListItem
      { $$ = XQValue($1.line, XQAttributeListAdd($1.value, $2.value)); }
  ;

DirAttributeListItem:
    kTokenQName kTokenEqual kTokenQuote AttributeValueQuoteChars kTokenQuote
      { $$ = XQValue($1.line, XQAttributeListItem($1.value, $4.value, $3.token, $1.line)); }
  | kTokenQName kTokenEqual kTokenApos AttributeValueAposChars kTokenApos
      { $$ = XQValue($1.line, XQAttributeListItem($1.value, $4.value, $3.token, $1.line)); }
  | kTokenQName kTokenEqual kTokenQuote kTokenQuote
      { $$ = XQValue($1.line, XQAttributeListItem($1.value, nullptr, $3.token, $1.line)); }
  | kTokenQName kTokenEqual kTokenApos kTokenApos
      { $$ = XQValue($1.line, XQAttributeListItem($1.value, nullptr, $3.token, $1.line)); }
  ;

AttributeValueQuoteChars:
    AttributeValueQuoteChar
      { $$ = XQValue($1.line, XQAttributeValueCharsWithUnicode($1.unit)); }
  | EnclosedExpr
      { $$ = XQValue($1.line, XQAttributeValueCharsWithExpr($1.value)); }
  | AttributeValueQuoteChars AttributeValueQuoteChar
      { $$ = XQValue($1.line, XQAttributeValueCharsAddUnicode($1.value, $2.unit)); }
  | AttributeValueQuoteChars EnclosedExpr
      { $$ = XQValue($1.line, XQAttributeValueCharsAddExpr($1.value, $2.value)); }
  ;

AttributeValueAposChars:
    AttributeValueAposChar
      { $$ = XQValue($1.line, XQAttributeValueCharsWithUnicode($1.unit)); }
  | EnclosedExpr
      { $$ = XQValue($1.line, XQAttributeValueCharsWithExpr($1.value)); }
  | AttributeValueAposChars AttributeValueAposChar
      { $$ = XQValue($1.line, XQAttributeValueCharsAddUnicode($1.value, $2.unit)); }
  | AttributeValueAposChars EnclosedExpr
      { $$ = XQValue($1.line, XQAttributeValueCharsAddExpr($1.value, $2.value)); }
  ;

AttributeValueQuoteChar:
    kTokenQuoteQuote
      { $$ = XQUnit($1.line, u'"'); }
  | kTokenQuoteAttContentChar
  | AttributeValueChar
  ;

AttributeValueAposChar:
    kTokenAposApos
      { $$ = XQUnit($1.line, u'\''); }
  | kTokenAposAttContentChar
  | AttributeValueChar
  ;

AttributeValueChar:
    kTokenCurlyBraceLeftCurlyBraceLeft
  | kTokenCurlyBraceRightCurlyBraceRight
  | kTokenPredefinedEntityRef
  | kTokenCharRef
      {
        XQCharRefInAttribute($1.unit, $1.line);
        $$ = $1;
      }
  ;

DirElementContent:
    DirectConstructor
      { $$ = XQValue($1.line, XQElementContent($1.value)); }
  | EnclosedExpr
      { $$ = XQValue($1.line, XQElementContent($1.value)); }
  | CDataSection
      { $$ = XQValue($1.line, XQElementContent($1.value)); }
  | ElementContentCharWS
      { $$ = XQValue($1.line, XQElementContentWhiteSpace($1.unit)); }
  | ElementContentChar
      { $$ = XQValue($1.line, XQElementContentWithUnicode($1.unit)); }
  | DirElementContent DirectConstructor
      { $$ = XQValue($1.line, XQElementContentAdd($1.value, $2.value)); }
  | DirElementContent EnclosedExpr
      { $$ = XQValue($1.line, XQElementContentAdd($1.value, $2.value)); }
  | DirElementContent CDataSection
      { $$ = XQValue($1.line, XQElementContentAdd($1.value, $2.value)); }
  | DirElementContent ElementContentCharWS
      { $$ = XQValue($1.line, XQElementContentAddWhiteSpace($1.value, $2.unit)); }
  | DirElementContent ElementContentChar
      { $$ = XQValue($1.line, XQElementContentAddUnicode($1.value, $2.unit)); }
  ;

ElementContentCharWS:
    kTokenElementContentCharWS
  ;

ElementContentChar:
    kTokenElementContentChar
  | kTokenCurlyBraceLeftCurlyBraceLeft
  | kTokenCurlyBraceRightCurlyBraceRight
  | kTokenCharRef
  | kTokenPredefinedEntityRef
  ;

DirPIConstructor:
    kTokenPIStart kTokenPITarget Chars kTokenPIEnd
      { $$ = XQValue($1.line, XQXmlPI($2.value, $3.value, $1.line)); }
  | kTokenPIStart kTokenPITarget kTokenPIEnd
      { $$ = XQValue($1.line, XQXmlPI($2.value, nullptr, $1.line)); }
  | kTokenPIStart kTokenPIEnd
      { $$ = XQValue($1.line, XQXmlPI(nullptr, nullptr, $1.line)); }
  ;

DirCommentConstructor:
    kTokenXMLCommentStart Chars kTokenXMLCommentEnd
      { $$ = XQValue($1.line, XQXmlComment($2.value, $1.line)); }
  | kTokenXMLCommentStart kTokenXMLCommentEnd
      { $$ = XQValue($1.line, XQXmlComment(nullptr, $1.line)); }
  ;

ComputedConstructor:
    CompDocConstructor
  | CompElemConstructor
  | CompAttrConsructor
  | CompTextConstructor
  | CompXmlPI
  | ComputedXmlComment
  ;

GeneralComp:
    kTokenEqual
  | kTokenNotEqual
  | kTokenLessThanCompare
  | kTokenLessThanEqual
  | kTokenGreaterThan
  | kTokenGreaterThanEqual
  ;

ValueComp:
    kTokenEq
  | kTokenNe
  | kTokenLt
  | kTokenLe
  | kTokenGt
  | kTokenGe
  ;

NodeComp:
    kTokenIs
  | kTokenLessThanLessThan
  | kTokenGreaterThanGreaterThan
  ;

ForwardStep:
    ForwardAxis NodeTest
      { $$ = XQValue($1.line, XQNodeTest($2.value, $1.token)); }
  | AbbrevForwardStep
  ;

ReverseStep:
    ReverseAxis NodeTest
      { $$ = XQValue($1.line, XQNodeTest($2.value, $1.token)); }
  | AbbrevReverseStep
  ;

AbbrevForwardStep:
    kTokenAtSign NodeTest
      { $$ = XQValue($1.line, XQNodeTest($2.value, kTokenAttributeColonColon)); }
  | NodeTest
      { $$ = XQValue($1.line, XQNodeTest($1.value, kTokenChildColonColon)); }
  ;

AbbrevReverseStep:
    kTokenPeriodPeriod
      { $$ = XQValue($1.line, XQNodeTest(XQAnyKindTest($1.line), kTokenParentColonColon)); }
  ;

ForwardAxis:
    kTokenChildColonColon
  | kTokenDescendantColonColon
  | kTokenAttributeColonColon
  | kTokenSelfColonColon
  | kTokenDescendantOrSelfColonColon
  | kTokenFollowingSiblingColonColon
  | kTokenFollowingColonColon
  ;

ReverseAxis:
    kTokenParentColonColon
  | kTokenAncestorColonColon
  | kTokenPrecedingSiblingColonColon
  | kTokenPrecedingColonColon
  | kTokenAncestorOrSelfColonColon
  ;

NodeTest:
    KindTest
  | NameTest
  ;

NameTest:
    kTokenQName
      { $$ = XQValue($1.line, XQNameTest($1.value, $1.line)); }
  | Wildcard
  ;

Wildcard:
    kTokenAsteriskColonNCName
      { $$ = XQValue($1.line, XQWildCardNameTest(nullptr, $1.value, $1.line)); }
  | kTokenNCNameColonAsterisk
      { $$ = XQValue($1.line, XQWildCardNameTest($1.value, nullptr, $1.line)); }
  | kTokenAsterisk
      { $$ = XQValue($1.line, XQWildCardNameTest(nullptr, nullptr, $1.line)); }
  ;

ParenthesizedExpr:
    kTokenParenLeft Expr kTokenParenRight
      { $$ = XQValue($1.line, $2.value); }
  | kTokenParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQEmptyLiteral($1.line)); }
  ;

FunctionCall:
    kTokenQNameParenLeft FunctionCallArgs kTokenParenRight
      { $$ = XQValue($1.line, XQFunctionCall($1.value, $2.value, $1.line)); }
  | kTokenQNameParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQFunctionCall($1.value, nullptr, $1.line)); }
  ;

FunctionCallArgs:
    ExprSingle
      { $$ = XQValue($1.line, XQFunctionArgs($1.value)); }
  | FunctionCallArgs kTokenComma ExprSingle
      { $$ = XQValue($1.line, XQFunctionArgsAdd($1.value, $3.value)); }
  ;

CompDocConstructor:
    kTokenDocumentCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompDocConstructor($2.value, $1.line)); }
  ;

CompElemConstructor:
    kTokenElementQNameCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompElemConstructor($1.value, $2.value, $1.line)); }
  | kTokenElementQNameCurlyBraceLeft kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompElemConstructor($1.value, nullptr, $1.line)); }
  | kTokenElementCurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft Expr
        kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompElemConstructor($2.value, $5.value, $1.line)); }
  | kTokenElementCurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft
        kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompElemConstructor($2.value, nullptr, $1.line)); }
  ;

CompAttrConsructor:
    kTokenAttributeQNameCurlyBraceLeft Expr kTokenCurlyBraceRight
      {
        NSObject* name = XQPiece(parser, @1, @1, XQStringLiteral($1.value, $1.line));
        $$ = XQValue($1.line, XQCompAttrConsructor(name, $2.value, $1.line));
      }
  | kTokenAttributeQNameCurlyBraceLeft kTokenCurlyBraceRight
      {
        NSObject* name = XQPiece(parser, @1, @1, XQStringLiteral($1.value, $1.line));
        $$ = XQValue($1.line, XQCompAttrConsructor(name, nullptr, $1.line));
      }
  | kTokenAttributeCurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft Expr
        kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompAttrConsructor($2.value, $5.value, $1.line)); }
  | kTokenAttributeCurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft
        kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompAttrConsructor($2.value, nullptr, $1.line)); }
  ;

CompXmlPI:
    kTokenPINCNameCurlyBraceLeft Expr kTokenCurlyBraceRight
      {
        NSObject* name = XQPiece(parser, @1, @1, XQStringLiteral($1.value, $1.line));
        $$ = XQValue($1.line, XQComputedPI(name, $2.value, $1.line));
      }
  | kTokenPINCNameCurlyBraceLeft kTokenCurlyBraceRight
      {
        NSObject* name = XQPiece(parser, @1, @1, XQStringLiteral($1.value, $1.line));
        $$ = XQValue($1.line, XQComputedPI(name, nullptr, $1.line));
      }
  | kTokenPICurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft Expr
        kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQComputedPI($2.value, $5.value, $1.line)); }
  | kTokenPICurlyBraceLeft Expr kTokenCurlyBraceRight kTokenCurlyBraceLeft kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQComputedPI($2.value, nullptr, $1.line)); }
  ;

ComputedXmlComment:
    kTokenCommentCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQComputedXmlComment($2.value, $1.line)); }
  ;

CompTextConstructor:
    kTokenTextCurlyBraceLeft Expr kTokenCurlyBraceRight
      { $$ = XQValue($1.line, XQCompTextConstructor($2.value, $1.line)); }
  ;

CDataSection:
    kTokenCDATAStart Chars kTokenCDATAEnd
      { $$ = XQValue($1.line, XQCdataSection($2.value, $1.line)); }
  | kTokenCDATAStart kTokenCDATAEnd
      { $$ = XQValue($1.line, XQCdataSection(nullptr, $1.line)); }
  ;

TypeDeclaration:
    kTokenAs SequenceType
      { $$ = XQValue($1.line, $2.value); }
  ;

SingleType:
    AtomicType kTokenQuestionMark
      { $$ = XQValue($1.line, XQSingleType($1.value, $2.token)); }
  | AtomicType
      { $$ = XQValue($1.line, XQSingleType($1.value, 0)); }
  ;

SequenceType:
    ItemType OccurrenceIndicator
      { $$ = XQValue($1.line, XQSequenceType($1.value, $2.token)); }
  | ItemType
      { $$ = XQValue($1.line, XQSequenceType($1.value, 0)); }
  | kTokenEmptyParenLeftParenRight
      { $$ = XQValue($1.line, XQSequenceTypeEmpty($1.line)); }
  ;

AtomicType:
    kTokenQName
      { $$ = XQValue($1.line, XQAtomicType($1.value, $1.line)); }
  ;

ItemType:
    AtomicType
  | KindTest
  | kTokenItemParenLeftParenRight
      { $$ = XQValue($1.line, XQAnyItemType($1.line)); }
  ;

KindTest:
    DocumentTest
  | ElementTest
  | AttributeTest
  | SchemaElementTest
  | SchemaAttributeTest
  | PITest
  | CommentTest
  | TextTest
  | AnyKindTest
  ;

ElementTest:
    kTokenElementParenLeft NodeName kTokenComma TypeName kTokenQuestionMark kTokenParenRight
      { $$ = XQValue($1.line, XQElementTest($2.value, $4.value, true, $1.line)); }
  | kTokenElementParenLeft NodeName kTokenComma TypeName kTokenParenRight
      { $$ = XQValue($1.line, XQElementTest($2.value, $4.value, false, $1.line)); }
  | kTokenElementParenLeft NodeName kTokenParenRight
      { $$ = XQValue($1.line, XQElementTest($2.value, nullptr, false, $1.line)); }
  | kTokenElementParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQElementTest(nullptr, nullptr, false, $1.line)); }
  ;

SchemaElementTest:
    kTokenSchemaElementParenLeft kTokenQName kTokenParenRight
      {
        XQSchemaTest($2.value, $1.line);
        NSObject* name = XQPiece(parser, @2, @2, XQNodeName($2.value, $2.line));
        $$ = XQValue($1.line, XQElementTest(name, nullptr, false, $1.line));
      }
  ;

AttributeTest:
    kTokenAttributeParenLeft NodeName kTokenComma TypeName kTokenParenRight
      { $$ = XQValue($1.line, XQAttributeTest($2.value, $4.value, $1.line)); }
  | kTokenAttributeParenLeft NodeName kTokenParenRight
      { $$ = XQValue($1.line, XQAttributeTest($2.value, nullptr, $1.line)); }
  | kTokenAttributeParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQAttributeTest(nullptr, nullptr, $1.line)); }
  ;

SchemaAttributeTest:
    kTokenSchemaAttributeParenLeft kTokenQName kTokenParenRight
      {
        XQSchemaTest($2.value, $1.line);
        NSObject* name = XQPiece(parser, @2, @2, XQNodeName($2.value, $2.line));
        $$ = XQValue($1.line, XQAttributeTest(name, nullptr, $1.line));
      }
  ;

PITest:
    kTokenProcessingInstructionParenLeft kTokenNCName kTokenParenRight
      { $$ = XQValue($1.line, XQPITest($2.value, $1.line)); }
  | kTokenProcessingInstructionParenLeft kTokenStringLiteral kTokenParenRight
      { $$ = XQValue($1.line, XQPITest($2.value, $1.line)); }
  | kTokenProcessingInstructionParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQPITest(nullptr, $1.line)); }
  ;

DocumentTest:
    kTokenDocumentNodeParenLeft ElementTest kTokenParenRight
      { $$ = XQValue($1.line, XQDocumentTest($2.value, $1.line)); }
  | kTokenDocumentNodeParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQDocumentTest(nullptr, $1.line)); }
  ;

CommentTest:
    kTokenCommentParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQCommentTest($1.line)); }
  ;

TextTest:
    kTokenTextParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQTextTest($1.line)); }
  ;

AnyKindTest:
    kTokenNodeParenLeft kTokenParenRight
      { $$ = XQValue($1.line, XQAnyKindTest($1.line)); }
  ;

NodeName:
    kTokenQName
      { $$ = XQValue($1.line, XQNodeName($1.value, $1.line)); }
  | kTokenAsterisk
      { $$ = XQValue($1.line, XQNodeNameWildCard()); }
  ;

TypeName:
    kTokenQName
      { $$ = XQValue($1.line, XQTypeName($1.value)); }
  | kTokenAsterisk
      { $$ = XQValue($1.line, XQTypeNameWildCard()); }
  ;

OccurrenceIndicator:
    kTokenQuestionMark
  | kTokenAsterisk
  | kTokenPlus
  ;

Chars:
    kTokenChar
      { $$ = XQValue($1.line, XQChars($1.unit)); }
  | Chars kTokenChar
      { $$ = XQValue($1.line, XQCharsAdd($1.value, $2.unit)); }
  ;
%%

const char* xquery::XQTokenName(int code) {
  if (code < kTokenAncestorColonColon || code > kTokenYes) return "";
  return yysymbol_name(YYTRANSLATE(code));
}
