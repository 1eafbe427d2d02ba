#include "Parser/ScannerActions.h"

#include "Parser/ScannerPhrases.h"
#include "Parser/XQueryParser.h"
#include "Parser/XQueryTokens.h"

#include <algorithm>

namespace xquery {

int sXQueryScannerStartState = XQueryStateDEFAULT;
std::vector<uint8_t> sXQueryScannerStateStack;
NSMutableString sXQueryScannerStringLiteral;
int sXQueryScannerStringLiteralToken = 0;
int sXQueryScannerStringLiteralLineNo = 0;
std::string sXQueryScannerStringLiteralSource;
int sXQueryScannerCommentLineNo = 0;
int sXQueryScannerExtensionLineNo = 0;
Ref<NSString> sXQueryScannerStringExtensionName;
NSMutableString sXQueryScannerStringExtensionContent;
bool sXQueryScannerAtEnd = false;

namespace {

bool isWhiteSpace(char16_t unit) {
  return unit == u' ' || unit == u'\t' || unit == u'\n' || unit == u'\r';
}

XQSTYPE tokenRecord(int token, int line, std::string_view text) {
  XQSTYPE record = {};
  record.line = line;
  record.token = token;
  if (sXQueryLogTokenSource) record.source = XQueryParserSting(text);
  return record;
}

int finishToken(const XQSTYPE& record) {
  XQlval = record;
  if (sXQueryLogTokens) XQLexTokenLog(record);
  return record.token;
}

int errorToken(const std::string& message, int line) {
  // The message names the line, so the counter stands there while it is recorded.
  const int currentLine = XQlineno;
  XQlineno = line;
  SetTokenValues(kTokenError, line, XQueryParserSting(message), XQScannerTokenText());
  XQlineno = currentLine;
  return kTokenError;
}

void noteLiteralSource() {
  if (sXQueryLogTokenSource) sXQueryScannerStringLiteralSource += XQScannerTokenText();
}

// The target of a processing instruction may not be "xml" in any case.
bool isReservedTarget(std::string_view name) {
  constexpr std::string_view reserved = "xml";
  return std::equal(name.begin(), name.end(), reserved.begin(), reserved.end(),
                    [](char a, char b) { return (a | 0x20) == b; });
}

// A name in an expression: a wildcard, the start of a function call or a name test.
XQueryScannedWord scanOperand(std::string_view rest) {
  XQueryScannedWord word;
  const size_t prefix = XQueryNCNameLength(rest);
  if (prefix > 0 && rest.substr(prefix, 2) == ":*") {
    return {.length = prefix + 2,
            .token = kTokenNCNameColonAsterisk,
            .name = rest.substr(0, prefix),
            .next = XQueryStateOPERATOR};
  }
  const size_t length = XQueryQNameLength(rest);
  const size_t open = length + XQuerySkipLength(rest.substr(length));
  if (rest.substr(open, 1) == "(" && rest.substr(open, 2) != "(:") {
    return {.length = open + 1,
            .token = kTokenQNameParenLeft,
            .name = rest.substr(0, length),
            .next = XQueryStateDEFAULT};
  }
  return {.length = length,
          .token = kTokenQName,
          .name = rest.substr(0, length),
          .next = XQueryStateOPERATOR};
}

enum class NameShape { None, NCName, QName, Name };

// What a name that is no keyword means in each state but DEFAULT.
struct NameRule {
  int state;
  NameShape shape;
  int token;
  int next;
};

constexpr NameRule nameRules[] = {
    {XQueryStateITEMTYPE, NameShape::QName, kTokenQName, XQueryStateOCCURRENCEINDICATOR},
    {XQueryStateKINDTEST, NameShape::QName, kTokenQName, XQueryStateCLOSEKINDTEST},
    {XQueryStateSINGLETYPE, NameShape::QName, kTokenQName, XQueryStateOPERATOR},
    {XQueryStateVARNAME, NameShape::QName, kTokenVarName, XQueryStateOPERATOR},
    {XQueryStateNAMESPACEDECL, NameShape::NCName, kTokenNCName, XQueryStateNAMESPACEDECL},
    {XQueryStateKINDTESTFORPI, NameShape::NCName, kTokenNCName, XQueryStateKINDTESTFORPI},
    {XQueryStateSTART_TAG, NameShape::QName, kTokenQName, XQueryStateSTART_TAG},
    {XQueryStateEND_TAG, NameShape::QName, kTokenQName, XQueryStateEND_TAG},
    {XQueryStatePROCESSING_INSTRUCTION, NameShape::Name, kTokenPITarget,
     XQueryStatePROCESSING_INSTRUCTION},
    {XQueryStateEXT_NAME, NameShape::QName, 0, XQueryStateEXT_CONTENT},
    {XQueryStatePRAG_NAME, NameShape::QName, 0, XQueryStatePRAG_CONTENT},
};

XQueryScannedWord scanName(std::string_view rest) {
  const auto* rule = std::find_if(std::begin(nameRules), std::end(nameRules),
                                  [](const auto& row) { return row.state == sXQueryScannerState; });
  if (rule == std::end(nameRules)) return {};
  size_t length = 0;
  switch (rule->shape) {
    case NameShape::None:
      break;
    case NameShape::NCName:
      length = XQueryNCNameLength(rest);
      break;
    case NameShape::QName:
      length = XQueryQNameLength(rest);
      break;
    case NameShape::Name:
      length = XQueryNameLength(rest);
      break;
  }
  const std::string_view name = rest.substr(0, length);
  if (rule->token == kTokenPITarget && isReservedTarget(name)) return {};
  return {.length = length, .token = rule->token, .name = name, .next = rule->next};
}

// Bytes of the character at the start of well-formed UTF-8.
size_t characterLength(std::string_view text) {
  const auto byte = static_cast<unsigned char>(text[0]);
  return byte < 0x80 ? 1 : byte < 0xE0 ? 2 : byte < 0xF0 ? 3 : 4;
}

}  // namespace

void XQScannerActionsReset() {
  sXQueryScannerStateStack = {};
  sXQueryScannerStringLiteral = {};
  sXQueryScannerStringLiteralToken = 0;
  sXQueryScannerStringLiteralLineNo = 0;
  sXQueryScannerStringLiteralSource = {};
  sXQueryScannerCommentLineNo = 0;
  sXQueryScannerExtensionLineNo = 0;
  sXQueryScannerStringExtensionName = nullptr;
  sXQueryScannerStringExtensionContent = {};
  sXQueryScannerAtEnd = false;
}

int SetTokenValues(int token, int line, NSObject* value, std::string_view text) {
  if (token == kTokenError) XQueryParseError(cast<NSString>(value)->utf8());
  XQSTYPE record = tokenRecord(token, line, text);
  record.value = value;
  return finishToken(record);
}

int SetTokenValues(int token, int line, char16_t unit, std::string_view text) {
  XQSTYPE record = tokenRecord(token, line, text);
  record.unit = unit;
  return finishToken(record);
}

void XQScannerStringLiteralStart(int tokenCode) {
  sXQueryScannerStringLiteral.clear();
  sXQueryScannerStringLiteralSource.clear();
  sXQueryScannerStringLiteralToken = tokenCode;
  sXQueryScannerStringLiteralLineNo = XQlineno;
}

int XQSymbol(int token) {
  return SetTokenValues(token, XQlineno, nullptr, XQScannerTokenText());
}

int XQSymbol(int token, int next) {
  XQScanStateSet(next);
  return XQSymbol(token);
}

int XQSymbol(int token, int push, int next) {
  XQScanStatePush(push);
  return XQSymbol(token, next);
}

int XQSymbolPop(int token) {
  XQScanStatePop();
  return XQSymbol(token);
}

int XQCharacter(int token, char16_t unit) {
  const int line = XQlineno;
  XQCountLines();
  return SetTokenValues(token, line, unit, XQScannerTokenText());
}

int XQNumber(int token) {
  XQScanStateSet(XQueryStateOPERATOR);
  const std::string_view text = XQScannerTokenText();
  return SetTokenValues(token, XQlineno, XQueryParserSting(text), text);
}

int XQOpenBrace(int resume) {
  return XQSymbol(kTokenCurlyBraceLeft, resume, XQueryStateDEFAULT);
}

int XQInvalidToken() {
  const std::string_view text = XQScannerTokenText();
  std::string message = "invalid token (";
  message += text;
  message += ')';
  switch (sXQueryScannerState) {
    case XQueryStateSTRING_LITERAL_QUOTE:
    case XQueryStateSTRING_LITERAL_APOS:
      message += " in string literal";
      break;
    case XQueryStateXMLSPACE_DECL:
      message += " expected (preserve or strip)";
      break;
    case XQueryStateEXT_CONTENT:
      message += " expected extension";
      break;
    case XQueryStatePRAG_CONTENT:
      message += " expected pragma";
      break;
    default:
      break;
  }
  return errorToken(message, XQlineno);
}

int XQEndOfInput() {
  sXQueryScannerAtEnd = true;
  switch (sXQueryScannerState) {
    case XQueryStateEXPR_COMMENT:
      return errorToken("comment not terminated ", sXQueryScannerCommentLineNo);
    case XQueryStateEXT_CONTENT:
      return errorToken("extension not terminated ", sXQueryScannerCommentLineNo);
    case XQueryStatePRAG_CONTENT:
      return errorToken("pragma not terminated ", sXQueryScannerCommentLineNo);
    case XQueryStateSTRING_LITERAL_QUOTE:
    case XQueryStateSTRING_LITERAL_APOS:
      return errorToken("String not terminated ", sXQueryScannerStringLiteralLineNo);
    default:
      return SetTokenValues(0, XQlineno, nullptr, {});
  }
}

void XQCountLines() {
  const std::string_view text = XQScannerTokenText();
  XQlineno += static_cast<int>(std::count(text.begin(), text.end(), '\n'));
}

void XQLiteralOpen(int token, char quote, int resume) {
  XQScannerStringLiteralStart(token);
  noteLiteralSource();
  XQScanStatePush(resume);
  XQScanStateSet(quote == '"' ? XQueryStateSTRING_LITERAL_QUOTE : XQueryStateSTRING_LITERAL_APOS);
}

void XQLiteralAppendText() {
  XQCountLines();
  noteLiteralSource();
  XQAppendUTF8(sXQueryScannerStringLiteral, XQScannerTokenText());
}

void XQLiteralAppendUnit(char16_t unit) {
  noteLiteralSource();
  sXQueryScannerStringLiteral.append(unit);
}

int XQLiteralClose() {
  noteLiteralSource();
  XQScanStatePop();
  NSString* value = XQueryParserAutoRelease(sXQueryScannerStringLiteral.string());
  return SetTokenValues(sXQueryScannerStringLiteralToken, sXQueryScannerStringLiteralLineNo, value,
                        sXQueryScannerStringLiteralSource);
}

void XQCommentOpen() {
  sXQueryScannerCommentLineNo = XQlineno;
  XQScanStatePush(sXQueryScannerState);
  XQScanStateSet(XQueryStateEXPR_COMMENT);
}

void XQExtensionOpen(int nameState) {
  sXQueryScannerExtensionLineNo = XQlineno;
  XQScanStateSet(nameState);
}

void XQExtensionAppend() {
  const char16_t unit = UTF8ToUnicode(XQScannerTokenText());
  XQCountLines();
  // The white space between name and content belongs to neither.
  const bool first = sXQueryScannerStringExtensionContent.length() == 0;
  if (!first || !isWhiteSpace(unit)) sXQueryScannerStringExtensionContent.append(unit);
}

void XQExtensionClose() {
  const bool isPragma = sXQueryScannerState == XQueryStatePRAG_CONTENT;
  // White space before the closing mark belongs to the mark.
  const NSStringView content = sXQueryScannerStringExtensionContent.view();
  uint32_t length = content.length();
  while (length > 0 && isWhiteSpace(content[length - 1])) --length;
  const Ref<NSString> text = NSString::stringWithView(content.substring(0, length));
  // Inside a comment it is only part of the comment.
  if (XQScanStatePop() == XQueryStateEXPR_COMMENT) return;
  const auto report = isPragma ? XQueryParserPragma : XQueryParserExtension;
  report(sXQueryScannerStringExtensionName, text, sXQueryScannerExtensionLineNo);
}

XQueryScannedWord XQScanWord(std::string_view rest) {
  const XQueryPhraseMatch match = XQueryMatchPhrase(sXQueryScannerState, rest);
  XQueryScannedWord word;
  if (rest.starts_with(")")) {
    word = {.length = 1, .token = kTokenParenRight, .next = XQueryStateOPERATOR};
  } else if (sXQueryScannerState == XQueryStateDEFAULT) {
    word = scanOperand(rest);
  } else {
    word = scanName(rest);
  }
  // A keyword comes before a name of the same length.
  if (match.phrase && match.length >= word.length) {
    word = {.length = match.length,
            .token = match.phrase->token,
            .name = match.name,
            .push = match.phrase->push,
            .next = match.phrase->next,
            .quote = match.quote};
  }
  if (word.length == 0) return {.length = characterLength(rest), .valid = false};
  return word;
}

int XQFinishWord(const XQueryScannedWord& word) {
  if (!word.valid) return XQInvalidToken();
  const int line = XQlineno;
  // The value is copied now: the name lies in the scanner's buffer.
  NSObject* value = word.name.empty() ? nullptr : XQueryParserSting(word.name);
  XQCountLines();
  if (word.quote != '\0') {
    XQLiteralOpen(word.token, word.quote, word.push);
    return 0;
  }
  if (word.token == 0) {
    sXQueryScannerStringExtensionName = Ref<NSString>(cast<NSString>(value));
    sXQueryScannerStringExtensionContent.clear();
    XQScanStateSet(word.next);
    return 0;
  }
  if (word.push >= 0) XQScanStatePush(word.push);
  XQScanStateSet(word.next);
  return SetTokenValues(word.token, line, value, XQScannerTokenText());
}

}  // namespace xquery
