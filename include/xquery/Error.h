// Failures, which a host sees as XQueryError objects: nothing is thrown at it.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

// What kind of failure an error tells of, so that nobody has to read its text, which a query can
// imitate.
enum class XQueryErrorCategory : uint8_t {
  Syntax,         // the text of the query: its tokens, its grammar, what a prolog says twice
  Names,          // names that are not declared, not resolved or declared twice
  Types,          // a value of another type or number of items than is asked for
  Values,         // a value of the right type that cannot be used
  Loading,        // a module that cannot be had
  Limit,          // a limit of the host or of the engine was reached
  RaisedByQuery,  // fn:error
  Internal,       // how the engine is used; also what says of no error which of these it is
};

// The numbers, which are those of the language's error codes.
enum class XQueryErrorNumber : int64_t {
  None = 0,  // raised by the query, a limit, or a code that stands in the text
  UnresolvedName = 1,
  Syntax = 3,
  Type = 6,
  Undefined = 8,
  Extension = 14,
  Unbound = 16,
  Arguments = 17,
  ItemKind = 19,
  ContextItem = 20,
  AttributeNotDistinct = 25,
  InvalidInstruction = 26,
  InvalidDocument = 28,
  Version = 31,
  BaseURIDeclaredTwice = 32,
  PrefixReused = 33,
  FunctionDeclaredTwice = 34,
  DuplicateDefinition = 37,
  CollationDeclaredTwice = 38,
  DuplicateParameter = 39,
  AttributeIsXmlns = 44,
  ReservedFunctionName = 45,
  InvalidNamespaceURI = 46,
  ModuleNotFound = 47,
  OutsideModule = 48,
  VariableDeclaredTwice = 49,
  InheritNamespacesDeclaredTwice = 55,
  OrderingDeclaredTwice = 65,
  ConstructionDeclaredTwice = 67,
  XMLSpaceDeclaredTwice = 68,
  EmptyOrderingDeclaredTwice = 69,
  InvalidNamespace = 70,
  InvalidComment = 72,
};

// A piece of the text of a query or a library module. All counts are of characters, which are code
// points: a tab is one, and so is the end of a line, however it is written.
struct XQuerySourcePlace {
  Ref<NSString> moduleURL;   // null for the query itself
  int64_t line;              // from 1
  int64_t column;            // from 1
  int64_t length;            // of a piece on several lines that of all of them
  Ref<NSString> sourceLine;  // the text of the line, without its end
};

// A call of a declared function.
struct XQueryErrorCall {
  Ref<NSString> function;                  // the name as the call has it, prefix included
  std::optional<XQuerySourcePlace> place;  // of the call
};

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

  // The same error of that category. Without being told an error is one of Internal, and with a
  // line of the query's text one of Syntax.
  [[nodiscard]] static Ref<XQueryError> error(XQueryErrorCategory ofCategory, int64_t number,
                                              const Ref<NSString>& withMsg);
  [[nodiscard]] static Ref<XQueryError> error(XQueryErrorCategory ofCategory, int64_t number,
                                              const Ref<NSString>& withMsg, int64_t atLine);

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

  XQueryErrorCategory category() const { return _category; }
  // The same as the code; a host's own error may have a number that is none of the enumeration.
  XQueryErrorNumber number() const { return static_cast<XQueryErrorNumber>(_err); }
  // The innermost expression that was being evaluated, or what a compilation could not use; nothing
  // where that is not known. A line here is that of the place's first character, which line() need
  // not be. An error with a place keeps the text of its query, and of the modules of that, as long
  // as it lives.
  //
  //   if (const auto place = error->place()) mark(place->line, place->column, place->length);
  std::optional<XQuerySourcePlace> place() const;
  // The calls of declared functions that led there, innermost first: the place of the error is in
  // the function of the first one, the place of each call in that of the next one. Of more than 64
  // these are the 32 innermost and the 32 outermost.
  std::vector<XQueryErrorCall> calls() const;
  // How many calls are missing between those.
  int64_t callsLeftOut() const;

  // XQueryError:3 - "message" at line:5, or without the last part when no line is known. A missing
  // message prints as (null). For an error of a module a second line names it, and its line again:
  // two blanks, "at ", the URL and ":5".
  Ref<NSString> localizedDescription() const override;

 protected:
  XQueryError(XQueryErrorCategory category, int64_t number, Ref<NSString> msg, int64_t line,
              Ref<NSString> sourceLine = nullptr, int64_t column = 0);
  XQueryError(const XQueryError& error, Ref<NSString> moduleURL, Ref<NSCounted> trace);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  XQueryErrorCategory _category;
  int64_t _err;
  Ref<NSString> _msg;
  int64_t _line;
  Ref<NSString> _sourceLine;
  int64_t _column;
  Ref<NSString> _moduleURL;
  Ref<NSCounted> _placeAndCalls;
  friend class XQueryErrorTrace;
};

}  // namespace xquery
