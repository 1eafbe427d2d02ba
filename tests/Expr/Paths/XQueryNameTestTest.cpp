#include "Expr/Paths/XQueryNameTest.h"
#include "PathTesting.h"

namespace xquery {
namespace {

class NameTest : public PathTesting {
 protected:
  // A prolog of a main or library module with the prefix p for urn:p.
  static Ref<XQueryProlog> prologWith(std::vector<Ref<XQueryPrologItem>> items) {
    items.push_back(
        XQueryPrologItemDeclareNamespace::declareNamespace(text("urn:p"), text("p"), 0));
    return XQueryProlog::prologWithItems(items, nullptr, nullptr, nullptr);
  }
  static Ref<XQueryProlog> mainModule() { return prologWith({}); }
  static Ref<XQueryProlog> libraryModule() {
    return prologWith(
        {XQueryPrologItemModuleNamespace::moduleNamespace(text("urn:m"), text("m"), 0)});
  }
  static Ref<XQueryProlog> withDefaultNamespace() {
    auto result = mainModule();
    result->setDefaultElementNamespace(text("urn:d"));
    return result;
  }
  static Ref<XQueryNameTest> bound(std::string_view name, XQueryProlog& prolog,
                                   bool attribute = false) {
    auto test = XQueryNameTest::nameTest(text(name));
    test->setExprLine(4);
    test->setAttribute(attribute);
    test->bindInfoForProlog(prolog);
    return test;
  }
  // "{URI}local" of the name in the context, or "(none)".
  std::string nameOf(const XQueryNameTest& test) {
    const auto qName = test.qNameForContext(context.get());
    if (!qName) return "(none)";
    const auto& URI = qName->namespaceURI();
    return "{" + (URI ? URI->utf8() : "") + "}" + qName->localPart()->utf8();
  }
  std::string matching(const XQueryExpr& test) {
    std::string result;
    for (const NSXMLNode* node : nodes) {
      if (XQueryAxisStep::isValid(node, &test, *context)) result += shown(node) + " ";
    }
    return result;
  }
  void SetUp() override {
    for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) {
      nodes.push_back(node);
      const auto* element = dyn_cast<NSXMLElement>(node);
      if (!element) continue;
      for (auto* n = element->firstNamespace(); n; n = NSXMLElement::nextNamespace(n)) {
        nodes.push_back(n);
      }
      for (auto* n = element->firstAttribute(); n; n = NSXMLElement::nextAttribute(n)) {
        nodes.push_back(n);
      }
    }
  }

  Ref<NSXMLDocument> document = parsed(
      "<r xmlns:p='urn:p'>"
      "<a/><p:a/><q:a xmlns:q='urn:p'/><ba/><x:a xmlns:x='urn:x'/><d:a xmlns:d='urn:d'/>"
      "<e a='1' p:a='2'/>t<!--a--><?a t?></r>");
  std::vector<const NSXMLNode*> nodes;
};

TEST_F(NameTest, AnElementNameWithAPrefixIsBound) {
  const auto test = bound("p:a", *mainModule());
  EXPECT_FALSE(test->isDeferred());
  EXPECT_EQ(nameOf(*test), "{urn:p}a");
  EXPECT_TRUE(test->boundName());
  EXPECT_EQ(matching(*test), "p:a q:a @p:a ");
}

TEST_F(NameTest, AnElementNameWithoutPrefixTakesTheDefaultElementNamespace) {
  const auto test = bound("a", *withDefaultNamespace());
  EXPECT_EQ(nameOf(*test), "{urn:d}a");
  EXPECT_EQ(matching(*test), "d:a ");
}

TEST_F(NameTest, AnAttributeNameWithoutPrefixHasNoNamespace) {
  const auto test = bound("a", *withDefaultNamespace(), true);
  EXPECT_FALSE(test->isDeferred());
  EXPECT_EQ(nameOf(*test), "{}a");
  EXPECT_EQ(matching(*test), "a @a ");
}

TEST_F(NameTest, AnAttributeNameWithAPrefixIsResolvedLikeAnElements) {
  EXPECT_EQ(nameOf(*bound("p:a", *withDefaultNamespace(), true)), "{urn:p}a");
}

TEST_F(NameTest, ElementsAndAttributesMatchAlikeAndNothingElse) {
  EXPECT_EQ(matching(*bound("a", *mainModule())), "a @a ");
}

TEST_F(NameTest, ANameInAMainModuleWithoutDefaultNamespaceWaitsForTheContext) {
  const auto main = mainModule();
  const auto test = bound("a", *main);
  EXPECT_TRUE(test->isDeferred());
  EXPECT_EQ(test->boundName(), nullptr);
  ASSERT_EQ(main->qNameReferences().size(), 1U);
  EXPECT_EQ(main->qNameReferences()[0]->exprLine(), 4);
  EXPECT_TRUE(main->errors().empty());
  EXPECT_EQ(nameOf(*test), "{}a");
  context = XQueryContext::xqueryContextWithNamespaces({{"", "urn:d"}});
  EXPECT_EQ(nameOf(*test), "{urn:d}a");
  EXPECT_EQ(matching(*test), "d:a ");
}

TEST_F(NameTest, AnUnknownPrefixInAMainModuleIsLookedUpInTheContext) {
  const auto test = bound("u:a", *mainModule());
  EXPECT_TRUE(test->isDeferred());
  EXPECT_EQ(errorOf([&] { matching(*test); }), "1: can't resolve QName for \"u:a\"");
  EXPECT_EQ(_internal(*context).error()->line(), 5);
  context = XQueryContext::xqueryContextWithNamespaces({{"u", "urn:x"}});
  EXPECT_EQ(matching(*test), "x:a ");
}

TEST_F(NameTest, AnUnknownPrefixInALibraryModuleIsAnErrorAtBinding) {
  const auto library = libraryModule();
  const auto test = bound("u:a", *library);
  ASSERT_EQ(library->errors().size(), 1U);
  EXPECT_EQ(library->errors()[0]->err(), 1);
  EXPECT_EQ(library->errors()[0]->msg()->utf8(), "can't resolve QName for \"u:a\"");
  EXPECT_EQ(library->errors()[0]->line(), 5);
  EXPECT_TRUE(library->qNameReferences().empty());
  EXPECT_EQ(nameOf(*test), "(none)");
  EXPECT_EQ(matching(*test), "");
}

TEST_F(NameTest, ANameInALibraryModuleWithoutDefaultNamespaceHasNone) {
  const auto test = bound("a", *libraryModule());
  EXPECT_FALSE(test->isDeferred());
  EXPECT_EQ(matching(*test), "a @a ");
}

TEST_F(NameTest, WithoutAContextANameIsInNoNamespace) {
  const auto test = bound("a", *mainModule());
  EXPECT_TRUE(test->isValidNode(*nodes[3], nullptr));  // the plain a
  EXPECT_FALSE(bound("u:a", *mainModule())->isValidNode(*nodes[3], nullptr));
}

TEST_F(NameTest, AStepAgreesWithTheTestAlone) {
  const auto main = mainModule();
  const auto viaStep = [&](Ref<XQueryExpr> test) {
    const auto walk = path({rootStep(), step(XQueryAxisDescendant, std::move(test))});
    walk->bindInfoForProlog(*main);
    focusOn(document);
    return shown(evaluatedOrThrown(*walk, *context));
  };
  EXPECT_EQ(viaStep(name("a")), "a");
  EXPECT_EQ(viaStep(name("p:a")), "p:a q:a");
  EXPECT_EQ(viaStep(anyName()), "r a p:a q:a ba x:a d:a e pi(a)");
  context = XQueryContext::xqueryContextWithNamespaces({{"", "urn:d"}, {"u", "urn:x"}});
  EXPECT_EQ(viaStep(name("a")), "d:a");
  EXPECT_EQ(viaStep(name("u:a")), "x:a");
  EXPECT_EQ(viaStep(XQueryWildCardNameTest::nameTest(text("u"), nullptr)), "x:a");
}

TEST_F(NameTest, TheFullWildcardAsksOnlyForAName) {
  const auto test = anyName();
  test->bindInfoForProlog(*mainModule());
  EXPECT_EQ(matching(*test),
            "r namespace(p) a p:a q:a namespace(q) ba x:a namespace(x) d:a namespace(d) "
            "e @a @p:a pi(a) ");
}

TEST_F(NameTest, AWildcardForAnyNamespaceComparesTheLocalName) {
  const auto test = XQueryWildCardNameTest::nameTest(nullptr, text("a"));
  test->bindInfoForProlog(*mainModule());
  EXPECT_EQ(matching(*test), "a p:a q:a x:a d:a @a @p:a pi(a) ");
}

TEST_F(NameTest, AWildcardForAnyLocalNameComparesTheNamespace) {
  const auto main = mainModule();
  const auto test = XQueryWildCardNameTest::nameTest(text("p"), nullptr);
  test->bindInfoForProlog(*main);
  EXPECT_EQ(test->uriForContext(context.get())->utf8(), "urn:p");
  EXPECT_EQ(matching(*test), "p:a q:a @p:a ");
  EXPECT_TRUE(main->qNameReferences().empty());
}

TEST_F(NameTest, AWildcardWithAnUnknownPrefixWaitsForTheContext) {
  const auto main = mainModule();
  const auto test = XQueryWildCardNameTest::nameTest(text("u"), nullptr);
  test->bindInfoForProlog(*main);
  EXPECT_EQ(main->qNameReferences().size(), 1U);
  EXPECT_EQ(errorOf([&] { matching(*test); }), "1: can't resolve QName for \"u:*\"");
  context = XQueryContext::xqueryContextWithNamespaces({{"u", "urn:x"}});
  EXPECT_EQ(matching(*test), "x:a ");
}

TEST_F(NameTest, ANameTestHasNoValue) {
  EXPECT_EQ(shown(name("a")->evaluateWithContext(*context)), "()");
  EXPECT_EQ(shown(anyName()->evaluateWithContext(*context)), "()");
}

TEST_F(NameTest, OtherTestsMatchNothing) {
  EXPECT_EQ(matching(*integer("1")), "");
  EXPECT_FALSE(XQueryAxisStep::isValid(nodes[0], nullptr, *context));
  EXPECT_FALSE(XQueryAxisStep::isValid(nullptr, anyNode().get(), *context));
}

}  // namespace
}  // namespace xquery
