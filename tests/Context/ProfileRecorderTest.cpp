// Counters and the tree of calls.
#include "Context/ProfileRecorder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <thread>

namespace xquery {
namespace {

using testing::ElementsAre;

class ProfileRecorder : public testing::Test {
 protected:
  static constexpr size_t counters = 1000;

  // One evaluation in which `work` happens.
  void evaluate(const std::function<void()>& work) {
    recorder.begin();
    work();
    recorder.end();
  }
  // The expression, which does `work`.
  void expression(XQueryCounterID counter, const std::function<void()>& work = {},
                  uint64_t items = 1) {
    const auto before = recorder.enter(counter);
    if (work) work();
    recorder.leave(before, items, false);
  }
  static void spend(int milliseconds) {
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
  }

  const XQueryProfileCounter& counter(XQueryCounterID id) const { return counts().counters()[id]; }
  const XQueryProfileCounts& counts() const { return recorder.counts(); }
  // "1/2 x3": counter 2 below counter 1, three calls.
  static std::vector<std::string> tree(const XQueryProfileCounts& of) {
    std::vector<std::string> lines;
    for (size_t i = 1; i < of.nodes().size(); ++i) {
      const XQueryProfileNode& node = of.nodes()[i];
      std::string path = std::to_string(node.counter);
      for (uint32_t above = node.parent; above; above = of.nodes()[above].parent) {
        path = std::to_string(of.nodes()[above].counter) + "/" + path;
      }
      lines.push_back(path + " x" + std::to_string(node.calls));
    }
    return lines;
  }
  static int64_t sumOfOwn(const XQueryProfileCounts& of) {
    int64_t sum = 0;
    for (const XQueryProfileNode& node : of.nodes()) sum += node.own;
    return sum;
  }

  XQueryProfileRecorder recorder{nullptr, counters};
};

TEST_F(ProfileRecorder, CountsCallsItemsAndFailures) {
  evaluate([&] {
    expression(3, {}, 5);
    expression(3, {}, 0);
    recorder.leave(recorder.enter(3), 0, true);
  });
  EXPECT_EQ(counter(3).calls, 3u);
  EXPECT_EQ(counter(3).items, 5u);
  EXPECT_EQ(counter(3).failures, 1u);
  EXPECT_EQ(counts().evaluations(), 1u);
  EXPECT_EQ(counter(4).calls, 0u);
}

TEST_F(ProfileRecorder, GivesTheTimeToTheInnermostExpression) {
  constexpr int64_t millisecond = 1'000'000;
  evaluate([&] {
    expression(0, [&] {
      spend(4);
      expression(1, [&] { spend(8); });
    });
  });
  EXPECT_GE(counter(0).own, 4 * millisecond);
  EXPECT_GE(counter(1).own, 8 * millisecond);
  EXPECT_EQ(counter(1).own, counter(1).total);
  EXPECT_EQ(counter(0).total, counter(0).own + counter(1).own);
  EXPECT_EQ(sumOfOwn(counts()), counts().nanoseconds());
}

TEST_F(ProfileRecorder, HasANodeForEachWayToAnExpression) {
  evaluate([&] {
    expression(0, [&] {
      expression(1, [&] { expression(9); });
      expression(2, [&] { expression(9); });
      expression(1, [&] { expression(9); });
    });
  });
  EXPECT_THAT(tree(counts()), ElementsAre("0 x1", "0/1 x2", "0/1/9 x2", "0/2 x1", "0/2/9 x1"));
  EXPECT_EQ(counter(9).calls, 3u);
}

TEST_F(ProfileRecorder, FindsManyChildrenInAnyOrder) {
  evaluate([&] {
    for (XQueryCounterID id = 0; id < counters; ++id) expression(id);
    for (XQueryCounterID id = counters; id-- > 0;) expression(id);
    for (XQueryCounterID id = 0; id < counters; ++id) expression(id * 7 % counters);
  });
  EXPECT_EQ(counts().nodes().size(), counters + 1);
  for (size_t i = 1; i <= counters; ++i) EXPECT_EQ(counts().nodes()[i].calls, 3u);
}

TEST_F(ProfileRecorder, AddsRecursiveCallsToTheFirst) {
  const std::function<void(int)> recurse = [&](int level) {
    expression(5, [&] {
      expression(6, [&] {
        if (level > 1) recurse(level - 1);
      });
    });
  };
  evaluate([&] { recurse(100); });
  EXPECT_THAT(tree(counts()), ElementsAre("5 x100", "5/6 x100"));
  EXPECT_EQ(counter(5).recursions, 99u);
  EXPECT_EQ(counter(5).deepest, 100u);
  EXPECT_LE(counter(5).total, counts().nanoseconds());
  EXPECT_EQ(sumOfOwn(counts()), counts().nanoseconds());
}

TEST_F(ProfileRecorder, AddsWhatLiesTooDeepToWhatIsAroundIt) {
  const std::function<void(XQueryCounterID)> nest = [&](XQueryCounterID id) {
    expression(id, [&] {
      if (id + 1 < counters) nest(id + 1);
    });
  };
  evaluate([&] { nest(0); });
  EXPECT_EQ(counts().nodes().size(), XQueryProfileCounts::mostDepth + 1);
  EXPECT_EQ(counts().nodes().back().folded, counters - XQueryProfileCounts::mostDepth);
  EXPECT_EQ(counts().nodes().back().calls, 1u);
  EXPECT_EQ(counter(counters - 1).calls, 1u);
  EXPECT_EQ(sumOfOwn(counts()), counts().nanoseconds());
}

TEST_F(ProfileRecorder, HasNoMoreNodesThanItMayHave) {
  evaluate([&] {
    for (XQueryCounterID a = 0; a < 200; ++a) {
      expression(a, [&] {
        for (XQueryCounterID b = 200; b < 300; ++b) expression(b);
      });
    }
  });
  EXPECT_EQ(counts().nodes().size(), XQueryProfileCounts::mostNodes);
  uint64_t calls = 0;
  for (const XQueryProfileNode& node : counts().nodes()) calls += node.calls + node.folded;
  EXPECT_EQ(calls, 1u + 200 + 200 * 100);
}

TEST_F(ProfileRecorder, ForgetsWhatWasNoEvaluation) {
  evaluate([&] { recorder.leaveUncounted(recorder.enter(2)); });
  EXPECT_EQ(counter(2).calls, 0u);
  EXPECT_THAT(tree(counts()), ElementsAre("2 x0"));
}

// An evaluation that ended in an exception may have left something behind.
TEST_F(ProfileRecorder, BeginsAnewWithEachEvaluation) {
  recorder.begin();
  (void)recorder.enter(1);
  recorder.end();
  evaluate([&] { expression(1); });
  EXPECT_THAT(tree(counts()), ElementsAre("1 x2"));
  EXPECT_EQ(counter(1).recursions, 0u);
  EXPECT_EQ(counts().evaluations(), 2u);
}

TEST_F(ProfileRecorder, IsAddedToOthers) {
  evaluate([&] { expression(0, [&] { expression(1, {}, 3); }); });
  XQueryProfileRecorder other(nullptr, counters);
  other.begin();
  const auto whole = other.enter(0);
  other.leave(other.enter(2), 4, true);
  other.leave(other.enter(1), 4, false);
  other.leave(whole, 0, false);
  other.end();
  XQueryProfileCounts sum(counters);
  sum.add(counts());
  sum.add(other.counts());
  EXPECT_THAT(tree(sum), ElementsAre("0 x2", "0/1 x2", "0/2 x1"));
  EXPECT_EQ(sum.counters()[1].items, 7u);
  EXPECT_EQ(sum.counters()[2].failures, 1u);
  EXPECT_EQ(sum.evaluations(), 2u);
  EXPECT_EQ(sum.nodes()[0].calls, 2u);
  EXPECT_EQ(sum.nanoseconds(), counts().nanoseconds() + other.counts().nanoseconds());
  EXPECT_EQ(sumOfOwn(sum), sum.nanoseconds());
}

}  // namespace
}  // namespace xquery
