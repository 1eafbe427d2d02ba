#include "Context/XQueryContextInternal.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Collection.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}
Ref<XQueryQName> name(std::string_view local) {
  return XQueryQName::qname(text(local), nullptr);
}

class DynamicContext : public testing::Test {
 protected:
  Ref<XQueryContext> holder = XQueryContext::xqueryContext();
  XQueryContextInternal& context = _internal(*holder);
};

TEST_F(DynamicContext, StartsOrderedWithoutFocus) {
  EXPECT_TRUE(context.ordered());
  EXPECT_FALSE(context.contextItem());
  EXPECT_EQ(context.position(), 0);
  EXPECT_EQ(context.last(), 0);
  EXPECT_EQ(context.baseURINodeCount(), 0U);
  EXPECT_FALSE(context.error());
  EXPECT_EQ(context.activeProlog(), nullptr);
}

TEST_F(DynamicContext, VariableIDsOutsideTheFrameHaveNoValue) {
  EXPECT_EQ(context.variableForID(0), nullptr);
  EXPECT_EQ(context.variableForID(-1), nullptr);
  EXPECT_EQ(context.variableForID(1), nullptr);
}

TEST_F(DynamicContext, SettingAnIDFillsTheSlotsBelowWithNull) {
  const Value value = text("v");
  context.setVariable(value, 5);
  for (int id = 1; id < 5; ++id) EXPECT_EQ(context.variableForID(id), NSNull::null()) << id;
  EXPECT_EQ(context.variableForID(5), value.get());
  EXPECT_EQ(context.variableForID(6), nullptr);
}

TEST_F(DynamicContext, SettingIDZeroHasNoEffect) {
  context.setVariable(text("v"), 0);
  EXPECT_EQ(context.variableForID(0), nullptr);
  EXPECT_EQ(context.variableForID(1), nullptr);
}

TEST_F(DynamicContext, AnInstalledFrameHidesTheOldOneUntilItIsPutBack) {
  context.setVariable(text("outer"), 1);
  const auto saved = context._inScopeVariables();
  context._setInScopeVariables(nullptr);
  EXPECT_EQ(context.variableForID(1), nullptr);
  context.setVariable(text("inner"), 1);
  context._setInScopeVariables(saved);
  EXPECT_EQ(static_cast<NSString*>(context.variableForID(1))->utf8(), "outer");
}

TEST_F(DynamicContext, SettingAnIDAgainReplacesItsValueOnly) {
  context.setVariable(text("a"), 1);
  context.setVariable(text("b"), 2);
  context.setVariable(text("c"), 1);
  EXPECT_EQ(static_cast<NSString*>(context.variableForID(1))->utf8(), "c");
  EXPECT_EQ(static_cast<NSString*>(context.variableForID(2))->utf8(), "b");
}

TEST_F(DynamicContext, GlobalsOfOneLocalPartAreKeptApartByNamespace) {
  context.setGlobal(text("v"), XQueryQName::qname(text("x"), text("urn:a")));
  EXPECT_EQ(context.globalForQName(*name("x")), nullptr);
  EXPECT_EQ(context.globalForQName(*XQueryQName::qname(text("x"), text("urn:b"))), nullptr);
  EXPECT_TRUE(context.globalForQName(*XQueryQName::qname(text("x"), text("urn:a"))));
}

TEST_F(DynamicContext, GlobalsAreKeptByNameUntilCleared) {
  context.setGlobal(text("v"), name("x"));
  ASSERT_TRUE(context.globalForQName(*name("x")));
  EXPECT_EQ(context.globalForQName(*name("y")), nullptr);
  context._clearGlobals();
  EXPECT_EQ(context.globalForQName(*name("x")), nullptr);
}

TEST_F(DynamicContext, SettingTheContextItemLeavesLastAlone) {
  context.setLast(9);
  context.setContextItem(text("i"), 2);
  EXPECT_EQ(context.last(), 9);
  EXPECT_EQ(context.position(), 2);
}

TEST_F(DynamicContext, ContextNamespacesAreSetAndRemoved) {
  context.addNamespace(text("urn:a"), text("a"));
  EXPECT_EQ(context.contextNamespaceForPrefix(NSStringView::ascii("a"))->utf8(), "urn:a");
  context.addNamespace(nullptr, text("a"));
  EXPECT_FALSE(context.contextNamespaceForPrefix(NSStringView::ascii("a")));
}

TEST_F(DynamicContext, FirstPrefixPrefersTheInnermostConstructor) {
  const auto prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  prolog->addPrefix(text("p1"), text("urn:u"));
  prolog->addPrefix(text("p2"), text("urn:u"));
  context.setActiveProlog(prolog.get());
  // Several prolog prefixes: the last of them.
  EXPECT_EQ(context.firstPrefixForNamespace(text("urn:u"))->utf8(), "p2");
  const auto node = [](std::string_view prefix) {
    return NSXMLNode::namespaceWithName(NSStringView::ascii(prefix), NSStringView::ascii("urn:u"));
  };
  context.pushInScopeNamespaces({node("outer")});
  context.pushInScopeNamespaces({node("first"), node("second")});
  EXPECT_EQ(context.firstPrefixForNamespace(text("urn:u"))->utf8(), "first");
  context.popInScopeNamespaces();
  EXPECT_EQ(context.firstPrefixForNamespace(text("urn:u"))->utf8(), "outer");
  context.popInScopeNamespaces();
  EXPECT_EQ(context.firstPrefixForNamespace(text("urn:u"))->utf8(), "p2");
  EXPECT_FALSE(context.firstPrefixForNamespace(text("urn:other")));
  context.setActiveProlog(nullptr);
}

TEST_F(DynamicContext, SinglePrologPrefixIsAnswered) {
  const auto prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  prolog->addPrefix(text("p"), text("urn:u"));
  context.setActiveProlog(prolog.get());
  EXPECT_EQ(context.firstPrefixForNamespace(text("urn:u"))->utf8(), "p");
  context.setActiveProlog(nullptr);
}

TEST_F(DynamicContext, BuiltinNamespacesHaveTheShiftedPrefixes) {
  const auto prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  context.setActiveProlog(prolog.get());
  EXPECT_EQ(context.firstPrefixForNamespace(text("http://www.w3.org/2001/XMLSchema"))->utf8(),
            "xsi");
  EXPECT_EQ(
      context.firstPrefixForNamespace(text("http://www.w3.org/2004/10/xpath-functions"))->utf8(),
      "xdt");
  EXPECT_FALSE(context.firstPrefixForNamespace(text("http://www.w3.org/1999/xhtml")));
  context.setActiveProlog(nullptr);
}

TEST_F(DynamicContext, NoNamespaceHasNoPrefix) {
  const auto prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  context.setActiveProlog(prolog.get());
  context.pushInScopeNamespaces(
      {NSXMLNode::namespaceWithName(NSStringView::ascii("p"), NSStringView::ascii("urn:u"))});
  EXPECT_FALSE(context.firstPrefixForNamespace(nullptr));
  context.setActiveProlog(nullptr);
}

TEST_F(DynamicContext, PoppingAnEmptyStackDoesNothing) {
  context.popInScopeNamespaces();
  EXPECT_FALSE(context.firstPrefixForNamespace(text("urn:u")));
}

TEST_F(DynamicContext, StaticQuestionsGoToTheActiveProlog) {
  const auto prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  prolog->addPrefix(text("p"), text("urn:p"));
  prolog->setDefaultElementNamespace(text("urn:e"));
  prolog->setDefaultCollation(text("urn:c"));
  prolog->setBaseURI(text("http://b/"));
  prolog->setXMLSpacePreserve(true);
  context.setActiveProlog(prolog.get());
  bool fromProlog = false;
  EXPECT_EQ(context.namespaceForPrefix(NSStringView::ascii("p"))->utf8(), "urn:p");
  EXPECT_EQ(context.namespaceForPrefix(NSStringView::ascii("p"), fromProlog)->utf8(), "urn:p");
  EXPECT_TRUE(fromProlog);
  EXPECT_FALSE(context.namespaceForPrefix(NSStringView::ascii("q")));
  EXPECT_EQ(context.defaultElementNamespace()->utf8(), "urn:e");
  EXPECT_EQ(context.defaultCollation()->utf8(), "urn:c");
  EXPECT_EQ(context.baseURI()->utf8(), "http://b/");
  EXPECT_TRUE(context.xmlSpacePreserve());
  context.setActiveProlog(nullptr);
  EXPECT_FALSE(context.namespaceForPrefix(NSStringView::ascii("p")));
  EXPECT_FALSE(context.baseURI());
  EXPECT_FALSE(context.xmlSpacePreserve());
}

TEST_F(DynamicContext, ALaterBaseURIReplacesTheOneBefore) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  context.setBaseURI(text("http://a/"), element.get());
  context.setBaseURI(text("http://b/"), element.get());
  EXPECT_EQ(context.baseURINodeCount(), 1U);
  EXPECT_EQ(context.baseURIForNode(element.get())->utf8(), "http://b/");
}

TEST_F(DynamicContext, BaseURINeedsBothParts) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  context.setBaseURI(nullptr, element.get());
  context.setBaseURI(text("u"), nullptr);
  EXPECT_EQ(context.baseURINodeCount(), 0U);
  context.setBaseURI(text("http://b/"), element.get());
  EXPECT_EQ(context.baseURINodeCount(), 1U);
  EXPECT_EQ(context.baseURIForNode(element.get())->utf8(), "http://b/");
  const auto other = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  EXPECT_FALSE(context.baseURIForNode(other.get()));
  EXPECT_FALSE(context.baseURIForNode(nullptr));
}

TEST_F(DynamicContext, TheNodesOwnBaseURIComesFirst) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  element->addAttribute(NSXMLNode::attributeWithName(
      NSStringView::ascii("xml:base"), NSStringView::ascii("http://own/"),
      NSStringView::ascii("http://www.w3.org/XML/1998/namespace")));
  context.setBaseURI(text("http://recorded/"), element.get());
  EXPECT_EQ(context.baseURIForNode(element.get())->utf8(), "http://own/");
}

TEST_F(DynamicContext, WithoutRecordedURIsTheOwnEmptyOneIsAnswered) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  const auto answer = context.baseURIForNode(element.get());
  ASSERT_TRUE(answer);
  EXPECT_EQ(answer->length(), 0U);
}

TEST_F(DynamicContext, RaisingThrowsWithTheDescriptionAsReason) {
  const auto error = XQueryError::error(6, "invalid type", 2);
  try {
    context.setError(error, true);
    FAIL() << "nothing was thrown";
  } catch (const NSException& exception) {
    EXPECT_EQ(exception.name(), "XQueryError");
    EXPECT_EQ(exception.reason()->utf8(), "XQueryError:6 - \"invalid type\" at line:3");
  }
  EXPECT_EQ(context.error().get(), error.get());
}

TEST_F(DynamicContext, TheLastErrorWinsAndMayBeCleared) {
  context.setError(XQueryError::error(6, "first"), false);
  context.setError(XQueryError::error(6, "second"), false);
  EXPECT_EQ(context.error()->msg()->utf8(), "second");
  context.setError(nullptr, false);
  EXPECT_FALSE(context.error());
}

TEST_F(DynamicContext, WithLoggingOnTheAssertionHandlerThrows) {
  setenv("XQUERY_LOG", "1", 1);
  testing::internal::CaptureStderr();
  const auto error = XQueryError::error(6, "invalid type");
  EXPECT_THROW(context.setError(error, true), NSException);
  const std::string log = testing::internal::GetCapturedStderr();
  unsetenv("XQUERY_LOG");
  EXPECT_NE(log.find("XQueryError:6 - \"invalid type\""), std::string::npos) << log;
  EXPECT_NE(log.find("Eval/XQueryContextInternal:288"), std::string::npos) << log;
}

TEST_F(DynamicContext, WithLoggingSetToZeroRaisingIsPlain) {
  setenv("XQUERY_LOG", "0", 1);
  testing::internal::CaptureStderr();
  EXPECT_THROW(context.setError(XQueryError::error(6, "invalid type"), true), NSException);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
  unsetenv("XQUERY_LOG");
}

TEST_F(DynamicContext, ExternalFunctionsAreNeverFound) {
  EXPECT_FALSE(context.XQueryExternalFunctionForQName(*name("f")));
}

}  // namespace
}  // namespace xquery
