// A step of a path as a walk takes it: as it is written, or with names taken into its test, and
// with what has been found out about it.
#pragma once

#include "Expr/Paths/XQueryPath.h"
#include "Expr/Paths/XQueryPathRun.h"
#include "Plan/Paths/XQueryNameChoice.h"
#include "Plan/Paths/XQueryPositionRange.h"
#include "Plan/Paths/XQueryValueLookup.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>

namespace xquery {

// The predicate of a step that asks for a position counted from the back.
struct XQueryFromBack {
  static constexpr size_t noPredicate = SIZE_MAX;
  size_t predicate = noPredicate;
  uint64_t behind = 0;  // the number of items behind the one that is asked for
};

// The predicates of a step that are conditions, in front of one that asks the items that these keep
// for positions: behind the last position none of them is asked.
struct XQueryConditionsBefore {
  static constexpr size_t noPredicate = SIZE_MAX;
  size_t first = noPredicate;  // of the conditions
  size_t position = 0;         // what asks for positions, the one behind the last condition
};

// The predicates of a step that need not be asked of each item, by their numbers.
struct XQueryStepPositions {
  static constexpr size_t noPredicate = SIZE_MAX;
  XQueryFromBack fromBack;
  // Keeps the items from one position to another.
  XQueryPositionRange range;
  // Answers the same for all items: a position, or whether they are kept.
  size_t sameForAll = noPredicate;
  // The position is asked for by a number, or by one of the three above.
  XQueryConditionsBefore conditions;
};

struct XQueryWalkedStep {
  static constexpr size_t noTrail = SIZE_MAX;

  explicit XQueryWalkedStep(const XQueryStep& asWritten) : step(&asWritten) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(&asWritten);
    if (!axisStep) return;
    axis = axisStep->axis();
    test = axisStep->expr();
    testMayRaise = axisStep->testMayRaise();
  }

  // An expression that is evaluated for each node.
  bool isExpression() const { return axis == 0; }
  // Whether its nodes are results in reverse order. What predicates have filtered is sorted
  // forward, also where they have become part of the test, and so is what an expression answers.
  bool isReverse() const {
    return isa<XQueryAxisStep>(step) && step->predicates().empty() && axis >= XQueryAxisAncestor &&
           axis <= XQueryAxisAncestorOrSelf;
  }
  // Whether predicates are left that are no part of the test.
  bool hasPredicates() const { return predicatesInTest < step->predicates().size(); }
  auto firstPredicate() const {
    return step->predicates().begin() + static_cast<std::ptrdiff_t>(predicatesInTest);
  }
  // Whether this is the step that "//" stands for.
  bool isDescendantShorthand() const {
    const auto* type = dyn_cast<XQueryTypeDeclaration>(test);
    return axis == XQueryAxisDescendantOrSelf && step->predicates().empty() && !choice && type &&
           type->type() == XQueryTypeDeclaration::AnyKindTest && !type->data() &&
           type->acceptsCount(1);
  }
  // Has the step take, of the nodes that its test accepts, those of one of the names alone, which
  // is what so many of its first predicates ask for.
  void setChoice(XQueryNameChoice names, size_t ofPredicates) {
    choice = std::make_unique<const XQueryNameChoice>(std::move(names));
    predicatesInTest = ofPredicates;
  }
  // Puts a step with such names in the place of what is written.
  void becomeAxisStep(int onAxis, XQueryNameChoice names) {
    axis = onAxis;
    ownTest = XQueryWildCardNameTest::nameTest(nullptr, nullptr);
    test = ownTest.get();
    setChoice(std::move(names), 0);
  }

  const XQueryStep* step;  // as it is written; its predicates are those of the walk
  int axis = 0;            // 0 for an expression
  const XQueryExpr* test = nullptr;
  bool testMayRaise = false;
  Ref<XQueryExpr> ownTest;
  std::unique_ptr<const XQueryNameChoice> choice;  // null for none
  size_t predicatesInTest = 0;
  // Of what the step finds, nothing but its candidates is wanted; null for none.
  std::unique_ptr<const XQueryValueLookup> lookup;

  // See XQueryPathWalk.h.
  bool absorbsNext = false;
  bool arrivesByParents = false;
  bool countsBelow = false;
  bool filtersEach = false;
  bool asksForWays = false;
  bool gathersFirst = false;
  XQueryStepPositions positions;
  // What is the same for all nodes is a number, so that the step walks no further than that.
  bool isPositionComputed = false;
  size_t trail = noTrail;
};

// The test of such a step, made ready for its nodes.
class XQueryStepTest {
 public:
  XQueryStepTest(const XQueryWalkedStep& step, XQueryPathRun& run);

  bool matches(const NSXMLNode* node) {
    return _test.matches(node) && (!_choice || _choice->accepts(*node, _context));
  }
  // As XQueryNodeTest.
  const NSXMLExpandedName* onlyName() const { return _isOfName ? _test.onlyName() : nullptr; }
  // The same for names of which a node needs one; instructions may have them as well.
  const NSXMLNameSelection* onlyNames() const { return _context ? nullptr : _choice; }
  // Whether every element matches, with every other child that has a name.
  bool takesAllNamed() const {
    constexpr uint32_t unnamed = XQueryKindBit(Kind::Text) | XQueryKindBit(Kind::Comment);
    return !_choice && _test.asksForKindAlone() && takesElements() &&
           (_test.kinds() & unnamed) == 0;
  }
  // The kinds of which it takes every node, and no others, as bits; 0 where it asks for more.
  uint32_t kindsAlone() const { return !_choice && _test.asksForKindAlone() ? _test.kinds() : 0; }
  bool takesElements() const { return (_test.kinds() & XQueryKindBit(Kind::Element)) != 0; }
  bool acceptsInstructions() const {
    return (_test.kinds() & XQueryKindBit(Kind::ProcessingInstruction)) != 0;
  }

 private:
  XQueryNodeTest _test;
  const XQueryNameChoice* _choice;
  bool _isOfName = true;              // the name is all that it asks for
  XQueryContext* _context = nullptr;  // where the names depend on its namespaces
};

}  // namespace xquery
