// The scanner: turns the bytes of a query into tokens.
//
// The same characters mean different things in expressions, in direct constructors, in types and in
// comments, so the scanner is a machine of 30 lexical states with a stack of return states. Every
// rule runs in its own states only, and the action of each token names the next state.
//
// A scanner belongs to one parse and holds all of its state, that of the generated code included,
// so any number of threads may scan at once.
#pragma once

#include "Parser/XQueryTokenValue.h"
#include "Platform/Base/XQueryPlaces.h"
#include "xquery/String.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class XQueryParser;

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

// What stands at the start of the rest of the input, where a name or a ")" begins.
struct XQueryScannedWord {
  size_t length = 0;
  int token = 0;               // 0 for what is no token of its own
  std::string_view name = {};  // the token's value
  int push = -1;
  int next = -1;
  char quote = '\0';  // opens a string literal that will be the token
  bool valid = true;
};

class XQueryScanner {
 public:
  // The parser gives the input and takes the errors.
  explicit XQueryScanner(XQueryParser& parser) : _parser(parser) {}
  ~XQueryScanner() { end(); }
  XQueryScanner(const XQueryScanner&) = delete;
  XQueryScanner& operator=(const XQueryScanner&) = delete;

  // Takes the parser's whole input; the first character is scanned in `startState`.
  void XQueryScannerInit(int startState);
  // The next token code, 0 at the end of the input; fills the value.
  int XQlex(XQueryTokenValue& value);

  // The current line, counted from 0.
  int line() const { return _line; }
  // Characters before the current token in its line; a token of several lines counts as beginning
  // with the last of them. For an error, those before what it is about.
  int64_t column() const;
  // Where the last token stands, of a literal from its opening quote; for an error what that is
  // about.
  XQuerySpan span() const { return _span; }
  // From "(::" to the end of the current token, which ends the extension.
  XQuerySpan extensionSpan() { return spanOf(_commentPlace, tokenStart() + tokenText().size()); }
  // The text of the current token; empty at the end of the input.
  std::string_view tokenText() const;
  // Whether it came upon what is no token.
  bool hasFailed() const { return _hasFailed; }
  int state() const { return _state; }
  // The return states; the last one is the top.
  const std::vector<uint8_t>& stateStack() const { return _stateStack; }

  void XQScanStateSet(int state);
  // Saves a state to return to.
  void XQScanStatePush(int state);
  // Returns to the state saved last and answers it. With nothing saved the state stays.
  int XQScanStatePop();
  // Begins a string literal that closes as `tokenCode`.
  void XQScannerStringLiteralStart(int tokenCode);
  // Fill the value of the token and answer it. The value of the error token is the message, which
  // is recorded at once.
  int SetTokenValues(int token, int line, NSObject* value, std::string_view text);
  int SetTokenValues(int token, int line, char16_t unit, std::string_view text);

 private:
  // The generated code, and what its rules do: the names, literals, comments, extensions and errors
  // that are more than one symbol and one next state (ScannerActions.cpp). What answers an int
  // answers the token.
  friend class XQueryScannerRules;

  int startState() const { return _startState; }
  int symbol(int token);
  int symbol(int token, int next);
  int symbol(int token, int push, int next);
  int symbolPop(int token);
  int character(int token, char16_t unit);
  int number(int token);
  int openBrace(int resume);
  int invalidToken();
  int endOfInput();
  // Advances the line counter by the line ends in the current token.
  void countLines();
  void literalOpen(int token, char quote, int resume);
  void literalAppendText();
  void literalAppendUnit(char16_t unit);
  int literalClose();
  // Of a comment, or of a pragma or extension.
  void commentOpen(int state);
  void extensionOpen(int nameState);
  void extensionAppend();
  void extensionClose();
  XQueryScannedWord scanWord(std::string_view rest) const;
  // To be called when the current token is the word; 0 when there is no token to return.
  int finishWord(const XQueryScannedWord& word);

  int finishToken(const XQueryTokenValue& record);
  int errorToken(const std::string& message, int line, size_t place);
  size_t tokenPlace() const;
  size_t tokenStart() const;
  XQuerySpan spanOf(size_t start, size_t end);
  void noteLiteralSource();
  void enterState(int state);
  void resetActions();
  void end();

  XQueryParser& _parser;
  void* _generated = nullptr;  // what the generated code knows of its input
  char* _input = nullptr;
  size_t _inputBytes = 0;  // what the input takes, with its end marks
  XQueryTokenValue* _value = nullptr;
  int _line = 0;
  // Places count in bytes from the start of the input.
  std::optional<size_t> _errorPlace;    // while an error is recorded
  std::optional<size_t> _literalStart;  // of the literal that is the token
  XQuerySpan _span;
  // How many characters there are up to the last place that was asked for.
  size_t _countedBytes = 0;
  uint32_t _countedCharacters = 0;
  int _state = XQueryStateINITIAL;
  int _startState = XQueryStateDEFAULT;
  std::vector<uint8_t> _stateStack;
  bool _isAtEnd = false;
  bool _hasFailed = false;
  // The literal being read, and where it began.
  NSMutableString _stringLiteral;
  int _stringLiteralToken = 0;
  int _stringLiteralLine = 0;
  size_t _stringLiteralPlace = 0;
  size_t _stringLiteralStart = 0;
  std::string _stringLiteralSource;  // only while token sources are logged
  // Lines of the last "(:" and of the last "pragma" or "extension".
  int _commentLine = 0;
  size_t _commentPlace = 0;
  int _extensionLine = 0;
  Ref<NSString> _extensionName;
  NSMutableString _extensionContent;
};

// --- runs of text --------------------------------------------------------------------------------

// Bytes of the white space at the start of the text, and of the characters that XML allows up to
// one of two delimiters. A long run is answered in pieces, so that whoever works on it can be
// ended.
size_t XQWhiteSpaceRun(std::string_view text);
size_t XQTextRun(std::string_view text, char delimiter, char otherDelimiter);
// All of the white space.
size_t XQWhiteSpaceLength(std::string_view text);

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
