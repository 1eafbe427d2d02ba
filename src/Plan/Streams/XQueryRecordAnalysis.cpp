#include "Plan/Streams/XQueryRecordAnalysis.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Functions/XQueryFunctionCall.h"

#include <algorithm>
#include <iterator>
#include <string_view>
#include <utility>

namespace xquery {

namespace {

bool asksForAnyElement(const XQueryExpr* test) {
  const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(test);
  return wildCard && !wildCard->prefix() && !wildCard->localName();
}

bool staysInside(int axis) {
  return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisSelf;
}

bool asksForName(const XQueryExpr* test) {
  const auto* name = dyn_cast<XQueryNameTest>(test);
  return name && !name->attribute();
}

bool isChildByName(const XQueryStep* step) {
  const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
  return axisStep && axisStep->axis() == XQueryAxisChild && asksForName(axisStep->expr());
}

}  // namespace

void XQueryRecordAnalysis::endPart(XQueryPlaceID place) {
  _now.place = place;
  _plan.parts.push_back(std::exchange(_now, {}));
  _part = _recordClause = XQueryNoPlace;
  _isAnywhere = _isByParents = _isComplete = _bindsRecords = false;
}

bool XQueryRecordAnalysis::isPathOfDocument(XQueryPlaceID place) const {
  const auto* path = dyn_cast<XQueryPathExpr>(exprAt(place));
  return path && (isa<XQueryRootStep>(path->step()) || isa<XQueryAxisStep>(path->step()));
}

bool XQueryRecordAnalysis::beginsWithRecords(XQueryPlaceID place) const {
  const XQueryPlaceID clause = recordClauseOf(place);
  if (clause == XQueryNoPlace || exprAt(clause)->kind() == Kind::LetExpr) return false;
  const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
  return bound != XQueryNoPlace && isPathOfDocument(inside(bound));
}

// The first clause but for those that take a value, which is the same for all records: whether it
// is evaluated once or for each of them cannot be told.
XQueryPlaceID XQueryRecordAnalysis::recordClauseOf(XQueryPlaceID place) const {
  XQueryPlaceID clause = _program.firstPart(place);
  while (clause != XQueryNoPlace && isa<XQueryLetExpr>(exprAt(clause))) {
    const XQueryFacts& facts = _facts[clause];
    const bool isSame =
        facts.isRepeatable() && !readsDocument(clause) && !facts.does(XQueryDeeds::MayFail);
    if (!isSame) break;
    clause = _program.nextPart(clause);
  }
  return clause;
}

bool XQueryRecordAnalysis::goesThroughRecords(XQueryPlaceID place) const {
  return isPathOfDocument(place) ||
         (isa<XQueryFLWORExpr>(exprAt(place)) && beginsWithRecords(place));
}

// --- what is evaluated for each record -------------------------------------------------------

void XQueryRecordAnalysis::takeItems(XQueryPlaceID place) {
  switch (exprAt(place)->kind()) {
    case Kind::PathExpr:
      return takePath(place);
    case Kind::FLWORExpr:
      if (!cast<XQueryFLWORExpr>(exprAt(place))->orderSpecs().empty()) {
        refuse(place, "order by sorts what is found in all records");
      }
      return takeClauses(place);
    default:
      refuse(place, "no path goes through the document record by record");
  }
}

void XQueryRecordAnalysis::takeClauses(XQueryPlaceID place) {
  XQueryPlaceID clause = recordClauseOf(place);
  const XQueryExpr* binder = clause == XQueryNoPlace ? nullptr : exprAt(clause);
  const auto* forClause = dyn_cast<XQueryForExpr>(binder);
  if (!forClause && !isa<XQueryQuantifiedExprItem>(binder)) {
    refuse(clause == XQueryNoPlace ? place : clause, "the first clause does not go through a path");
  }
  if (forClause && forClause->posVarID() != 0) {
    refuse(clause, "the records before it are counted");
  }
  const XQueryPlaceID bound = _program.part(clause, XQueryRole::Bound);
  if (bound == XQueryNoPlace || !isa<XQueryPathExpr>(exprAt(inside(bound)))) {
    refuse(clause, "the first clause does not go through a path");
  }
  takePath(inside(bound));
  if (_bindsRecords && levelOfRecord() <= levelsThatHoldDescendants) _recordClause = clause;
  while ((clause = _program.nextPart(clause)) != XQueryNoPlace) checkInside(clause);
}

// Whatever is evaluated there starts from the record.
void XQueryRecordAnalysis::checkInside(XQueryPlaceID place) const {
  using namespace XQueryDeeds;
  if (_facts[place].does(ReadsItem | ReadsPosition | ReadsSize)) {
    refuse(place, "it reads the document apart from the record");
  }
  checkStaysInside(place);
}

// The innermost place is told of; of a path from the root the path, since "/" is one object.
void XQueryRecordAnalysis::checkStaysInside(XQueryPlaceID place) const {
  for (XQueryPlaceID each = _program[place].end; each-- > place;) {
    const bool isRoot = isa<XQueryRootStepExpr>(exprAt(each)) && each > place;
    const XQueryPlaceID shown = isRoot ? _program[each].parent : each;
    if (_facts[each].does(XQueryDeeds::ReadsRoot)) {
      refuse(shown, "it reads the document apart from the record");
    }
    if (_facts[each].does(XQueryDeeds::ReadsOutside) && !leavesItToItsParts(each)) {
      refuse(shown, "it may lead out of the record");
    }
  }
}

// Whether what looks outside there are parts of the place alone, which are asked by themselves.
bool XQueryRecordAnalysis::leavesItToItsParts(XQueryPlaceID place) const {
  const XQueryExpr* expr = exprAt(place);
  if (const auto* call = dyn_cast<XQueryFunctionCall>(expr)) {
    if (!call->builtIn() || call->builtIn()->row().has(XQueryBuiltInFunction::LooksAround)) {
      return false;
    }
  } else if (isa<XQueryPathExpr>(expr)) {
    return takesInnerAxes(place);
  }
  for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
       part = _program.nextPart(part)) {
    if (_facts[part].does(XQueryDeeds::ReadsOutside)) return true;
  }
  return false;
}

// Whether the steps stay inside of the node that the path begins with. The descendant axis does
// where it is that of the record itself, not of what is inside.
bool XQueryRecordAnalysis::takesInnerAxes(XQueryPlaceID path) const {
  const XQueryStep* step = cast<XQueryPathExpr>(exprAt(path))->step();
  const XQueryPlaceID first = _program.firstPart(path);
  bool isRecord = first != XQueryNoPlace && step->kind() == Kind::FilterStep &&
                  isa<XQueryVariable>(exprAt(first)) && _recordClause != XQueryNoPlace &&
                  _program[first].binder == _recordClause;
  for (; step; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep) {
      isRecord = isRecord && step == cast<XQueryPathExpr>(exprAt(path))->step();
      continue;
    }
    const bool skipsLevels = axisStep->axis() == XQueryAxisDescendantOrSelf &&
                             asksForAnyNode(axisStep->expr()) && step->predicates().empty() &&
                             isChildByName(step->next());
    const bool isDescent =
        skipsLevels || (axisStep->axis() == XQueryAxisDescendant && asksForName(axisStep->expr()));
    if (isDescent ? !isRecord : !staysInside(axisStep->axis())) return false;
    isRecord = false;
  }
  return true;
}

// --- the path --------------------------------------------------------------------------------

void XQueryRecordAnalysis::takePath(XQueryPlaceID place) {
  _part = _program.firstPart(place);
  const XQueryStep* step = cast<XQueryPathExpr>(exprAt(place))->step();
  if (isa<XQueryRootStep>(step)) {
    _part = _program.nextPart(_part);
    step = step->next();
  } else if (!isa<XQueryAxisStep>(step) || _program[place].focus != XQueryNoPlace) {
    refuse(place, "the path does not begin at the document");
  }
  while (step && takeRecordStep(*step, place)) step = step->next();
  if (_isAnywhere) refuse(place, "any node may be a record");
  if (isWholeDocument()) refuse(place, "the whole document would be one record");
  if (_now.record.size() > mostSteps) refuse(place, "the path to the record is too long");
  _bindsRecords = !step && _now.record.back().name;
  // What any name finds may be instructions, which are in what is around them.
  while (!_now.record.empty() && !_now.record.back().name) _now.record.pop_back();
  if (isWholeDocument()) refuse(place, "a record would be any element or instruction");
  for (; step; step = step->next()) takeInnerStep(*step, place);
}

bool XQueryRecordAnalysis::isWholeDocument() const {
  const std::vector<XQueryStreamStep>& path = _now.record;
  return path.empty() || (path.size() == 1 && !path.front().isAnywhere);
}

// Beyond any that matters where it is not known.
size_t XQueryRecordAnalysis::levelOfRecord() const {
  for (const XQueryStreamStep& step : _now.record) {
    if (step.isAnywhere) return SIZE_MAX;
  }
  return _now.record.size();
}

// Whether more steps may belong to the way to the record. Moves on behind the step.
bool XQueryRecordAnalysis::takeRecordStep(const XQueryStep& step, XQueryPlaceID path) {
  const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
  if (!axisStep || _isComplete) return false;
  const XQueryExpr* test = axisStep->expr();
  const bool hasPredicates = !step.predicates().empty();
  if (axisStep->axis() == XQueryAxisDescendantOrSelf && asksForAnyNode(test) && !hasPredicates) {
    beginAnywhere(path);
    _isByParents = true;
    _part = _program.nextPart(_part);
    return true;
  }
  const bool isDescendant = axisStep->axis() == XQueryAxisDescendant;
  const auto* name = dyn_cast<XQueryNameTest>(test);
  const bool isOfElements = asksForName(test) || asksForAnyElement(test);
  if ((axisStep->axis() != XQueryAxisChild && !isDescendant) || !isOfElements) return false;
  if (countsPositions(step)) {
    if (isDescendant || _isAnywhere) refuse(path, "positions are counted below any element");
    return false;
  }
  // Of what the descendant axis finds elements may lie in one another.
  if (levelOfRecord() == SIZE_MAX) _isByParents = true;
  if (isDescendant) beginAnywhere(path);
  _now.record.push_back({std::exchange(_isAnywhere, false), name});
  _part = _program.nextPart(_part);
  checkPredicates(step);
  // What a predicate looks at is below its step.
  _isComplete = hasPredicates;
  return true;
}

void XQueryRecordAnalysis::beginAnywhere(XQueryPlaceID path) {
  if (_isAnywhere || levelOfRecord() > levelsThatHoldDescendants) {
    refuse(path, "the descendant axis may lead out of its node");
  }
  // What is found then comes parent by parent.
  if (!_program[path].isOrdered)
    refuse(path, "\"//\" is not in document order where it is unordered");
  _isAnywhere = true;
}

// Whether a predicate of the step depends on which nodes there are beside the one that it is
// asked for.
bool XQueryRecordAnalysis::countsPositions(const XQueryStep& step) const {
  XQueryPlaceID predicate = _program.nextPart(_part);
  for (size_t index = 0; index < step.predicates().size(); ++index) {
    if (step.asksForPosition(index)) return true;
    if (!step.predicates()[index]) break;
    const XQueryFacts& facts = _facts[predicate];
    if (facts.does(XQueryDeeds::ReadsPosition | XQueryDeeds::ReadsSize) ||
        facts.mayBe(XQueryItems::Numeric | XQueryItems::Other)) {
      return true;
    }
    predicate = _program.nextPart(predicate);
  }
  return false;
}

void XQueryRecordAnalysis::checkPredicates(const XQueryStep& step) {
  for (const auto& predicate : step.predicates()) {
    if (!predicate) break;
    checkStaysInside(_part);
    _part = _program.nextPart(_part);
  }
}

// Whether it is a function that makes values of the nodes it is given, a new one each time.
bool XQueryRecordAnalysis::makesValues(XQueryPlaceID place) const {
  const auto* call = dyn_cast<XQueryFunctionCall>(exprAt(inside(place)));
  if (!call || !call->builtIn()) return false;
  constexpr std::string_view makers[] = {"string", "data", "name", "local-name"};
  const std::string_view name = call->builtIn()->row().localName;
  if (std::find(std::begin(makers), std::end(makers), name) == std::end(makers)) return false;
  const XQueryPlaceID list = _program.part(inside(place), XQueryRole::Arguments);
  if (list == XQueryNoPlace) return true;
  for (XQueryPlaceID each = _program.firstPart(list); each != XQueryNoPlace;
       each = _program.nextPart(each)) {
    if (!_facts[each].are(XQueryItems::Node)) return false;
  }
  return true;
}

void XQueryRecordAnalysis::takeInnerStep(const XQueryStep& step, XQueryPlaceID path) {
  const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
  if (axisStep) {
    if (!staysInside(axisStep->axis())) refuse(path, "a step may lead out of the record");
  } else if (step.expr()) {
    if (_facts[_part].does(XQueryDeeds::ReadsPosition | XQueryDeeds::ReadsSize)) {
      refuse(path, "a step counts what the one before it finds in all records");
    }
    // Of a whole path the same value is handed out once, as truth values are, and new nodes are
    // sorted.
    const bool findsNodes =
        _facts[_part].are(XQueryItems::Node) && _facts[_part].tree == XQueryTreeFact::OfContext;
    if (!findsNodes && (step.next() || !makesValues(_part))) {
      refuse(path, "a step answers what may be no node of the record");
    }
    // Nodes are sorted at the end of the path.
    if (!findsNodes && _isByParents) {
      refuse(path, "values of what is found below any element are not in document order");
    }
    checkStaysInside(_part);
  }
  if (step.expr()) _part = _program.nextPart(_part);
  checkPredicates(step);
}

}  // namespace xquery
