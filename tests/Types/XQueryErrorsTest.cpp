#include "Types/XQueryErrors.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <string>
#include <string_view>

namespace xquery {
namespace {

struct Row {
  int64_t number;
  std::string_view text;
  int64_t expectedNumber;
  std::string_view expectedText;
};

template <size_t places>
constexpr Row row(const XQueryErrorText<places>& entry, int64_t number, std::string_view text) {
  return {entry.number, entry.text, number, text};
}

const Row rows[] = {
    row(XQueryErrors::nestedTooDeeply, 0, "limit: expression nested too deeply"),
    row(XQueryErrors::outOfMemory, 0, "limit: out of memory"),
    row(XQueryErrors::deadlinePassed, 0, "limit: deadline passed"),
    row(XQueryErrors::evaluationCancelled, 0, "limit: evaluation cancelled"),
    row(XQueryErrors::memoryCeilingReached, 0, "limit: memory ceiling reached"),
    row(XQueryErrors::tooManyDigits, 0, "limit: number of too many digits"),
    row(XQueryErrors::rangeTooLong, 0, "limit: range of too many items"),
    row(XQueryErrors::notAStream, 0, "cannot be evaluated as a stream: %@"),
    row(XQueryErrors::nodeOfAStreamKept, 0, "a node of a stream is still referred to"),
    row(XQueryErrors::unresolvedQName, 1, "can't resolve QName for \"%@\""),
    row(XQueryErrors::noSource, 3, "there is no query text"),
    row(XQueryErrors::notUTF8, 3, "the query is not well-formed UTF-8"),
    row(XQueryErrors::scannerError, 3, "%@ - %@"),
    row(XQueryErrors::invalidToken, 3, "%@ invalid token (%@)- %@"),
    row(XQueryErrors::parserFailure, 3, "%@"),
    row(XQueryErrors::invalidType, 6, "invalid type"),
    row(XQueryErrors::invalidConversion, 6, "invalid type conversion"),
    row(XQueryErrors::invalidOperand, 6, "invalid type for operator"),
    row(XQueryErrors::invalidAtomization, 6, "invalid type for automization"),
    row(XQueryErrors::notAString, 6, "not a string type - %@"),
    row(XQueryErrors::notANumber, 6, "not a numeric type - %@"),
    row(XQueryErrors::notAnInteger, 6, "not a integer type - %@"),
    row(XQueryErrors::valueOfAnotherType, 6, "value does not match a required type"),
    row(XQueryErrors::divideByZero, 6, "divide by zero"),
    row(XQueryErrors::divisionByZero, 6, "Division by zero"),
    row(XQueryErrors::undefinedVariable, 8, "reference to undefined variable \"%@\""),
    row(XQueryErrors::mustUnderstandExtension, 14,
        "must-understand extension not supported (%@ %@)"),
    row(XQueryErrors::unresolvedExternalVariable, 16, "unresloved external variable - %@"),
    row(XQueryErrors::unresolvedExternalFunction, 16, "unresloved external function - %@"),
    row(XQueryErrors::itemNotANode, 19, "item not a node"),
    row(XQueryErrors::itemNotAtomic, 19, "item not an atomic typ"),
    row(XQueryErrors::itemNotANodeOrAtomic, 19, "item not a node or atomic type"),
    row(XQueryErrors::contextItemNotANode, 20, "context item not a node"),
    row(XQueryErrors::attributeNotDistinct, 25, "Attribute name not distinct"),
    row(XQueryErrors::invalidInstruction, 26, "processing instruction content cannot contain ?>"),
    row(XQueryErrors::invalidDocumentNode, 28, "invalid node for document"),
    row(XQueryErrors::attributeIsXMLNS, 44, "Attribute namesapce is xmlns"),
    row(XQueryErrors::invalidNamespace, 70, "invalid namespace declaration"),
    row(XQueryErrors::invalidComment, 72, "invalid comment"),
    row(XQueryErrors::unsupportedVersion, 31, "version \"%@\" not supported"),
    row(XQueryErrors::baseURIDefined, 32, "base-uri already defined for %@"),
    row(XQueryErrors::secondBaseURI, 32, "Prolog contains more than one base URI declaration"),
    row(XQueryErrors::prefixReused, 33, "invalid resuse of prefix for %@"),
    row(XQueryErrors::functionDeclaredTwice, 34, "invalid function declaration for %@"),
    row(XQueryErrors::duplicateVariable, 37, "duplicate definition of variable %@"),
    row(XQueryErrors::duplicateFunction, 37, "duplicate definition of function %@"),
    row(XQueryErrors::secondDefaultCollation, 38,
        "Prolog contains more than one default collation declaration"),
    row(XQueryErrors::duplicateParameter, 39, "more than one parameter with the same name"),
    row(XQueryErrors::functionInReservedNamespace, 45, "invalid function declaration for %@"),
    row(XQueryErrors::invalidNamespaceURI, 46, "invalid namespace uri for %@"),
    row(XQueryErrors::moduleNotFound, 47, "can't access module for %@"),
    row(XQueryErrors::variableOutsideModule, 48, "invalid variable declaration for %@"),
    row(XQueryErrors::functionOutsideModule, 48, "invalid function declaration for %@"),
    row(XQueryErrors::variableDeclaredTwice, 49, "invalid variable declaration for %@"),
    row(XQueryErrors::secondInheritNamespaces, 55,
        "Prolog contains more than one inherit-namespaces declaration"),
    row(XQueryErrors::secondOrderingMode, 65,
        "Prolog contains more than one ordering mode declaration"),
    row(XQueryErrors::secondConstruction, 67,
        "Prolog contains more than one construction declaration"),
    row(XQueryErrors::secondXMLSpace, 68, "Prolog contains more than one xmlspace declaration"),
    row(XQueryErrors::secondEmptyOrdering, 69,
        "Prolog contains more than one empty ordering declaration"),
    row(XQueryErrors::reservedPrefix, 70, "prefix %@ can't be redeclared"),
    row(XQueryErrors::undefinedFunction, 8, "function %@ not defined for context"),
    row(XQueryErrors::invalidArguments, 17, "invalid arguments to function - %@"),
    row(XQueryErrors::namedError, 0, "%@#%@"),
    row(XQueryErrors::describedError, 0, "%@#%@ - %@"),
    row(XQueryErrors::notZeroOrOne, 6,
        "fn:zero-or-one called with a sequence containing more than one item"),
    row(XQueryErrors::notOneOrMore, 6,
        "fn:one-or-more called with a sequence containing zero items"),
    row(XQueryErrors::notExactlyOne, 6,
        "fn:exactly-one called with a sequence containing zero or more than one item"),
    row(XQueryErrors::unsupportedNormalizationForm, 0,
        "err:FOCH0003 - unsupported normalization form"),
};

TEST(ErrorCatalogue, EveryRowIsTested) {
  std::ifstream in(XQUERY_SOURCE_DIR "/src/Types/XQueryErrors.h");
  size_t count = 0;
  for (std::string line; std::getline(in, line);) {
    count += line.starts_with("inline constexpr XQueryErrorText<");
  }
  EXPECT_EQ(count, std::size(rows));
}

TEST(ErrorCatalogue, EveryRowHasItsNumberAndText) {
  for (const Row& row : rows) {
    EXPECT_EQ(row.number, row.expectedNumber) << row.expectedText;
    EXPECT_EQ(row.text, row.expectedText);
  }
}

TEST(ErrorCatalogue, ARowWithoutPlacesIsItsText) {
  const auto error = XQueryErrors::invalidType.error();
  EXPECT_EQ(error->err(), 6);
  EXPECT_EQ(error->msg()->utf8(), "invalid type");
  EXPECT_EQ(error->line(), 0);
}

TEST(ErrorCatalogue, LinesCountFromZeroAndAreStoredFromOne) {
  EXPECT_EQ(XQueryErrors::invalidType.errorAtLine(0)->line(), 1);
  EXPECT_EQ(XQueryErrors::undefinedVariable.errorAtLine(4, "x")->line(), 5);
}

TEST(ErrorCatalogue, PlacesAreFilledInOrder) {
  EXPECT_EQ(XQueryErrors::invalidToken.message("syntax error,", "+", "1 +")->utf8(),
            "syntax error, invalid token (+)- 1 +");
  EXPECT_EQ(XQueryErrors::undefinedVariable.message("p:x")->utf8(),
            "reference to undefined variable \"p:x\"");
}

TEST(ErrorCatalogue, APartThatLooksLikeAPlaceIsNotFilled) {
  EXPECT_EQ(XQueryErrors::scannerError.message("%@", "b")->utf8(), "%@ - b");
}

TEST(ErrorCatalogue, AMissingObjectIsNamedSo) {
  EXPECT_EQ(XQueryErrors::reservedPrefix.message(Ref<NSString>())->utf8(),
            "prefix (null) can't be redeclared");
}

TEST(ErrorCatalogue, PartsKeepTextOutsideASCIIAndNumbers) {
  EXPECT_EQ(XQueryErrors::parserFailure.message("\xC3\xA9")->utf8(), "\xC3\xA9");
  EXPECT_EQ(XQueryErrors::parserFailure.message(NSString::stringWithUTF8("\xC3\xA9"))->utf8(),
            "\xC3\xA9");
  EXPECT_EQ(XQueryErrors::parserFailure.message(int64_t{-7})->utf8(), "-7");
}

TEST(ErrorCatalogue, BytesThatAreNotUTF8AreReplaced) {
  EXPECT_EQ(XQueryErrors::parserFailure.message("a\xFF")->utf8(), "a\xEF\xBF\xBD");
}

}  // namespace
}  // namespace xquery
