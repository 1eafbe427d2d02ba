#include "FunctionBench.h"

#include "Engine.h"
#include "ProcessorTime.h"

#include <algorithm>
#include <cstdio>
#include <iterator>
#include <limits>
#include <stdexcept>
#include <string>
#include <vector>

namespace bench {
namespace {

using namespace xquery;

constexpr int sizes[] = {10, 100, 1000, 10000, 100000, 1000000};
constexpr const char* prolog =
    "declare variable $text external; declare variable $wide external; "
    "declare variable $same external; declare variable $part external; "
    "declare variable $list external; declare variable $words external; "
    "declare variable $others external; declare variable $numbers external; ";

struct FunctionRow {
  const char* name;
  const char* query;
};

// `text` and `wide` are one text in ASCII and beyond it; `list` is the words with commas between.
constexpr FunctionRow rows[] = {
    {"contains", "contains($text, 'nowhere')"},
    {"contains, wide", "contains($wide, 'nowhere')"},
    {"contains, hostile pattern", "contains($same, $part)"},
    {"starts-with", "starts-with($text, $text)"},
    {"substring", "substring($text, 2)"},
    {"substring-after", "substring-after($text, 't')"},
    {"concat", "concat($text, $text)"},
    {"concat, wide", "concat($text, $wide)"},
    {"string-join", "string-join($words, ', ')"},
    {"translate", "translate($text, 'abc', 'AB')"},
    {"translate, wide", "translate($wide, 'abc', 'AB')"},
    {"normalize-space", "normalize-space($text)"},
    {"upper-case", "upper-case($text)"},
    {"upper-case, wide", "upper-case($wide)"},
    {"normalize-unicode, wide", "normalize-unicode($wide, 'NFD')"},
    {"string-to-codepoints", "string-to-codepoints($text)"},
    {"tokenize", "tokenize($list, ',')"},
    {"replace", "replace($list, '[0-9]+', '#')"},
    {"matches, constant pattern", "$words[matches(., '^[a-z]+[0-9]+$')]"},
    {"distinct-values", "distinct-values($words)"},
    {"distinct-values, integers", "distinct-values($numbers)"},
    {"sum", "sum($numbers)"},
    {"index-of", "index-of($words, 'nowhere')"},
    {"deep-equal", "deep-equal($words, $others)"},
};

Value integersUpTo(int last) {
  const auto query = compile("1 to " + std::to_string(last));
  return XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {});
}

XQueryVariables inputsOfSize(int size) {
  const auto count = static_cast<size_t>(size);
  std::u16string wide;
  std::string list;
  std::vector<Value> words, others;
  for (int index = 0; index < size; ++index) {
    wide += u"some t\u00E9xt"[index % 9];
    const std::string word = "word" + std::to_string(index);
    list += (index ? "," : "") + word;
    words.push_back(NSString::stringWithUTF8(word));
    others.push_back(NSString::stringWithUTF8(word));
  }
  std::string text;
  for (const char16_t unit : wide) text += unit < 0x80 ? static_cast<char>(unit) : 'e';
  return {{"text", NSString::stringWithUTF8(text)},
          {"wide", NSString::stringWithUTF16(wide)},
          {"same", NSString::stringWithUTF8(std::string(count, 'a'))},
          {"part", NSString::stringWithUTF8(std::string(count / 2, 'a') + "b")},
          {"list", NSString::stringWithUTF8(list)},
          {"words", NSArray::arrayWithObjects(std::move(words))},
          {"others", NSArray::arrayWithObjects(std::move(others))},
          {"numbers", integersUpTo(size)}};
}

// The best of several evaluations, in nanoseconds.
double timeOf(const XQuery& query, const XQueryVariables& constants) {
  const auto context = XQueryContext::xqueryContext();
  const double end = processorSeconds() + 0.05;
  double best = std::numeric_limits<double>::infinity();
  for (int run = 0; run < 5 || processorSeconds() < end; ++run) {
    const double start = processorSeconds();
    evaluate(*context, query, {}, constants);
    best = std::min(best, processorSeconds() - start);
  }
  return best * 1e9;
}

void printHeader() {
  std::printf("%-28s", "ns per item of");
  for (const int size : sizes) std::printf("%10d", size);
  std::printf("  last tenfold\n");
}

}  // namespace

int reportFunctions() {
  constexpr double mostGrowth = 50;
  std::vector<std::vector<double>> times(std::size(rows));
  for (const int size : sizes) {
    const XQueryVariables inputs = inputsOfSize(size);
    for (size_t row = 0; row < std::size(rows); ++row) {
      const auto query = compile(std::string(prolog) + rows[row].query);
      try {
        times[row].push_back(timeOf(*query, inputs));
      } catch (const std::runtime_error& error) {
        std::printf("%s: %s\n", rows[row].name, error.what());
        times[row].push_back(std::numeric_limits<double>::infinity());
      }
    }
  }
  printHeader();
  bool proportional = true;
  for (size_t row = 0; row < std::size(rows); ++row) {
    std::printf("%-28s", rows[row].name);
    for (size_t i = 0; i < std::size(sizes); ++i) std::printf("%10.2f", times[row][i] / sizes[i]);
    const double growth = times[row].back() / times[row].end()[-2];
    std::printf("%13.1f\n", growth);
    proportional = proportional && growth <= mostGrowth;  // nor is what failed
  }
  return proportional ? 0 : 1;
}

}  // namespace bench
