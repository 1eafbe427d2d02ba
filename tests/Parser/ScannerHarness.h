// Drives the scanner alone over a text.
#pragma once

#include "Parser/ScannerActions.h"
#include "Parser/XQueryParser.h"
#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

struct ScannedToken {
  int code = 0;
  int line = 0;
  std::string text;   // the value as text; of a character token the code unit as UTF-8
  char16_t unit = 0;  // of a character token
  int state = 0;      // after the token
  std::vector<int> stack;
  std::string source;

  std::string name() const { return XQTokenName(code); }
};

class Scanned {
 public:
  explicit Scanned(std::string_view text, int startState = XQueryStateDEFAULT,
                   const std::vector<int>& stack = {}) {
    Ref<XQueryParser> parser =
        XQueryParser::unparsedParserWithSource(NSString::stringWithUTF8(text));
    const XQueryParser::Session session(*parser);
    XQueryScannerInit(startState);
    for (const int state : stack) XQScanStatePush(state);
    while (const int code = XQlex()) {
      tokens.push_back(record(code));
      if (code == kTokenError) break;
    }
    endState = sXQueryScannerState;
    endLine = XQlineno;
    for (const auto& error : parser->errors()) {
      errors.push_back(error->localizedDescription()->utf8());
    }
  }

  std::string names() const {
    std::string result;
    for (const ScannedToken& token : tokens) {
      if (!result.empty()) result += ' ';
      result += token.name().substr(6);
    }
    return result;
  }
  // Code units of the character tokens.
  std::u16string units() const {
    std::u16string result;
    for (const ScannedToken& token : tokens) {
      if (XQTokenIsCharacter(token.code)) result += token.unit;
    }
    return result;
  }

  std::vector<ScannedToken> tokens;
  std::vector<std::string> errors;
  int endState = 0;
  int endLine = 0;

 private:
  static ScannedToken record(int code) {
    ScannedToken token;
    token.code = code;
    EXPECT_EQ(XQlval.token, code);
    token.line = XQlval.line;
    if (XQTokenIsCharacter(code)) {
      token.unit = XQlval.unit;
      char bytes[3];
      token.text = std::string(bytes, static_cast<size_t>(UniCodeToUTF8(token.unit, bytes)));
    } else if (XQlval.value) {
      token.text = cast<NSString>(XQlval.value)->utf8();
    }
    if (XQlval.source) token.source = cast<NSString>(XQlval.source)->utf8();
    token.state = sXQueryScannerState;
    token.stack.assign(sXQueryScannerStateStack.begin(), sXQueryScannerStateStack.end());
    return token;
  }
};

}  // namespace xquery
