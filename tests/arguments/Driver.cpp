#include "arguments/Driver.h"

#include "arguments/RegistryColumns.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <memory>

namespace xquery::arguments {
namespace {

constexpr std::string_view variables = "abcde";

// Calls that are told apart by one argument of several only are many. What a sanitizer finds it
// finds in some of them as well.
#ifdef XQUERY_SANITIZED
constexpr size_t oneCallIn = 11;
#else
constexpr size_t oneCallIn = 1;
#endif

// fn:trace would write to the log.
class Silence : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {}
};

// A context that loads nothing, for each context item; an item, once given, stays in force.
XQueryContext& contextWith(const Sample* item) {
  static std::map<const Sample*, Ref<XQueryContext>> contexts;
  Ref<XQueryContext>& context = contexts[item];
  if (!context) {
    context = XQueryContext::xqueryContext();
    context->contextSetClient(std::make_shared<Silence>());
    XQueryLoading loading;
    loading.policy = XQueryLoadingPolicy::denyAll();
    context->contextSetLoading(loading);
  }
  return *context;
}

Ref<XQuery> compiledCall(const std::string& name, size_t count) {
  std::string declarations;
  std::string arguments;
  for (size_t i = 0; i < count; ++i) {
    declarations += std::string("declare variable $") + variables[i] + " external; ";
    arguments += std::string(i ? ", $" : "$") + variables[i];
  }
  return XQuery::xqueryWithSource(declarations + name + "(" + arguments + ")");
}

// What the call comes to, and what it shows to be wrong in the function's row of the registry.
std::string outcomeOf(const XQuery& query, const Call& call, const std::string& function) {
  XQueryVariables constants;
  for (size_t i = 0; i < call.count(); ++i) {
    constants[std::string(1, variables[i])] = call.arguments[i]->value;
  }
  Ref<XQueryError> error;
  const Value item = call.contextItem ? call.contextItem->value : nullptr;
  const Value answer = contextWith(call.contextItem).evaluateXQuery(query, constants, item, &error);
  const std::string wrong = contradictionInRow(function, call, dyn_cast<NSArray>(answer));
  if (!wrong.empty()) return "against the registry: " + wrong;
  return error ? show(*error) : show(answer);
}

// Whether the text is as the pattern, in which a "*" stands for any text.
bool isLike(std::string_view text, std::string_view pattern) {
  const size_t star = pattern.find('*');
  if (star == pattern.npos) return text == pattern;
  if (!text.starts_with(pattern.substr(0, star))) return false;
  text.remove_prefix(star);
  pattern.remove_prefix(star + 1);
  while (!isLike(text, pattern)) {
    if (text.empty()) return false;
    text.remove_prefix(1);
  }
  return true;
}

// What the call may answer, printed.
std::vector<std::string> expectedOf(const Function& function, const Call& call) {
  std::vector<std::string> texts;
  try {
    if (call.count() < function.least || call.count() > function.most) throw Refused();
    std::string text;
    for (const Item& item : function.rule(call)) {
      text += text.empty() ? "" : ", ";
      if (item.isNode()) {
        text += "node " + item.node->label;
      } else if (item.isAtomic()) {
        text += std::to_string(item.type) + " " + item.text;
      } else {
        text += item.text;
      }
    }
    texts.push_back(text.empty() ? "()" : text);
  } catch (const Failure& failure) {
    texts = failure.texts;
  } catch (Refused) {
    texts.push_back("refused");
  }
  texts.insert(texts.end(), call.alternatives.begin(), call.alternatives.end());
  for (std::string& text : texts) {
    if (text == "refused") text = "error 17 invalid arguments to function - " + function.name;
  }
  return texts;
}

// Compares the calls of one function and says at its end what was not as expected.
class Comparison {
 public:
  explicit Comparison(const Function& function) : _function(function) {}

  // All combinations of `count` of the values; of several, one in `oneCallIn`.
  void callWithAll(const std::vector<const Sample*>& values, size_t count, const Sample* item) {
    const Ref<XQuery> query = compiledCall(_function.name, count);
    ASSERT_FALSE(query->parseErrors()) << _function.name;
    // Otherwise some values would never be the first argument.
    ASSERT_TRUE(oneCallIn == 1 || values.empty() || values.size() % oneCallIn != 0);
    std::vector<size_t> choice(count, 0);
    for (size_t number = 0;; ++number) {
      if (count < 2 || number % oneCallIn == 0) {
        Call call;
        call.contextItem = item;
        for (const size_t index : choice) call.arguments.push_back(values[index]);
        compare(*query, call);
      }
      size_t place = 0;
      while (place < count && ++choice[place] == values.size()) choice[place++] = 0;
      if (place == count) return;
    }
  }

  void finish() {
    EXPECT_GT(_calls, 0U);
    if (_mismatches) {
      ADD_FAILURE() << _function.name << ": " << _mismatches << " of " << _calls
                    << " calls are not as expected" << _report;
    }
  }

 private:
  void compare(const XQuery& query, const Call& call) {
    ++_calls;
    const std::vector<std::string> expected = expectedOf(_function, call);
    const std::string found = outcomeOf(query, call, _function.name);
    const auto fits = [&](const std::string& text) { return isLike(found, text); };
    if (std::any_of(expected.begin(), expected.end(), fits)) return;
    if (++_mismatches > mostReported) return;
    _report += "\n  " + _function.name + "(";
    for (size_t i = 0; i < call.count(); ++i) {
      _report += (i ? " ; " : "") + call.arguments[i]->name;
    }
    _report += ")";
    if (call.contextItem) _report += " of " + call.contextItem->name;
    _report += "\n      expected";
    for (const std::string& text : expected) _report += " [" + text + "]";
    _report += "\n      found    [" + found + "]";
  }

  static constexpr size_t mostReported = 12;
  const Function& _function;
  size_t _calls = 0;
  size_t _mismatches = 0;
  std::string _report;
};

std::vector<const Sample*> all() {
  std::vector<const Sample*> values;
  for (const Sample& sample : samples()) values.push_back(&sample);
  return values;
}

std::vector<const Sample*> typical() {
  std::vector<const Sample*> values = all();
  std::erase_if(values, [](const Sample* sample) { return !sample->isTypical; });
  return values;
}

std::vector<const Sample*> usual() {
  std::vector<const Sample*> values = all();
  std::erase_if(values, [](const Sample* sample) { return !sample->isUsual; });
  return values;
}

std::vector<const Sample*> first(size_t count, std::vector<const Sample*> values) {
  values.resize(std::min(count, values.size()));
  return values;
}

void expectRule(const Function& function) {
  EXPECT_TRUE(rowTakesAsRule(function)) << function.name;
  Comparison comparison(function);
  const auto takes = [&](size_t n) { return n >= function.least && n <= function.most; };
  const Sample* const items[] = {nullptr, &sampleNamed("p:e"), &sampleNamed("42 '12'")};
  comparison.callWithAll({}, 0, nullptr);
  for (const Sample& sample : samples()) {
    if (sample.items.size() == 1) comparison.callWithAll({}, 0, &sample);
  }
  for (const Sample* item : items) comparison.callWithAll(all(), 1, item);
  comparison.callWithAll(takes(2) ? typical() : usual(), 2, nullptr);
  comparison.callWithAll(takes(3) ? usual() : first(5, usual()), 3, nullptr);
  comparison.callWithAll(first(takes(4) ? 9 : 3, usual()), 4, nullptr);
  comparison.callWithAll(first(3, usual()), 5, nullptr);
  comparison.finish();
}

}  // namespace

void expectRules(const std::vector<Function>& family) {
  for (const Function& function : family) expectRule(function);
}

std::vector<const std::vector<Function>*> families() {
  return {&constructorFunctions(), &cardinalityFunctions(), &sequenceFunctions(),
          &aggregateFunctions(),   &numericFunctions(),     &dateFunctions(),
          &stringFunctions(),      &patternFunctions(),     &nodeFunctions(),
          &focusFunctions(),       &resourceFunctions(),    &extensionFunctions()};
}

}  // namespace xquery::arguments
