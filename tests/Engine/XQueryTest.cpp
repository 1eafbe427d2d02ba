// The compiled query and the evaluation driver, seen through the exported classes.
#include "Context/XQueryContextInternal.h"
#include "Engine/XQueryInternal.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <functional>
#include <stdexcept>
#include <vector>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}

// An expression that does what the test says when it is evaluated.
class Body : public XQueryExpr {
 public:
  explicit Body(std::function<Value(XQueryContextInternal&)> work)
      : XQueryExpr(Kind::OtherExpr), _work(std::move(work)) {}
  void bindInfoForProlog(XQueryProlog&) override {}
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext& context) const override { return _work(_internal(context)); }

 private:
  std::function<Value(XQueryContextInternal&)> _work;
};

using Items = std::vector<Ref<XQueryPrologItem>>;

class Driver : public testing::Test {
 protected:
  // Evaluates; the error, if any, is left in `error`.
  Ref<NSArray> evaluate(std::string_view source, const XQueryVariables& constants = {},
                        const Value& item = Value()) {
    query = XQuery::xqueryWithSource(source);
    return context->evaluateXQuery(*query, constants, item, &error);
  }
  // A query whose body is the given expression.
  Ref<NSArray> evaluateBody(std::function<Value(XQueryContextInternal&)> work,
                            const Items& items = {}, const Value& item = Value()) {
    query = make<XQuery>(std::make_unique<XQueryInternal>(
        XQueryProlog::prologWithItems(items, nullptr, nullptr, nullptr),
        make<Body>(std::move(work))));
    return context->evaluateXQuery(*query, {}, item, &error);
  }
  // A query whose body is one literal.
  Ref<NSArray> evaluateLiteral(const Value& value) {
    query = make<XQuery>(std::make_unique<XQueryInternal>(
        XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr),
        XQueryLiteral::literalWithValue(value)));
    return context->evaluateXQuery(*query, {}, nullptr, &error);
  }
  std::string strings(const Ref<NSArray>& items) {
    std::string all;
    for (const Value& item : items->objects()) {
      if (!all.empty()) all += ' ';
      all += XQueryItemStringValue(*item);
    }
    return all;
  }
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQuery> query;
  Ref<XQueryError> error;
};

TEST_F(Driver, SyntaxErrorIsKeptInTheQueryAndHandedOut) {
  EXPECT_FALSE(evaluate("1 +"));
  ASSERT_TRUE(query->parseErrors());
  ASSERT_GE(query->parseErrors()->count(), 1U);
  ASSERT_TRUE(error);
  EXPECT_EQ(error.get(), query->parseErrors()->objectAtIndex(0));
  EXPECT_EQ(error->err(), 3);
}

TEST_F(Driver, WithoutAnErrorSlotAFailedQueryJustAnswersNothing) {
  const auto bad = XQuery::xqueryWithSource("1 +");
  EXPECT_FALSE(context->evaluateXQuery(*bad, {}, nullptr, nullptr));
}

TEST_F(Driver, AQueryThatCompiledHasNoErrors) {
  EXPECT_EQ(strings(evaluate("1, 2")), "1 2");
  EXPECT_FALSE(query->parseErrors());
}

TEST_F(Driver, OnlyTheFirstOfSeveralErrorsIsHandedOut) {
  EXPECT_FALSE(
      evaluate("declare default element namespace ''; declare default function namespace ''; 1"));
  ASSERT_EQ(query->parseErrors()->count(), 2U);
  EXPECT_EQ(error.get(), query->parseErrors()->objectAtIndex(0));
}

TEST_F(Driver, ErrorSlotIsClearedFirst) {
  error = XQueryError::error(1, "old");
  EXPECT_TRUE(evaluate("1"));
  EXPECT_FALSE(error);
}

TEST_F(Driver, EmptySequenceIsAnEmptyArray) {
  const auto items = evaluate("()");
  ASSERT_TRUE(items);
  EXPECT_EQ(items->count(), 0U);
}

TEST_F(Driver, AnArrayOfOneNullIsANewEmptyArray) {
  const auto array = NSArray::arrayWithObjects({NSNull::null()});
  const auto items = evaluateLiteral(array);
  ASSERT_TRUE(items);
  EXPECT_EQ(items->count(), 0U);
  EXPECT_NE(items.get(), array.get());
}

TEST_F(Driver, AnEmptyArrayIsAnsweredAsItIs) {
  const auto array = NSArray::array();
  EXPECT_EQ(evaluateLiteral(array).get(), array.get());
}

TEST_F(Driver, AnItemIsWrapped) {
  const Value item = text("a");
  const auto items = evaluateLiteral(item);
  ASSERT_EQ(items->count(), 1U);
  EXPECT_EQ(items->objectAtIndex(0), item.get());
}

TEST_F(Driver, AnErrorAsFirstElementGoesToTheErrorSlot) {
  const auto failure = XQueryError::error(0, "returned");
  EXPECT_FALSE(evaluateLiteral(NSArray::arrayWithObjects({failure, text("dropped")})));
  EXPECT_EQ(error.get(), failure.get());
}

TEST_F(Driver, AnErrorFurtherDownStaysInTheResult) {
  const auto failure = XQueryError::error(0, "returned");
  const auto items = evaluateLiteral(NSArray::arrayWithObjects({text("a"), failure}));
  ASSERT_TRUE(items);
  EXPECT_EQ(items->count(), 2U);
  EXPECT_FALSE(error);
}

TEST_F(Driver, NoValueIsNoArrayAndNoError) {
  EXPECT_FALSE(evaluateLiteral(Value()));
  EXPECT_FALSE(error);
}

TEST_F(Driver, AnEmptyQueryIsValidAndHasNoValue) {
  EXPECT_FALSE(evaluate(""));
  EXPECT_FALSE(query->parseErrors());
  EXPECT_FALSE(error);
}

TEST_F(Driver, ALibraryModuleHasNoValue) {
  EXPECT_FALSE(evaluate("module namespace m = 'urn:m'; declare variable $m:x := 1;"));
  EXPECT_FALSE(query->parseErrors());
  EXPECT_FALSE(error);
}

TEST_F(Driver, TextThatIsNotUTF8IsACompileError) {
  EXPECT_FALSE(evaluate("'\xff'"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 3);
  EXPECT_EQ(error->line(), 0);
}

TEST_F(Driver, UnsupportedVersionIsRejected) {
  EXPECT_FALSE(evaluate("xquery version '2.0'; 1"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 31);
  EXPECT_EQ(error->msg()->utf8(), "version \"2.0\" not supported");
  EXPECT_EQ(strings(evaluate("xquery version '1.0'; 1")), "1");
}

TEST_F(Driver, ConstantsBecomeExternalVariables) {
  EXPECT_EQ(strings(evaluate("declare variable $x external; $x", {{"x", text("five")}})), "five");
}

TEST_F(Driver, ConstantsMayBeArrays) {
  const auto array = NSArray::arrayWithObjects({text("a"), text("b")});
  EXPECT_EQ(strings(evaluate("declare variable $x external; $x", {{"x", array}})), "a b");
}

TEST_F(Driver, ConstantWithAnUndeclaredPrefixIsSkipped) {
  EXPECT_FALSE(evaluate("declare variable $x external; $x", {{"q:x", text("five")}}));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 16);
  EXPECT_EQ(error->msg()->utf8(), "unresloved external variable - x");
}

TEST_F(Driver, ConstantWithADeclaredPrefixIsFound) {
  EXPECT_EQ(strings(evaluate("declare namespace p = 'urn:p'; declare variable $p:x external; $p:x",
                             {{"p:x", text("ok")}})),
            "ok");
}

TEST_F(Driver, UnresolvedPrefixedVariableIsNamedWithItsString) {
  EXPECT_FALSE(evaluate("declare namespace p = 'urn:p'; declare variable $p:x external; 1"));
  ASSERT_TRUE(error);
  // A declared name is made from local part and namespace, so it has no prefix to print.
  EXPECT_EQ(error->msg()->utf8(), "unresloved external variable - x");
}

TEST_F(Driver, ConstantsNeverLeakIntoTheNextEvaluation) {
  EXPECT_TRUE(evaluate("declare variable $x external; $x", {{"x", text("v")}}));
  EXPECT_FALSE(evaluate("declare variable $x external; $x"));
  EXPECT_EQ(error->err(), 16);
}

TEST_F(Driver, ADeclaredValueReplacesASuppliedConstant) {
  EXPECT_EQ(strings(evaluate("declare variable $x := 1; $x", {{"x", text("supplied")}})), "1");
}

TEST_F(Driver, DeclarationsSeeTheOnesBefore) {
  EXPECT_EQ(strings(evaluate("declare variable $a := 2; declare variable $b := $a + 3; $b")), "5");
}

TEST_F(Driver, DeclarationsDoNotSeeTheOnesAfter) {
  EXPECT_FALSE(evaluate("declare variable $b := $a; declare variable $a := 2; $b"));
  EXPECT_EQ(error->err(), 8);
}

TEST_F(Driver, ExternalFunctionAlwaysFailsEvenWhenNeverCalled) {
  EXPECT_FALSE(evaluate("declare function local:f() external; 1"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 16);
  EXPECT_EQ(error->msg()->utf8(), "unresloved external function - f");
}

TEST_F(Driver, ContextItemOfAnEarlierEvaluationStaysInForce) {
  const auto document = NSXMLDocument::documentWithData("<a/>", 0);
  EXPECT_EQ(evaluate(".", {}, document)->objectAtIndex(0), document.get());
  EXPECT_EQ(evaluate(".")->objectAtIndex(0), document.get());
  EXPECT_EQ(evaluate(".", {}, NSNull::null())->objectAtIndex(0), document.get());
}

TEST_F(Driver, ContextItemOutlivesItsHolder) {
  evaluate("1", {}, NSXMLDocument::documentWithData("<a>t</a>", 0));
  EXPECT_EQ(strings(evaluate("a")), "t");
}

TEST_F(Driver, WithoutAContextItemDotAndRelativePathsAreEmpty) {
  for (const char* source : {".", "a", "@a", "a/b[1]"}) {
    const auto items = evaluate(source);
    ASSERT_TRUE(items) << source;
    EXPECT_EQ(items->count(), 0U) << source;
  }
}

TEST_F(Driver, WithoutAContextItemAnAbsolutePathFails) {
  EXPECT_FALSE(evaluate("/a"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 20);
  EXPECT_EQ(error->msg()->utf8(), "context item not a node");
}

TEST_F(Driver, AContextItemIsGivenPositionOneAndLastIsLeftAlone) {
  _internal(*context).setContextItem(text("old"), 7);
  _internal(*context).setLast(9);
  int64_t position = 0;
  int64_t last = 0;
  const auto look = [&](XQueryContextInternal& dynamic) {
    position = dynamic.position();
    last = dynamic.last();
    return dynamic.contextItem();
  };
  EXPECT_EQ(strings(evaluateBody(look)), "old");
  EXPECT_EQ(position, 7);
  EXPECT_EQ(strings(evaluateBody(look, {}, text("new"))), "new");
  EXPECT_EQ(position, 1);
  EXPECT_EQ(last, 9);
}

TEST_F(Driver, TheBodySeesThePrologAndItsOrderingMode) {
  for (const bool ordered : {false, true}) {
    EXPECT_TRUE(evaluateBody(
        [&](XQueryContextInternal& dynamic) {
          EXPECT_EQ(dynamic.activeProlog(), _internal(*query).prolog());
          EXPECT_EQ(dynamic.ordered(), ordered);
          return Value(NSNull::null());
        },
        {XQueryPrologItemOrdered::ordered(ordered, 0)}));
  }
}

TEST_F(Driver, GlobalsAreClearedAfterSuccessAndAfterAnError) {
  const auto name = XQueryQName::qname(text("x"), nullptr);
  EXPECT_TRUE(evaluate("declare variable $x := 1; $x"));
  EXPECT_EQ(_internal(*context).globalForQName(*name), nullptr);
  EXPECT_FALSE(evaluate("declare variable $x := 1; $nowhere"));
  EXPECT_EQ(_internal(*context).globalForQName(*name), nullptr);
}

TEST_F(Driver, AVariableWithoutAValueIsUnresolved) {
  EXPECT_FALSE(evaluate("declare variable $x := .; 1"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 16);
  EXPECT_EQ(error->msg()->utf8(), "unresloved external variable - x");
}

TEST_F(Driver, AnExceptionWithoutAnErrorAnswersNothing) {
  const auto fail = [](XQueryContextInternal&) -> Value {
    throw NSException("AnyName", text("reason"));
  };
  EXPECT_FALSE(evaluateBody(fail));
  EXPECT_FALSE(error);
}

TEST_F(Driver, AnExceptionWithoutAnErrorHandsOutTheLastOne) {
  EXPECT_FALSE(evaluate("$nowhere"));
  const auto earlier = error;
  const auto fail = [](XQueryContextInternal&) -> Value {
    throw NSException("AnyName", text("reason"));
  };
  EXPECT_FALSE(evaluateBody(fail));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), earlier->err());
  EXPECT_EQ(error->msg(), earlier->msg());
}

TEST_F(Driver, OtherExceptionsPassThrough) {
  const auto fail = [](XQueryContextInternal&) -> Value { throw std::runtime_error("host"); };
  EXPECT_THROW(static_cast<void>(evaluateBody(fail)), std::runtime_error);
}

TEST_F(Driver, RunningOutOfMemoryIsALimit) {
  const auto fail = [](XQueryContextInternal&) -> Value { throw std::bad_alloc(); };
  EXPECT_FALSE(evaluateBody(fail));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 0);
  EXPECT_EQ(error->msg()->utf8(), "limit: out of memory");
}

TEST_F(Driver, ADecimalOfTooManyDigitsIsALimit) {
  const std::string digits(200000, '9');
  EXPECT_FALSE(evaluate("declare variable $x := " + digits + "; $x * $x"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 0);
  EXPECT_EQ(error->msg()->utf8(), "limit: number of too many digits");
}

TEST_F(Driver, ParseErrorsAreAFreshArrayEachTime) {
  const auto bad = XQuery::xqueryWithSource("1 +");
  const auto first = bad->parseErrors();
  first->objects().clear();
  EXPECT_NE(bad->parseErrors(), first);
  EXPECT_GE(bad->parseErrors()->count(), 1U);
}

TEST_F(Driver, LocalVariableIDsOfTheBodyStartAtOne) {
  EXPECT_TRUE(evaluate("declare function local:f($a, $b) { $a }; 1"));
  EXPECT_EQ(_internal(*query).prolog()->nextLocalVariableID(), 1);
}

TEST_F(Driver, RunTimeErrorComesWithNumberMessageAndLine) {
  EXPECT_FALSE(evaluate("\n\n$nowhere"));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->code(), 8);
  EXPECT_EQ(error->domain()->utf8(), "XQueryErrorDomain");
  ASSERT_TRUE(error->userInfo());
  EXPECT_EQ(error->userInfo()->errorMessage->utf8(), "reference to undefined variable \"nowhere\"");
  EXPECT_EQ(error->userInfo()->errorLine, 3);
}

TEST_F(Driver, WithLoggingOnErrorsStillReachTheCaller) {
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(evaluate("$nowhere"));
  testing::internal::GetCapturedStderr();
  unsetenv("XQUERY_LOG");
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 8);
}

TEST_F(Driver, WithLoggingOnAnErrorIsAnAssertionFailureInTheLogAndTheSameForTheCaller) {
  const std::string description = "XQueryError:6 - \"Division by zero\" at line:2";
  EXPECT_FALSE(evaluate("1 +\n1 div 0"));
  EXPECT_EQ(error->description()->utf8(), description);
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  EXPECT_FALSE(evaluate("1 +\n1 div 0"));
  const std::string log = testing::internal::GetCapturedStderr();
  unsetenv("XQUERY_LOG");
  EXPECT_EQ(error->description()->utf8(), description);
  const std::string failure =
      "*** Assertion failure in -[XQueryContextInternal setError:raiseException:], "
      "Eval/XQueryContextInternal:288: " +
      description + "\n";
  const size_t at = log.find(failure);
  ASSERT_NE(at, log.npos) << log;
  EXPECT_EQ(log.find("***", at + 1), log.npos) << "one cause, one line";
}

TEST_F(Driver, FirstElementIsDecoratedWithItsRecordedBaseURI) {
  Ref<NSXMLElement> element;
  evaluateBody([&](XQueryContextInternal& internal) -> Value {
    element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
    internal.setBaseURI(text("http://base/"), element.get());
    return element;
  });
  EXPECT_EQ(element->XMLString()->utf8(), "<a xml:base=\"http://base/\"/>");
}

TEST_F(Driver, ADocumentsRootElementIsDecorated) {
  Ref<NSXMLDocument> document;
  evaluateBody([&](XQueryContextInternal& internal) -> Value {
    document = NSXMLDocument::document();
    document->addChild(NSXMLElement::elementWithName(NSStringView::ascii("a")));
    internal.setBaseURI(text("http://base/"), document->rootElement());
    return document;
  });
  EXPECT_EQ(document->rootElement()->XMLString()->utf8(), "<a xml:base=\"http://base/\"/>");
}

TEST_F(Driver, ElementWithoutARecordedURIGetsAnEmptyOne) {
  const auto recorded = NSXMLElement::elementWithName(NSStringView::ascii("r"));
  _internal(*context).setBaseURI(text("http://base/"), recorded.get());
  Ref<NSXMLElement> element;
  evaluateBody([&](XQueryContextInternal&) -> Value {
    element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
    return element;
  });
  EXPECT_EQ(element->XMLString()->utf8(), "<a xml:base=\"\"/>");
}

TEST_F(Driver, AnExistingBaseIsNotReplaced) {
  Ref<NSXMLElement> element;
  evaluateBody([&](XQueryContextInternal& internal) -> Value {
    element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
    element->addAttribute(NSXMLNode::attributeWithName(NSStringView::ascii("xml:base"),
                                                       NSStringView::ascii("http://own/")));
    internal.setBaseURI(text("http://base/"), element.get());
    return element;
  });
  EXPECT_EQ(element->XMLString()->utf8(), "<a xml:base=\"http://own/\"/>");
}

TEST_F(Driver, OtherFirstItemsAreNotDecorated) {
  const auto recorded = NSXMLElement::elementWithName(NSStringView::ascii("r"));
  _internal(*context).setBaseURI(text("http://base/"), recorded.get());
  EXPECT_TRUE(evaluateLiteral(text("a")));
  const auto comment = NSXMLNode::commentWithStringValue(NSStringView::ascii("c"));
  EXPECT_TRUE(evaluateLiteral(Value(comment.get())));
}

TEST_F(Driver, DeeplyNestedHandMadeTreesEndInAClearError) {
  Ref<XQueryExpr> nested = XQueryLiteral::literalWithValue(NSNull::null());
  for (int depth = 0; depth < 2000000; ++depth) {
    auto list = XQueryExprList::exprList();
    list->addObject(nested);
    nested = list;
  }
  query = make<XQuery>(std::make_unique<XQueryInternal>(
      XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr), nested));
  nested = nullptr;
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, nullptr, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 0);
  EXPECT_EQ(error->msg()->utf8(), "limit: expression nested too deeply");
}

class RecordingClient : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext&) override {
    heard += label->utf8() + "=" + XQueryItemStringValue(*value) + ";";
  }
  std::string heard;
};

TEST_F(Driver, AClientMayBeReplacedAndTakenAway) {
  const auto first = std::make_shared<RecordingClient>();
  const auto second = std::make_shared<RecordingClient>();
  context->contextSetClient(first);
  context->contextSetClient(second);
  EXPECT_EQ(first.use_count(), 1);
  _traceValue(*context, text("v"), text("l"));
  EXPECT_EQ(first->heard + second->heard, "l=v;");
  context->contextSetClient(nullptr);
  _traceValue(*context, text("w"), text("l"));
  EXPECT_EQ(second->heard, "l=v;");
  EXPECT_FALSE(context->contextClient());
}

TEST_F(Driver, AClientHearsAndNothingIsLogged) {
  const auto client = std::make_shared<RecordingClient>();
  context->contextSetClient(client);
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  _traceValue(*context, text("v"), text("label"));
  unsetenv("XQUERY_LOG");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  EXPECT_EQ(client->heard, "label=v;");
}

TEST_F(Driver, TraceGoesToTheClient) {
  const auto client = std::make_shared<RecordingClient>();
  context->contextSetClient(client);
  EXPECT_EQ(context->contextClient(), client);
  _traceValue(*context, text("v"), text("label"));
  EXPECT_EQ(client->heard, "label=v;");
}

TEST_F(Driver, TraceWithoutClientLogsLabelThenValueWhenLoggingIsOn) {
  testing::internal::CaptureStderr();
  _traceValue(*context, text("v"), text("label"));
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  _traceValue(*context, text("v"), text("label"));
  unsetenv("XQUERY_LOG");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "label v\n");
}

TEST_F(Driver, InertEntryPointsAcceptAnything) {
  context->addXQueryProlog(text("anything"));
  context->contextAddClientSelector("selector:", "name");
  EXPECT_EQ(strings(evaluate("1")), "1");
}

TEST_F(Driver, ContextNamespacesResolveWhatTheQueryLeftOpen) {
  context = XQueryContext::xqueryContextWithNamespaces({{"p", "urn:p"}});
  const auto document = NSXMLDocument::documentWithData("<a xmlns='urn:p'>t</a>", 0);
  EXPECT_EQ(strings(evaluate("p:a", {}, document)), "t");
  EXPECT_FALSE(evaluate("q:a", {}, document));
  EXPECT_EQ(error->err(), 1);
}

}  // namespace
}  // namespace xquery
