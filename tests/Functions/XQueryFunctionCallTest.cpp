#include "Context/XQueryContextInternal.h"
#include "Expr/Evaluated.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/Boolean.h"
#include "Functions/FunctionsTesting.h"
#include "Functions/Sequence.h"
#include "Functions/String.h"
#include "Functions/XQueryFunctionCall.h"
#include "Platform/Base/StackTestSupport.h"
#include "Prolog/PrologTesting.h"
#include "xquery/Exception.h"

#include <algorithm>
#include <functional>

namespace xquery {
namespace {

using functiontest::answer;

// An expression that does what the test says when it is evaluated.
class ActingExpr : public XQueryExpr {
 public:
  using Act = std::function<Value(XQueryContext&)>;
  explicit ActingExpr(Act act) : XQueryExpr(Kind::OtherExpr), _act(std::move(act)) {}
  void bindInfoForProlog(XQueryProlog&) override { ++boundTimes; }
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext& context) const override { return _act(context); }
  int boundTimes = 0;

 private:
  Act _act;
};

Ref<ActingExpr> acting(ActingExpr::Act act) {
  return make<ActingExpr>(std::move(act));
}
Ref<ActingExpr> giving(Value value) {
  return acting([value](XQueryContext&) { return value; });
}
Ref<ActingExpr> raising(std::string_view message) {
  return acting([message = std::string(message)](XQueryContext& context) -> Value {
    _internal(context).raise(XQueryError::error(6, message));
  });
}
Value integer(int64_t value) {
  return functiontest::integer(value);
}

Ref<XQueryFunctionCall> callOf(std::string_view name, const std::vector<Ref<XQueryExpr>>& args,
                               int64_t line = 0) {
  Ref<XQueryArgs> list = args.empty() ? nullptr : XQueryArgs::args();
  for (const auto& arg : args) list->addObject(arg);
  auto call = XQueryFunctionCall::functionCallWithName(text(name), list);
  call->setExprLine(line);
  return call;
}

class FunctionCall : public testing::Test {
 protected:
  // "error 8 line 3 message", or the value.
  std::string evaluated(const XQueryExpr& expr) {
    try {
      return functiontest::show(evaluatedOrThrown(expr, *context));
    } catch (const NSException&) {
      const auto& error = dynamic.error();
      return "error " + std::to_string(error->err()) + " line " + std::to_string(error->line()) +
             " " + error->msg()->utf8();
    }
  }
  std::string evaluated(const Ref<XQueryFunctionCall>& call, XQueryProlog& prolog) {
    call->bindInfoForProlog(prolog);
    dynamic.setActiveProlog(&prolog);
    return evaluated(*call);
  }
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryContextInternal& dynamic = _internal(*context);
};

// --- binding -------------------------------------------------------------------------------------

TEST_F(FunctionCall, IsBoundToABuiltInByName) {
  const auto prolog = prologOf({});
  const auto call = callOf("count", {nothing()});
  call->bindInfoForProlog(*prolog);
  EXPECT_EQ(call->function(), static_cast<XQueryProcedure>(fn_count));
  EXPECT_FALSE(call->functionDecl());
}

TEST_F(FunctionCall, ABuiltInIsFoundWhateverTheNumberOfArguments) {
  const auto prolog = prologOf({});
  const auto call = callOf("fn:true", {nothing(), nothing()});
  call->bindInfoForProlog(*prolog);
  EXPECT_EQ(call->function(), static_cast<XQueryProcedure>(fn_true));
}

TEST_F(FunctionCall, ADeclaredFunctionIsFoundByNameAndNumberOfArguments) {
  const auto prolog =
      prologOf({function("local:f", params({"a"})), function("local:f", params({"a", "b"}))});
  const auto one = callOf("local:f", {nothing()});
  const auto two = callOf("local:f", {nothing(), nothing()});
  const auto none = callOf("local:f", {});
  for (const auto& call : {one, two, none}) call->bindInfoForProlog(*prolog);
  ASSERT_TRUE(one->functionDecl());
  EXPECT_EQ(one->functionDecl()->params().size(), 1U);
  ASSERT_TRUE(two->functionDecl());
  EXPECT_EQ(two->functionDecl()->params().size(), 2U);
  EXPECT_FALSE(none->functionDecl());
  EXPECT_TRUE(prolog->errors().empty());
}

// Only a library module can declare a function in the standard namespace.
TEST_F(FunctionCall, ABuiltInWinsOverADeclaredFunctionOfItsName) {
  const OwnRegistry modules;
  const auto prolog = prologOf({moduleNamespace("m", "http://www.w3.org/2004/10/xpath-functions"),
                                function("m:count", params({"a"}), giving(integer(99))),
                                function("m:count", params({"a", "b"}), giving(integer(99)))},
                               modules);
  ASSERT_TRUE(prolog->errors().empty());
  EXPECT_EQ(evaluated(callOf("m:count", {giving(integer(1))}), *prolog), "integer 1");
  EXPECT_EQ(evaluated(callOf("m:count", {giving(integer(1)), giving(integer(2))}), *prolog),
            "error 17 line 1 invalid arguments to function - m:count");
}

TEST_F(FunctionCall, AnUnprefixedNameTakesTheDefaultFunctionNamespace) {
  const auto prolog = prologOf({XQueryPrologItemDefaultFunctionNamespace::functionNamespace(
                                    text("http://www.w3.org/2004/10/xquery-local-functions"), 0),
                                function("local:f", {}, giving(integer(1)))});
  EXPECT_EQ(evaluated(callOf("f", {}), *prolog), "integer 1");
  EXPECT_EQ(evaluated(callOf("count", {nothing()}), *prolog),
            "error 8 line 1 function count not defined for context");
}

TEST_F(FunctionCall, BindsItsArguments) {
  const auto prolog = prologOf({});
  for (const char* name : {"count", "local:f", "zz:f"}) {
    const auto argument = giving(integer(1));
    callOf(name, {argument})->bindInfoForProlog(*prolog);
    EXPECT_EQ(argument->boundTimes, 1) << name;
  }
  EXPECT_TRUE(prolog->errors().empty());
}

// --- what was not found --------------------------------------------------------------------------

TEST_F(FunctionCall, OfAnUnknownFunctionFailsWhenEvaluated) {
  const auto prolog = prologOf({function("local:f", params({"a"}))});
  for (const char* name : {"local:g", "zz:f", "nowhere", "local:f"}) {
    const auto call = callOf(name, {}, 4);
    call->bindInfoForProlog(*prolog);
    EXPECT_TRUE(prolog->errors().empty());
    EXPECT_EQ(evaluated(*call),
              std::string("error 8 line 5 function ") + name + " not defined for context");
  }
}

TEST_F(FunctionCall, TheArgumentsAreEvaluatedEvenThen) {
  const auto prolog = prologOf({});
  EXPECT_EQ(evaluated(callOf("zz:f", {raising("first")}), *prolog), "error 6 line 0 first");
}

TEST_F(FunctionCall, OfAnExternalFunctionFails) {
  const auto prolog = prologOf({function("local:f", params({"a"}), nullptr)});
  EXPECT_EQ(evaluated(callOf("local:f", {giving(integer(1))}), *prolog),
            "error 8 line 1 function local:f not defined for context");
}

TEST_F(FunctionCall, ANumberOfArgumentsOtherThanTheParametersIsRefused) {
  const auto prolog = prologOf({function("local:f", params({"a"}), giving(integer(1)))});
  const auto args = XQueryArgs::args();
  args->addObject(nothing());
  const auto call = XQueryFunctionCall::functionCallWithName(text("local:f"), args);
  call->bindInfoForProlog(*prolog);
  args->addObject(nothing());
  EXPECT_EQ(evaluated(*call), "error 17 line 1 invalid arguments to function - local:f");
}

TEST_F(FunctionCall, ADeclaredFunctionWithoutAValueIsNotDefined) {
  const auto prolog = prologOf({function("local:f", {}, giving(Value()))});
  EXPECT_EQ(evaluated(callOf("local:f", {}), *prolog),
            "error 8 line 1 function local:f not defined for context");
}

TEST_F(FunctionCall, AnErrorThatAFunctionAnswersIsRaised) {
  const auto prolog = prologOf({function("local:f", {}, giving(XQueryError::error(7, "mine", 2)))});
  EXPECT_EQ(evaluated(callOf("local:f", {}), *prolog), "error 7 line 3 mine");
}

// --- arguments -----------------------------------------------------------------------------------

TEST_F(FunctionCall, ArgumentsAreEvaluatedInOrder) {
  std::string order;
  const auto noting = [&](std::string_view name) {
    return acting([&order, name](XQueryContext&) {
      order += name;
      return Value(text(name));
    });
  };
  const auto prolog = prologOf({});
  for (size_t count = 2; count <= 5; ++count) {
    order.clear();
    std::vector<Ref<XQueryExpr>> args;
    for (size_t index = 0; index < count; ++index) {
      args.push_back(noting(std::string_view("abcde").substr(index, 1)));
    }
    const std::string joined(std::string_view("abcde").substr(0, count));
    EXPECT_EQ(evaluated(callOf("concat", args), *prolog), "untypedAtomic " + joined);
    EXPECT_EQ(order, joined);
  }
}

TEST_F(FunctionCall, ABuiltInGetsNoArrayOfFewerThanTwoItems) {
  const auto prolog = prologOf({});
  const auto one = functiontest::sequence({integer(1)});
  EXPECT_EQ(evaluated(callOf("trace", {giving(one), giving(text("l"))}), *prolog), "integer 1");
  const auto none = functiontest::sequence({});
  EXPECT_EQ(evaluated(callOf("trace", {giving(none), giving(text("l"))}), *prolog), "()");
}

TEST_F(FunctionCall, ABuiltInRefusesAnArgumentWithoutAValue) {
  const auto prolog = prologOf({});
  EXPECT_EQ(evaluated(callOf("count", {giving(Value())}), *prolog),
            "error 17 line 1 invalid arguments to function - count");
  EXPECT_EQ(answer("empty(.)"), "error 17 line 1 invalid arguments to function - empty");
}

TEST_F(FunctionCall, AParameterWithoutAValueIsUndefinedWhereItIsUsed) {
  EXPECT_EQ(answer("declare function local:f($a) { 1 }; local:f(.)"), "integer 1");
  EXPECT_EQ(answer("declare function local:f($a) { $a }; local:f(.)"),
            "error 8 line 1 reference to undefined variable \"a\"");
}

TEST_F(FunctionCall, ParametersTakeAnyValueWhateverTheirType) {
  EXPECT_EQ(answer("declare function local:f($a as xs:integer) as xs:integer { $a }; "
                   "local:f('text'), local:f((1, 'b')), local:f(())"),
            "string text, integer 1, string b");
}

TEST_F(FunctionCall, ManyParametersKeepTheirPlaces) {
  std::string list;
  std::string arguments;
  std::string expected;
  for (int index = 1; index <= 25; ++index) {
    const std::string number = std::to_string(index);
    list += (index > 1 ? ", $p" : "$p") + number;
    arguments += (index > 1 ? ", " : "") + number;
    expected += (index > 1 ? ", integer " : "integer ") + number;
  }
  EXPECT_EQ(
      answer("declare function local:f(" + list + ") { " + list + " }; local:f(" + arguments + ")"),
      expected);
}

// --- the context of the callee -------------------------------------------------------------------

TEST_F(FunctionCall, TheBodySeesNoneOfTheCallersVariables) {
  dynamic.setVariable(text("callers"), 1);
  NSObject* seen = integer(0).get();
  const auto prolog = prologOf({function("local:f", {}, acting([&](XQueryContext&) {
                                           seen = dynamic.variableForID(1);
                                           dynamic.setVariable(text("callees"), 1);
                                           return integer(1);
                                         }))});
  EXPECT_EQ(evaluated(callOf("local:f", {}), *prolog), "integer 1");
  EXPECT_EQ(seen, nullptr);
  EXPECT_EQ(shown(Value(dynamic.variableForID(1))), "callers");
}

TEST_F(FunctionCall, ArgumentsAreEvaluatedInTheCallersFrame) {
  dynamic.setVariable(integer(5), 1);
  const auto reading = [&](XQueryContext&) { return Value(dynamic.variableForID(1)); };
  const auto prolog =
      prologOf({function("local:f", params({"a", "b"}), acting([&](XQueryContext&) {
                           return functiontest::sequence(
                               {Value(dynamic.variableForID(1)), Value(dynamic.variableForID(2))});
                         }))});
  EXPECT_EQ(evaluated(callOf("local:f", {giving(integer(7)), acting(reading)}), *prolog),
            "(integer 7, integer 5)");
}

TEST_F(FunctionCall, TheFrameComesBackWhenAnExceptionPasses) {
  dynamic.setVariable(text("callers"), 1);
  const auto prolog = prologOf({function("local:f", params({"a"}), raising("inside"))});
  EXPECT_EQ(evaluated(callOf("local:f", {giving(integer(1))}), *prolog), "error 6 line 0 inside");
  EXPECT_EQ(shown(Value(dynamic.variableForID(1))), "callers");
  EXPECT_EQ(evaluated(callOf("error", {}), *prolog),
            "error 0 line 0 http://www.w3.org/2004/07/xqt-errors#FOER0000");
  EXPECT_EQ(shown(Value(dynamic.variableForID(1))), "callers");
}

// A function of a library module runs in that module's static context.
class ImportedFunction : public FunctionCall {
 protected:
  ImportedFunction() {
    module = prologOf({moduleNamespace("m", "urn:m"), XQueryPrologItemOrdered::ordered(false, 0),
                       function("m:f", {}, acting([this](XQueryContext&) { return act(); }))},
                      modules);
    main = prologOf(
        {XQueryPrologItemModuleImport::moduleImport(text("urn:m"), std::nullopt, text("m"), 0)},
        modules);
    dynamic.setActiveProlog(main.get());
    dynamic.setOrdered(true);
  }
  Value act() {
    prologInside = dynamic.activeProlog();
    orderedInside = dynamic.ordered();
    if (fails) dynamic.raise(XQueryError::error(6, "inside"));
    return integer(1);
  }
  OwnRegistry modules;
  Ref<XQueryProlog> module;
  Ref<XQueryProlog> main;
  XQueryProlog* prologInside = nullptr;
  bool orderedInside = true;
  bool fails = false;
};

TEST_F(ImportedFunction, IsEvaluatedInTheStaticContextOfItsModule) {
  EXPECT_EQ(evaluated(callOf("m:f", {}), *main), "integer 1");
  EXPECT_EQ(prologInside, module.get());
  EXPECT_FALSE(orderedInside);
  EXPECT_EQ(dynamic.activeProlog(), main.get());
  EXPECT_TRUE(dynamic.ordered());
}

TEST_F(ImportedFunction, PutsTheCallersStaticContextBackWhenItFails) {
  fails = true;
  EXPECT_EQ(evaluated(callOf("m:f", {}), *main), "error 6 line 0 inside");
  EXPECT_EQ(prologInside, module.get());
  EXPECT_EQ(dynamic.activeProlog(), main.get());
  EXPECT_TRUE(dynamic.ordered());
}

TEST_F(FunctionCall, ABuiltInRunsInTheCallersStaticContext) {
  EXPECT_EQ(answer("declare default element namespace 'urn:d'; "
                   "declare function local:f() { xs:QName('a') }; local:f() eq xs:QName('a')"),
            "true");
}

// --- recursion -----------------------------------------------------------------------------------

// Ends when the predicate no longer keeps the document: the step behind it is not evaluated then.
constexpr const char* countingDown =
    "declare function local:down($n) { .[$n > 0]/local:down($n - 1), $n };";

TEST(Recursion, EveryLevelSeesItsOwnParameters) {
  EXPECT_EQ(answer(std::string(countingDown) + "local:down(3)", functiontest::document("<a/>")),
            "integer 0, integer 1, integer 2, integer 3");
}

TEST(Recursion, BetweenTwoFunctionsInEitherOrderOfDeclaration) {
  EXPECT_EQ(answer("declare function local:a($n) { .[$n > 0]/local:b($n - 1), 'a' };"
                   "declare function local:b($n) { .[$n > 0]/local:a($n - 1), 'b' };"
                   "local:a(2)",
                   functiontest::document("<a/>")),
            "string a, string b, string a");
}

TEST(Recursion, WithoutAnEndIsAnErrorAboutNesting) {
  constexpr const char* tooDeep = "error 0 line 0 limit: expression nested too deeply";
  EXPECT_EQ(answer("declare function local:f($n) { local:f($n + 1) }; local:f(0)"), tooDeep);
  EXPECT_EQ(answer("declare function local:f() { 1, local:f() }; local:f()"), tooDeep);
  EXPECT_EQ(answer("declare function local:f($n) { count(local:f(local:f($n))) }; local:f(0)"),
            tooDeep);
  EXPECT_EQ(answer("declare function local:f($a, $b, $c, $d) { local:f($b, $c, $d, $a) };"
                   "local:f(1, 2, 3, 4)"),
            tooDeep);
}

TEST(Recursion, WithoutAnEndIsNotPassedOverByAPredicate) {
  EXPECT_EQ(answer("declare function local:f($n) { (1)[local:f($n + 1)] }; (1)[local:f(0)]"),
            "error 0 line 0 limit: expression nested too deeply");
}

TEST(Recursion, AfterItsErrorTheContextWorksOn) {
  const auto context = XQueryContext::xqueryContext();
  const auto endless =
      XQuery::xqueryWithSource("declare function local:f($n) { local:f($n + 1) }; local:f(0)");
  const auto sound =
      XQuery::xqueryWithSource("declare function local:f($n) { $n + 1 }; local:f(local:f(0))");
  for (int round = 0; round < 3; ++round) {
    EXPECT_FALSE(context->evaluateXQuery(*endless, {}, nullptr));
    EXPECT_EQ(functiontest::show(context->evaluateXQuery(*sound, {}, nullptr)), "(integer 2)");
  }
}

// What the query answers on a thread with a stack of that many bytes.
std::string answerOnStack(size_t bytes, const std::string& query) {
  std::string result;
  onStack(bytes, [&] { result = answer(query); });
  return result;
}

constexpr const char* counting =
    "declare function local:count($n) { if ($n = 0) then 0 else 1 + local:count($n - 1) };";

TEST(Recursion, AHundredThousandLevelsFitAGibibyteOfStack) {
  EXPECT_EQ(answerOnStack(size_t{1} << 30, std::string(counting) + "local:count(100000)"),
            "integer 100000");
}

TEST(Recursion, AThousandLevelsFitTheUsualStack) {
  EXPECT_EQ(answerOnStack(size_t{8} << 20, std::string(counting) + "local:count(1000)"),
            "integer 1000");
}

TEST(Recursion, WithoutAnEndIsAnErrorOnASmallStackToo) {
  EXPECT_EQ(answerOnStack(size_t{1} << 20, std::string(counting) + "local:count(-1)"),
            "error 0 line 0 limit: expression nested too deeply");
}

// How far apart on the native stack two levels of a recursion are.
class Levels : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
    const auto here = reinterpret_cast<uintptr_t>(__builtin_frame_address(0));
    if (_deepest != 0) bytesPerLevel = std::max(bytesPerLevel, _deepest - here);
    _deepest = here;
    ++count;
  }
  uintptr_t bytesPerLevel = 0;
  size_t count = 0;

 private:
  uintptr_t _deepest = 0;
};

TEST(Recursion, ALevelTakesLessThanTenKilobytesOfStack) {
  const auto levels = std::make_shared<Levels>();
  const auto context = XQueryContext::xqueryContext();
  context->contextSetClient(levels);
  const auto query = XQuery::xqueryWithSource(
      "declare function local:f($n) { local:f(trace($n + 1, 'level')) }; local:f(0)");
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr));
  EXPECT_GT(levels->count, 500U);
  EXPECT_LT(levels->bytesPerLevel, 10240U);
  RecordProperty("bytesPerLevel", static_cast<int>(levels->bytesPerLevel));
}

}  // namespace
}  // namespace xquery
