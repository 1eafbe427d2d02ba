#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Base/NSLog.h"
#include "xquery/Object.h"

#include <cstdio>
#include <cstdlib>
#include <string>

namespace xquery {
namespace {

std::string textOf(const NSObject* object) {
  const NSString* string = dyn_cast<NSString>(object);
  return string ? string->utf8() : std::string();
}

std::string textOf(char16_t unit) {
  char bytes[3];
  return std::string(bytes, static_cast<size_t>(UniCodeToUTF8(unit, bytes)));
}

}  // namespace

bool sXQueryLogTokens = false;
bool sXQueryLogStates = false;
bool sXQueryLogTokenSource = false;

const char* const sXQueryStateStrings[XQueryStateCount] = {
#define XQUERY_NAME(name) #name,
    XQUERY_SCANNER_STATES(XQUERY_NAME)
#undef XQUERY_NAME
};

bool XQScannerGetEnv(const char* name, bool defaultValue) {
  const char* value = std::getenv(name);
  if (!value || !*value || std::string_view(value) == "0") return defaultValue;
  return true;
}

void XQScannerReadSwitches() {
  const bool byDefault = XQScannerGetEnv("XQUERY_LOG_DEFAULT", false);
  sXQueryLogTokens = XQScannerGetEnv("XQUERY_LOG_TOKENS", byDefault);
  sXQueryLogStates = XQScannerGetEnv("XQUERY_LOG_STATES", byDefault);
  sXQueryLogTokenSource = XQScannerGetEnv("XQUERY_LOG_TOKEN_SOURCE", byDefault);
  XQdebug = XQScannerGetEnv("XQUERY_YYDEBUG", byDefault) ? 1 : 0;
}

void XQLexStateLog(const char* what, int state) {
  if (sXQueryLogStates) NSLog(std::string(what) + ":" + sXQueryStateStrings[state]);
}

void XQLexStateLog(const char* what) {
  if (sXQueryLogStates) NSLog(what);
}

bool XQTokenIsCharacter(int token) {
  switch (token) {
    case kTokenAposAttContentChar:
    case kTokenChar:
    case kTokenCharRef:
    case kTokenCurlyBraceLeftCurlyBraceLeft:
    case kTokenCurlyBraceRightCurlyBraceRight:
    case kTokenElementContentChar:
    case kTokenElementContentCharWS:
    case kTokenPredefinedEntityRef:
    case kTokenQuoteAttContentChar:
      return true;
    default:
      return false;
  }
}

void XQLexTokenLog(const XQueryTokenValue& value) {
  const int token = value.token;
  std::string line = std::string("token:") + XQTokenName(token) + "(" + std::to_string(token) +
                     ") line:" + std::to_string(value.line) + " value:";
  // The doubled braces have always been printed as text although they are characters.
  const bool asText =
      token == kTokenCurlyBraceLeftCurlyBraceLeft || token == kTokenCurlyBraceRightCurlyBraceRight;
  if (!XQTokenIsCharacter(token)) {
    line += textOf(value.value);
  } else if (asText) {
    line += textOf(value.unit);
  } else {
    char digits[8];
    std::snprintf(digits, sizeof digits, "0x%4.4X", static_cast<unsigned>(value.unit));
    line += digits;
  }
  if (sXQueryLogTokenSource) line += " source:" + textOf(value.source);
  NSLog(line);
}

}  // namespace xquery
