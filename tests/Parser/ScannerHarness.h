// Drives the scanner alone over a text.
#pragma once

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
    XQueryScanner& scanner = parser->scanner();
    scanner.XQueryScannerInit(startState);
    for (const int state : stack) scanner.XQScanStatePush(state);
    XQueryTokenValue value;
    while (const int code = scanner.XQlex(value)) {
      EXPECT_EQ(value.token, code);
      tokens.push_back(record(value, scanner));
      if (code == kTokenError) break;
    }
    endState = scanner.state();
    endLine = scanner.line();
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
  static ScannedToken record(const XQueryTokenValue& value, const XQueryScanner& scanner) {
    ScannedToken token;
    token.code = value.token;
    token.line = value.line;
    if (XQTokenIsCharacter(token.code)) {
      token.unit = value.unit;
      char bytes[3];
      token.text = std::string(bytes, static_cast<size_t>(UniCodeToUTF8(token.unit, bytes)));
    } else if (value.value) {
      token.text = cast<NSString>(value.value)->utf8();
    }
    if (value.source) token.source = cast<NSString>(value.source)->utf8();
    token.state = scanner.state();
    token.stack.assign(scanner.stateStack().begin(), scanner.stateStack().end());
    return token;
  }
};

}  // namespace xquery
