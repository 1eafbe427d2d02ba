// The public questions about result items.
#include "Types/XQueryBinary.h"
#include "Types/XQueryQName.h"
#include "TypesTestSupport.h"
#include "xquery/URL.h"

namespace xquery {
namespace {

using testing::decimal;
using testing::integer;
using testing::parse;
using testing::text;
using testing::view;
using testing::xsString;

TEST(ItemTypeName, OfNodesAsTheirKindTests) {
  const std::pair<Value, const char*> rows[] = {
      {parse("<a/>"), "document-node()"},
      {NSXMLElement::elementWithName(view("a")), "element()"},
      {NSXMLNode::attributeWithName(view("a"), view("v")), "attribute()"},
      {NSXMLNode::namespaceWithName(view("p"), view("u")), "namespace()"},
      {NSXMLNode::processingInstructionWithName(view("p"), view("u")), "processing-instruction()"},
      {NSXMLNode::commentWithStringValue(view("p")), "comment()"},
      {NSXMLNode::textWithStringValue(view("p")), "text()"},
  };
  for (const auto& [item, name] : rows) EXPECT_EQ(XQueryItemTypeName(*item), name);
}

TEST(ItemTypeName, OfAtomicValuesWithTheUsualPrefix) {
  const std::pair<Value, const char*> rows[] = {
      {text("a"), "xdt:untypedAtomic"},
      {xsString("a"), "xs:string"},
      {integer(1), "xs:integer"},
      {decimal("1.5"), "xs:decimal"},
      {NSNumber::trueValue(), "xs:boolean"},
      {XQueryNumber::nan(), "xs:double"},
      {XQueryNumber::yearMonthDurationWithMonths(1), "xdt:yearMonthDuration"},
      {XQueryNumber::dayTimeDurationWithSeconds(1), "xdt:dayTimeDuration"},
      {NSURL::URLWithString(text("a")), "xs:anyURI"},
      {XQueryQName::qname(text("a"), nullptr), "xs:QName"},
      {XQueryHexBinary::binaryWithString(view("")), "xs:hexBinary"},
  };
  for (const auto& [item, name] : rows) EXPECT_EQ(XQueryItemTypeName(*item), name);
}

TEST(ItemTypeName, AnItemWithoutATypeIsAnItem) {
  EXPECT_EQ(XQueryItemTypeName(*NSData::dataWithBytes("a")), "item()");
  EXPECT_EQ(XQueryItemTypeName(*XQueryError::error(1, "a")), "item()");
}

TEST(ItemStringValue, OfNodesValuesDataAndErrors) {
  EXPECT_EQ(XQueryItemStringValue(*parse("<a>x<b>\xC3\xA9</b></a>")), "x\xC3\xA9");
  EXPECT_EQ(XQueryItemStringValue(*NSXMLNode::attributeWithName(view("a"), view("v"))), "v");
  EXPECT_EQ(XQueryItemStringValue(*integer(7)), "7");
  EXPECT_EQ(XQueryItemStringValue(*text("\xE2\x82\xAC")), "\xE2\x82\xAC");
  EXPECT_EQ(XQueryItemStringValue(*NSData::dataWithBytes("\xAB\x01")), "AB01");
  const Ref<XQueryError> error = XQueryError::error(1, "a");
  EXPECT_EQ(XQueryItemStringValue(*error), error->description()->utf8());
}

TEST(UntypedAtomic, IsAPlainString) {
  const Value value = NSString::stringWithUTF8("\xC3\xA9");
  EXPECT_EQ(XQueryObjectTypeID(value.get()), 8);
  EXPECT_EQ(XQueryItemStringValue(*value), "\xC3\xA9");
}

}  // namespace
}  // namespace xquery
