#include "Plan/Streams/XQueryStreamPlan.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/DocumentAnalysis.h"
#include "Plan/Rules/PlaceInside.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryNumber.h"

#include <optional>
#include <utility>

namespace xquery {

namespace {

// What the reader can look for.
constexpr size_t mostSteps = 63;

struct FoldOfFunction {
  std::string_view name;
  XQueryStreamFold fold;
};

constexpr FoldOfFunction folds[] = {
    {"count", XQueryStreamFold::Count},      {"sum", XQueryStreamFold::Sum},
    {"avg", XQueryStreamFold::Average},      {"min", XQueryStreamFold::Least},
    {"max", XQueryStreamFold::Greatest},     {"exists", XQueryStreamFold::Exists},
    {"empty", XQueryStreamFold::Empty},      {"distinct-values", XQueryStreamFold::Distinct},
    {"subsequence", XQueryStreamFold::Part},
};

bool asksForAnyElement(const XQueryExpr* test) {
  const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(test);
  return wildCard && !wildCard->prefix() && !wildCard->localName();
}

// Goes over the program from the body to the path that finds the records.
class Analysis : private XQueryDocumentAnalysis<XQueryStreamPlan> {
 public:
  using XQueryDocumentAnalysis::XQueryDocumentAnalysis;

  XQueryStreamPlan run() {
    return planBy([this] {
      checkGlobals();
      takeBody(_program.bodies().back().place);
    });
  }

 private:
  XQueryPlaceID inside(XQueryPlaceID place) const { return XQueryPlaceInside(_program, place); }

  // Globals are evaluated before the first record is read.
  void checkGlobals() const {
    for (const XQueryProgramBody& body : _program.bodies()) {
      if (!body.variable) continue;
      const XQueryFacts& facts = _facts[body.place];
      if (facts.does(XQueryDeeds::ReadsFocus)) {
        refuse(body.place, "a global variable reads the document");
      }
      // The first result is given its base URI, which is not to be seen in copies made after it.
      const bool hasBase = body.prolog && body.prolog->baseURI();
      if (hasBase && facts.does(XQueryDeeds::MakesNodes)) {
        refuse(body.place, "a global variable makes nodes that have a base URI");
      }
    }
  }

  // --- folds -----------------------------------------------------------------------------------

  void takeBody(XQueryPlaceID body) {
    const XQueryPlaceID place = inside(body);
    _plan.each = place;
    if (isa<XQueryFunctionCall>(exprAt(place))) return takeCall(place);
    if (takePosition(place)) return;
    if (const auto* quantifier = dyn_cast<XQueryQuantifiedExpr>(exprAt(place))) {
      // Where a clause has no items the next one stands in its place: that is asked of all records.
      if (quantifier->items().size() > 1) refuse(place, "the quantifier has more than one clause");
      _plan.fold = quantifier->every() ? XQueryStreamFold::Every : XQueryStreamFold::Some;
      return takeClauses(place);
    }
    takeItems(place);
  }

  void takeCall(XQueryPlaceID place) {
    const auto* call = cast<XQueryFunctionCall>(exprAt(place));
    const XQueryPlaceID arguments = _program.part(place, XQueryRole::Arguments);
    const XQueryPlaceID first =
        arguments == XQueryNoPlace ? arguments : _program.firstPart(arguments);
    const size_t count = call->args() ? call->args()->count() : 0;
    if (call->builtIn() && first != XQueryNoPlace) {
      for (const FoldOfFunction& row : folds) {
        if (row.name != call->builtIn()->row().localName) continue;
        if (row.fold == XQueryStreamFold::Part) {
          takeSubsequence(first, count);
        } else if (count != 1) {
          refuse(place, "the function has more than one argument");
        }
        _plan.fold = row.fold;
        _plan.each = first;
        return takeItems(inside(first));
      }
    }
    refuse(place, "the function needs the whole of its argument");
  }

  // Of an integer that is written there. What is no integer, or too large for a double, is rounded
  // by the function in a way of its own.
  std::optional<uint64_t> literalAt(XQueryPlaceID place) const {
    constexpr uint64_t most = uint64_t{1} << 53;
    const XQueryExpr* const expr = exprAt(inside(place));
    const auto* literal = dyn_cast<XQueryLiteral>(expr);
    const auto* number = literal ? dyn_cast<XQueryNumber>(literal->literalValue().get()) : nullptr;
    const auto position = XQueryStep::literalPositionOf(expr);
    const bool isInteger = number && number->typeID() == XQueryTypeInteger;
    return isInteger && position && *position <= most ? position : std::nullopt;
  }

  void takeSubsequence(XQueryPlaceID first, size_t count) {
    const XQueryPlaceID start = _program.nextPart(first);
    const XQueryPlaceID length = count == 3 ? _program.nextPart(start) : XQueryNoPlace;
    const auto from = start == XQueryNoPlace ? std::nullopt : literalAt(start);
    if (!from || *from < 1) refuse(first, "the first position is no number that is written there");
    _plan.first = *from;
    if (length == XQueryNoPlace) return;
    const auto number = literalAt(length);
    if (!number) refuse(length, "the number of items is not written there");
    _plan.last = *from - 1 + *number;
  }

  // (...)[3]
  bool takePosition(XQueryPlaceID place) {
    const auto* path = dyn_cast<XQueryPathExpr>(exprAt(place));
    const XQueryStep* step = path ? path->step() : nullptr;
    const bool isFiltered = step && step->kind() == Kind::FilterStep && !step->next() &&
                            step->predicates().size() == 1 && step->asksForPosition(0);
    if (!isFiltered) return false;
    _plan.fold = XQueryStreamFold::Part;
    _plan.first = _plan.last = *step->literalPosition(0);
    _plan.each = _program.firstPart(place);
    takeItems(inside(_plan.each));
    return true;
  }

  // --- what is evaluated for each record -------------------------------------------------------

  void takeItems(XQueryPlaceID place) {
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

  void takeClauses(XQueryPlaceID place) {
    XQueryPlaceID clause = _program.firstPart(place);
    const XQueryExpr* binder = clause == XQueryNoPlace ? nullptr : exprAt(clause);
    const auto* forClause = dyn_cast<XQueryForExpr>(binder);
    if (!forClause && !isa<XQueryQuantifiedExprItem>(binder)) {
      refuse(clause == XQueryNoPlace ? place : clause,
             "the first clause does not go through a path");
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
  void checkInside(XQueryPlaceID place) const {
    using namespace XQueryDeeds;
    if (_facts[place].does(ReadsItem | ReadsPosition | ReadsSize)) {
      refuse(place, "it reads the document apart from the record");
    }
    checkStaysInside(place);
  }

  // The innermost place is told of; of a path from the root the path, since "/" is one object.
  void checkStaysInside(XQueryPlaceID place) const {
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
  bool leavesItToItsParts(XQueryPlaceID place) const {
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
  bool takesInnerAxes(XQueryPlaceID path) const {
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
      const bool isDescent = skipsLevels || (axisStep->axis() == XQueryAxisDescendant &&
                                             asksForName(axisStep->expr()));
      if (isDescent ? !isRecord : !staysInside(axisStep->axis())) return false;
      isRecord = false;
    }
    return true;
  }

  static bool staysInside(int axis) {
    return axis == XQueryAxisChild || axis == XQueryAxisAttribute || axis == XQueryAxisSelf;
  }
  static bool asksForName(const XQueryExpr* test) {
    const auto* name = dyn_cast<XQueryNameTest>(test);
    return name && !name->attribute();
  }
  static bool isChildByName(const XQueryStep* step) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    return axisStep && axisStep->axis() == XQueryAxisChild && asksForName(axisStep->expr());
  }

  // --- the path --------------------------------------------------------------------------------

  void takePath(XQueryPlaceID place) {
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
    const bool isWhole =
        _plan.record.size() < 2 && (_plan.record.empty() || !_plan.record.front().isAnywhere);
    if (isWhole) refuse(place, "the whole document would be one record");
    // What has nothing below it is no matter where the path goes on.
    if (!_plan.record.back().name) refuse(place, "a record would be any element or instruction");
    if (_plan.record.size() > mostSteps) refuse(place, "the path to the record is too long");
    _bindsRecords = !step;
    for (; step; step = step->next()) takeInnerStep(*step, place);
  }

  // Beyond any that matters where it is not known.
  size_t levelOfRecord() const {
    for (const XQueryStreamStep& step : _plan.record) {
      if (step.isAnywhere) return SIZE_MAX;
    }
    return _plan.record.size();
  }

  // Whether more steps may belong to the way to the record. Moves on behind the step.
  bool takeRecordStep(const XQueryStep& step, XQueryPlaceID path) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
    if (!axisStep || _isComplete) return false;
    const XQueryExpr* test = axisStep->expr();
    const bool hasPredicates = !step.predicates().empty();
    if (axisStep->axis() == XQueryAxisDescendantOrSelf && asksForAnyNode(test) && !hasPredicates) {
      beginAnywhere(path);
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
    if (isDescendant) beginAnywhere(path);
    _plan.record.push_back({std::exchange(_isAnywhere, false), name});
    _part = _program.nextPart(_part);
    checkPredicates(step);
    // What a predicate looks at is below its step.
    _isComplete = hasPredicates;
    return true;
  }

  void beginAnywhere(XQueryPlaceID path) {
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
  bool countsPositions(const XQueryStep& step) const {
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

  void checkPredicates(const XQueryStep& step) {
    for (const auto& predicate : step.predicates()) {
      if (!predicate) break;
      checkStaysInside(_part);
      _part = _program.nextPart(_part);
    }
  }

  void takeInnerStep(const XQueryStep& step, XQueryPlaceID path) {
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
      if (!findsNodes) refuse(path, "a step answers what may be no node of the record");
      checkStaysInside(_part);
    }
    if (step.expr()) _part = _program.nextPart(_part);
    checkPredicates(step);
  }

  XQueryPlaceID _part = XQueryNoPlace;  // of the path, the next of those of the step at hand
  bool _isAnywhere = false;             // "//" has been met and waits for the name behind it
  bool _isComplete = false;
  bool _bindsRecords = false;                   // the path finds the records themselves
  XQueryPlaceID _recordClause = XQueryNoPlace;  // whose variable is a record that holds descendants
};

}  // namespace

std::string XQueryStreamPlan::recordPath() const {
  std::string path;
  for (const XQueryStreamStep& step : record) {
    path += step.isAnywhere ? "//" : "/";
    path += step.name ? step.name->name()->utf8() : "*";
  }
  return path;
}

std::string XQueryStreamPlan::description() const {
  std::string result = "items as they are found";
  if (fold == XQueryStreamFold::Some) result = "some";
  if (fold == XQueryStreamFold::Every) result = "every";
  if (fold == XQueryStreamFold::Part) {
    const bool isOpen = last == std::numeric_limits<uint64_t>::max();
    result = "items from position " + std::to_string(first) +
             (isOpen ? "" : " to " + std::to_string(last));
  } else {
    for (const FoldOfFunction& row : folds) {
      if (row.fold == fold) result = row.name;
    }
  }
  return "record: " + recordPath() + "\nresult: " + result + "\n";
}

XQueryStreamPlan XQueryPlanStream(const XQueryProgram& program, const XQueryFactTable& facts) {
  return Analysis(program, facts).run();
}

}  // namespace xquery
