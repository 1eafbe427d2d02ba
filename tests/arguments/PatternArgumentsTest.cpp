// matches, replace and tokenize. The texts among the samples hold few characters that mean
// something in a pattern, so that a small reading of patterns is enough here. Pieces and replaced
// texts are plain, hence untyped; only the piece of nothing is a string.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <cctype>
#include <optional>
#include <utility>

namespace xquery::arguments {
namespace {

// A pattern of characters, of "." for any, of "?" after what may be missing, and of "$" for the
// end.
class Pattern {
 public:
  // Nothing for flags that there are not.
  static std::optional<Pattern> with(const std::string& text, const std::string& flags) {
    if (flags.find_first_not_of("imsx") != flags.npos) return std::nullopt;
    return Pattern(text, flags.find('i') != flags.npos);
  }

  // The first match from there on, as the places of its start and end.
  std::optional<std::pair<size_t, size_t>> find(const std::string& text, size_t from) const {
    for (size_t start = from; start <= text.size(); ++start) {
      const size_t end = matchedTo(text, start, 0);
      if (end != std::string::npos) return std::pair(start, end);
    }
    return std::nullopt;
  }

 private:
  Pattern(std::string text, bool ignoresCase) : _text(std::move(text)), _ignoresCase(ignoresCase) {}

  bool isOne(char c, char wanted) const {
    if (wanted == '.' || c == wanted) return true;
    return _ignoresCase && std::isalpha(c) && std::isalpha(wanted) && (c | 32) == (wanted | 32);
  }

  size_t matchedTo(const std::string& text, size_t at, size_t place) const {
    if (place == _text.size()) return at;
    if (_text[place] == '$') {
      return at == text.size() ? matchedTo(text, at, place + 1) : std::string::npos;
    }
    const bool isOptional = place + 1 < _text.size() && _text[place + 1] == '?';
    const size_t next = place + (isOptional ? 2 : 1);
    size_t end = std::string::npos;
    if (at < text.size() && isOne(text[at], _text[place])) end = matchedTo(text, at + 1, next);
    return end == std::string::npos && isOptional ? matchedTo(text, at, next) : end;
  }

  std::string _text;
  bool _ignoresCase;
};

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
    const bool isNoFlag = call.count() > plain && !Pattern::with("", texts[plain]);
    if (isNoFlag) call.orRefused();
    if (texts[0].empty()) call.orElse("9 ");
  }
  attempt.finish();
  texts.resize(4);
  return {texts[0], texts[1], plain == 3 ? texts[2] : "", texts[plain]};
}

// The whole matches of the text, as places; refused when one of them is empty.
std::vector<std::pair<size_t, size_t>> places(const std::string& text, const Pattern& pattern) {
  std::vector<std::pair<size_t, size_t>> all;
  size_t from = 0;
  while (const auto place = pattern.find(text, from)) {
    if (place->second == from) throw Refused();
    all.push_back(*place);
    from = place->second;
  }
  return all;
}

Sequence matches(const Call& call) {
  const Texts texts = read(call, 2);
  const auto pattern = Pattern::with(texts.pattern, texts.flags);
  if (!pattern) throw Refused();
  return one(boolean(pattern->find(texts.input, 0).has_value()));
}

Sequence tokenize(const Call& call) {
  const Texts texts = read(call, 2);
  if (texts.input.empty()) return one(string(""));
  const auto pattern = Pattern::with(texts.pattern, texts.flags);
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
  const auto pattern = Pattern::with(texts.pattern, texts.flags);
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
