// The catalogue of errors: the number and the text of every failure that the engine reports, one
// row each. Whoever reports one names its row:
//
//   context.raise(XQueryErrors::undefinedVariable.errorAtLine(exprLine(), _name));
//
// The type of a row counts the "%@" of its text, so that a row given too few or too many parts does
// not compile. A number is that of the language's own error code; 0 stands for what has none, such
// as the limits of the engine. Odd spellings are what callers look for: keep them.
#pragma once

#include "Types/MessageText.h"
#include "xquery/Error.h"
#include "xquery/String.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

template <size_t places = 0>
struct XQueryErrorText {
  XQueryErrorCategory category;
  int64_t number;
  std::string_view text;  // ASCII

  consteval XQueryErrorText(XQueryErrorCategory ofCategory, int64_t withNumber,
                            std::string_view withText)
      : category(ofCategory), number(withNumber), text(withText) {
    size_t found = 0;
    for (size_t at = text.find("%@"); at != text.npos; at = text.find("%@", at + 2)) ++found;
    if (found != places) throw "the text has another number of places to fill";
  }

  template <class... Parts>
  requires(sizeof...(Parts) == places) Ref<NSString> message(const Parts&... parts)
  const { return filledText(text, parts...); }
  // An error without a line.
  template <class... Parts>
  requires(sizeof...(Parts) == places)
      [[nodiscard]] Ref<XQueryError> error(const Parts&... parts) const {
    return XQueryError::error(category, number, message(parts...));
  }
  // The line counts from 0.
  template <class... Parts>
  requires(sizeof...(Parts) == places)
      [[nodiscard]] Ref<XQueryError> errorAtLine(int64_t line, const Parts&... parts) const {
    return XQueryError::error(category, number, message(parts...), line);
  }
};

namespace XQueryErrors {

using enum XQueryErrorCategory;

// --- limits --------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> nestedTooDeeply{Limit, 0, "limit: expression nested too deeply"};
inline constexpr XQueryErrorText<> outOfMemory{Limit, 0, "limit: out of memory"};
inline constexpr XQueryErrorText<> deadlinePassed{Limit, 0, "limit: deadline passed"};
inline constexpr XQueryErrorText<> evaluationCancelled{Limit, 0, "limit: evaluation cancelled"};
inline constexpr XQueryErrorText<> memoryCeilingReached{Limit, 0, "limit: memory ceiling reached"};
inline constexpr XQueryErrorText<> tooManyDigits{Limit, 0, "limit: number of too many digits"};
inline constexpr XQueryErrorText<> rangeTooLong{Limit, 0, "limit: range of too many items"};

// --- streams -------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<1> notAStream{Internal, 0, "cannot be evaluated as a stream: %@"};
inline constexpr XQueryErrorText<> nodeOfAStreamKept{Internal, 0,
                                                     "a node of a stream is still referred to"};

// --- parsing -------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> noSource{Syntax, 3, "there is no query text"};
inline constexpr XQueryErrorText<> notUTF8{Syntax, 3, "the query is not well-formed UTF-8"};
inline constexpr XQueryErrorText<2> scannerError{Syntax, 3, "%@ - %@"};
inline constexpr XQueryErrorText<3> invalidToken{Syntax, 3, "%@ invalid token (%@)- %@"};
inline constexpr XQueryErrorText<1> parserFailure{Syntax, 3, "%@"};
inline constexpr XQueryErrorText<2> mustUnderstandExtension{
    Syntax, 14, "must-understand extension not supported (%@ %@)"};

// --- the prolog ----------------------------------------------------------------------------------

inline constexpr XQueryErrorText<1> unsupportedVersion{Syntax, 31, "version \"%@\" not supported"};
inline constexpr XQueryErrorText<1> baseURIDefined{Syntax, 32, "base-uri already defined for %@"};
inline constexpr XQueryErrorText<> secondBaseURI{
    Syntax, 32, "Prolog contains more than one base URI declaration"};
inline constexpr XQueryErrorText<1> prefixReused{Names, 33, "invalid resuse of prefix for %@"};
inline constexpr XQueryErrorText<1> functionDeclaredTwice{Names, 34,
                                                          "invalid function declaration for %@"};
inline constexpr XQueryErrorText<1> duplicateVariable{Names, 37,
                                                      "duplicate definition of variable %@"};
inline constexpr XQueryErrorText<1> duplicateFunction{Names, 37,
                                                      "duplicate definition of function %@"};
inline constexpr XQueryErrorText<> secondDefaultCollation{
    Syntax, 38, "Prolog contains more than one default collation declaration"};
inline constexpr XQueryErrorText<> duplicateParameter{Names, 39,
                                                      "more than one parameter with the same name"};
inline constexpr XQueryErrorText<1> functionInReservedNamespace{
    Names, 45, "invalid function declaration for %@"};
inline constexpr XQueryErrorText<1> invalidNamespaceURI{Names, 46, "invalid namespace uri for %@"};
inline constexpr XQueryErrorText<1> moduleNotFound{Loading, 47, "can't access module for %@"};
inline constexpr XQueryErrorText<1> variableOutsideModule{Names, 48,
                                                          "invalid variable declaration for %@"};
inline constexpr XQueryErrorText<1> functionOutsideModule{Names, 48,
                                                          "invalid function declaration for %@"};
inline constexpr XQueryErrorText<1> variableDeclaredTwice{Names, 49,
                                                          "invalid variable declaration for %@"};
inline constexpr XQueryErrorText<> secondInheritNamespaces{
    Syntax, 55, "Prolog contains more than one inherit-namespaces declaration"};
inline constexpr XQueryErrorText<> secondOrderingMode{
    Syntax, 65, "Prolog contains more than one ordering mode declaration"};
inline constexpr XQueryErrorText<> secondConstruction{
    Syntax, 67, "Prolog contains more than one construction declaration"};
inline constexpr XQueryErrorText<> secondXMLSpace{
    Syntax, 68, "Prolog contains more than one xmlspace declaration"};
inline constexpr XQueryErrorText<> secondEmptyOrdering{
    Syntax, 69, "Prolog contains more than one empty ordering declaration"};
inline constexpr XQueryErrorText<1> reservedPrefix{Names, 70, "prefix %@ can't be redeclared"};

// --- names and variables -------------------------------------------------------------------------

inline constexpr XQueryErrorText<1> unresolvedQName{Names, 1, "can't resolve QName for \"%@\""};
inline constexpr XQueryErrorText<1> undefinedVariable{Names, 8,
                                                      "reference to undefined variable \"%@\""};
inline constexpr XQueryErrorText<1> unresolvedExternalVariable{Names, 16,
                                                               "unresloved external variable - %@"};
inline constexpr XQueryErrorText<1> unresolvedExternalFunction{Names, 16,
                                                               "unresloved external function - %@"};

// --- types ---------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> invalidType{Types, 6, "invalid type"};
inline constexpr XQueryErrorText<> invalidConversion{Types, 6, "invalid type conversion"};
inline constexpr XQueryErrorText<> invalidOperand{Types, 6, "invalid type for operator"};
inline constexpr XQueryErrorText<> invalidAtomization{Types, 6, "invalid type for automization"};
inline constexpr XQueryErrorText<1> notAString{Types, 6, "not a string type - %@"};
inline constexpr XQueryErrorText<1> notANumber{Types, 6, "not a numeric type - %@"};
inline constexpr XQueryErrorText<1> notAnInteger{Types, 6, "not a integer type - %@"};
inline constexpr XQueryErrorText<> valueOfAnotherType{Types, 6,
                                                      "value does not match a required type"};

// --- arithmetic ----------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> divideByZero{Values, 6, "divide by zero"};
inline constexpr XQueryErrorText<> divisionByZero{Values, 6, "Division by zero"};

// --- paths ---------------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> itemNotANode{Types, 19, "item not a node"};
inline constexpr XQueryErrorText<> itemNotAtomic{Types, 19, "item not an atomic typ"};
inline constexpr XQueryErrorText<> itemNotANodeOrAtomic{Types, 19,
                                                        "item not a node or atomic type"};
inline constexpr XQueryErrorText<> contextItemNotANode{Types, 20, "context item not a node"};

// --- constructors --------------------------------------------------------------------------------

inline constexpr XQueryErrorText<> attributeNotDistinct{Values, 25, "Attribute name not distinct"};
inline constexpr XQueryErrorText<> invalidInstruction{
    Values, 26, "processing instruction content cannot contain ?>"};
inline constexpr XQueryErrorText<> invalidDocumentNode{Values, 28, "invalid node for document"};
inline constexpr XQueryErrorText<> attributeIsXMLNS{Values, 44, "Attribute namesapce is xmlns"};
inline constexpr XQueryErrorText<> invalidNamespace{Values, 70, "invalid namespace declaration"};
inline constexpr XQueryErrorText<> invalidComment{Values, 72, "invalid comment"};

// --- function calls ------------------------------------------------------------------------------

inline constexpr XQueryErrorText<1> undefinedFunction{Names, 8,
                                                      "function %@ not defined for context"};
inline constexpr XQueryErrorText<1> invalidArguments{Types, 17,
                                                     "invalid arguments to function - %@"};
inline constexpr XQueryErrorText<2> namedError{RaisedByQuery, 0, "%@#%@"};
inline constexpr XQueryErrorText<3> describedError{RaisedByQuery, 0, "%@#%@ - %@"};
inline constexpr XQueryErrorText<> notZeroOrOne{
    Types, 6, "fn:zero-or-one called with a sequence containing more than one item"};
inline constexpr XQueryErrorText<> notOneOrMore{
    Types, 6, "fn:one-or-more called with a sequence containing zero items"};
inline constexpr XQueryErrorText<> notExactlyOne{
    Types, 6, "fn:exactly-one called with a sequence containing zero or more than one item"};
inline constexpr XQueryErrorText<> unsupportedNormalizationForm{
    Values, 0, "err:FOCH0003 - unsupported normalization form"};

}  // namespace XQueryErrors
}  // namespace xquery
