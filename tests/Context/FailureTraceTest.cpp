#include "Context/FailureTrace.h"
#include "Engine/ErrorPlaceText.h"

#include <gtest/gtest.h>

namespace xquery {
namespace {

struct FailureTrace : testing::Test {
  FailureTrace() : places(XQueryPlaces::places()), name(NSString::stringWithASCII("f")) {
    places->beginModule(NSString::stringWithASCII("0123456789"), nullptr);
    for (uint32_t start = 0; start < 10; ++start) places->add({start, start + 1});
  }
  std::string text(const XQueryError& of) const { return placeText(*trace.on(of, places)); }

  Ref<XQueryPlaces> places;
  Ref<NSString> name;
  XQueryFailureTrace trace;
  Ref<XQueryError> error = XQueryError::error(1, "e");
};

TEST_F(FailureTrace, GivesAnErrorItsPlaceAndCalls) {
  trace.begin(1);
  EXPECT_EQ(text(*error), "at 1:1+1");
  trace.addCall(2, name.get());
  trace.addCall(3, name.get());
  EXPECT_EQ(text(*error), "at 1:1+1 called f 1:2+1 called f 1:3+1");
  EXPECT_FALSE(error->place());
}

TEST_F(FailureTrace, BeginsAnew) {
  trace.begin(1);
  trace.addCall(2, name.get());
  trace.begin(4);
  EXPECT_EQ(text(*error), "at 1:4+1");
}

TEST_F(FailureTrace, ComesBehindWhatAnErrorKnows) {
  trace.begin(1);
  trace.addCall(2, name.get());
  const auto kept = trace.on(*error, places);
  trace.begin(9);
  EXPECT_EQ(text(*kept), "at 1:1+1 called f 1:2+1");
  trace.addCall(3, name.get());
  EXPECT_EQ(text(*kept), "at 1:1+1 called f 1:2+1 called f 1:3+1");
}

TEST_F(FailureTrace, KeepsSixtyFourCallsAndNoMore) {
  trace.begin(1);
  for (int i = 0; i < 64; ++i) trace.addCall(2, name.get());
  EXPECT_EQ(trace.on(*error, places)->calls().size(), 64u);
  EXPECT_EQ(trace.on(*error, places)->callsLeftOut(), 0);
  trace.addCall(2, name.get());
  EXPECT_EQ(trace.on(*error, places)->calls().size(), 64u);
  EXPECT_EQ(trace.on(*error, places)->callsLeftOut(), 1);
}

TEST_F(FailureTrace, KeepsTheInnermostAndTheOutermost) {
  trace.begin(1);
  for (uint32_t i = 0; i < 1000; ++i) {
    trace.addCall(i < 32 ? 2 : i < 968 ? 3 : 4, name.get());
  }
  const auto calls = trace.on(*error, places)->calls();
  ASSERT_EQ(calls.size(), 64u);
  for (size_t i = 0; i < calls.size(); ++i) {
    EXPECT_EQ(placeText(calls[i].place), i < 32 ? "1:2+1" : "1:4+1") << i;
  }
  EXPECT_EQ(trace.on(*error, places)->callsLeftOut(), 936);
}

TEST_F(FailureTrace, OfAKeptErrorCountsWhatBothLeaveOut) {
  trace.begin(1);
  for (int i = 0; i < 100; ++i) trace.addCall(2, name.get());
  const auto kept = trace.on(*error, places);
  trace.begin(9);
  for (int i = 0; i < 200; ++i) trace.addCall(3, name.get());
  const auto all = trace.on(*kept, places);
  EXPECT_EQ(all->calls().size() + static_cast<size_t>(all->callsLeftOut()), 300u);
  EXPECT_EQ(placeText(all->calls().front().place), "1:2+1");
  EXPECT_EQ(placeText(all->calls()[31].place), "1:2+1");
  EXPECT_EQ(placeText(all->calls()[32].place), "1:3+1");
}

}  // namespace
}  // namespace xquery
