// What the rules of the scanner do: the names, literals, comments, extensions and errors that are
// more than one symbol and one next state. For XQueryScanner.l only.
#pragma once

#include "Parser/XQueryScanner.h"
#include "xquery/String.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

// The state that XQueryScannerInit was given, entered at the first character.
extern int sXQueryScannerStartState;
// The return states; the last one is the top.
extern std::vector<uint8_t> sXQueryScannerStateStack;
// The literal being read.
extern NSMutableString sXQueryScannerStringLiteral;
extern int sXQueryScannerStringLiteralToken;
extern int sXQueryScannerStringLiteralLineNo;
extern std::string sXQueryScannerStringLiteralSource;  // only while token sources are logged
// Lines of the last "(:" and of the last "pragma" or "extension".
extern int sXQueryScannerCommentLineNo;
extern int sXQueryScannerExtensionLineNo;
extern Ref<NSString> sXQueryScannerStringExtensionName;
extern NSMutableString sXQueryScannerStringExtensionContent;
extern bool sXQueryScannerAtEnd;

void XQScannerActionsReset();

// Each answers the token.
int XQSymbol(int token);
int XQSymbol(int token, int next);
int XQSymbol(int token, int push, int next);
int XQSymbolPop(int token);
int XQCharacter(int token, char16_t unit);
int XQNumber(int token);
int XQOpenBrace(int resume);
int XQInvalidToken();
int XQEndOfInput();

// Advances the line counter by the line ends in the current token.
void XQCountLines();
void XQLiteralOpen(int token, char quote, int resume);
void XQLiteralAppendText();
void XQLiteralAppendUnit(char16_t unit);
int XQLiteralClose();
void XQCommentOpen();
void XQExtensionOpen(int nameState);
void XQExtensionAppend();
void XQExtensionClose();

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
XQueryScannedWord XQScanWord(std::string_view rest);
// To be called when the current token is the word; 0 when there is no token to return.
int XQFinishWord(const XQueryScannedWord& word);

}  // namespace xquery
