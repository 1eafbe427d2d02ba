// Documents, queries and evaluations in one call each.
#include "xquery/Evaluating.h"

#include <gtest/gtest.h>

#include <fstream>
#include <string>

namespace xquery {
namespace {

std::string said(const Ref<XQueryError>& error) {
  return error ? std::to_string(error->err()) + " " + error->msg()->utf8() : "done";
}

std::string texts(const XQueryResult<XQueryItemRange>& items) {
  if (!items) return "error " + said(items.error());
  std::string text;
  for (const Value& item : *items) text += XQueryItemStringValue(*item) + ";";
  return text;
}

class File {
 public:
  explicit File(std::string_view content)
      : path(::testing::TempDir() + "EvaluatingTest" + std::to_string(count++)) {
    std::ofstream(path) << content;
  }
  ~File() { std::remove(path.c_str()); }
  const std::string path;

 private:
  static inline int count = 0;
};

TEST(Evaluating, AQueryThatIsAskedOnce) {
  EXPECT_EQ(texts(XQueryEvaluate("1 to 3")), "1;2;3;");
  EXPECT_EQ(texts(XQueryEvaluate("string(.)", XQueryMakeInteger(7))), "7;");
  EXPECT_EQ(texts(XQueryEvaluate("//b", XQueryReadXML("<a><b>1</b><b>2</b></a>"))), "1;2;");
}

TEST(Evaluating, ACompiledQueryWithVariables) {
  const auto query = XQueryCompile("declare variable $n external; $n * 2");
  ASSERT_TRUE(query);
  EXPECT_EQ(texts(XQueryEvaluate(query, {}, {{"n", XQueryMakeInteger(21)}})), "42;");
  EXPECT_EQ(texts(XQueryEvaluate(*query, {}, {{"n", *XQueryMakeDecimal("0.5")}})), "1;");
  EXPECT_EQ(texts(XQueryEvaluate(query)), "error 16 unresloved external variable - n");
}

TEST(Evaluating, AValueOfNothingIsAnEmptyRange) {
  for (const char* text : {"", "()", "(: nothing :)", "module namespace m = 'urn:m';"}) {
    EXPECT_EQ(texts(XQueryEvaluate(text)), "") << text;
  }
}

TEST(Evaluating, ErrorsFromWhereverTheyCome) {
  EXPECT_TRUE(texts(XQueryEvaluate("1 +")).starts_with("error 3 "));
  EXPECT_EQ(texts(XQueryEvaluate("1 idiv 0")), "error 6 divide by zero");
  EXPECT_EQ(texts(XQueryEvaluate("(1, <!-- a -- b -->)")), "error 72 invalid comment");
  ASSERT_FALSE(XQueryCompile("1 +"));
  EXPECT_EQ(XQueryCompile("1 +").error()->err(), 3);
}

TEST(Evaluating, TheErrorIsWhatWentWrongFirst) {
  const auto broken = XQueryReadXML("<a>\n<b></a>");
  ASSERT_FALSE(broken);
  EXPECT_EQ(broken.error()->category(), XQueryErrorCategory::Loading);
  EXPECT_TRUE(said(broken.error()).starts_with("0 line 2, column ")) << said(broken.error());
  EXPECT_EQ(texts(XQueryEvaluate("1", broken)), "error " + said(broken.error()));
  EXPECT_EQ(texts(XQueryEvaluate("1 +", broken)), "error " + said(broken.error()));
}

TEST(Evaluating, FilesAreReadWithTheirWhiteSpaceUnlessToldOtherwise) {
  const File file("<a> <b/> </a>");
  EXPECT_EQ(texts(XQueryEvaluate("count(/a/node())", XQueryReadFile(file.path))), "3;");
  EXPECT_EQ(texts(XQueryEvaluate("count(/a/node())", XQueryReadFile(file.path, 0))), "1;");
  const auto missing = XQueryReadFile("/nowhere.xml");
  ASSERT_FALSE(missing);
  EXPECT_TRUE(said(missing.error()).starts_with("0 /nowhere.xml: ")) << said(missing.error());
  EXPECT_EQ(missing.error()->line(), 0);
}

TEST(Evaluating, AContextKeepsWhatItKeeps) {
  const auto context = XQueryContext::xqueryContext();
  EXPECT_EQ(texts(XQueryEvaluate("string(.)", XQueryMakeInteger(7), {}, context)), "7;");
  EXPECT_EQ(texts(XQueryEvaluate("string(.)", {}, {}, context)), "7;");
  XQueryLimits limits;
  limits.duration = std::chrono::nanoseconds(0);
  context->contextSetLimits(limits);
  EXPECT_EQ(texts(XQueryEvaluate("1", {}, {}, context)), "error 0 limit: deadline passed");
}

TEST(Evaluating, ItemsOutliveTheirContextAndDocument) {
  const auto items = XQueryEvaluate("//b", XQueryReadXML("<a><b>1</b></a>"));
  ASSERT_TRUE(items);
  EXPECT_EQ(cast<NSXMLNode>(items->at(0))->parent()->name()->utf8(), "a");
}

TEST(Evaluating, Streams) {
  const File file("<a><b>1</b><b>2</b></a>");
  XQueryStreamInput input;
  input.path = file.path;
  std::string found;
  const auto receive = [&](const Value& item) {
    found += XQueryItemStringValue(*item) + ";";
    return true;
  };
  const auto query = XQueryCompile("/a/b/text()", {}, {}, XQueryWay::Streamed);
  EXPECT_EQ(said(XQueryEvaluateStream(query, input, receive).error()), "done");
  EXPECT_EQ(found, "1;2;");
  input.path = "/nowhere.xml";
  const auto missing = XQueryEvaluateStream(query, input, receive);
  EXPECT_TRUE(said(missing.error()).starts_with("0 /nowhere.xml: ")) << said(missing.error());
  const auto plain = XQueryEvaluateStream(XQueryCompile("/a"), input, receive);
  EXPECT_EQ(said(plain.error()), "0 cannot be evaluated as a stream: it was not compiled to be");
  const auto broken = XQueryEvaluateStream(XQueryCompile("1 +"), input, receive);
  EXPECT_EQ(broken.error()->err(), 3);
}

}  // namespace
}  // namespace xquery
