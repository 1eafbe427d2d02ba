// What the rules of the scanner do: the names, literals, comments, extensions and errors that are
// more than one symbol and one next state.
#include "Parser/ScannerPhrases.h"
#include "Parser/XQueryParser.h"
#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"

#include <algorithm>

namespace xquery {

namespace {

bool isWhiteSpace(char16_t unit) {
  return unit == u' ' || unit == u'\t' || unit == u'\n' || unit == u'\r';
}

XQueryTokenValue tokenRecord(int token, int line, std::string_view text) {
  XQueryTokenValue record = {};
  record.line = line;
  record.token = token;
  if (sXQueryLogTokenSource) record.source = XQueryParserSting(text);
  return record;
}

// The target of a processing instruction may not be "xml" in any case.
bool isReservedTarget(std::string_view name) {
  constexpr std::string_view reserved = "xml";
  return std::equal(name.begin(), name.end(), reserved.begin(), reserved.end(),
                    [](char a, char b) { return (a | 0x20) == b; });
}

// A name in an expression: a wildcard, the start of a function call or a name test.
XQueryScannedWord scanOperand(std::string_view rest) {
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

XQueryScannedWord scanName(int state, std::string_view rest) {
  const auto* rule = std::find_if(std::begin(nameRules), std::end(nameRules),
                                  [state](const NameRule& row) { return row.state == state; });
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

bool startsCharacter(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0) != 0x80;
}

// Bytes of the character at the start of well-formed UTF-8.
size_t characterLength(std::string_view text) {
  const auto byte = static_cast<unsigned char>(text[0]);
  return byte < 0x80 ? 1 : byte < 0xE0 ? 2 : byte < 0xF0 ? 3 : 4;
}

}  // namespace

void XQueryScanner::resetActions() {
  _stateStack = {};
  _stringLiteral = {};
  _stringLiteralToken = 0;
  _stringLiteralLine = 0;
  _stringLiteralSource = {};
  _commentLine = 0;
  _extensionLine = 0;
  _extensionName = nullptr;
  _extensionContent = {};
  _isAtEnd = false;
  _hasFailed = false;
  _literalStart.reset();
  _span = {};
  _countedBytes = 0;
  _countedCharacters = 0;
}

void XQueryScanner::XQScanStateSet(int state) {
  if (state != _state) XQLexStateLog("State Set", state);
  enterState(state);
}

void XQueryScanner::XQScanStatePush(int state) {
  XQLexStateLog("State Push", state);
  _stateStack.push_back(static_cast<uint8_t>(state));
}

int XQueryScanner::XQScanStatePop() {
  XQLexStateLog("State Pop");
  int state = _state;
  if (!_stateStack.empty()) {
    state = _stateStack.back();
    _stateStack.pop_back();
  }
  enterState(state);
  return state;
}

int XQueryScanner::finishToken(const XQueryTokenValue& record) {
  *_value = record;
  if (sXQueryLogTokens) XQLexTokenLog(record);
  return record.token;
}

int XQueryScanner::errorToken(const std::string& message, int line, size_t place) {
  // The message names the line, so the counter stands there while it is recorded.
  const int currentLine = _line;
  _line = line;
  _errorPlace = place;
  // What is not terminated goes on to the end, and any other error is about the token.
  _span = spanOf(place, _isAtEnd ? tokenStart() : tokenStart() + tokenText().size());
  SetTokenValues(kTokenError, line, XQueryParserSting(message), tokenText());
  _errorPlace.reset();
  _line = currentLine;
  return kTokenError;
}

int64_t XQueryScanner::column() const {
  const std::string_view before(_input, _errorPlace ? *_errorPlace : tokenPlace());
  const std::string_view inLine = before.substr(before.rfind('\n') + 1);
  return std::count_if(inLine.begin(), inLine.end(), startsCharacter);
}

// Characters are counted on from the place that was asked for last, which few are before.
XQuerySpan XQueryScanner::spanOf(size_t start, size_t end) {
  const auto countedTo = [this](size_t place) {
    if (place < _countedBytes) _countedBytes = _countedCharacters = 0;
    const std::string_view text(_input + _countedBytes, place - _countedBytes);
    _countedCharacters +=
        static_cast<uint32_t>(std::count_if(text.begin(), text.end(), startsCharacter));
    _countedBytes = place;
    return _countedCharacters;
  };
  const uint32_t first = countedTo(start);
  return {first, countedTo(std::max(start, end))};
}

void XQueryScanner::noteLiteralSource() {
  if (sXQueryLogTokenSource) _stringLiteralSource += tokenText();
}

int XQueryScanner::SetTokenValues(int token, int line, NSObject* value, std::string_view text) {
  if (token == kTokenError) {
    _hasFailed = true;
    XQueryParseError(cast<NSString>(value)->utf8());
  }
  XQueryTokenValue record = tokenRecord(token, line, text);
  record.value = value;
  return finishToken(record);
}

int XQueryScanner::SetTokenValues(int token, int line, char16_t unit, std::string_view text) {
  XQueryTokenValue record = tokenRecord(token, line, text);
  record.unit = unit;
  return finishToken(record);
}

void XQueryScanner::XQScannerStringLiteralStart(int tokenCode) {
  _stringLiteral.clear();
  _stringLiteralSource.clear();
  _stringLiteralToken = tokenCode;
  _stringLiteralLine = _line;
  _stringLiteralPlace = tokenPlace();
  _stringLiteralStart = tokenStart();
}

int XQueryScanner::symbol(int token) {
  return SetTokenValues(token, _line, nullptr, tokenText());
}

int XQueryScanner::symbol(int token, int next) {
  XQScanStateSet(next);
  return symbol(token);
}

int XQueryScanner::symbol(int token, int push, int next) {
  XQScanStatePush(push);
  return symbol(token, next);
}

int XQueryScanner::symbolPop(int token) {
  XQScanStatePop();
  return symbol(token);
}

int XQueryScanner::character(int token, char16_t unit) {
  const int line = _line;
  countLines();
  return SetTokenValues(token, line, unit, tokenText());
}

int XQueryScanner::number(int token) {
  XQScanStateSet(XQueryStateOPERATOR);
  const std::string_view text = tokenText();
  return SetTokenValues(token, _line, XQueryParserSting(text), text);
}

int XQueryScanner::openBrace(int resume) {
  return symbol(kTokenCurlyBraceLeft, resume, XQueryStateDEFAULT);
}

int XQueryScanner::invalidToken() {
  const std::string_view text = tokenText();
  std::string message = "invalid token (";
  message += text;
  message += ')';
  switch (_state) {
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
  return errorToken(message, _line, tokenPlace());
}

int XQueryScanner::endOfInput() {
  _isAtEnd = true;
  switch (_state) {
    case XQueryStateEXPR_COMMENT:
      return errorToken("comment not terminated ", _commentLine, _commentPlace);
    case XQueryStateEXT_CONTENT:
      return errorToken("extension not terminated ", _commentLine, _commentPlace);
    case XQueryStateEXT_KEY:
    case XQueryStateEXT_NAME:
    case XQueryStatePRAG_NAME:
    case XQueryStatePRAG_CONTENT:
      return errorToken("pragma not terminated ", _commentLine, _commentPlace);
    case XQueryStateSTRING_LITERAL_QUOTE:
    case XQueryStateSTRING_LITERAL_APOS:
      return errorToken("String not terminated ", _stringLiteralLine, _stringLiteralPlace);
    default:
      return SetTokenValues(0, _line, nullptr, {});
  }
}

void XQueryScanner::countLines() {
  const std::string_view text = tokenText();
  _line += static_cast<int>(std::count(text.begin(), text.end(), '\n'));
}

void XQueryScanner::literalOpen(int token, char quote, int resume) {
  XQScannerStringLiteralStart(token);
  noteLiteralSource();
  XQScanStatePush(resume);
  XQScanStateSet(quote == '"' ? XQueryStateSTRING_LITERAL_QUOTE : XQueryStateSTRING_LITERAL_APOS);
}

void XQueryScanner::literalAppendText() {
  countLines();
  noteLiteralSource();
  XQAppendUTF8(_stringLiteral, tokenText());
}

void XQueryScanner::literalAppendUnit(char16_t unit) {
  noteLiteralSource();
  _stringLiteral.append(unit);
}

int XQueryScanner::literalClose() {
  noteLiteralSource();
  XQScanStatePop();
  NSString* value = XQueryParserAutoRelease(_stringLiteral.string());
  _literalStart = _stringLiteralStart;
  return SetTokenValues(_stringLiteralToken, _stringLiteralLine, value, _stringLiteralSource);
}

void XQueryScanner::commentOpen(int state) {
  _commentLine = _line;
  _commentPlace = tokenPlace();
  XQScanStatePush(_state);
  XQScanStateSet(state);
}

void XQueryScanner::extensionOpen(int nameState) {
  _extensionLine = _line;
  XQScanStateSet(nameState);
}

void XQueryScanner::extensionAppend() {
  const char16_t unit = UTF8ToUnicode(tokenText());
  countLines();
  // The white space between name and content belongs to neither.
  const bool first = _extensionContent.length() == 0;
  if (!first || !isWhiteSpace(unit)) _extensionContent.append(unit);
}

void XQueryScanner::extensionClose() {
  const bool isPragma = _state == XQueryStatePRAG_CONTENT;
  // White space before the closing mark belongs to the mark.
  const NSStringView content = _extensionContent.view();
  uint32_t length = content.length();
  while (length > 0 && isWhiteSpace(content[length - 1])) --length;
  const Ref<NSString> text = NSString::stringWithView(content.substring(0, length));
  // Inside a comment it is only part of the comment.
  if (XQScanStatePop() == XQueryStateEXPR_COMMENT) return;
  const auto report = isPragma ? XQueryParserPragma : XQueryParserExtension;
  report(_extensionName, text, _extensionLine);
}

XQueryScannedWord XQueryScanner::scanWord(std::string_view rest) const {
  const XQueryPhraseMatch match = XQueryMatchPhrase(_state, rest);
  XQueryScannedWord word;
  if (rest.starts_with(")")) {
    word = {.length = 1, .token = kTokenParenRight, .next = XQueryStateOPERATOR};
  } else if (_state == XQueryStateDEFAULT) {
    word = scanOperand(rest);
  } else {
    word = scanName(_state, rest);
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

int XQueryScanner::finishWord(const XQueryScannedWord& word) {
  if (!word.valid) return invalidToken();
  const int line = _line;
  // The value is copied now: the name lies in the scanner's buffer.
  NSObject* value = word.name.empty() ? nullptr : XQueryParserSting(word.name);
  countLines();
  if (word.quote != '\0') {
    literalOpen(word.token, word.quote, word.push);
    return 0;
  }
  if (word.token == 0) {
    _extensionName = Ref<NSString>(cast<NSString>(value));
    _extensionContent.clear();
    XQScanStateSet(word.next);
    return 0;
  }
  if (word.push >= 0) XQScanStatePush(word.push);
  XQScanStateSet(word.next);
  return SetTokenValues(word.token, line, value, tokenText());
}

}  // namespace xquery
