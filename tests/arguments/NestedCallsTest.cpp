// Calls in calls, at random but the same each time: whatever comes out of one function goes into
// another, and the end is a value or an error that says what is wrong.
#include "arguments/Driver.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryString.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <memory>
#include <random>

namespace xquery::arguments {
namespace {

class Silence : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {}
};

std::vector<const Function*> everyFunction() {
  std::vector<const Function*> functions;
  for (const auto* family : families()) {
    for (const Function& function : *family) functions.push_back(&function);
  }
  return functions;
}

Value asType(XQueryTypeID type, const std::string& text) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  return XQueryCastAs(XQueryString::stringWithString(*NSString::stringWithUTF8(text)), type,
                      *context);
}

// Beside the samples what is long, large, or in a shape that only a host can give.
const std::vector<std::pair<std::string, Value>>& values() {
  static const std::vector<std::pair<std::string, Value>> all = [] {
    std::vector<std::pair<std::string, Value>> list;
    for (const Sample& sample : samples()) list.emplace_back(sample.name, sample.value);
    const Value one = sampleNamed("42 '12'").value;
    list.emplace_back("no items", NSArray::array());
    list.emplace_back("one item", NSArray::arrayWithObjects({one}));
    list.emplace_back("one node", NSArray::arrayWithObjects({sampleNamed("p:e").value}));
    list.emplace_back("many", NSArray::arrayWithObjects(std::vector<Value>(2000, one)));
    list.emplace_back("long text", asType(9, std::string(20000, 'a') + "b"));
    list.emplace_back("wide text", asType(9, std::string(5000, 'a') + "\U0001F600\u00e9"));
    list.emplace_back("large", asType(42, "9223372036854775807"));
    list.emplace_back("small", asType(42, "-9223372036854775808"));
    list.emplace_back("larger", asType(42, "1" + std::string(400, '0')));
    list.emplace_back("tiny", asType(13, "0." + std::string(400, '0') + "1"));
    list.emplace_back("largest", asType(11, "1.7976931348623157e308"));
    list.emplace_back("far year", asType(21, "999999-12-31T23:59:59.999Z"));
    list.emplace_back("long duration", asType(29, "P99999999999D"));
    list.emplace_back("many months", asType(28, "-P999999999Y"));
    list.emplace_back("far zone", asType(23, "00:00:00-99:99"));
    for (const auto& [name, value] : list) EXPECT_TRUE(value) << name;
    return list;
  }();
  return all;
}

class Generator {
 public:
  explicit Generator(uint32_t seed) : _random(seed) {}

  size_t below(size_t count) { return _random() % count; }

  // A call of up to `depth` functions in one another; its arguments are calls and variables.
  std::string call(size_t depth) {
    const Function& function = *_functions[below(_functions.size())];
    const size_t most = std::min<size_t>(function.most, 5);
    size_t count = function.least + below(most - function.least + 1);
    if (below(20) == 0) count = below(6);
    std::string text = function.name + "(";
    const size_t nested = count ? below(count) : 0;
    for (size_t i = 0; i < count; ++i) {
      const bool isCall = depth > 1 && (i == nested || below(3) == 0);
      text += (i ? ", " : "") + (isCall ? call(depth - 1) : variable());
    }
    return text + ")";
  }

 private:
  std::string variable() { return std::string("$") + "abcde"[below(5)]; }

  std::mt19937 _random;
  std::vector<const Function*> _functions = everyFunction();
};

// Number 0 is for the limits of the engine, for the errors that queries make of their own, and for
// the code that stands in its message.
bool saysWhatIsWrong(const XQueryError& error) {
  const std::string text = error.msg() ? error.msg()->utf8() : "";
  if (error.err() > 0) return !text.empty();
  return text.starts_with("limit: ") || text.starts_with("err:FOCH0003") ||
         text.find('#') != text.npos;
}

void evaluateOften(const std::string& body, Generator& generator, XQueryContext& context) {
  const Ref<XQuery> query = XQuery::xqueryWithSource(
      "declare variable $a external; declare variable $b external; declare variable $c external; "
      "declare variable $d external; declare variable $e external; " +
      body);
  ASSERT_FALSE(query->parseErrors()) << body;
  for (int round = 0; round < 5; ++round) {
    XQueryVariables constants;
    std::string chosen;
    for (const char name : std::string_view("abcde")) {
      const auto& [label, value] = values()[generator.below(values().size())];
      constants[std::string(1, name)] = value;
      chosen += std::string(" $") + name + " " + label;
    }
    Ref<XQueryError> error;
    const Ref<NSArray> items = context.evaluateXQuery(*query, constants, nullptr, &error);
    ASSERT_TRUE(items || error) << body << chosen;
    if (error) {
      ASSERT_TRUE(saysWhatIsWrong(*error)) << body << chosen << " " << show(*error);
    } else {
      ASSERT_FALSE(show(Value(items)).empty());
    }
  }
}

#ifdef XQUERY_SANITIZED
constexpr int rounds = 6000;
#else
constexpr int rounds = 20000;
#endif

TEST(NestedCalls, EndWithAValueOrAnErrorThatSaysWhatIsWrong) {
  Generator generator(20041029);
  const Ref<XQueryContext> withoutItem = XQueryContext::xqueryContext();
  const Ref<XQueryContext> withItem = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  for (const auto& context : {withoutItem, withItem}) {
    context->contextSetLoading(loading);
    context->contextSetClient(std::make_shared<Silence>());
  }
  const Ref<XQuery> focus = XQuery::xqueryWithSource(".");
  ASSERT_TRUE(withItem->evaluateXQuery(*focus, {}, sampleNamed("p:e").value));
  for (int round = 0; round < rounds && !HasFatalFailure(); ++round) {
    const std::string body = generator.call(2 + generator.below(2));
    evaluateOften(body, generator, generator.below(2) ? *withItem : *withoutItem);
  }
}

}  // namespace
}  // namespace xquery::arguments
