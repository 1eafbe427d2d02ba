// Conditions in front of a position.
//
// Pattern     a[C][1], a[C][D][position() <= 3], $l[C][$n], $l[C][last()]: one or more predicates
// in
//             front of one that asks for positions by a literal, or that "positions" or "ranges"
//             took
// Facts       the conditions are repeatable, load nothing and do not ask how many items there are;
//             what they leave in variables cannot be told, and none reads what another one sets;
//             counted from the back, those behind the first one do not ask for their position
//             either; what the positions are compared with does not ask for the number of items;
//             nothing shows the focus that the predicates leave (StepsAround.h)
// Operator    none: the step is told (XQueryConditionFilter). Its items are asked for all of the
//             conditions one after another, as they are found, until one stands at the last
//             position
// Why         behind the last position nothing is kept, so that nobody can tell whether anything
//             there meets the conditions; an error in a condition only drops its item
#include "Plan/Paths/XQueryConditionFilter.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/StepsAround.h"

#include <span>
#include <vector>

namespace xquery {
namespace {

class Search {
 public:
  explicit Search(XQueryPlanning& planning) : _planning(planning), _program(planning.program) {}

  // A path: its predicates, step by step.
  void lookAt(XQueryPlaceID path) {
    auto* walked = XQueryWalkedPathAt(_planning, path);
    if (!walked) return;
    const XQueryStep* step = nullptr;
    std::vector<XQueryPlaceID> predicates;
    for (XQueryPlaceID part = _program.firstPart(path); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryPlace& at = _program[part];
      if (at.role != XQueryRole::Predicate) continue;
      if (at.step != step) {
        lookAtStep(path, *walked, step, predicates);
        predicates.clear();
      }
      step = at.step;
      predicates.push_back(part);
    }
    lookAtStep(path, *walked, step, predicates);
  }

 private:
  void lookAtStep(XQueryPlaceID place, XQueryWalkedPath& path, const XQueryStep* step,
                  std::span<const XQueryPlaceID> predicates) {
    if (predicates.size() < 2 || !step || step->predicates().size() != predicates.size()) return;
    XQueryStepPositions* of = path.positionsOf(*step);
    const XQueryWalkedStep* walked = path.walked(*step);
    for (size_t index = walked ? walked->predicatesInTest : 0; of && index < predicates.size();
         ++index) {
      if (!endsAt(*step, *of, index)) continue;
      const bool isFromBack = of->fromBack.predicate == index;
      const size_t least = walked ? walked->predicatesInTest : 0;
      const auto before = predicates.subspan(least, index - least);
      const size_t count = conditionsAtEnd(*step, *of, least, before, isFromBack);
      if (count == 0) continue;
      // A path restores the focus that its start has left.
      const bool isAll = path.start() == step && path.steps().empty();
      if (!isAll && !XQueryHidesFocusOf(*step, path, place, _planning)) {
        return _planning.refuse(predicates[index],
                                "an error that comes up later may show the focus it leaves");
      }
      of->conditions = {index - count, index};
      return _planning.choose(predicates[index]);
    }
  }

  static bool endsAt(const XQueryStep& step, const XQueryStepPositions& of, size_t index) {
    return step.literalPosition(index) || of.fromBack.predicate == index ||
           of.sameForAll == index || (of.range.predicate == index && !of.range.readsSize());
  }

  // How many of the predicates at the end are conditions, the first one of which has that number.
  size_t conditionsAtEnd(const XQueryStep& step, const XQueryStepPositions& of, size_t number,
                         std::span<const XQueryPlaceID> predicates, bool isFromBack) const {
    XQueryVariableSet reads;
    XQueryVariableSet assigns;
    size_t count = 0;
    while (count < predicates.size() && count < XQueryConditionFilter::mostConditions) {
      const size_t index = predicates.size() - 1 - count;
      if (endsAt(step, of, number + index) || !isCondition(predicates[index])) break;
      // Counted from the back, only the first one can be told at which position an item stands.
      if (isFromBack && count > 0 && mayAskForPosition(predicates[index + 1])) break;
      const XQueryFacts& facts = _planning.facts[predicates[index]];
      reads.add(facts.reads);
      assigns.add(facts.assigns);
      if (reads.meets(assigns)) break;
      ++count;
    }
    return count;
  }

  bool isCondition(XQueryPlaceID place) const {
    const XQueryFacts& facts = _planning.facts[place];
    return facts.isRepeatable() &&
           !facts.does(XQueryDeeds::ReadsSize | XQueryDeeds::LoadsDocuments) &&
           !_planning.showsLeftovers(facts.assigns, _program[place].parent);
  }

  bool mayAskForPosition(XQueryPlaceID place) const {
    const XQueryFacts& facts = _planning.facts[place];
    return facts.does(XQueryDeeds::ReadsPosition) ||
           facts.mayBe(XQueryItems::Numeric | XQueryItems::Other);
  }

  XQueryPlanning& _planning;
  const XQueryProgram& _program;
};

}  // namespace

void XQueryEndWithPositions(XQueryPlanning& planning) {
  Search search(planning);
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    search.lookAt(place);
  }
}

}  // namespace xquery
