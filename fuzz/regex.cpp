// Regular expressions with their input. The first line is the flags, the second the pattern, the
// third the replacement and the rest the text. Whatever they are, the three functions say of the
// same matches what they are, what is between them and what the text is without them or with
// something else in their places; those of the language answer the same; and no search takes longer
// than its limit.
#include "Functions/XQueryRegEx.h"
#include "support/Failure.h"
#include "support/Input.h"
#include "xquery/xquery.h"

#include <chrono>
#include <ctime>
#include <string>
#include <vector>

using namespace xquery;
using namespace xquery::fuzz;

namespace {

using Texts = std::vector<std::string>;

// The time limit of an evaluation, and what this thread may work before it is over: many times as
// long, since the sanitizers make everything slow.
constexpr std::chrono::milliseconds limit(100);
constexpr double mostSeconds = 4;

double workedSeconds() {
  timespec now{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
  return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9;
}

// The strings of a result; none for the empty sequence.
Texts textsOf(const Value& value) {
  Texts texts;
  if (const auto* array = dyn_cast<NSArray>(value)) {
    for (const Value& each : array->objects()) texts.push_back(cast<NSString>(each)->utf8());
  } else if (const auto* string = dyn_cast<NSString>(value)) {
    texts.push_back(string->utf8());
  }
  return texts;
}

std::string shown(const Texts& texts) {
  std::string all;
  for (const std::string& text : texts) all += "[" + text + "]";
  return all;
}

// The pieces between the matches, and the matches in turn, are the text.
void checkPieces(const XQueryRegEx& regEx, const NSString& text) {
  const Value matches = regEx.matches(&text);
  const Value pieces = regEx.tokenize(&text);
  check(!matches == !pieces, "matches that fail, and pieces that do not", text.utf8());
  if (!matches) return;
  const Texts found = textsOf(matches);
  const Texts between = textsOf(pieces);
  const std::string both = shown(found) + " " + shown(between);
  check(between.size() == found.size() + 1, "pieces and matches do not alternate", both);
  std::string whole;
  for (size_t i = 0; i < between.size(); ++i) {
    whole += between[i] + (i < found.size() ? found[i] : "");
  }
  checkEqual(whole, text.utf8(), "the pieces and matches are not the text");
  const bool hasMatch = cast<NSNumber>(regEx.hasMatch(&text))->boolValue();
  check(hasMatch == !found.empty(), "a match to one of them", both);
  const Value same = regEx.replace(&text, NSStringView::ascii("$0"));
  check(same && cast<NSString>(same)->isEqualToString(text), "replaced by itself it changes", both);
  const Value without = regEx.replace(&text, NSStringView());
  std::string rest;
  for (const std::string& piece : between) rest += piece;
  checkEqual(cast<NSString>(without)->utf8(), rest, "replaced by nothing");
}

// What stands in the place of a match: not known where it refers to groups, and none where it is no
// replacement.
enum class Expansion { Text, None, Unknown };
Expansion expand(const std::string& replacement, const std::string& match, std::string& out) {
  bool refersToGroups = false;
  for (size_t at = 0; at < replacement.size(); ++at) {
    const char byte = replacement[at];
    const char follower = at + 1 < replacement.size() ? replacement[at + 1] : '\0';
    const bool isEscaped = byte == '\\' && (follower == '\\' || follower == '$');
    const bool isGroup = byte == '$' && follower >= '0' && follower <= '9';
    if (byte != '\\' && byte != '$') {
      out += byte;
    } else if (!isEscaped && !isGroup) {
      return Expansion::None;
    } else {
      refersToGroups = refersToGroups || (isGroup && follower != '0');
      out += isGroup ? match : std::string(1, follower);
      ++at;
    }
  }
  return refersToGroups ? Expansion::Unknown : Expansion::Text;
}

// Each match is replaced, and nothing else.
void checkReplaced(const XQueryRegEx& regEx, const NSString& text, const NSString& replacement) {
  const Value matches = regEx.matches(&text);
  if (!matches) return;
  const Texts found = textsOf(matches);
  const Texts between = textsOf(regEx.tokenize(&text));
  std::string expected = between.front();
  Expansion expansion = Expansion::Text;
  for (size_t i = 0; i < found.size() && expansion == Expansion::Text; ++i) {
    expansion = expand(replacement.utf8(), found[i], expected);
    expected += between[i + 1];
  }
  if (expansion == Expansion::Unknown) return;
  const Value replaced = regEx.replace(&text, replacement.view());
  check(!replaced == (expansion == Expansion::None), "a replacement to one of them",
        replacement.utf8());
  if (replaced) checkEqual(cast<NSString>(replaced)->utf8(), expected, "replaced otherwise");
}

// --- through queries -----------------------------------------------------------------------------

Ref<XQuery> queryOf(std::string_view call) {
  return XQuery::xqueryWithSource(
      "declare variable $s external; declare variable $p external; declare variable $r external;"
      "declare variable $f external;" +
      std::string(call));
}

struct Answer {
  Texts items;
  bool isError = false;
  bool isLimit = false;
};

Answer answerOf(const XQuery& query, const XQueryVariables& constants) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = limit;
  context->contextSetLimits(limits);
  const double before = workedSeconds();
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(query, constants, {}, &error);
  check(items || error, "neither a value nor an error");
  check(workedSeconds() - before < mostSeconds, "a search far beyond its limit");
  Answer answer;
  answer.isError = error != nullptr;
  answer.isLimit = error && error->category() == XQueryErrorCategory::Limit;
  for (size_t i = 0; items && i < items->count(); ++i) {
    answer.items.push_back(XQueryItemStringValue(*items->objectAtIndex(i)));
  }
  return answer;
}

// A function of the language answers what the expression does, and is an error where that is none.
void checkCall(const Answer& answer, const Value& direct, const char* function) {
  check(answer.isError == !direct, "an error to one of them", function);
  if (direct) checkEqual(shown(answer.items), shown(textsOf(direct)), function);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  static const auto matches = queryOf("string(matches($s, $p, $f))");
  static const auto tokenize = queryOf("tokenize($s, $p, $f)");
  static const auto replace = queryOf("replace($s, $p, $r, $f)");
  Input input(data, size);
  const auto flags = NSString::stringWithUTF8Replacing(input.line());
  const auto pattern = NSString::stringWithUTF8Replacing(input.line());
  const auto replacement = NSString::stringWithUTF8Replacing(input.line());
  const auto text = NSString::stringWithUTF8Replacing(input.rest());
  const XQueryVariables constants = {{"s", text}, {"p", pattern}, {"r", replacement}, {"f", flags}};
  const Answer hasMatch = answerOf(*matches, constants);
  const Answer pieces = answerOf(*tokenize, constants);
  const Answer replaced = answerOf(*replace, constants);
  if (hasMatch.isLimit || pieces.isLimit || replaced.isLimit) return 0;
  const auto regEx = XQueryRegEx::regExp(pattern->view(), flags->view());
  check(hasMatch.isError == !regEx, "a pattern to one of them", pattern->utf8());
  if (!regEx) return 0;
  checkEqual(shown(hasMatch.items),
             cast<NSNumber>(regEx->hasMatch(text.get()))->boolValue() ? "[true]" : "[false]",
             "matches");
  checkCall(replaced, regEx->replace(text.get(), replacement->view()), "replace");
  // No text has no pieces to the function but itself.
  if (text->length() > 0) checkCall(pieces, regEx->tokenize(text.get()), "tokenize");
  checkPieces(*regEx, *text);
  checkReplaced(*regEx, *text, *replacement);
  return 0;
}
