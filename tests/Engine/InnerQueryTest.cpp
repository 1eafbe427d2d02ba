#include "Functions/InnerQuery.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

std::string shown(const Ref<NSArray>& items, const Ref<NSError>& error) {
  if (!items) return error ? error->localizedDescription()->utf8() : "no value";
  EXPECT_FALSE(error);
  std::string all;
  for (const Value& item : items->objects()) {
    all += XQueryItemTypeName(*item) + " " + XQueryItemStringValue(*item) + ";";
  }
  return all;
}

class NodeQueries : public testing::Test {
 protected:
  std::string objects(std::string_view query) {
    Ref<NSError> error;
    const Ref<NSArray> items = root->objectsForXQuery(text(query), &error);
    return shown(items, error);
  }
  std::string nodes(std::string_view path) {
    Ref<NSError> error;
    const Ref<NSArray> items = root->nodesForXPath(text(path), &error);
    return shown(items, error);
  }

  Ref<NSXMLDocument> document =
      NSXMLDocument::documentWithData("<a><b>1</b><b x='3'>2</b></a>", NSXMLNodePreserveWhitespace);
  NSXMLElement* root = document->rootElement();
};

TEST_F(NodeQueries, HaveTheNodeAsContextItem) {
  EXPECT_EQ(objects("sum(b), 'x', name(.)"), "xs:double 3;xs:string x;xs:string a;");
  EXPECT_EQ(nodes("b[2]/@x | b[1]"), "element() 1;attribute() 3;");
  EXPECT_EQ(objects("()"), "");
  EXPECT_EQ(nodes("c"), "");
}

TEST_F(NodeQueries, AnswerTheNodesThemselves) {
  const Ref<NSArray> found = root->nodesForXPath(text("/a/b"));
  ASSERT_EQ(found->count(), 2U);
  EXPECT_EQ(found->objectAtIndex(0), root->firstChild());
}

TEST_F(NodeQueries, SayWhyTheyFail) {
  EXPECT_EQ(objects("$x"), "XQueryError:8 - \"reference to undefined variable \"x\"\" at line:1");
  EXPECT_EQ(nodes("b, 1"), "XQueryError:19 - \"item not a node\"");
  EXPECT_EQ(nodes("error()"), "XQueryError:0 - \"http://www.w3.org/2004/07/xqt-errors#FOER0000\"");
  EXPECT_TRUE(objects("1 +").starts_with("XQueryError:3 - "));
  EXPECT_FALSE(root->objectsForXQuery(text("1 +")));
  EXPECT_EQ(objects(""), "no value");
}

TEST_F(NodeQueries, ForgetAFormerError) {
  Ref<NSError> error = XQueryError::error(1, "former");
  EXPECT_TRUE(root->objectsForXQuery(text("1"), &error));
  EXPECT_FALSE(error);
}

TEST(InnerQuery, RaisesItsLimitsInTheQueryAroundIt) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  const auto query = XQuery::xqueryWithSource(
      "(1, 2)[ext:eval('declare function local:f($n) { 1 + local:f($n) }; local:f(1)')]");
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, {}, &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->msg()->utf8(), "limit: expression nested too deeply");
}

TEST(InnerQuery, MayHaveQueriesOfItsHostInIt) {
  class Client : public XQueryClient {
   public:
    std::string heard;
    void XQueryClientTraceValue(const Value& value, const Ref<NSString>&, XQueryContext&) override {
      Ref<NSError> error;
      heard += shown(cast<NSXMLNode>(value.get())->objectsForXQuery(text("count(*)")), error);
    }
  };
  const auto client = std::make_shared<Client>();
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  context->contextSetClient(client);
  const auto query = XQuery::xqueryWithSource("trace(<a><b/><b/></a>, ''), ext:eval('1')");
  EXPECT_TRUE(context->evaluateXQuery(*query, {}, {}));
  EXPECT_EQ(client->heard, "xs:integer 2;");
}

}  // namespace
}  // namespace xquery
