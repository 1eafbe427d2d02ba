#include "Platform/Base/Counting.h"
#include "Platform/Base/NSLog.h"
#include "Platform/Base/XQueryErrorTrace.h"
#include "xquery/Error.h"

#include <string>

namespace xquery {

namespace {

const Ref<NSString>& errorDomain() {
  static const Ref<NSString> domain = [] {
    Ref<NSString> text = NSString::stringWithASCII("XQueryErrorDomain");
    NSCounting::makeImmortal(*text);
    return text;
  }();
  return domain;
}

// A dictionary only for what is there: no message, no entry; line 0, no entry; neither, nothing.
std::optional<NSError::UserInfo> userInfoFor(const Ref<NSString>& msg, int64_t line) {
  if (!msg && line == 0) return std::nullopt;
  NSError::UserInfo info{msg, std::nullopt};
  if (line != 0) info.errorLine = line;
  return info;
}

}  // namespace

NSError::NSError(Kind kind, Ref<NSString> domain, int64_t code, std::optional<UserInfo> userInfo)
    : NSCounted(kind), _domain(std::move(domain)), _code(code), _userInfo(std::move(userInfo)) {}

Ref<NSError> NSError::errorWithDomain(std::string_view domain, int64_t code,
                                      std::string_view message) {
  UserInfo info{NSString::stringWithUTF8Replacing(message), std::nullopt};
  return make<NSError>(Kind::Error, NSString::stringWithUTF8Replacing(domain), code,
                       std::optional<UserInfo>(std::move(info)));
}

Ref<NSString> NSError::localizedDescription() const {
  NSMutableString text;
  text.append(_domain->view());
  text.appendASCII(":" + std::to_string(_code));
  if (_userInfo && _userInfo->errorMessage) {
    text.appendASCII(" - ");
    text.append(_userInfo->errorMessage->view());
  }
  return text.string();
}

XQueryError::XQueryError(XQueryErrorCategory category, int64_t number, Ref<NSString> msg,
                         int64_t line, Ref<NSString> sourceLine, int64_t column)
    : NSError(Kind::QueryError, errorDomain(), number, userInfoFor(msg, line)),
      _category(category),
      _err(number),
      _msg(std::move(msg)),
      _line(line),
      _sourceLine(std::move(sourceLine)),
      _column(column) {
  if (XQueryLogEnabled()) NSLog(XQueryError::localizedDescription()->utf8());
}

// It was logged when it was made.
XQueryError::XQueryError(const XQueryError& error, Ref<NSString> moduleURL, Ref<NSCounted> trace)
    : NSError(Kind::QueryError, errorDomain(), error.err(), userInfoFor(error.msg(), error.line())),
      _category(error.category()),
      _err(error.err()),
      _msg(error.msg()),
      _line(error.line()),
      _sourceLine(error.sourceLine()),
      _column(error.column()),
      _moduleURL(std::move(moduleURL)),
      _placeAndCalls(std::move(trace)) {}

Ref<XQueryError> XQueryError::errorInModule(const XQueryError& error, Ref<NSString> moduleURL) {
  return make<XQueryError>(error, std::move(moduleURL), error._placeAndCalls);
}

Ref<XQueryError> XQueryError::error(XQueryErrorCategory ofCategory, int64_t number,
                                    const Ref<NSString>& withMsg) {
  return make<XQueryError>(ofCategory, number, withMsg, int64_t{0});
}

Ref<XQueryError> XQueryError::error(XQueryErrorCategory ofCategory, int64_t number,
                                    const Ref<NSString>& withMsg, int64_t atLine) {
  return make<XQueryError>(ofCategory, number, withMsg, atLine + 1);
}

Ref<XQueryError> XQueryError::error(int64_t number, const Ref<NSString>& withMsg, int64_t atLine) {
  return error(XQueryErrorCategory::Internal, number, withMsg, atLine);
}

Ref<XQueryError> XQueryError::error(int64_t number, const Ref<NSString>& withMsg) {
  return error(XQueryErrorCategory::Internal, number, withMsg);
}

Ref<XQueryError> XQueryError::error(int64_t number, std::string_view withMsg, int64_t atLine) {
  return error(number, NSString::stringWithUTF8Replacing(withMsg), atLine);
}

Ref<XQueryError> XQueryError::error(int64_t number, std::string_view withMsg) {
  return error(number, NSString::stringWithUTF8Replacing(withMsg));
}

Ref<XQueryError> XQueryError::error(int64_t number, const Ref<NSString>& withMsg, int64_t atLine,
                                    Ref<NSString> sourceLine, int64_t inColumn) {
  return make<XQueryError>(XQueryErrorCategory::Syntax, number, withMsg, atLine + 1,
                           std::move(sourceLine), inColumn + 1);
}

std::optional<XQuerySourcePlace> XQueryError::place() const {
  const auto* trace = XQueryErrorTrace::of(*this);
  return trace ? trace->places().place(trace->place()) : std::nullopt;
}

std::vector<XQueryErrorCall> XQueryError::calls() const {
  std::vector<XQueryErrorCall> calls;
  const auto* trace = XQueryErrorTrace::of(*this);
  if (!trace) return calls;
  for (const XQueryTracedCall& call : trace->calls()) {
    calls.push_back({call.function, trace->places().place(call.place)});
  }
  return calls;
}

int64_t XQueryError::callsLeftOut() const {
  const auto* trace = XQueryErrorTrace::of(*this);
  return trace ? trace->leftOut() : 0;
}

Ref<NSString> XQueryError::localizedDescription() const {
  const UserInfo* info = userInfo();
  NSMutableString text;
  text.appendASCII("XQueryError:" + std::to_string(code()) + " - \"");
  if (info && info->errorMessage) {
    text.append(info->errorMessage->view());
  } else {
    text.appendASCII("(null)");
  }
  text.appendASCII("\"");
  if (info && info->errorLine) text.appendASCII(" at line:" + std::to_string(*info->errorLine));
  if (_moduleURL) {
    text.appendASCII("\n  at ");
    text.append(_moduleURL->view());
    if (_line != 0) text.appendASCII(":" + std::to_string(_line));
  }
  return text.string();
}

}  // namespace xquery
