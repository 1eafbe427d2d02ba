// matches, replace and tokenize. The texts among the samples hold few characters that mean
// something in a pattern, so that a small reading of patterns is enough here. Pieces and replaced
// texts are plain, hence untyped; only the piece of nothing is a string.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <regex>

namespace xquery::arguments {
namespace {

// The pattern with its flags, of ASCII characters; null for flags that there are not. "x" has no
// meaning for the patterns used with it.
std::optional<std::regex> compiled(const std::string& pattern, const std::string& flags) {
  auto options = std::regex::ECMAScript;
  for (const char flag : flags) {
    if (std::string_view("imsx").find(flag) == std::string_view::npos) return std::nullopt;
    if (flag == 'i') options |= std::regex::icase;
  }
  return std::regex(pattern, options);
}

struct Texts {
  std::string input;
  std::string pattern;
  std::string replacement;
  std::string flags;
};

Texts read(const Call& call, size_t plain) {
  Attempts attempt;
  std::vector<std::string> texts;
  for (size_t i = 0; i < call.count(); ++i) {
    texts.push_back(attempt([&] { return stringOf(call[i]); }));
  }
  if (attempt.haveFailed()) {
    // What makes the answer certain may come first.
    const bool isNoFlag = call.count() > plain && !compiled("a", texts[plain]);
    if (isNoFlag) call.orRefused();
    if (texts[0].empty()) call.orElse("9 ");
  }
  attempt.finish();
  texts.resize(4);
  return {texts[0], texts[1], plain == 3 ? texts[2] : "", texts[plain]};
}

// The whole matches of the text, as places; refused when one of them is empty.
std::vector<std::pair<size_t, size_t>> places(const std::string& text, const std::regex& pattern) {
  std::vector<std::pair<size_t, size_t>> all;
  size_t from = 0;
  std::smatch match;
  while (
      std::regex_search(text.begin() + static_cast<ptrdiff_t>(from), text.end(), match, pattern)) {
    const size_t start = from + static_cast<size_t>(match.position());
    const size_t end = start + static_cast<size_t>(match.length());
    if (end == from) throw Refused();
    all.emplace_back(start, end);
    from = end;
  }
  return all;
}

Sequence matches(const Call& call) {
  const Texts texts = read(call, 2);
  const auto pattern = compiled(texts.pattern, texts.flags);
  if (!pattern) throw Refused();
  return one(boolean(std::regex_search(texts.input, *pattern)));
}

Sequence tokenize(const Call& call) {
  const Texts texts = read(call, 2);
  if (texts.input.empty()) return one(string(""));
  const auto pattern = compiled(texts.pattern, texts.flags);
  if (!pattern) throw Refused();
  Sequence pieces;
  size_t from = 0;
  for (const auto& [start, end] : places(texts.input, *pattern)) {
    pieces.push_back(untyped(texts.input.substr(from, start - from)));
    from = end;
  }
  pieces.push_back(untyped(texts.input.substr(from)));
  return pieces;
}

// What the replacement stands for; only "$1" among the samples is more than itself, and no pattern
// has a group.
std::string expanded(const std::string& replacement) {
  return replacement == "$1" ? "" : replacement;
}

Sequence replace(const Call& call) {
  const Texts texts = read(call, 3);
  const auto pattern = compiled(texts.pattern, texts.flags);
  if (!pattern) throw Refused();
  std::string result;
  size_t from = 0;
  for (const auto& [start, end] : places(texts.input, *pattern)) {
    result += texts.input.substr(from, start - from) + expanded(texts.replacement);
    from = end;
  }
  return one(untyped(result + texts.input.substr(from)));
}

}  // namespace

const std::vector<Function>& patternFunctions() {
  static const std::vector<Function> functions = {
      {"fn:matches", 2, 3, matches},
      {"fn:tokenize", 2, 3, tokenize},
      {"fn:replace", 3, 4, replace},
  };
  return functions;
}

TEST(PatternArguments, EndAsTheRulesSay) {
  expectRules(patternFunctions());
}

}  // namespace xquery::arguments
