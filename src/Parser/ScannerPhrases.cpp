#include "Parser/ScannerPhrases.h"

#include "Parser/XQueryScanner.h"
#include "Parser/XQueryTokens.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryString.h"

#include <algorithm>
#include <unordered_map>
#include <vector>

namespace xquery {
namespace {

// Short names for the table.
constexpr int D = XQueryStateDEFAULT;
constexpr int O = XQueryStateOPERATOR;
constexpr int IT = XQueryStateITEMTYPE;
constexpr int OI = XQueryStateOCCURRENCEINDICATOR;
constexpr int KT = XQueryStateKINDTEST;
constexpr int PI = XQueryStateKINDTESTFORPI;
constexpr int ND = XQueryStateNAMESPACEDECL;
constexpr int NK = XQueryStateNAMESPACEKEYWORD;
constexpr int XS = XQueryStateXMLSPACE_DECL;
constexpr int VN = XQueryStateVARNAME;
constexpr int ST = XQueryStateSINGLETYPE;
constexpr int none = -1;

constexpr XQueryPhrase phrases[] = {
    // --- axes
    {D, "ancestor ::", kTokenAncestorColonColon, none, D},
    {D, "ancestor-or-self ::", kTokenAncestorOrSelfColonColon, none, D},
    {D, "attribute ::", kTokenAttributeColonColon, none, D},
    {D, "child ::", kTokenChildColonColon, none, D},
    {D, "descendant ::", kTokenDescendantColonColon, none, D},
    {D, "descendant-or-self ::", kTokenDescendantOrSelfColonColon, none, D},
    {D, "following ::", kTokenFollowingColonColon, none, D},
    {D, "following-sibling ::", kTokenFollowingSiblingColonColon, none, D},
    {D, "parent ::", kTokenParentColonColon, none, D},
    {D, "preceding ::", kTokenPrecedingColonColon, none, D},
    {D, "preceding-sibling ::", kTokenPrecedingSiblingColonColon, none, D},
    {D, "self ::", kTokenSelfColonColon, none, D},

    // --- prolog
    {D, "xquery version QUOTE", kTokenXQueryVersionStringLiteral, D, none},
    {D, "encoding QUOTE", kTokenEncodingStringLiteral, D, none},
    {D, "at QUOTE", kTokenAtStringLiteral, D, none},
    {D, "declare construction", kTokenDeclareConstruction, none, O},
    {D, "declare ordering", kTokenDeclareOrdering, none, O},
    {D, "declare default collation", kTokenDeclareDefaultCollation, none, ND},
    {D, "declare namespace", kTokenDeclareNamespace, none, ND},
    {D, "declare base-uri", kTokenDeclareBaseURI, none, ND},
    {D, "module namespace", kTokenModuleNamespace, none, ND},
    {D, "declare default element", kTokenDeclareDefaultElement, none, NK},
    {D, "declare default function", kTokenDeclareDefaultFunction, none, NK},
    {D, "import schema", kTokenImportSchema, none, NK},
    {D, "import module", kTokenImportModule, none, NK},
    {D, "declare xmlspace", kTokenDeclareXMLSpace, none, XS},
    {D, "declare variable $", kTokenDeclareVariableDollarSign, none, VN},
    {D, "declare function", kTokenDeclareFunction, none, D},
    {D, "declare default order empty greatest", kTokenDeclareDefaultOrderEmptyGreatest, none, D},
    {D, "declare default order empty least", kTokenDeclareDefaultOrderEmptyLeast, none, D},
    {D, "declare inherit-namespaces yes", kTokenDeclareInheritNamespacesYes, none, D},
    {D, "declare inherit-namespaces no", kTokenDeclareInheritNamespacesNo, none, D},
    {NK, "namespace", kTokenNamespace, none, ND},
    {NK, "default element", kTokenDefaultElement, none, NK},
    {XS, "preserve", kTokenPreserve, none, D},
    {XS, "strip", kTokenStrip, none, D},

    // --- openings of expressions
    {D, "for $", kTokenForDollarSign, none, VN},
    {D, "let $", kTokenLetDollarSign, none, VN},
    {D, "some $", kTokenSomeDollarSign, none, VN},
    {D, "every $", kTokenEveryDollarSign, none, VN},
    {D, "if (", kTokenIfParenLeft, none, D},
    {D, "typeswitch (", kTokenTypeswitchParenLeft, none, D},
    {D, "validate {", kTokenValidateCurlyBraceLeft, O, D},
    {D, "validate lax {", kTokenValidateModeLax, O, D},
    {D, "validate strict {", kTokenValidateModeStrict, O, D},
    {D, "ordered {", kTokenOrderedCurlyBraceLeft, O, D},
    {D, "unordered {", kTokenUnorderedCurlyBraceLeft, O, D},
    {D, "element {", kTokenElementCurlyBraceLeft, O, D},
    {D, "element QNAME {", kTokenElementQNameCurlyBraceLeft, O, D},
    {D, "attribute {", kTokenAttributeCurlyBraceLeft, O, D},
    {D, "attribute QNAME {", kTokenAttributeQNameCurlyBraceLeft, O, D},
    {D, "document {", kTokenDocumentCurlyBraceLeft, O, D},
    {D, "text {", kTokenTextCurlyBraceLeft, O, D},
    {D, "comment {", kTokenCommentCurlyBraceLeft, O, D},
    {D, "processing-instruction {", kTokenPICurlyBraceLeft, O, D},
    {D, "processing-instruction NCNAME {", kTokenPINCNameCurlyBraceLeft, O, D},

    // --- kind tests
    {D, "attribute (", kTokenAttributeParenLeft, O, KT},
    {D, "schema-attribute (", kTokenSchemaAttributeParenLeft, O, KT},
    {D, "comment (", kTokenCommentParenLeft, O, KT},
    {D, "text (", kTokenTextParenLeft, O, KT},
    {D, "node (", kTokenNodeParenLeft, O, KT},
    {D, "document-node (", kTokenDocumentNodeParenLeft, O, KT},
    {D, "element (", kTokenElementParenLeft, O, KT},
    {D, "schema-element (", kTokenSchemaElementParenLeft, O, KT},
    {D, "processing-instruction (", kTokenProcessingInstructionParenLeft, O, PI},
    {IT, "attribute (", kTokenAttributeParenLeft, OI, KT},
    {IT, "schema-attribute (", kTokenSchemaAttributeParenLeft, OI, KT},
    {IT, "comment (", kTokenCommentParenLeft, OI, KT},
    {IT, "text (", kTokenTextParenLeft, OI, KT},
    {IT, "node (", kTokenNodeParenLeft, OI, KT},
    {IT, "document-node (", kTokenDocumentNodeParenLeft, OI, KT},
    {IT, "element (", kTokenElementParenLeft, OI, KT},
    {IT, "schema-element (", kTokenSchemaElementParenLeft, OI, KT},
    {IT, "processing-instruction (", kTokenProcessingInstructionParenLeft, OI, PI},
    {IT, "item ( )", kTokenItemParenLeftParenRight, none, OI},
    {IT, "empty ( )", kTokenEmptyParenLeftParenRight, none, O},
    {KT, "element (", kTokenElementParenLeft, KT, KT},
    {KT, "schema-element (", kTokenSchemaElementParenLeft, KT, KT},

    // --- function declarations
    {D, ") as", kTokenParenRightAs, none, IT},
    {O, ") as", kTokenParenRightAs, none, IT},

    // --- after an operand
    {O, "for $", kTokenForDollarSign, none, VN},
    {O, "let $", kTokenLetDollarSign, none, VN},
    {O, "instance of", kTokenInstanceOf, none, IT},
    {O, "treat as", kTokenTreatAs, none, IT},
    {O, "castable as", kTokenCastableAs, none, ST},
    {O, "cast as", kTokenCastAs, none, ST},
    {O, "case", kTokenCase, none, IT},
    {O, "as", kTokenAs, none, IT},
    {O, "then", kTokenThen, none, D},
    {O, "else", kTokenElse, none, D},
    {O, "external", kTokenExternal, none, D},
    {O, "and", kTokenAnd, none, D},
    {O, "or", kTokenOr, none, D},
    {O, "at", kTokenAt, none, D},
    {O, "div", kTokenDiv, none, D},
    {O, "idiv", kTokenIDiv, none, D},
    {O, "mod", kTokenMod, none, D},
    {O, "eq", kTokenEq, none, D},
    {O, "ne", kTokenNe, none, D},
    {O, "ge", kTokenGe, none, D},
    {O, "gt", kTokenGt, none, D},
    {O, "le", kTokenLe, none, D},
    {O, "lt", kTokenLt, none, D},
    {O, "except", kTokenExcept, none, D},
    {O, "intersect", kTokenIntersect, none, D},
    {O, "union", kTokenUnion, none, D},
    {O, "in", kTokenIn, none, D},
    {O, "is", kTokenIs, none, D},
    {O, "order by", kTokenOrderBy, none, D},
    {O, "stable order by", kTokenStableOrderBy, none, D},
    {O, "return", kTokenReturn, none, D},
    {O, "satisfies", kTokenSatisfies, none, D},
    {O, "to", kTokenTo, none, D},
    {O, "where", kTokenWhere, none, D},
    {O, "preserve", kTokenPreserve, none, D},
    {O, "strip", kTokenStrip, none, D},
    {O, "ordered", kTokenOrdered, none, D},
    {O, "unordered", kTokenUnordered, none, D},
    {O, "ascending", kTokenAscending, none, O},
    {O, "descending", kTokenDescending, none, O},
    {O, "empty greatest", kTokenEmptyGreatest, none, O},
    {O, "empty least", kTokenEmptyLeast, none, O},
    {O, "collation", kTokenCollation, none, O},
    {O, "default", kTokenDefault, none, O},
};

// The rows of each state by their first word.
using Index = std::unordered_map<std::string_view, std::vector<const XQueryPhrase*>>;

const Index& phrasesOfState(int state) {
  static const std::vector<Index> index = [] {
    std::vector<Index> result(XQueryStateCount);
    for (const XQueryPhrase& phrase : phrases) {
      const std::string_view words = phrase.words;
      result[static_cast<size_t>(phrase.state)][words.substr(0, words.find(' '))].push_back(
          &phrase);
    }
    return result;
  }();
  return index[static_cast<size_t>(state)];
}

bool isLetter(char character) {
  return (character >= 'a' && character <= 'z') || (character >= 'A' && character <= 'Z');
}

// Length of the name character at the start of `text`, 0 when there is none.
size_t nameCharacterLength(std::string_view text, bool first) {
  if (text.empty()) return 0;
  const auto byte = static_cast<unsigned char>(text[0]);
  if (byte < 0x80) {
    if (isLetter(text[0]) || byte == '_') return 1;
    const bool inside = (byte >= '0' && byte <= '9') || byte == '-' || byte == '.';
    return inside && !first ? 1 : 0;
  }
  // No name character lies outside the BMP.
  const size_t length = byte < 0xE0 ? 2 : 3;
  if (byte >= 0xF0 || text.size() < length) return 0;
  // A character is one of the inside of a name when a name of a letter and it is a name.
  const char16_t probe[] = {u'a', UTF8ToUnicode(text)};
  const bool valid =
      XQueryString::isNCName(first ? NSStringView(probe + 1, 1) : NSStringView(probe, 2));
  return valid ? length : 0;
}

// Where no names occur a keyword ends at what cannot go on in a word: "else-1" is "else", "-", "1".
bool isWordEnd(std::string_view rest, bool amongNames) {
  if (rest.empty()) return true;
  if (amongNames) return nameCharacterLength(rest, false) == 0;
  const auto byte = static_cast<unsigned char>(rest[0]);
  return byte < 0x80 && !isLetter(rest[0]) && !(byte >= '0' && byte <= '9') && byte != '_';
}

// Length of the pragma that starts with "(::"; the whole text when it does not end.
size_t pragmaLength(std::string_view text) {
  const size_t end = text.find("::)", 3);
  return end == std::string_view::npos ? text.size() : end + 3;
}

// Length of the comment that starts with "(:"; 0 when it does not end.
size_t commentLength(std::string_view text) {
  size_t depth = 0;
  WorkPacer pacer;
  for (size_t at = 0; at + 1 < text.size();) {
    pacer.turn();
    if (text[at] == '(' && text[at + 1] == ':') {
      if (depth > 0 && text.substr(at, 3) == "(::") {
        at += pragmaLength(text.substr(at));
        continue;
      }
      ++depth;
      at += 2;
    } else if (text[at] == ':' && text[at + 1] == ')') {
      at += 2;
      if (--depth == 0) return at;
    } else {
      ++at;
    }
  }
  return 0;
}

// Length of `word` at the start of `text`, 0 when it is not there.
size_t wordLength(std::string_view word, std::string_view text, bool amongNames,
                  XQueryPhraseMatch& match) {
  if (word == "QNAME" || word == "NCNAME") {
    const size_t length = word == "QNAME" ? XQueryQNameLength(text) : XQueryNCNameLength(text);
    match.name = text.substr(0, length);
    return length;
  }
  if (word == "QUOTE") {
    if (text.empty() || (text[0] != '"' && text[0] != '\'')) return 0;
    match.quote = text[0];
    return 1;
  }
  if (!text.starts_with(word)) return 0;
  if (word == "(" && text.starts_with("(:")) return 0;
  const bool isName = isLetter(word[0]);
  return !isName || isWordEnd(text.substr(word.size()), amongNames) ? word.size() : 0;
}

// The row at the start of `text`; its length is 0 when it does not match.
XQueryPhraseMatch matchPhrase(const XQueryPhrase& phrase, std::string_view text) {
  XQueryPhraseMatch match;
  match.phrase = &phrase;
  const bool amongNames = phrase.state != XQueryStateOPERATOR;
  std::string_view words = phrase.words;
  for (size_t at = 0;;) {
    const std::string_view word = words.substr(0, words.find(' '));
    const size_t length = wordLength(word, text.substr(at), amongNames, match);
    if (length == 0) return {};
    at += length;
    if (word.size() == words.size()) {
      match.length = at;
      return match;
    }
    words.remove_prefix(word.size() + 1);
    at += XQuerySkipLength(text.substr(at));
  }
}

// The first word of a run: a parenthesis, or letters and hyphens.
std::string_view firstWord(std::string_view text, bool amongNames) {
  if (text.starts_with(")")) return text.substr(0, 1);
  if (amongNames) return text.substr(0, XQueryNCNameLength(text));
  const auto end = std::find_if_not(text.begin(), text.end(), isLetter);
  return text.substr(0, static_cast<size_t>(end - text.begin()));
}

}  // namespace

XQueryPhraseMatch XQueryMatchPhrase(int state, std::string_view text) {
  const Index& index = phrasesOfState(state);
  const auto rows = index.find(firstWord(text, state != XQueryStateOPERATOR));
  XQueryPhraseMatch best;
  if (rows == index.end()) return best;
  for (const XQueryPhrase* phrase : rows->second) {
    const XQueryPhraseMatch match = matchPhrase(*phrase, text);
    if (match.length > best.length) best = match;
  }
  return best;
}

size_t XQueryNCNameLength(std::string_view text) {
  size_t length = nameCharacterLength(text, true);
  if (length == 0) return 0;
  WorkPacer pacer;
  while (const size_t next = nameCharacterLength(text.substr(length), false)) {
    pacer.turn();
    length += next;
  }
  return length;
}

size_t XQueryQNameLength(std::string_view text) {
  const size_t prefix = XQueryNCNameLength(text);
  if (prefix == 0 || prefix >= text.size() || text[prefix] != ':') return prefix;
  const size_t local = XQueryNCNameLength(text.substr(prefix + 1));
  return local == 0 ? prefix : prefix + 1 + local;
}

size_t XQueryNameLength(std::string_view text) {
  size_t length = XQueryNCNameLength(text);
  if (length == 0) return 0;
  WorkPacer pacer;
  while (length < text.size()) {
    pacer.turn();
    const size_t next = text[length] == ':' ? 1 : nameCharacterLength(text.substr(length), false);
    if (next == 0) break;
    length += next;
  }
  return length;
}

size_t XQuerySkipLength(std::string_view text) {
  size_t at = 0;
  while (at < text.size()) {
    if (const size_t run = XQWhiteSpaceRun(text.substr(at))) {
      at += run;
    } else if (text.substr(at, 2) == "(:" && text.substr(at, 3) != "(::") {
      const size_t length = commentLength(text.substr(at));
      if (length == 0) return at;
      at += length;
    } else {
      break;
    }
  }
  return at;
}

}  // namespace xquery
