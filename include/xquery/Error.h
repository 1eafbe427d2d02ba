// Failures. A host sees them as XQueryError objects; inside the engine a run-time failure travels
// as an NSException, which never leaves the public interface.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace xquery {

// What every error object answers. Errors are immutable.
class XQUERY_EXPORT NSError : public NSCounted {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::Error || object.kind() == Kind::QueryError;
  }

  // What the error carries beside its code; an absent entry is not in the dictionary.
  struct UserInfo {
    Ref<NSString> errorMessage;        // key "ErrorMessage"
    std::optional<int64_t> errorLine;  // key "ErrorLine"
  };

  // For a failure outside the language, such as a stylesheet that does not compile.
  [[nodiscard]] static Ref<NSError> errorWithDomain(std::string_view domain, int64_t code,
                                                    std::string_view message);

  const Ref<NSString>& domain() const { return _domain; }
  int64_t code() const { return _code; }
  // Null when the error has neither message nor line.
  const UserInfo* userInfo() const { return _userInfo ? &*_userInfo : nullptr; }
  // A new string for a reader: "domain:code", and the message when there is one.
  virtual Ref<NSString> localizedDescription() const;
  virtual Ref<NSString> description() const { return localizedDescription(); }

 protected:
  NSError(Kind kind, Ref<NSString> domain, int64_t code, std::optional<UserInfo> userInfo);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _domain;
  int64_t _code;
  std::optional<UserInfo> _userInfo;
};

// An error of the engine: domain "XQueryErrorDomain", the code is the error number. Lines count
// from 1; 0 means that no line is known. With the environment variable XQUERY_LOG set (not empty
// and not "0"), making one logs its description.
//
// An error of a library module that a query imports knows the module's URL; its line is one there.
//
//   if (error->err() == 8) undefined(error->msg()->utf8(), error->line());
//   log(error->description()->utf8());   // XQueryError:8 - "reference to ..." at line:3
class XQUERY_EXPORT XQueryError : public NSError {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::QueryError; }

  // `line` counts from 0, as the scanner counts; the error stores line + 1.
  [[nodiscard]] static Ref<XQueryError> error(int64_t number, const Ref<NSString>& withMsg,
                                              int64_t atLine);
  // Without a line.
  [[nodiscard]] static Ref<XQueryError> error(int64_t number, const Ref<NSString>& withMsg);
  // The same with the message as UTF-8 text.
  [[nodiscard]] static Ref<XQueryError> error(int64_t number, std::string_view withMsg,
                                              int64_t atLine);
  [[nodiscard]] static Ref<XQueryError> error(int64_t number, std::string_view withMsg);

  // With a message that ends with a line of the query's text; the column counts from 0 as well.
  [[nodiscard]] static Ref<XQueryError> error(int64_t number, const Ref<NSString>& withMsg,
                                              int64_t atLine, Ref<NSString> sourceLine,
                                              int64_t inColumn);

  // The same error, known to be one of the module at that URL.
  [[nodiscard]] static Ref<XQueryError> errorInModule(const XQueryError& error,
                                                      Ref<NSString> moduleURL);

  // The same as the code.
  int64_t err() const { return _err; }
  // May be null.
  const Ref<NSString>& msg() const { return _msg; }
  int64_t line() const { return _line; }
  // The line of the query's text that the message ends with, as the errors of a parse do, and the
  // place in it, in characters counted from 1. For any other message null and 0.
  const Ref<NSString>& sourceLine() const { return _sourceLine; }
  int64_t column() const { return _column; }
  // Null for an error of the query itself, and for one that arises while it is evaluated.
  const Ref<NSString>& moduleURL() const { return _moduleURL; }

  // XQueryError:3 - "message" at line:5, or without the last part when no line is known. A missing
  // message prints as (null). For an error of a module a second line names it, and its line again:
  // two blanks, "at ", the URL and ":5".
  Ref<NSString> localizedDescription() const override;

 protected:
  XQueryError(int64_t number, Ref<NSString> msg, int64_t line, Ref<NSString> sourceLine = nullptr,
              int64_t column = 0);
  XQueryError(const XQueryError& error, Ref<NSString> moduleURL);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  int64_t _err;
  Ref<NSString> _msg;
  int64_t _line;
  Ref<NSString> _sourceLine;
  int64_t _column;
  Ref<NSString> _moduleURL;
};

// The one exception type of the engine, thrown and caught inside it; a run-time error has the name
// "XQueryError" and the error's description as its reason.
class XQUERY_EXPORT NSException {
 public:
  NSException(std::string name, Ref<NSString> reason)
      : _name(std::move(name)), _reason(std::move(reason)) {}
  const std::string& name() const { return _name; }
  const Ref<NSString>& reason() const { return _reason; }

 private:
  std::string _name;
  Ref<NSString> _reason;
};

}  // namespace xquery
