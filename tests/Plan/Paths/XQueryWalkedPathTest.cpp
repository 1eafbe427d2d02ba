#include "Expr/Paths/PathTesting.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Plan.h"
#include "xquery/Number.h"

namespace xquery {
namespace {

// Each would take hours if every context item walked its whole axis.
class OverlappingAxes : public PathTesting {
 protected:
  static constexpr int count = 300000;
  static std::string repeated(std::string_view part, int times = count) {
    std::string result;
    for (int i = 0; i < times; ++i) result += part;
    return result;
  }
  size_t found(const Value& item, const Steps& steps) {
    focusOn(item);
    const auto asWritten = path(steps);
    asWritten->bindInfoForProlog(*prolog);
    const Value answer = evaluatedOrThrown(*XQueryPlanned(*prolog, asWritten), *context);
    const auto* array = dyn_cast<NSArray>(answer);
    return array ? array->count() : isNull(answer) ? 0 : 1;
  }
  // "//a" and then the step.
  size_t foundFromEvery(const Value& item, Ref<XQueryStep> last) {
    return found(item, {rootStep(), anyDepth(), child("a"), std::move(last)});
  }
};

TEST_F(OverlappingAxes, OfNestedElements) {
  const auto deep = parsed(repeated("<a>") + repeated("</a>"));
  for (const bool ordered : {true, false}) {
    _internal(*context).setOrdered(ordered);
    EXPECT_EQ(found(deep, {rootStep(), anyDepth(), child("a"), anyDepth(), child("a")}),
              count - 1U);
    EXPECT_EQ(foundFromEvery(deep, step(XQueryAxisDescendant, anyName())), count - 1U);
    EXPECT_EQ(foundFromEvery(deep, step(XQueryAxisAncestor, anyName())), count - 1U);
    EXPECT_EQ(foundFromEvery(deep, step(XQueryAxisAncestorOrSelf, anyNode())), count + 1U);
    EXPECT_EQ(foundFromEvery(deep, step(XQueryAxisFollowing, anyNode())), 0U);
    EXPECT_EQ(foundFromEvery(deep, step(XQueryAxisPreceding, anyNode())), 0U);
  }
}

TEST_F(OverlappingAxes, OfSiblings) {
  const auto flat = parsed("<r>" + repeated("<a/>") + "</r>");
  for (const bool ordered : {true, false}) {
    _internal(*context).setOrdered(ordered);
    for (const int axis : {XQueryAxisFollowingSibling, XQueryAxisFollowing, XQueryAxisPreceding,
                           XQueryAxisPrecedingSibling}) {
      EXPECT_EQ(foundFromEvery(flat, step(axis, name("a"))), count - 1U) << axis;
    }
  }
  EXPECT_EQ(found(flat, {rootStep(), anyDepth(), child("a"), step(XQueryAxisParent, anyNode()),
                         anyDepth(), child("a")}),
            static_cast<size_t>(count));
}

TEST_F(OverlappingAxes, ThatRunToTheEndOfTheDocument) {
  const auto lasts = parsed("<r>" + repeated("<g><p><a/></p></g>") + "</r>");
  EXPECT_EQ(foundFromEvery(lasts, step(XQueryAxisDescendant, name("a"))), count - 1U);
  EXPECT_EQ(found(lasts, {rootStep(), anyDepth(), child("a"), anyDepth(), child("p")}), count - 1U);
}

TEST_F(OverlappingAxes, BeforeStepsWhosePredicatesMayBeRepeated) {
  const auto lasts = parsed("<r>" + repeated("<g><p><a><b/></a></p></g>", 30000) + "</r>");
  EXPECT_EQ(found(lasts, {rootStep(), anyDepth(), child("b"), anyDepth(),
                          child("p", {path({child("a")})})}),
            29999U);
}

TEST_F(OverlappingAxes, EndAtAPositionFoundNearby) {
  const auto flat = parsed("<r>" + repeated("<a/>") + "</r>");
  EXPECT_EQ(foundFromEvery(flat, step(XQueryAxisPreceding, name("a"), {integer("1")})), count - 1U);
  EXPECT_EQ(foundFromEvery(flat, step(XQueryAxisFollowing, name("a"), {integer("2")})), count - 2U);
}

TEST_F(OverlappingAxes, AreWalkedAgainForAPredicateThatMayHaveEffects) {
  const auto nested = parsed("<a><a><a/></a></a>");
  int evaluations = 0;
  const auto counting = probe([&](XQueryContext&) -> Value {
    ++evaluations;
    return NSNumber::trueValue();
  });
  EXPECT_EQ(
      found(nested, {rootStep(), anyDepth(), child("a"), step(XQueryAxisAncestorOrSelf, name("a")),
                     step(XQueryAxisSelf, anyNode(), {counting})}),
      3U);
  EXPECT_EQ(evaluations, 6);
}

TEST_F(OverlappingAxes, AreWalkedAgainForAPredicateThatReadsAVariableSetOnTheWay) {
  const auto nested = parsed("<a><a><b/></a></a>");
  prolog->newLocalVariableIDForQName(prolog->variableQNameFromString(text("v")));
  const auto variable = XQueryVariable::variableWithName(text("v"));
  variable->bindInfoForProlog(*prolog);
  ASSERT_NE(variable->varID(), 0);
  // True from the second "a" on only.
  int visits = 0;
  const auto setting = probe([&](XQueryContext& c) -> Value {
    _internal(c).setVariable(NSNumber::numberWithBool(++visits == 2), variable->varID());
    return NSNumber::trueValue();
  });
  EXPECT_EQ(found(nested, {rootStep(), anyDepth(), child("a", {setting}),
                           step(XQueryAxisDescendant, name("b")),
                           step(XQueryAxisSelf, anyNode(), {variable})}),
            1U);
}

TEST_F(OverlappingAxes, OfTreesThatGoAwayAreWalkedAnew) {
  // Every context item yields a tree of its own, and the next may lie where the last one lay.
  int trees = 0;
  const auto freshTree = probe([&](XQueryContext&) -> Value {
    ++trees;
    return parsed("<r><x><y/></x></r>");
  });
  const auto flat = parsed("<r>" + repeated("<a/>", 50) + "</r>");
  const Steps steps = {step(XQueryAxisChild, name("a")), filterStep(freshTree),
                       step(XQueryAxisDescendant, name("y")), step(XQueryAxisAncestor, anyNode())};
  EXPECT_EQ(found(flat->rootElement(), steps), 150U);
  EXPECT_EQ(trees, 50);
}

}  // namespace
}  // namespace xquery
