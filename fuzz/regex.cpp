// Regular expressions with their input. The first line is the flags, the second the pattern, the
// third the replacement and the rest the text. Whatever they are, the three functions say of the
// same matches what they are, what is between them and what the text is without them; and no
// search takes longer than its limit.
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

const XQuery& query() {
  static const auto compiled = XQuery::xqueryWithSource(
      "declare variable $s external; declare variable $p external; declare variable $r external;"
      "declare variable $f external;"
      "(matches($s, $p, $f), tokenize($s, $p, $f), replace($s, $p, $r, $f))");
  return *compiled;
}

// Answers whether a limit was reached.
bool isEvaluatedWithinLimits(const XQueryVariables& constants) {
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = limit;
  context->contextSetLimits(limits);
  const double before = workedSeconds();
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(query(), constants, {}, &error);
  check(items || error, "neither a value nor an error");
  check(workedSeconds() - before < mostSeconds, "a search far beyond its limit");
  return !error || error->category() != XQueryErrorCategory::Limit;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const auto flags = NSString::stringWithUTF8Replacing(input.line());
  const auto pattern = NSString::stringWithUTF8Replacing(input.line());
  const auto replacement = NSString::stringWithUTF8Replacing(input.line());
  const auto text = NSString::stringWithUTF8Replacing(input.rest());
  const XQueryVariables constants = {{"s", text}, {"p", pattern}, {"r", replacement}, {"f", flags}};
  if (!isEvaluatedWithinLimits(constants)) return 0;
  const auto regEx = XQueryRegEx::regExp(pattern->view(), flags->view());
  if (regEx) checkPieces(*regEx, *text);
  return 0;
}
