#include "Types/XQueryQName.h"
#include "TypesTestSupport.h"

#include <array>
#include <thread>
#include <vector>

namespace xquery {
namespace {

using testing::text;
using testing::utf8;
using testing::view;

struct Parts {
  const char* name;
  const char* prefix;
  const char* localPart;
};

TEST(QNameParsing, TheFirstColonAfterTheFirstCharacterSplits) {
  const Parts rows[] = {{"a", "", "a"},        {"p:a", "p", "a"},   {"p:", "p", ""},
                        {":x", "", ":x"},      {"", "", ""},        {":", "", ":"},
                        {"p:a:b", "p", "a:b"}, {":a:b", "", ":a:b"}};
  for (const Parts& row : rows) {
    Ref<NSString> prefix;
    Ref<NSString> localPart;
    XQueryQName::parseQNameString(text(row.name), prefix, localPart);
    EXPECT_EQ(utf8(prefix), row.prefix) << row.name;
    EXPECT_EQ(utf8(localPart), row.localPart) << row.name;
  }
}

struct Ranges {
  const char* name;
  XQueryQName::Range prefix;
  XQueryQName::Range localPart;
};

TEST(QNameParsing, RangesOfPrefixAndLocalPart) {
  constexpr uint32_t none = XQueryQName::notFound;
  const Ranges rows[] = {{"abc", {0, 0}, {0, 3}},      {"", {0, 0}, {0, 0}},
                         {"p:a", {0, 1}, {2, 1}},      {"ab:", {0, 2}, {3, 0}},
                         {":ab", {0, 0}, {1, 2}},      {"a:", {none, 0}, {none, 0}},
                         {":a", {none, 0}, {none, 0}}, {":", {none, 0}, {none, 0}}};
  for (const Ranges& row : rows) {
    XQueryQName::Range prefix{7, 7};
    XQueryQName::Range localPart{7, 7};
    XQueryQName::parseQNameString(view(row.name), prefix, localPart);
    EXPECT_EQ(prefix.location, row.prefix.location) << row.name;
    EXPECT_EQ(prefix.length, row.prefix.length) << row.name;
    EXPECT_EQ(localPart.location, row.localPart.location) << row.name;
    EXPECT_EQ(localPart.length, row.localPart.length) << row.name;
  }
}

TEST(QName, KeepsThePrefixAsAHint) {
  const Ref<XQueryQName> name = XQueryQName::qname(text("p:a"), text("urn:n"));
  EXPECT_EQ(utf8(name->namespaceURI()), "urn:n");
  EXPECT_EQ(utf8(name->localPart()), "a");
  EXPECT_EQ(utf8(name->prefixHint()), "p");
  EXPECT_EQ(utf8(name->XQueryStringValue()), "p:a");
  EXPECT_EQ(utf8(name->description()), "<XQueryQName namespace:urn:n prefix:p localpart:a>");
}

TEST(QName, PrintsItsLocalPartWhenItHasNoHint) {
  const Ref<XQueryQName> plain = XQueryQName::qname(text("a"), text("urn:n"));
  EXPECT_EQ(utf8(plain->XQueryStringValue()), "a");
  const Ref<XQueryQName> made = XQueryQName::qnameWithLocalPart(text("p:a"), nullptr);
  EXPECT_FALSE(made->prefixHint());
  EXPECT_EQ(utf8(made->localPart()), "p:a");
  EXPECT_EQ(utf8(made->XQueryStringValue()), "p:a");
  EXPECT_EQ(utf8(made->description()),
            "<XQueryQName namespace:(null) prefix:(null) localpart:p:a>");
}

TEST(QName, EqualityIsOfNamespaceAndLocalPart) {
  const Ref<XQueryQName> name = XQueryQName::qname(text("p:a"), text("urn:n"));
  const Ref<XQueryQName> other = XQueryQName::qname(text("q:a"), text("urn:n"));
  EXPECT_TRUE(name->isEqual(*other));
  EXPECT_EQ(name->hash(), other->hash());
  EXPECT_FALSE(name->isEqual(*XQueryQName::qname(text("p:b"), text("urn:n"))));
  EXPECT_FALSE(name->isEqual(*XQueryQName::qname(text("p:a"), text("urn:m"))));
  EXPECT_FALSE(name->isEqual(*XQueryQName::qname(text("p:a"), nullptr)));
  const Ref<XQueryQName> none = XQueryQName::qname(text("a"), nullptr);
  EXPECT_TRUE(none->isEqual(*XQueryQName::qnameWithLocalPart(text("a"), nullptr)));
  EXPECT_FALSE(none->isEqual(*XQueryQName::qname(text("a"), NSString::empty())));
}

TEST(QName, ItsInternedNameIsThatOfNodesOfTheSameName) {
  const Ref<XQueryQName> name = XQueryQName::qname(text("p:a"), text("urn:n"));
  const Ref<NSXMLElement> element = NSXMLElement::elementWithName(view("q:a"), view("urn:n"));
  EXPECT_EQ(name->expandedName().get(), element->expandedName());
  const Ref<XQueryQName> none = XQueryQName::qname(text("a"), nullptr);
  EXPECT_EQ(none->expandedName().get(), NSXMLElement::elementWithName(view("a"))->expandedName());
  EXPECT_NE(none->expandedName().get(), name->expandedName().get());
}

TEST(QName, SeveralThreadsInternOneNameAlike) {
  const Ref<XQueryQName> name = XQueryQName::qname(text("p:shared"), text("urn:n"));
  std::array<const NSXMLExpandedName*, 8> seen{};
  std::vector<std::thread> threads;
  for (auto& slot : seen) {
    threads.emplace_back([&name, &slot] { slot = name->expandedName().get(); });
  }
  for (std::thread& thread : threads) thread.join();
  for (const NSXMLExpandedName* interned : seen) {
    EXPECT_NE(interned, nullptr);
    EXPECT_EQ(interned, seen[0]);
  }
}

}  // namespace
}  // namespace xquery
