#include "Plan/Paths/XQueryWalkedPath.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/XQueryListChanges.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Paths/XQueryConditionFilter.h"
#include "Plan/Paths/XQueryPathGivers.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <iterator>

namespace xquery {
namespace {

bool isKeptByAll(const XQueryStep& step, size_t firstPredicate, NSObject* item, int64_t position,
                 XQueryContext& context) {
  const auto& predicates = step.predicates();
  return std::all_of(predicates.begin() + static_cast<std::ptrdiff_t>(firstPredicate),
                     predicates.end(), [&](const auto& predicate) {
                       return XQueryStep::keeps(*predicate, item, position, context);
                     });
}

// Of some items those from one to before another.
struct Stretch {
  size_t first;
  size_t end;
};

// Of nodes in document order and of one tree those in the subtree of a node, and perhaps others.
Stretch stretchBelow(const NSXMLNode* node, const XQueryItemList& list) {
  constexpr size_t fewNodes = 16;
  const auto nodeAt = [&list](size_t i) { return cast<NSXMLNode>(list[i]); };
  const bool isOpen =
      node && list.count() > fewNodes && NSXMLNodeOrder::areComparable(node, nodeAt(0));
  if (!isOpen) return {0, list.count()};
  const auto firstFrom = [&](const NSXMLNode* bound) {
    size_t first = 0;
    size_t end = list.count();
    while (first < end) {
      const size_t middle = first + (end - first) / 2;
      const bool isBefore =
          NSXMLNodeOrder::number(*nodeAt(middle)) < NSXMLNodeOrder::number(*bound);
      (isBefore ? first : end) = isBefore ? middle + 1 : middle;
    }
    return first;
  };
  const NSXMLNode* stop = NSXMLTree::endOfSubtree(node);
  return {firstFrom(node), stop ? firstFrom(stop) : list.count()};
}

// As a step filters its items, which asks all of them by evaluating the predicate.
Value keptItems(const Value& items, const XQueryExpr& predicate, const XQueryNodeQuestion& question,
                bool areInOrder, XQueryContext& context) {
  auto& dynamic = _internal(context);
  const XQueryItemList list(items.get());
  dynamic.setLast(static_cast<int64_t>(list.count()));
  XQueryGatherer kept;
  WorkPacer pacer;
  const Stretch asked =
      areInOrder ? stretchBelow(question.nodeAbove(context), list) : Stretch{0, list.count()};
  for (size_t i = asked.first; i < asked.end; ++i) {
    pacer.turn();
    auto* node = dyn_cast<NSXMLNode>(list[i]);
    const auto answer = node ? question.holdsFor(node, context) : std::nullopt;
    const auto position = static_cast<int64_t>(i) + 1;
    if (answer ? *answer : XQueryStep::keeps(predicate, list[i], position, context)) {
      kept.add(list[i]);
    } else if (!answer && dynamic.isFailing()) {
      return {};
    }
    if (answer && i + 1 == list.count()) dynamic.setContextItem(node, position);
  }
  if (asked.end < list.count()) {
    dynamic.setContextItem(list[list.count() - 1], static_cast<int64_t>(list.count()));
  }
  return kept.value();
}

// The items that conditions keep of those at the positions that are asked for behind them.
Value itemsUpToPosition(const Value& items, XQueryConditionFilter& filter,
                        const XQueryNodeQuestion* stretch, const XQueryContext& context) {
  const XQueryItemList list(items.get());
  XQueryGatherer kept;
  WorkPacer pacer;
  const Stretch asked =
      stretch ? stretchBelow(stretch->nodeAbove(context), list) : Stretch{0, list.count()};
  for (size_t i = asked.first; i < asked.end && !filter.isOver(); ++i) {
    pacer.turn();
    const size_t at = filter.goesBackwards() ? asked.end - 1 - (i - asked.first) : i;
    if (filter.keeps(list[at], static_cast<int64_t>(at) + 1)) kept.add(list[at]);
  }
  return filter.hasFailed() ? Value() : kept.value();
}

// As a predicate keeps it that asks for that position.
Value itemFromBack(const Value& items, uint64_t behind) {
  const XQueryItemList list(items.get());
  XQueryGatherer kept;
  NSObject* item = behind < list.count() ? list[list.count() - 1 - behind] : nullptr;
  if (item && item->kind() != Kind::Null) kept.add(item);
  return kept.value();
}

// As a predicate keeps them that answers the same for all, leaving the focus that asking each
// leaves; null when a limit was reached.
Value itemsChosenAtOnce(const Value& items, const XQueryExpr& predicate, XQueryContext& context) {
  const XQueryItemList list(items.get());
  if (list.count() == 0) return items;
  const auto count = static_cast<int64_t>(list.count());
  _internal(context).setContextItem(list[list.count() - 1], count);
  _internal(context).setLast(count);
  const auto position = XQueryStep::positionIn(predicate, context);
  if (_internal(context).isFailing()) return {};
  XQueryGatherer kept;
  WorkPacer pacer;
  const size_t first = position.value_or(1) - 1;  // far behind the last for none
  const size_t end = position && first < list.count() ? first + 1 : list.count();
  for (size_t i = first; i < end; ++i) {
    pacer.turn();
    NSObject* item = list[i];
    if (item && item->kind() != Kind::Null) kept.add(item);
  }
  return kept.value();
}

// Takes out all but those in the range, which is not empty.
void keepOwn(std::vector<Value>& items, const XQueryPositionRange::Positions& positions) {
  const auto end = static_cast<size_t>(std::min<uint64_t>(positions.last, items.size()));
  XQueryEraseItems(items, end, items.size() - end);
  if (positions.hole >= positions.first && positions.hole <= end) {
    XQueryEraseItems(items, static_cast<size_t>(positions.hole - 1), 1);
  }
  XQueryEraseItems(items, 0, static_cast<size_t>(positions.first - 1));
}

// Keeps the items as a predicate does that asks for these positions; false, and the items as they
// were, where it has to be asked.
bool keepRange(const XQueryPositionRange& range, Value& items, XQueryContext& context) {
  const XQueryItemList list(items.get());
  if (list.count() == 0) return true;
  const auto positions = range.positionsOf(list.count(), context);
  if (!positions) return false;
  const auto end = static_cast<size_t>(std::min<uint64_t>(positions->last, list.count()));
  NSArray* own = items->kind() == Kind::Sequence ? XQueryOwnArray(items) : nullptr;
  if (own && positions->first <= end) {
    keepOwn(own->objects(), *positions);
    items = normalised(std::move(items));
    return true;
  }
  XQueryGatherer kept;
  WorkPacer pacer;
  for (uint64_t i = positions->first - 1; i < end; ++i) {
    pacer.turn();
    NSObject* item = list[static_cast<size_t>(i)];
    if (i + 1 != positions->hole && item && item->kind() != Kind::Null) kept.add(item);
  }
  items = kept.value();
  return true;
}

// What deals with each node in the focus that there was before the walk.
class InFormerFocus final : public XQueryItemGiver::Taker {
 public:
  InFormerFocus(XQueryItemGiver::Taker& taker, XQueryContextInternal& context)
      : _taker(taker),
        _context(context),
        _item(context.contextItem()),
        _position(context.position()),
        _last(context.last()) {}

  bool take(Value item) override {
    putBack();
    return _taker.take(std::move(item));
  }
  void putBack() {
    _context.setContextItem(_item, _position);
    _context.setLast(_last);
  }

 private:
  XQueryItemGiver::Taker& _taker;
  XQueryContextInternal& _context;
  const Value _item;
  const int64_t _position;
  const int64_t _last;
};

}  // namespace

XQueryWalkedPath::XQueryWalkedPath(Ref<XQueryExpr> plain, Ref<XQueryPathExpr> path)
    : XQueryPlannedExpr(std::move(plain)), _path(std::move(path)) {
  const XQueryStep* step = _path->step();
  if (step && !isa<XQueryAxisStep>(step)) {
    _start = step;
    step = step->next();
  }
  for (; step; step = step->next()) {
    _steps.emplace_back(*step);
    _hasPredicates = _hasPredicates || !step->predicates().empty();
  }
  const XQueryStep* lastAdopting = nullptr;
  for (const XQueryWalkedStep& each : _steps) {
    if (each.step->mayAdopt()) lastAdopting = each.step;
  }
  for (XQueryWalkedStep& each : _steps) {
    if (!lastAdopting || each.step == lastAdopting) break;
    each.gathersFirst = !each.isExpression();
  }
}

void XQueryWalkedPath::takeSteps(XQueryWalkedPath& of) {
  _start = of._start;
  _steps.insert(_steps.begin(), std::make_move_iterator(of._steps.begin()),
                std::make_move_iterator(of._steps.end()));
  of._steps.clear();
  of._areStepsTaken = true;
}

XQueryStepPositions* XQueryWalkedPath::positionsOf(const XQueryStep& step) {
  if (_start == &step) return &_startPositions;
  for (XQueryWalkedStep& each : _steps) {
    if (each.step == &step) return each.isExpression() ? nullptr : &each.positions;
  }
  return nullptr;
}

bool XQueryWalkedPath::keepsRangeAlone() const {
  return _start && _steps.empty() && !_picker && _start->predicates().size() == 1 &&
         _startPositions.range.predicate == 0;
}

const XQueryWalkedStep* XQueryWalkedPath::walked(const XQueryStep& asWritten) const {
  const auto found = std::find_if(_steps.begin(), _steps.end(), [&](const XQueryWalkedStep& each) {
    return each.step == &asWritten;
  });
  return found == _steps.end() ? nullptr : &*found;
}

// Diagnostics show every error that a predicate meets.
bool XQueryWalkedPath::showsErrors(const XQueryContext& context) const {
  return _hasPredicates && _internal(context).showsErrors();
}

Value XQueryWalkedPath::computeValue(XQueryContext& context) const {
  if (_areStepsTaken || showsErrors(context)) return plain().evaluateWithContext(context);
  XQueryCheckStack(context);
  XQueryPathResults results;
  Value items;
  switch (evaluate(context, items, results)) {
    case Answer::Failed:
      return {};
    case Answer::Items:
      return items;
    case Answer::Results:
      break;
  }
  return results.value(_internal(context).ordered());
}

std::optional<uint64_t> XQueryWalkedPath::countNodes(uint64_t most, XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryPathResults results;
  results.endAfter(most);
  results.countOnly();
  Value items;
  const Answer answer = evaluate(context, items, results);
  if (answer == Answer::Failed) return std::nullopt;
  // What answers nodes goes through all of the steps, but for no items at all.
  return answer == Answer::Items ? 0 : std::min(results.count(), most);
}

std::optional<uint64_t> XQueryWalkedPath::countItems(uint64_t most, XQueryContext& context) const {
  const bool showsAll = showsErrors(context);
  if (_countsNodes && !showsAll) return countNodes(most, context);
  if (!_steps.empty() || !_picker || showsAll) {
    const Value items = evaluateWithContext(context);
    if (!items) return std::nullopt;
    return std::min<uint64_t>(XQueryItemList(items.get()).count(), most);
  }
  XQueryCheckStack(context);
  auto& dynamic = _internal(context);
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  std::optional<uint64_t> number;
  const Value items = evaluateStart(context, &number);
  // An error among the items, alone, may be one of what asks for them.
  if (!items || isa<XQueryError>(items)) return std::nullopt;
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return std::min(number.value_or(XQueryItemList(items.get()).count()), most);
}

std::optional<NSXMLNameIndex::Ways> XQueryWalkedPath::waysFrom(const NSXMLNameIndex& elements,
                                                               XQueryContext& context) const {
  auto& dynamic = _internal(context);
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  XQueryPathResults results;
  results.countOnly();
  XQueryPathWalk walk(_steps, _trailCount, results, context);
  walk.setsEveryFocus = false;
  walk.startsFromOne = true;
  walk.orderIsFree = true;
  auto ways = walk.waysFrom(elements);
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return walk.hasFailed ? std::nullopt : std::move(ways);
}

Value XQueryWalkedPath::firstItems(uint64_t most, XQueryContext& context) const {
  XQueryCheckStack(context);
  XQueryPathResults results;
  results.endAfter(most);
  Value items;
  const Answer answer = evaluate(context, items, results);
  if (answer == Answer::Results) return results.value(_internal(context).ordered());
  return answer == Answer::Items ? items : Value();
}

bool XQueryWalkedPath::giveItems(XQueryContext& context, XQueryItemGiver::Taker& taker) const {
  auto& dynamic = _internal(context);
  if (showsErrors(context)) {
    const Value items = plain().evaluateWithContext(context);
    if (XQueryHasFailed(items, context)) return false;
    XQueryGiveItems(items, taker);
    return !dynamic.isFailing();
  }
  XQueryCheckStack(context);
  InFormerFocus inFocus(taker, dynamic);
  XQueryPathResults results;
  results.handTo(inFocus);
  Value items;
  const Answer answer = walk(context, items, results);
  // An error leaves the focus as it was when it was raised.
  if (answer == Answer::Failed || dynamic.isFailing()) return false;
  inFocus.putBack();
  if (answer == Answer::Results) {
    if (results.areHandedOn()) return true;
    items = results.value(dynamic.ordered());
  }
  XQueryGiveItems(items, taker);
  return !dynamic.isFailing();
}

// An item that is no node is an error, wherever it stands among the others. The first nodes of all
// are those that are found first only where these come in order.
bool XQueryWalkedPath::mayEndEarly(const Value& items, const XQueryPathWalk& walk) const {
  if (walk.setsEveryFocus || walk.results.countsOnly()) return !walk.setsEveryFocus;
  const auto* start = dyn_cast<NSXMLNode>(items.get());
  if (!start || !walk.orderIsFree) return false;
  return !_steps.front().absorbsNext || walk.absorbsNext(_steps.front(), start);
}

// An error leaves the focus as it was when it was raised.
XQueryWalkedPath::Answer XQueryWalkedPath::evaluate(XQueryContext& context, Value& items,
                                                    XQueryPathResults& results) const {
  auto& dynamic = _internal(context);
  const int64_t position = dynamic.position();
  const int64_t last = dynamic.last();
  Value contextItem = dynamic.contextItem();
  const Answer answer = walk(context, items, results);
  if (answer == Answer::Failed) return answer;
  dynamic.setContextItem(std::move(contextItem), position);
  dynamic.setLast(last);
  return answer;
}

XQueryWalkedPath::Answer XQueryWalkedPath::walk(XQueryContext& context, Value& items,
                                                XQueryPathResults& results) const {
  const auto& dynamic = _internal(context);
  items = _path->step() ? Value(dynamic.contextItem()) : NSNull::null();
  if (_start) {
    items = evaluateStart(context);
    if (XQueryHasFailed(items, context)) return Answer::Failed;
  }
  if (_steps.empty() || isNull(items)) return Answer::Items;
  XQueryPathWalk walk(_steps, _trailCount, results, context);
  walk.setsEveryFocus = !XQueryAllAreNodes(items);
  walk.startsFromOne = isa<NSXMLNode>(items.get());
  walk.orderIsFree = dynamic.ordered();
  if (results.mayEndEarly() && !mayEndEarly(items, walk)) results.takeAll();
  const bool isPicked = _picker && !looksUpAll(items, walk);
  const bool isTaken = isPicked         ? pickNodes(items, walk)
                       : _keepsSiblings ? takeSiblings(items, walk)
                                        : walk.takeAlongWays(items);
  if (!isTaken) {
    walk.takeValue(0, items, true);
    walk.noteMet();
  }
  return walk.hasFailed ? Answer::Failed : Answer::Results;
}

// With `number`, the number of items that are picked may be put there in place of a list of them.
Value XQueryWalkedPath::evaluateStart(XQueryContext& context,
                                      std::optional<uint64_t>* number) const {
  Value items =
      _start->expr() ? _start->expr()->evaluateWithContext(context) : Value(NSNull::null());
  if (XQueryHasFailed(items, context)) return {};
  if (_picker && _pickedStep == _start && pickItems(items, context, number)) return items;
  const auto& predicates = _start->predicates();
  size_t index = 0;
  while (index < predicates.size() && items) {  // null where there is no context item
    const size_t done = keepStart(index, items, context);
    if (XQueryHasFailed(items, context)) return {};
    if (done == 0) break;
    index += done;
  }
  return _start->handlePreicatesFromIndex(index, std::move(items), context);
}

// Keeps items of the start as its predicates from one on do; answers how many of these are dealt
// with, none where the step itself has to ask.
size_t XQueryWalkedPath::keepStart(size_t index, Value& items, XQueryContext& context) const {
  const XQueryExpr& predicate = *_start->predicates()[index];
  const auto* question =
      _start->asksForPosition(index) ? nullptr : XQueryNodeQuestionIn(&predicate);
  if (index == _startPositions.conditions.first) {
    XQueryConditionFilter filter(*_start, _startPositions, context);
    items = itemsUpToPosition(items, filter, _isStartInOrder ? question : nullptr, context);
    return filter.predicatesDone() - index;
  }
  if (index == _startPositions.fromBack.predicate) {
    items = itemFromBack(items, _startPositions.fromBack.behind);
    return 1;
  }
  if (index == _startPositions.sameForAll) {
    items = itemsChosenAtOnce(items, predicate, context);
    return 1;
  }
  if (index == _startPositions.range.predicate &&
      keepRange(_startPositions.range, items, context)) {
    return 1;
  }
  if (!question) return 0;
  items = keptItems(items, predicate, *question, _isStartInOrder, context);
  return 1;
}

// --- picking -------------------------------------------------------------------------------------

// Filters the items of the start, of which only some are asked; false when each has to be.
bool XQueryWalkedPath::pickItems(Value& items, XQueryContext& context,
                                 std::optional<uint64_t>* number) const {
  const auto listItems = [&items](std::vector<Value>& listed) {
    return XQueryListItems(XQueryItemList(items.get()), listed);
  };
  XQueryPicks picks;
  if (number) picks.wantedNumber = XQueryPicks::Number::OfItems;
  if (!_picker->pick(items, listItems, context, picks)) return false;
  if (picks.number) {
    *number = picks.number;
    items = NSNull::null();
    return true;
  }
  _internal(context).setLast(static_cast<int64_t>(picks.items->size()));
  XQueryGatherer kept;
  for (const XQueryPick& pick : picks.chosen) {
    const Value& item = (*picks.items)[pick.position];
    if (pick.isSure ||
        isKeptByAll(*_pickedStep, 0, item.get(), int64_t{pick.position} + 1, context)) {
      kept.add(item);
    } else if (_internal(context).isFailing()) {
      items = Value();
      return true;
    }
  }
  items = kept.value();
  return true;
}

// The nodes that reach the predicates of a step from the first one.
bool XQueryWalkedPath::listNodes(const Value& start, const XQueryWalkedStep& step,
                                 XQueryPathWalk& walk, std::vector<Value>& listed) const {
  XQueryPathWalk listing(_steps, _trailCount, walk.results, walk.context);
  listing.setsEveryFocus = false;
  listing.orderIsFree = walk.orderIsFree;
  listing.listingStep = &step;
  listing.listed = &listed;
  listing.takeValue(0, start, true);
  walk.hasFailed = listing.hasFailed;
  return !listing.hasFailed;
}

bool XQueryWalkedPath::listNodesBefore(const XQueryStep& step, XQueryContext& context,
                                       std::vector<Value>& nodes) const {
  if (_start == &step) return listStart(context, nodes);
  Value start = _internal(context).contextItem();
  if (_start) {
    start = evaluateStart(context);
    if (XQueryHasFailed(start, context)) return false;
  }
  const XQueryWalkedStep* last = walked(step);
  if (!start || !last || !XQueryAllAreNodes(start)) return false;
  XQueryPathResults results;
  XQueryPathWalk walk(_steps, _trailCount, results, context);
  return isNull(start) || listNodes(start, *last, walk, nodes);
}

bool XQueryWalkedPath::listStart(XQueryContext& context, std::vector<Value>& nodes) const {
  const Value items = _start->expr() ? _start->expr()->evaluateWithContext(context) : Value();
  if (XQueryHasFailed(items, context) || !items || !XQueryAllAreNodes(items)) return false;
  const XQueryItemList list(items.get());
  WorkPacer pacer;
  for (size_t i = 0; i < list.count(); ++i) {
    pacer.turn();
    nodes.emplace_back(list[i]);
  }
  return true;
}

// Whether the index of the tree answers at once what tables of the nodes, which every evaluation
// has to make for itself, would answer: all predicates of a step that goes down from the document.
bool XQueryWalkedPath::looksUpAll(const Value& start, const XQueryPathWalk& walk) const {
  const auto* document = dyn_cast<NSXMLDocument>(start.get());
  const XQueryWalkedStep* step = walked(*_pickedStep);
  if (!document || !step || !step->lookup || walk.setsEveryFocus) return false;
  const auto index = step - _steps.data();
  const bool isBelow = index == 0 ? step->axis == XQueryAxisDescendant
                                  : index == 1 && walk.absorbsNext(_steps.front(), document);
  const size_t asked = step->step->predicates().size() - step->predicatesInTest;
  return isBelow && step->lookup->answers() == asked && step->lookup->isReady(document);
}

// The same for the nodes that reach the picked step: hands on what is left.
bool XQueryWalkedPath::pickNodes(const Value& start, XQueryPathWalk& walk) const {
  const XQueryWalkedStep* step = walked(*_pickedStep);
  if (!step || walk.setsEveryFocus) return false;
  // Of several nodes all that they find together is picked from, and of one what all of its
  // siblings find.
  const bool isAmongSiblings =
      step == &_steps.front() && beginsWithSiblings() && walk.startsFromOne;
  const NSXMLNode* among = isAmongSiblings ? nodeAmongMany(start, walk.context) : nullptr;
  if (isAmongSiblings && !among) return false;
  const auto list = [&](std::vector<Value>& listed) {
    if (!among) return listNodes(start, *step, walk, listed);
    listSiblings(among->parent(), walk, listed);
    return true;
  };
  XQueryPicks picks;
  const bool isCounted = walk.results.countsOnly() && step == &_steps.back() && !among;
  if (isCounted) picks.wantedNumber = XQueryPicks::Number::OfNodes;
  const bool hasPicked =
      _picker->pick(among ? Value(among->parent()) : start, list, walk.context, picks);
  if (walk.hasFailed) return true;
  if (!hasPicked || (among && !leaveOnOneSide(among, picks))) return false;
  if (picks.number) {
    walk.results.addNumber(*picks.number);
    return true;
  }
  std::vector<NSXMLNode*>& nodes = walk.openNodeList();
  for (const XQueryPick& pick : picks.chosen) {
    auto* node = cast<NSXMLNode>((*picks.items)[pick.position]);
    // The predicates cannot tell at which position the node stands.
    if (pick.isSure || isKeptByAll(*step->step, step->predicatesInTest, node, 1, walk.context)) {
      nodes.push_back(node);
    } else if (_internal(walk.context).isFailing()) {
      walk.hasFailed = true;
      return true;
    }
  }
  walk.takeNodes(static_cast<size_t>(step - _steps.data()) + 1, nodes);
  walk.closeNodeList();
  if (step == &_steps.back()) walk.results.setIsReversed(step->isReverse());
  return true;
}

}  // namespace xquery
