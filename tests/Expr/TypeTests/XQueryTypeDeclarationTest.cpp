#include "Expr/Paths/PathTesting.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"

namespace xquery {
namespace {

class TypeDeclaration : public PathTesting {
 protected:
  using Declaration = XQueryTypeDeclaration;
  Ref<Declaration> bound(Ref<Declaration> declaration, int occurance = Declaration::ExactlyOne) {
    declaration->setOccuranceType(occurance);
    declaration->bindInfoForProlog(*prolog);
    return declaration;
  }
  Ref<Declaration> atomic(std::string_view name, int occurance = Declaration::ExactlyOne) {
    return bound(Declaration::atomic(text(name)), occurance);
  }
  bool matches(const Value& value, const Ref<Declaration>& declaration) {
    return XQueryInstanceOf(value.get(), *declaration, context.get());
  }
  // Which of the occurrence indicators "", "?", "*", "+" let the value match.
  std::string indicators(const Value& value, const std::function<Ref<Declaration>()>& made) {
    std::string result;
    for (int occurance = 0; occurance < 4; ++occurance) {
      if (matches(value, bound(made(), occurance))) result += "1?*+"[occurance];
    }
    return result;
  }
  // Which nodes of the sample match.
  std::string matchingNodes(const Ref<Declaration>& declaration) {
    bound(declaration);
    std::string result;
    for (const Value& node : nodes) {
      if (matches(node, declaration)) result += shown(node) + " ";
    }
    return result;
  }

  Ref<NSXMLDocument> document = parsed("<r><a x='1' y='2'>t</a><b/><!--k--><?p q?><?z q?></r>");
  std::vector<Value> nodes = [this] {
    std::vector<Value> result;
    for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) {
      result.push_back(const_cast<NSXMLNode*>(node));
      const auto* element = dyn_cast<NSXMLElement>(node);
      if (!element) continue;
      for (auto* n = element->firstAttribute(); n; n = NSXMLElement::nextAttribute(n)) {
        result.push_back(n);
      }
    }
    return result;
  }();
  const Value five = XQueryNumber::integerWithInt64(5);
  const Value six = XQueryNumber::integerWithInt64(6);
  const Value none = NSNull::null();
};

TEST_F(TypeDeclaration, EachFactoryMakesItsKind) {
  EXPECT_EQ(Declaration::atomic(text("xs:int"))->type(), 1);
  EXPECT_EQ(Declaration::empty()->type(), 2);
  EXPECT_EQ(Declaration::item()->type(), 3);
  EXPECT_EQ(Declaration::document(nullptr)->type(), 4);
  EXPECT_EQ(Declaration::element(nullptr)->type(), 5);
  EXPECT_EQ(Declaration::pi(nullptr)->type(), 6);
  EXPECT_EQ(Declaration::attribute(nullptr)->type(), 7);
  EXPECT_EQ(Declaration::comment()->type(), 8);
  EXPECT_EQ(Declaration::text()->type(), 9);
  EXPECT_EQ(Declaration::anyKind()->type(), 10);
  EXPECT_EQ(Declaration::item()->occuranceType(), 0);
}

TEST_F(TypeDeclaration, HasNoValueOfItsOwn) {
  EXPECT_EQ(shown(Declaration::item()->evaluateWithContext(*context)), "()");
}

TEST_F(TypeDeclaration, BindingResolvesTheNameOfAnAtomicType) {
  const auto declaration = Declaration::atomic(text("xs:integer"));
  EXPECT_TRUE(isa<NSString>(declaration->data()));
  EXPECT_EQ(declaration->typeID(), XQueryTypeNone);
  declaration->bindInfoForProlog(*prolog);
  ASSERT_TRUE(isa<XQueryQName>(declaration->data()));
  EXPECT_EQ(cast<XQueryQName>(declaration->data())->localPart()->utf8(), "integer");
  EXPECT_EQ(declaration->typeID(), XQueryTypeInteger);
}

TEST_F(TypeDeclaration, AnUnprefixedTypeTakesTheDefaultElementNamespace) {
  prolog->setDefaultElementNamespace(text("http://www.w3.org/2001/XMLSchema"));
  EXPECT_TRUE(matches(five, atomic("integer")));
}

TEST_F(TypeDeclaration, ATypeThatDoesNotResolveMatchesNothing) {
  EXPECT_FALSE(matches(five, atomic("no:integer")));
  EXPECT_FALSE(matches(five, atomic("xs:nothing")));
  EXPECT_FALSE(matches(document, atomic("xs:nothing")));
  EXPECT_FALSE(matches(five, Declaration::atomic(text("xs:integer"))));  // not bound
}

TEST_F(TypeDeclaration, BindingMarksAndBindsNameTests) {
  const auto attributeTest = XQueryNameTest::nameTest(text("x"));
  bound(Declaration::attribute(attributeTest));
  EXPECT_TRUE(attributeTest->attribute());
  EXPECT_TRUE(attributeTest->boundName());
  const auto elementTest = XQueryNameTest::nameTest(text("x"));
  bound(Declaration::element(elementTest));
  EXPECT_FALSE(elementTest->attribute());
  EXPECT_TRUE(elementTest->isDeferred());
}

TEST_F(TypeDeclaration, TheEmptySequenceMatchesByOccurrenceAlone) {
  EXPECT_EQ(indicators(none, [] { return Declaration::atomic(text("xs:integer")); }), "?*");
  EXPECT_EQ(indicators(none, [] { return Declaration::anyKind(); }), "?*");
  EXPECT_EQ(indicators(none, [] { return Declaration::item(); }), "?*");
  EXPECT_EQ(indicators(none, [] { return Declaration::empty(); }), "1?*+");
  EXPECT_EQ(indicators(array({}), [] { return Declaration::item(); }), "?*");
  EXPECT_EQ(indicators(array({none}), [] { return Declaration::item(); }), "?*");
}

TEST_F(TypeDeclaration, OnlyTheEmptySequenceMatchesEmpty) {
  EXPECT_EQ(indicators(five, [] { return Declaration::empty(); }), "");
  EXPECT_EQ(indicators(array({five, six}), [] { return Declaration::empty(); }), "");
}

TEST_F(TypeDeclaration, OneItemMatchesAllButPlus) {
  EXPECT_EQ(indicators(five, [] { return Declaration::atomic(text("xs:integer")); }), "1?*");
  EXPECT_EQ(indicators(five, [] { return Declaration::item(); }), "1?*");
  EXPECT_EQ(indicators(array({five}), [] { return Declaration::item(); }), "1?*");
  EXPECT_EQ(indicators(document, [] { return Declaration::anyKind(); }), "1?*");
}

TEST_F(TypeDeclaration, SeveralItemsMatchStarAndPlus) {
  const Value both = array({five, six});
  EXPECT_EQ(indicators(both, [] { return Declaration::atomic(text("xs:integer")); }), "*+");
  EXPECT_EQ(indicators(both, [] { return Declaration::item(); }), "*+");
}

TEST_F(TypeDeclaration, AnUnknownOccurrenceMatchesNothing) {
  EXPECT_FALSE(matches(five, bound(Declaration::item(), 4)));
  EXPECT_FALSE(matches(none, bound(Declaration::item(), -1)));
}

TEST_F(TypeDeclaration, EveryMemberMustBeOfTheAtomicType) {
  const auto many = atomic("xs:integer", Declaration::ZeroOrMore);
  EXPECT_TRUE(matches(array({five, six}), many));
  EXPECT_FALSE(matches(array({five, text("s")}), many));
  EXPECT_FALSE(matches(array({document, five}), many));
}

TEST_F(TypeDeclaration, ASubtypeMatchesItsBase) {
  EXPECT_TRUE(matches(five, atomic("xs:decimal")));
  EXPECT_FALSE(matches(five, atomic("xs:double")));
  EXPECT_FALSE(matches(five, atomic("xs:string")));
}

TEST_F(TypeDeclaration, APlainStringIsUntyped) {
  const Value plain = text("s");
  EXPECT_TRUE(matches(plain, atomic("xdt:anyAtomicType")));
  EXPECT_TRUE(matches(plain, atomic("xdt:untypedAtomic")));
  EXPECT_FALSE(matches(plain, atomic("xs:string")));
  EXPECT_TRUE(matches(XQueryString::stringWithString(*text("s")), atomic("xs:string")));
}

TEST_F(TypeDeclaration, ANodeIsOfNoAtomicType) {
  EXPECT_FALSE(matches(document, atomic("xdt:anyAtomicType")));
}

TEST_F(TypeDeclaration, KindTestsMatchTheirNodes) {
  EXPECT_EQ(matchingNodes(Declaration::document(nullptr)), "doc ");
  EXPECT_EQ(matchingNodes(Declaration::element(nullptr)), "r a b ");
  EXPECT_EQ(matchingNodes(Declaration::attribute(nullptr)), "@x @y ");
  EXPECT_EQ(matchingNodes(Declaration::pi(nullptr)), "pi(p) pi(z) ");
  EXPECT_EQ(matchingNodes(Declaration::comment()), "comment(k) ");
  EXPECT_EQ(matchingNodes(Declaration::text()), "text(t) ");
  EXPECT_EQ(matchingNodes(Declaration::anyKind()),
            "doc r a @x @y text(t) b comment(k) pi(p) pi(z) ");
  EXPECT_EQ(matchingNodes(Declaration::item()), "doc r a @x @y text(t) b comment(k) pi(p) pi(z) ");
}

TEST_F(TypeDeclaration, NameTestsNarrowElementsAndAttributes) {
  EXPECT_EQ(matchingNodes(Declaration::element(name("a"))), "a ");
  EXPECT_EQ(matchingNodes(Declaration::element(name("x"))), "");
  EXPECT_EQ(matchingNodes(Declaration::attribute(name("x"))), "@x ");
  EXPECT_EQ(matchingNodes(Declaration::attribute(name("a"))), "");
}

TEST_F(TypeDeclaration, DataThatIsNoNameTestMatchesNothing) {
  EXPECT_EQ(matchingNodes(Declaration::element(anyName())), "");
  EXPECT_EQ(matchingNodes(Declaration::attribute(text("x"))), "");
}

TEST_F(TypeDeclaration, ADocumentTestWithAnElementTestNeverMatches) {
  EXPECT_EQ(matchingNodes(Declaration::document(Declaration::element(name("r")))), "");
}

TEST_F(TypeDeclaration, AProcessingInstructionTestComparesTheTarget) {
  EXPECT_EQ(matchingNodes(Declaration::pi(text("p"))), "pi(p) ");
  EXPECT_EQ(matchingNodes(Declaration::pi(text("P"))), "");
}

TEST_F(TypeDeclaration, DataMakesAPlainKindTestFail) {
  for (const int type : {8, 9, 10}) {
    EXPECT_EQ(matchingNodes(make<Declaration>(type, Value(text("data")))), "") << type;
  }
}

TEST_F(TypeDeclaration, KindsOutsideTheTableMatchNothing) {
  for (const int type : {0, 11, -1}) {
    EXPECT_FALSE(matches(five, make<Declaration>(type, Value()))) << type;
    EXPECT_FALSE(matches(document, make<Declaration>(type, Value()))) << type;
  }
}

TEST_F(TypeDeclaration, SeveralNodesNeverMatchAKindTest) {
  const Value both = array({nodes[1], nodes[2]});
  EXPECT_EQ(indicators(both, [] { return Declaration::element(nullptr); }), "");
  EXPECT_EQ(indicators(both, [] { return Declaration::anyKind(); }), "");
  EXPECT_EQ(indicators(nodes[1], [] { return Declaration::element(nullptr); }), "1?*");
  EXPECT_EQ(indicators(array({nodes[1]}), [] { return Declaration::element(nullptr); }), "1?*");
}

TEST_F(TypeDeclaration, AnAtomicValueMatchesNoKindTest) {
  EXPECT_FALSE(matches(five, Declaration::anyKind()));
  EXPECT_FALSE(matches(five, Declaration::text()));
}

TEST_F(TypeDeclaration, KindTestsInStepsAgreeWithMatching) {
  const auto walked = [&](Ref<Declaration> test) {
    return shownFrom(document, {step(XQueryAxisDescendant, test)});
  };
  EXPECT_EQ(walked(Declaration::element(nullptr)), "r a b");
  EXPECT_EQ(walked(Declaration::element(name("a"))), "a");
  EXPECT_EQ(walked(Declaration::pi(text("z"))), "pi(z)");
  EXPECT_EQ(walked(Declaration::comment()), "comment(k)");
  EXPECT_EQ(walked(Declaration::text()), "text(t)");
  EXPECT_EQ(walked(Declaration::item()), "r a text(t) b comment(k) pi(p) pi(z)");
  EXPECT_EQ(walked(Declaration::document(nullptr)), "()");
  EXPECT_EQ(walked(bound(Declaration::element(nullptr), Declaration::OneOrMore)), "()");
  EXPECT_EQ(walked(atomic("xs:integer")), "()");
  EXPECT_EQ(shownFrom(nodes[2], {step(XQueryAxisAttribute, Declaration::attribute(name("y")))}),
            "@y");
}

TEST_F(TypeDeclaration, KindTestsInStepsLookUpNoContextNamespace) {
  context = XQueryContext::xqueryContextWithNamespaces({{"", "urn:d"}, {"d", "urn:d"}});
  const auto namespaced = parsed("<r><d:a xmlns:d='urn:d'/><a/></r>");
  const auto found = [&](std::string_view lexical) {
    const Value result =
        evaluateFrom(namespaced, {step(XQueryAxisDescendant, Declaration::element(name(lexical)))});
    return shown(result);
  };
  EXPECT_EQ(found("a"), "a");
  EXPECT_EQ(found("d:a"), "()");
}

TEST_F(TypeDeclaration, TreatAsGivesTheValueItself) {
  EXPECT_EQ(XQueryTreatAs(five, *atomic("xs:integer"), *context).get(), five.get());
  const Value both = array({five, six});
  EXPECT_EQ(XQueryTreatAs(both, *bound(Declaration::item(), 2), *context).get(), both.get());
}

TEST_F(TypeDeclaration, TreatAsRefusesWhatDoesNotMatch) {
  EXPECT_EQ(errorOf([&] { XQueryTreatAs(five, *atomic("xs:string"), *context); }),
            "6: invalid type");
  EXPECT_EQ(errorOf([&] { XQueryTreatAs(nullptr, *Declaration::item(), *context); }),
            "6: invalid type");
  EXPECT_EQ(errorOf([&] { XQueryTreatAs(none, *Declaration::item(), *context); }),
            "6: invalid type");
}

}  // namespace
}  // namespace xquery
