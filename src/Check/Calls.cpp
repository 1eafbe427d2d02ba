// Built-in functions that answer otherwise than in XQuery 1.0 for the arguments that they are
// given.
#include "Check/Checking.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Functions/XQueryRegEx.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Number.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <string>
#include <string_view>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

// The call of one function, with as many arguments as it takes.
using Look = void (*)(XQueryChecking& checking, XQueryPlaceID call, std::string_view name);

void lookAtSubsequence(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* start = dyn_cast<NSNumber>(checking.literalIn(checking.argument(call, 1)));
  const XQueryPlaceID place = checking.argument(call, 1);
  // -1 is a sign and a number.
  const auto* sign = start ? nullptr : checking.inside<XQueryExpr>(place);
  const bool isNegative =
      sign && sign->kind() == Kind::OperatorExpr &&
      checking.leftOperand(checking.program.withoutParentheses(place)) == XQueryNoPlace &&
      checking.labelOf(place) == "-";
  if (checking.argumentCount(call) != 3 || (!isNegative && !(start && start->doubleValue() < 1))) {
    return;
  }
  checking.warn(call, ID::SubsequenceStart,
                {isNegative ? "a negative place" : checking.labelOf(place)});
}

void lookAtDeepEqual(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const XQueryFacts& first = checking.factsOf(checking.argument(call, 0));
  const XQueryFacts& second = checking.factsOf(checking.argument(call, 1));
  const auto holdsElements = [](const XQueryFacts& facts) {
    return facts.most > 0 && facts.are(Node) && facts.mayBe(Element | Document);
  };
  if (!holdsElements(first) || !holdsElements(second)) return;
  // With "and" behind or before it the attributes may be compared as well.
  const XQueryPlaceID whole = checking.at(call).parent;
  const auto* expr = checking.as<XQueryOperatorExpr>(whole);
  if (!expr || expr->operatorType() != XQueryOperatorAnd) checking.warn(call, ID::DeepEqual);
}

void lookAtIndexOf(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const XQueryFacts& sought = checking.factsOf(checking.argument(call, 1));
  if (sought.most > 0 && sought.are(Node)) checking.warn(call, ID::IndexOfNode);
}

void lookAtID(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  checking.warn(call, ID::FindsNothing, {std::string(name)});
}

void lookAtCollection(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  checking.warn(call, ID::AbsentFunction, {std::string(name), "doc() for each document"});
}

void lookAtExtreme(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const XQueryPlaceID items = checking.argument(call, 0);
  const XQueryFacts& facts = checking.factsOf(items);
  const bool adds = name == "sum" || name == "avg";
  if (facts.most > 0 && facts.are(URI)) {
    checking.warn(call, ID::AggregateOfURIs, {std::string(name)});
  } else if (adds && facts.most > 0 && facts.are(DateTime | Date | Time)) {
    checking.warn(call, ID::CallDiffers,
                  {std::string(name) + " of a date or time", "of one alone it is that one"});
  } else if (checking.givesUntypedText(items)) {
    checking.warn(
        call, ID::UntypedText,
        {std::string(checking.functionCalledIn(items)), "is a number for " + std::string(name)});
  }
}

void lookAtBaseURI(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const XQueryPlaceID node = checking.argument(call, 0);
  if (node == XQueryNoPlace) {
    checking.warn(call, ID::CallDiffers,
                  {"base-uri without an argument", "it gives that of the query, use base-uri(.)"});
    return;
  }
  const XQueryFacts& facts = checking.factsOf(node);
  if (facts.most > 0 && facts.are(Document)) checking.warn(call, ID::BaseURIOfDocument);
}

void lookAtNumber(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  if (const XQueryPlaceID items = checking.argument(call, 0); items != XQueryNoPlace) {
    const XQueryFacts& facts = checking.factsOf(items);
    if (facts.most > 0 && facts.least > 1) {
      checking.warn(call, ID::CallDiffers, {"number of several items", "it is NaN"});
    } else if (facts.most > 0 && facts.are(URI)) {
      checking.warn(call, ID::CallDiffers, {"number of a URI", "it fails, use string()"});
    }
  }
  const auto* text = checking.textIn(checking.argument(call, 0));
  if (!text) return;
  // Numbers begin with a sign, a digit or a point; what does not is NaN in both languages.
  const std::string written = text->utf8();
  const size_t first = written.find_first_not_of(" \t\r\n");
  if (first == written.npos) return;
  const std::string_view rest = std::string_view(written).substr(first);
  const size_t digit = rest.find_first_not_of("+-.");
  const bool begins =
      digit != rest.npos && digit < 3 && std::isdigit(static_cast<unsigned char>(rest[digit]));
  const size_t end = rest.find_first_not_of("0123456789+-.eE \t\r\n");
  if (!begins || end == rest.npos) return;
  checking.warn(call, ID::NumberFromFront, {checking.labelOf(checking.argument(call, 0))});
}

void lookAtNodeName(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  if (checking.argumentCount(call) > 0) return;
  checking.warn(call, ID::CallDiffers, {"node-name without an argument", "it gives nothing"});
}

void lookAtError(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const XQueryPlaceID code = checking.argument(call, 0);
  if (code == XQueryNoPlace) return;
  const XQueryFacts& facts = checking.factsOf(code);
  if (facts.most == 0 || facts.mayBe(QName | Other)) return;
  checking.warn(call, ID::CallDiffers, {"error of what is no QName", "its code is lost"});
}

// "en-US" matches "en-GB", the language alone being compared.
void lookAtLang(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* language = checking.textIn(checking.argument(call, 0));
  if (!language || language->view().find(u'-') == NSStringView::notFound) return;
  checking.warn(call, ID::CallDiffers,
                {"lang of a language with a region", "the language alone is compared"});
}

// Of what is known to hold both, and of no item that may be anything.
void lookAtDistinct(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const XQueryFacts& facts = checking.factsOf(checking.argument(call, 0));
  if (facts.most == 0 || facts.mayBe(Other)) return;
  if (!facts.are(Boolean | Numeric | String) || !facts.mayBe(Boolean) || !facts.mayBe(Numeric)) {
    return;
  }
  checking.warn(call, ID::CallDiffers,
                {std::string(name) + " of truth values and numbers", "true equals 1, false 0"});
}

// Of the two ordered durations there are only their own parts.
void lookAtDurationPart(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const bool isOfMonths = name.starts_with("years") || name.starts_with("months");
  const XQueryItemKinds other = isOfMonths ? DayTimeDuration : YearMonthDuration;
  const XQueryFacts& facts = checking.factsOf(checking.argument(call, 0));
  if (facts.most == 0 || !facts.are(other)) return;
  checking.warn(
      call, ID::CallDiffers,
      {std::string(name) + (isOfMonths ? " of a dayTimeDuration" : " of a yearMonthDuration"),
       "it fails, and is not 0"});
}

void lookAtDocument(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* location = checking.textIn(checking.argument(call, 0));
  if (!location || location->length() > 0) return;
  checking.warn(call, ID::CallDiffers,
                {"doc of the empty text", "it gives nothing, and not what is at the base URI"});
}

// Lengths and positions count UTF-16 units.
void lookAtUnits(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const auto* text = checking.textIn(checking.argument(call, 0));
  const auto isHalf = [](char16_t unit) { return (unit & 0xF800) == 0xD800; };
  uint32_t i = 0;
  while (text && i < text->length() && !isHalf(text->view()[i])) ++i;
  if (!text || i == text->length()) return;
  checking.warn(call, ID::CallDiffers,
                {std::string(name) + " with a character beyond U+FFFF", "it counts as two"});
}

void lookAtCodepoints(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* code = dyn_cast<NSNumber>(checking.literalIn(checking.argument(call, 0)));
  if (!code || code->doubleValue() != 0) return;
  checking.warn(call, ID::CallDiffers,
                {"codepoints-to-string of 0", "it gives U+0000, and not an error"});
}

void lookAtAbs(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* made = checking.inside<XQueryFunctionCall>(checking.argument(call, 0));
  if (!made || !made->builtIn()) return;
  const auto& row = made->builtIn()->row();
  if (row.namespaceID != XQueryNamespaceXS || row.localName != "negativeInteger") return;
  checking.warn(call, ID::CallDiffers, {"abs of xs:negativeInteger", "it fails, use xs:integer()"});
}

// In no namespace a name has no prefix, and no name holds white space.
void lookAtQName(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* URI = checking.literalIn(checking.argument(call, 0));
  const auto* URIText = dyn_cast<NSString>(URI);
  const auto* name = checking.textIn(checking.argument(call, 1));
  if (!name) return;
  const bool isNowhere = URI && (URI->kind() == Kind::Null || (URIText && URIText->length() == 0));
  const std::string written = name->utf8();
  const bool isWrong = written.empty() || written.find_first_of(" \t\r\n") != written.npos;
  if (!isWrong && !(isNowhere && written.find(':') != written.npos)) return;
  checking.warn(
      call, ID::CallDiffers,
      {"QName of " + checking.labelOf(checking.argument(call, 1)), "the name is not checked"});
}

void lookAtNormalForm(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* text = checking.textIn(checking.argument(call, 1));
  if (!text || text->length() == 0) return;
  constexpr std::array<std::string_view, 4> forms = {"NFC", "NFD", "NFKC", "NFKD"};
  const std::string written = text->utf8();
  if (std::find(forms.begin(), forms.end(), written) != forms.end()) return;
  checking.warn(call, ID::NormalForm, {checking.labelOf(checking.argument(call, 1))});
}

// Visits the places of a pattern's characters that are neither in classes nor behind backslashes.
template <class Visit>
void visitBareCharacters(std::string_view pattern, Visit visit) {
  bool isInClass = false;
  for (size_t i = 0; i < pattern.size(); ++i) {
    if (pattern[i] == '\\') {
      ++i;
    } else if (pattern[i] == '[') {
      isInClass = true;
    } else if (pattern[i] == ']') {
      isInClass = false;
    } else if (!isInClass) {
      visit(i);
    }
  }
}

// The groups of a pattern that take what they match.
size_t groupsIn(std::string_view pattern) {
  size_t count = 0;
  visitBareCharacters(pattern, [&](size_t i) {
    if (pattern[i] == '(' && !pattern.substr(i + 1).starts_with('?')) ++count;
  });
  return count;
}

// "$11" is the eleventh group in XQuery 1.0 where there are so many, and else, as it always is
// here, the first group and a 1.
std::string longReferenceIn(std::string_view replacement, size_t groups) {
  const auto isDigit = [&](size_t i) {
    return i < replacement.size() && replacement[i] >= '0' && replacement[i] <= '9';
  };
  for (size_t i = 0; i < replacement.size(); ++i) {
    if (replacement[i] == '\\') {
      ++i;
    } else if (replacement[i] == '$' && isDigit(i + 1) && isDigit(i + 2)) {
      const auto number = static_cast<size_t>(replacement[i + 1] - '0') * 10 +
                          static_cast<size_t>(replacement[i + 2] - '0');
      if (number > 9 && number <= groups) return std::string(replacement.substr(i, 3));
    }
  }
  return {};
}

void lookAtReplacement(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* pattern = checking.textIn(checking.argument(call, 1));
  const auto* replacement = checking.textIn(checking.argument(call, 2));
  if (!pattern || !replacement) return;
  const std::string found = longReferenceIn(replacement->utf8(), groupsIn(pattern->utf8()));
  if (found.empty()) return;
  checking.warn(call, ID::CallDiffers,
                {"replace with " + found, "it is group " + found.substr(1, 1) + " and a digit"});
}

void lookAtTokens(XQueryChecking& checking, XQueryPlaceID call, std::string_view) {
  const auto* text = checking.textIn(checking.argument(call, 0));
  if (!text || text->length() > 0) return;
  checking.warn(call, ID::CallDiffers, {"tokenize of the empty text", "it gives one token"});
}

// The first construct of a pattern that Perl reads otherwise; empty for none.
std::string otherConstructIn(std::string_view pattern) {
  bool isInClass = false;
  for (size_t i = 0; i < pattern.size(); ++i) {
    const std::string_view rest = pattern.substr(i);
    if (rest.starts_with('\\')) {
      for (const std::string_view escape : {"\\i", "\\I", "\\c", "\\C"}) {
        if (rest.starts_with(escape)) return std::string(escape);
      }
      if (rest.starts_with("\\p{Is") || rest.starts_with("\\P{Is")) {
        return std::string(rest.substr(0, rest.find('}')).substr(0, 40)) + "}";
      }
      ++i;
    } else if (isInClass && rest.starts_with("-[")) {
      return "-[";
    } else if (rest.starts_with('[')) {
      isInClass = true;
    } else if (rest.starts_with(']')) {
      isInClass = false;
    }
  }
  return {};
}

// Where white space is passed over, what stands behind "#" is, up to the end of its line.
bool hasComment(std::string_view pattern) {
  bool isThere = false;
  visitBareCharacters(pattern, [&](size_t i) { isThere = isThere || pattern[i] == '#'; });
  return isThere;
}

// Asks the engine itself. Compiling takes stack for each group, of which most patterns have few.
void checkPattern(XQueryChecking& checking, XQueryPlaceID call, std::string_view name,
                  const NSString& pattern) {
  constexpr uint32_t mostUnits = 500;
  if (pattern.length() > mostUnits) return;
  const std::string text = pattern.utf8();
  if (std::count(text.begin(), text.end(), '(') > 20) return;
  const size_t flagsIndex = name == "replace" ? 3 : 2;
  const bool hasFlags = checking.argumentCount(call) > flagsIndex;
  const auto* flags = checking.textIn(checking.argument(call, flagsIndex));
  if (hasFlags && !flags) return;
  const auto regEx = XQueryRegEx::regExp(pattern.view(), flags ? flags->view() : NSStringView());
  const std::string label = checking.labelOf(checking.argument(call, 1));
  if (!regEx) {
    checking.warn(call, ID::PatternFails, {label, "it or its flags are not well formed"});
  } else if (name != "matches" && XQueryIsTrue(regEx->hasMatch(NSString::empty().get()))) {
    checking.warn(call, ID::PatternFails,
                  {label, name == "replace" ? "replace fails where it matches no text"
                                            : "tokenize fails where it matches no text"});
  }
}

void lookAtPattern(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const auto* text = checking.textIn(checking.argument(call, 1));
  if (!text) return;
  const std::string pattern = text->utf8();
  std::string construct = otherConstructIn(pattern);
  const auto* flags = checking.textIn(checking.argument(call, name == "replace" ? 3 : 2));
  const bool isExtended = flags && flags->view().find(u'x') != NSStringView::notFound;
  if (construct.empty() && isExtended && hasComment(pattern)) construct = "#";
  if (construct.empty()) return checkPattern(checking, call, name, *text);
  checking.warn(call, ID::PatternDiffers, {construct});
}

// A step behind an axis step is asked for each node by itself.
void lookAtPosition(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  const XQueryPlaceID focus = checking.at(call).focus;
  if (focus == XQueryNoPlace || checking.at(focus).role != XQueryRole::Step) return;
  const auto* path = checking.as<XQueryPathExpr>(checking.at(focus).parent);
  const XQueryStep* before = path ? path->step() : nullptr;
  while (before && before->next() != checking.at(focus).step) before = before->next();
  if (before && isa<XQueryAxisStep>(before)) {
    checking.warn(call, ID::PositionInStep, {std::string(name)});
  }
}

// Which argument is a collation.
struct Collated {
  std::string_view name;
  size_t index;
};
constexpr auto collated = std::to_array<Collated>({
    {"compare", 2},
    {"starts-with", 2},
    {"ends-with", 2},
    {"contains", 2},
    {"substring-before", 2},
    {"substring-after", 2},
    {"index-of", 2},
    {"deep-equal", 2},
    {"distinct-values", 1},
    {"max", 1},
    {"min", 1},
});

void checkCollation(XQueryChecking& checking, XQueryPlaceID call, std::string_view name) {
  for (const Collated& row : collated) {
    if (row.name != name) continue;
    const XQueryPlaceID place = checking.argument(call, row.index);
    if (place == XQueryNoPlace) return;
    // The default one is that of code points, whatever is declared.
    if (checking.functionCalledIn(place) == "default-collation") return;
    const auto* text = checking.textIn(place);
    const std::string URI = text ? text->utf8() : std::string();
    if (XQueryIsCodepointCollation(URI)) return;
    checking.warn(place, ID::Collation, {checking.labelOf(place)});
  }
}

struct Row {
  std::string_view name;
  Look look;
};

constexpr auto rows = std::to_array<Row>({
    {"subsequence", lookAtSubsequence},
    {"deep-equal", lookAtDeepEqual},
    {"index-of", lookAtIndexOf},
    {"id", lookAtID},
    {"idref", lookAtID},
    {"collection", lookAtCollection},
    {"max", lookAtExtreme},
    {"min", lookAtExtreme},
    {"sum", lookAtExtreme},
    {"avg", lookAtExtreme},
    {"base-uri", lookAtBaseURI},
    {"number", lookAtNumber},
    {"node-name", lookAtNodeName},
    {"error", lookAtError},
    {"distinct-values", lookAtDistinct},
    {"lang", lookAtLang},
    {"normalize-unicode", lookAtNormalForm},
    {"years-from-duration", lookAtDurationPart},
    {"months-from-duration", lookAtDurationPart},
    {"days-from-duration", lookAtDurationPart},
    {"hours-from-duration", lookAtDurationPart},
    {"minutes-from-duration", lookAtDurationPart},
    {"seconds-from-duration", lookAtDurationPart},
    {"doc", lookAtDocument},
    {"string-length", lookAtUnits},
    {"substring", lookAtUnits},
    {"codepoints-to-string", lookAtCodepoints},
    {"abs", lookAtAbs},
    {"QName", lookAtQName},
    {"matches", lookAtPattern},
    {"replace", lookAtPattern},
    {"tokenize", lookAtPattern},
    {"replace", lookAtReplacement},
    {"tokenize", lookAtTokens},
    {"position", lookAtPosition},
    {"last", lookAtPosition},
});

}  // namespace

void XQueryCheckBuiltInCall(XQueryChecking& checking, XQueryPlaceID place) {
  const std::string_view name = checking.functionCalledIn(place);
  const auto* builtIn = checking.as<XQueryFunctionCall>(place)->builtIn();
  if (name.empty() || !builtIn->row().takes(checking.argumentCount(place))) return;
  for (const Row& row : rows) {
    if (row.name == name) row.look(checking, place, name);
  }
  checkCollation(checking, place, name);
}

}  // namespace xquery
