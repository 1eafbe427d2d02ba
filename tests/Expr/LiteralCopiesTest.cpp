#include "Expr/LiteralCopies.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <barrier>
#include <functional>
#include <string>
#include <thread>
#include <vector>

namespace xquery {
namespace {

// Runs the work in a thread at a place other than that of this one.
void elsewhere(const std::function<void()>& work) {
  const uint32_t own = threadPlace();
  std::thread([&] {
    ASSERT_NE(threadPlace(), own);
    work();
  }).join();
}

TEST(LiteralCopies, TheThreadThatCompiledGetsTheStoredObject) {
  const XQueryLiteralCopies copies(XQueryNumber::integerWithInt64(7));
  EXPECT_EQ(copies.own().get(), copies.stored().get());
}

TEST(LiteralCopies, OtherThreadsGetOneOfTheirOwnWithoutCountingTheStoredOne) {
  const Value values[] = {
      XQueryNumber::integerWithInt64(7),
      XQueryNumber::numberWithDecimal(NSDecimal(8)),
      XQueryNumber::numberWithDouble(1.5),
      XQueryString::stringWithView(NSStringView::ascii("a text of more than twenty-four units")),
      XQueryDate::xqueryDateFromString(NSStringView::ascii("2004-05-06")),
      XQueryDate::xqueryDateTimeFromString(NSStringView::ascii("2004-05-06T07:08:09.5+01:30")),
  };
  for (const Value& value : values) {
    const XQueryLiteralCopies copies(value);
    Value kept;
    elsewhere([&] {
      EXPECT_EQ(copies.own().get(), copies.own().get());
      kept = copies.own();
    });
    EXPECT_NE(kept.get(), value.get());
    EXPECT_EQ(kept->kind(), value->kind());
    EXPECT_EQ(XQueryItemTypeName(*kept), XQueryItemTypeName(*value));
    EXPECT_EQ(XQueryItemStringValue(*kept), XQueryItemStringValue(*value));
    elsewhere([&] { EXPECT_EQ(copies.own().get(), kept.get()); });
  }
}

TEST(LiteralCopies, WhatIsNeverCountedAndNodesAreOneForAll) {
  const Ref<NSXMLNode> comment = NSXMLNode::commentWithStringValue(NSStringView::ascii("c"));
  for (const Value& value : {Value(NSNull::null()), Value(XQueryNumber::nan()), Value(comment),
                             Value(XQueryNumber::posInf())}) {
    const XQueryLiteralCopies copies(value);
    elsewhere([&] { EXPECT_EQ(copies.own().get(), value.get()); });
  }
}

TEST(LiteralCopies, TheyOutliveTheLiteral) {
  Value kept;
  {
    const XQueryLiteralCopies copies(
        XQueryString::stringWithView(NSStringView::ascii("some text beyond what is kept inline")));
    elsewhere([&] { kept = copies.own(); });
  }
  EXPECT_EQ(XQueryItemStringValue(*kept), "some text beyond what is kept inline");
}

TEST(LiteralCopies, ThreadsMeetAtFirstUse) {
  for (int round = 0; round < 50; ++round) {
    const XQueryLiteralCopies copies(XQueryNumber::integerWithInt64(round));
    std::barrier together(8);
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
      threads.emplace_back([&] {
        together.arrive_and_wait();
        const Value first = copies.own();
        for (int k = 0; k < 100; ++k) EXPECT_EQ(copies.own().get(), first.get());
      });
    }
    for (auto& thread : threads) thread.join();
  }
}

// A path holds the same object once, however often a step answers it.
TEST(LiteralCopies, ALiteralIsOneObjectWithinAnEvaluation) {
  const auto query = XQuery::xqueryWithSource(
      "count((<a/>, <b/>, <c/>)/('text')), "
      "count((<a/>, <b/>, <c/>)/(7))");
  const auto evaluated = [&] {
    const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, Value());
    return XQueryItemStringValue(*items->objects()[0]) +
           XQueryItemStringValue(*items->objects()[1]);
  };
  EXPECT_EQ(evaluated(), "11");
  elsewhere([&] { EXPECT_EQ(evaluated(), "11"); });
}

}  // namespace
}  // namespace xquery
