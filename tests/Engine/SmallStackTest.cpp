// Threads with little stack: a result or an error, whatever is asked of them.
#include "Engine/LimitsTestSupport.h"
#include "Platform/Base/StackTestSupport.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <unistd.h>

namespace xquery {
namespace {

using limitstest::evaluate;
using limitstest::Outcome;

constexpr size_t kibibyte = 1024;
constexpr const char* tooDeep = "limit: expression nested too deeply";

// Stacks that a host may give its threads.
#ifdef XQUERY_SANITIZED
constexpr size_t sizes[] = {1024 * kibibyte};
#else
constexpr size_t sizes[] = {64 * kibibyte, 96 * kibibyte, 160 * kibibyte};
#endif

std::string repeated(const std::string& text, size_t count) {
  std::string result;
  for (size_t i = 0; i < count; ++i) result += text;
  return result;
}

// What a query comes to, on a thread with a stack of that size; its error if there is one.
std::string outcomeOn(size_t size, const std::string& query) {
  Outcome outcome;
  onStack(size, [&] {
    const auto context = XQueryContext::xqueryContext();
    outcome = evaluate(*context, query);
  });
  return outcome.error.empty() ? outcome.result : outcome.error;
}

// A function that does the work at every level, down to the end of the stack.
std::string downWith(const std::string& work) {
  return "declare namespace x = 'http://libxquery.example/xquery/2004/10/functions'; declare "
         "function local:f($n) { (" +
         work + ", local:f($n + 1)) }; local:f(1)";
}

TEST(SmallStack, PlainWorkNeedsLittle) {
  for (const size_t size : sizes) {
    EXPECT_EQ(outcomeOn(size, "1 + 1"), "2") << size;
    EXPECT_EQ(outcomeOn(size, "string(<a>{ for $x in 1 to 3 order by -$x return $x }</a>)"),
              "3 2 1")
        << size;
    EXPECT_EQ(outcomeOn(size, "tokenize('a b', ' ')"), "a b") << size;
  }
}

TEST(SmallStack, TextNestedDeeplyIsAnErrorOfParsingBindingOrEvaluating) {
  constexpr size_t depth = 3000;
  const std::string queries[] = {
      repeated("(", depth) + "1" + repeated(")", depth),
      repeated("<a>", depth) + repeated("</a>", depth),
      repeated("<a>{", depth) + repeated("}</a>", depth),
      repeated("if (1) then 1 else ", depth) + "1",
      repeated("1 + (", depth) + "1" + repeated(")", depth),
      repeated("for $x in 1 return ", depth) + "1",
      repeated("a[", depth) + "1" + repeated("]", depth),
      repeated("count(", depth) + "1" + repeated(")", depth),
      repeated("a/", depth) + "a",
      repeated("-", depth) + "1",
  };
  for (const size_t size : sizes) {
    for (const std::string& query : queries) {
      // Neither a crash nor a hang; what it is depends on the size.
      const std::string outcome = outcomeOn(size, query);
      EXPECT_LT(outcome.size(), 100000U) << query.substr(0, 20);
    }
  }
}

TEST(SmallStack, WorkOfEveryKindAtItsEndIsAnError) {
  const std::string works[] = {
      "matches('abc', '(a|b)*c')",
      "replace('abc', '((b)|(c))+', 'x')",
      "normalize-unicode('abc'), upper-case('abc'), string(current-dateTime())",
      "xs:double('1e5'), 1.5 * 99999999999999999999, 10 div 3",
      "x:eval('1 + 1')",
      "count(x:node-from-string('<a><b>x</b></a>')//b)",
      "deep-equal(<a><b/></a>, <a><b/></a>), string(<a b='{ $n }'>{ $n }</a>)",
      "resolve-uri('a/../b', 'http://x/y'), distinct-values((1, 2, 1)), tokenize('a b', ' ')",
      "(for $x in ($n, 1) order by $x return $x), (some $x in 1 to 3 satisfies $x = 2)",
      "count(doc('file:///nonexistent'))",
  };
  for (const size_t size : sizes) {
    for (const std::string& work : works) {
      EXPECT_EQ(outcomeOn(size, downWith(work)), tooDeep) << size << " " << work;
    }
  }
}

TEST(SmallStack, ADocumentFromAFileIsReadOrAnError) {
  const std::string path = (std::filesystem::temp_directory_path() /
                            ("small-stack-" + std::to_string(getpid()) + ".xml"))
                               .string();
  std::ofstream(path) << "<a><b/></a>";
  for (const size_t size : sizes) {
    const std::string outcome = outcomeOn(size, "count(doc('file://" + path + "')//b)");
    EXPECT_TRUE(outcome == "1" || outcome == tooDeep) << size << " " << outcome;
    EXPECT_EQ(outcomeOn(size, downWith("count(doc(concat('file://" + path + "?', $n))//b)")),
              tooDeep)
        << size;
  }
  std::filesystem::remove(path);
}

TEST(SmallStack, AStreamIsReadOrAnError) {
  constexpr size_t depth = 1000;
  const std::string documents[] = {
      "<a>" + repeated("<b>1</b>", 1000) + "</a>",
      "<a><b>" + repeated("<c>", depth) + repeated("</c>", depth) + "</b></a>",
      "<!DOCTYPE a [<!ENTITY e 'x'>]><a><b>&e;</b></a>",
  };
  const auto query = XQuery::xqueryWithSource("for $b in /a/b return string($b)", XQueryLoading(),
                                              XQueryLimits(), XQueryWay::Streamed);
  for (const size_t size : sizes) {
    for (const std::string& document : documents) {
      onStack(size, [&] {
        XQueryStreamInput input;
        input.read = [left = std::string_view(document)](char* buffer, size_t most) mutable {
          const size_t count = left.copy(buffer, std::min(most, size_t{100}));
          left.remove_prefix(count);
          return static_cast<ptrdiff_t>(count);
        };
        XQueryStreamFailure failure;
        size_t items = 0;
        const auto receive = [&](const Value&) { return ++items > 0; };
        const bool isComplete =
            XQueryContext::xqueryContext()->evaluateStream(*query, {}, input, receive, failure);
        EXPECT_TRUE(isComplete ? items > 0 : failure.error || !failure.reading.message.empty())
            << size << " " << document.substr(0, 20);
      });
    }
  }
}

TEST(SmallStack, APatternOfManyGroupsIsCompiledOrAnError) {
  const std::string query = "matches('a', '" + repeated("(", 249) + "a" + repeated(")", 249) + "')";
  for (const size_t size : sizes) {
    const std::string outcome = outcomeOn(size, query);
    EXPECT_TRUE(outcome == "true" || outcome == tooDeep) << size << " " << outcome;
  }
  EXPECT_EQ(outcomeOn(1024 * kibibyte, query), "true");
}

// What a host nests is given back without recursion.
// A chain of them is one condition, however long it is.
TEST(SmallStack, AnyNumberOfConditionsIsAskedOfANode) {
  constexpr size_t count = 10'000;
  const std::string queries[] = {
      "count(<r><a x='7'/></r>//a[@x != '5'" + repeated(" and @x != '5'", count) + "])",
      "count(<r><a x='7'/></r>//a[@x = '5'" + repeated(" or @x = '5'", count) + " or @x])",
      "count(<r><a/></r>//*[name() = 'b'" + repeated(" or name() = 'b'", count) + " or not(@x)])",
      "let $l := <r><a x='7'/></r>/a for $a in $l return count($l[@x != '5'" +
          repeated(" and @x != '5'", count) + "])",
  };
  for (const size_t size : sizes) {
    for (const std::string& query : queries) {
      EXPECT_EQ(outcomeOn(size, query), "1") << size << " " << query.substr(0, 40);
    }
  }
}

TEST(SmallStack, ValuesNestedDeeplyAreGivenBack) {
  for (const size_t size : sizes) {
    onStack(size, [] {
      Value nested = NSNull::null();
      for (int i = 0; i < 100000; ++i) nested = NSArray::arrayWithObjects({nested});
      const auto query = XQuery::xqueryWithSource(repeated("(", 100) + "1" + repeated(")", 100));
      nested = Value();
    });
  }
}

}  // namespace
}  // namespace xquery
