// The scanner: turns the bytes of a query into tokens.
//
// The same characters mean different things in expressions, in direct constructors, in types and in
// comments, so the scanner is a machine of 30 lexical states with a stack of return states. Every
// rule runs in its own states only, and the action of each token names the next state.
//
// All state is global. It is valid only while a parser is the current one.
#pragma once

#include "Parser/XQueryTokenValue.h"
#include "xquery/String.h"

#include <cstdint>
#include <string_view>

// The current line, counted from 0.
extern int XQlineno;

// The next token code, 0 at the end of the input; fills XQlval.
int XQlex();

namespace xquery {

// In the order of their numbers. The formatter does not know a list when it sees one.
// clang-format off
#define XQUERY_SCANNER_STATES(STATE)                                                              \
  STATE(INITIAL) STATE(DEFAULT) STATE(OPERATOR) STATE(NAMESPACEDECL) STATE(NAMESPACEKEYWORD)      \
  STATE(XMLSPACE_DECL) STATE(ITEMTYPE) STATE(SINGLETYPE) STATE(KINDTEST) STATE(KINDTESTFORPI)     \
  STATE(VARNAME) STATE(START_TAG) STATE(END_TAG) STATE(XML_COMMENT)                               \
  STATE(PROCESSING_INSTRUCTION) STATE(PROCESSING_INSTRUCTION_CONTENT) STATE(CDATA_SECTION)        \
  STATE(ELEMENT_CONTENT) STATE(QUOT_ATTRIBUTE_CONTENT) STATE(APOS_ATTRIBUTE_CONTENT)              \
  STATE(EXPR_COMMENT) STATE(EXT_KEY) STATE(EXT_NAME) STATE(PRAG_NAME) STATE(EXT_CONTENT)          \
  STATE(PRAG_CONTENT) STATE(OCCURRENCEINDICATOR) STATE(CLOSEKINDTEST)                             \
  STATE(STRING_LITERAL_QUOTE) STATE(STRING_LITERAL_APOS)
// clang-format on

enum XQueryScannerState : int {
#define XQUERY_ENUMERATOR(name) XQueryState##name,
  XQUERY_SCANNER_STATES(XQUERY_ENUMERATOR)
#undef XQUERY_ENUMERATOR
      XQueryStateCount
};

// Clears everything; the first character is scanned in `startState`. The input is that of the
// current parser.
void XQueryScannerInit(int startState);
// Gives the buffers back.
void XQueryScannerEnd();

extern int sXQueryScannerState;
void XQScanStateSet(int state);
// Saves a state to return to.
void XQScanStatePush(int state);
// Returns to the state saved last and answers it. With nothing saved the state stays.
int XQScanStatePop();
size_t XQScanStateDepth();

// Begins a string literal that closes as `tokenCode`.
void XQScannerStringLiteralStart(int tokenCode);
// Fill XQlval and answer the token. For the error token the value is the message, which is recorded
// at once.
int SetTokenValues(int token, int line, NSObject* value, std::string_view text);
int SetTokenValues(int token, int line, char16_t unit, std::string_view text);
// The text of the current token; empty at the end of the input.
std::string_view XQScannerTokenText();

// --- character conversions -----------------------------------------------------------------------

// "&#65;" and "&#x41;"; 0 for an empty reference and for a character outside the BMP, which these
// references are knowingly too narrow for.
char16_t CharRefToUnicode(std::string_view text);
// "&lt;" and its kin, told apart by the second and third character; 0 for any other letter.
char16_t PredefinedEntityToUnicode(std::string_view text);
// The first code unit of the first character: a high surrogate outside the BMP.
char16_t UTF8ToUnicode(std::string_view bytes);
// 1 to 3 bytes; answers how many.
int UniCodeToUTF8(char16_t codeUnit, char* out);
// The whole text, decoded.
void XQAppendUTF8(NSMutableString& to, std::string_view bytes);

// --- logging -------------------------------------------------------------------------------------

// Switched by the environment at the first scan of the process.
extern bool sXQueryLogTokens;
extern bool sXQueryLogStates;
extern bool sXQueryLogTokenSource;

// The name of a state.
extern const char* const sXQueryStateStrings[XQueryStateCount];
// Unset, empty and "0" give the default; so "0" cannot switch off what the default switches on.
bool XQScannerGetEnv(const char* name, bool defaultValue);
// Reads the switches; the last is the grammar's trace.
void XQScannerReadSwitches();
void XQLexStateLog(const char* what, int state);
void XQLexStateLog(const char* what);
void XQLexTokenLog(const XQueryTokenValue& value);
// Whether the token's value is a code unit.
bool XQTokenIsCharacter(int token);

}  // namespace xquery
