#include "Plan/Streams/XQueryStreamPlan.h"

#include "Context/StackGuard.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Streams/XQueryRecordAnalysis.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryNumber.h"

#include <algorithm>
#include <optional>
#include <utility>

namespace xquery {

namespace {

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

// Goes over the program from the body to the paths that find the records.
class Analysis : private XQueryRecordAnalysis {
 public:
  using XQueryRecordAnalysis::XQueryRecordAnalysis;

  XQueryStreamPlan run() {
    return planBy([this] {
      checkGlobals();
      takeBody(_program.bodies().back().place);
    });
  }

 private:
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
    if (takeWhole(place)) return endPart(place);
    if (!readsDocument(place)) {
      refuse(place, "no path goes through the document record by record");
    }
    _plan.around = body;
    takeAround(place, true);
    checkVariablesAround(body);
    checkPaths(place);
  }

  // What is all of the query, and whose items may be nodes of the document.
  bool takeWhole(XQueryPlaceID place) {
    _now.each = place;
    switch (exprAt(place)->kind()) {
      case Kind::PathExpr:
        if (takePosition(place)) return true;
        if (!isPathOfDocument(place)) return false;
        takePath(place);
        return true;
      case Kind::FLWORExpr:
        if (!beginsWithRecords(place)) return false;
        takeItems(place);
        return true;
      default:
        return takeFold(place);
    }
  }

  // Whether it is a function or a quantifier over records.
  bool takeFold(XQueryPlaceID place) {
    if (const auto* quantifier = dyn_cast<XQueryQuantifiedExpr>(exprAt(place))) {
      if (!beginsWithRecords(place)) return false;
      // Where a clause has no items the next one stands in its place: that is asked of all records.
      if (quantifier->items().size() > 1) refuse(place, "the quantifier has more than one clause");
      _now.fold = quantifier->every() ? XQueryStreamFold::Every : XQueryStreamFold::Some;
      _now.each = place;
      takeClauses(place);
      return true;
    }
    return isa<XQueryFunctionCall>(exprAt(place)) && takeCall(place);
  }

  bool takeCall(XQueryPlaceID place) {
    const auto* call = cast<XQueryFunctionCall>(exprAt(place));
    const XQueryPlaceID arguments = _program.part(place, XQueryRole::Arguments);
    const XQueryPlaceID first =
        arguments == XQueryNoPlace ? arguments : _program.firstPart(arguments);
    if (!call->builtIn() || first == XQueryNoPlace || !goesThroughRecords(inside(first))) {
      return false;
    }
    for (const FoldOfFunction& row : folds) {
      if (row.name != call->builtIn()->row().localName) continue;
      const size_t count = call->args()->count();
      if (row.fold == XQueryStreamFold::Part) {
        takeSubsequence(first, count);
      } else if (count != 1) {
        refuse(place, "the function has more than one argument");
      }
      _now.fold = row.fold;
      _now.each = first;
      takeItems(inside(first));
      return true;
    }
    return false;
  }

  // --- what stands around folds ----------------------------------------------------------------

  // Looks for folds there. `isSure`: it is evaluated whatever happens.
  void takeAround(XQueryPlaceID whole, bool isSure) {
    const XQueryPlaceID place = inside(whole);
    if (!readsDocument(place)) return;
    if (!XQueryStackHasRoom()) refuse(place, "the query nests too deeply");
    if (takeFold(place)) return endFoldWithin(place, isSure);
    checkItself(place);
    const XQueryExpr* const expr = exprAt(place);
    const bool isOfTuples =
        isa<XQueryFLWORExpr>(expr) || isa<XQueryLetExpr>(expr) || isa<XQueryForExpr>(expr);
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryRole role = _program[part].role;
      const XQueryRoleTraits traits = XQueryTraitsOf(role);
      if (traits.isNoValue || traits.hasOwnFocus) continue;
      takeAround(part, isSure && (isOfTuples || !traits.isOptional));
      // There may be no tuple for what comes behind.
      if (role == XQueryRole::Where || isa<XQueryForExpr>(exprAt(part))) isSure = false;
    }
  }

  // The fold is evaluated once, whether or not anybody asks for it.
  void endFoldWithin(XQueryPlaceID place, bool isSure) {
    if (_now.fold == XQueryStreamFold::Part) refuse(place, "nodes of a record are kept");
    if (!_program[place].slot) refuse(place, "its value cannot stand for it");
    if (!_facts[place].reads.isEmpty()) {
      refuse(place, "it depends on a variable that is set around it");
    }
    _now.isSure = isSure;
    endPart(place);
  }

  // That nothing but parts of the place looks at the document.
  void checkItself(XQueryPlaceID place) const {
    using namespace XQueryDeeds;
    unsigned ofParts = 0;
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      const XQueryRoleTraits traits = XQueryTraitsOf(_program[part].role);
      if (!traits.isNoValue && !traits.hasOwnFocus) ofParts |= _facts[part].deeds & ReadsFocus;
    }
    if (isPathOfDocument(place)) refuse(place, "what the path finds is needed as a whole");
    const auto* call = dyn_cast<XQueryFunctionCall>(exprAt(place));
    const bool isOwnDeed = (_facts[place].deeds & ReadsFocus & ~ofParts) != 0;
    if (isOwnDeed || (call && readsFocusItself(*call))) {
      refuse(place, "it reads the document apart from the record");
    }
    if (call && call->builtIn()) checkArguments(place);
  }

  bool readsFocusItself(const XQueryFunctionCall& call) const {
    const size_t count = call.args() ? call.args()->count() : 0;
    if (call.builtIn()) return call.builtIn()->row().readsContextItem(count);
    return call.functionDecl() &&
           _facts.ofFunction(call.functionDecl()).does(XQueryDeeds::ReadsFocus);
  }

  void checkArguments(XQueryPlaceID call) const {
    const XQueryPlaceID list = _program.part(call, XQueryRole::Arguments);
    for (XQueryPlaceID each = _program.firstPart(list); each != XQueryNoPlace;
         each = _program.nextPart(each)) {
      if (goesThroughRecords(inside(each))) {
        refuse(call, "the function needs the whole of its argument");
      }
    }
  }

  // Of what a quantifier leaves set behind it, nothing is there.
  void checkVariablesAround(XQueryPlaceID body) const {
    const auto isWithin = [](XQueryPlaceID place, const XQueryPlace& whole, XQueryPlaceID begin) {
      return place >= begin && place < whole.end;
    };
    for (XQueryPlaceID place = body; place < _program[body].end; ++place) {
      const XQueryPlaceID binder = _program[place].binder;
      if (!isa<XQueryVariable>(exprAt(place)) || binder == XQueryNoPlace) continue;
      for (const XQueryStreamPart& part : _plan.parts) {
        const XQueryPlace& whole = _program[part.place];
        if (isWithin(binder, whole, part.place) && !isWithin(place, whole, part.place)) {
          refuse(place, "the variable is set for each record");
        }
      }
    }
  }

  // Together they may be as long as one.
  void checkPaths(XQueryPlaceID place) const {
    size_t length = 0;
    for (auto part = _plan.parts.begin(); part != _plan.parts.end(); ++part) {
      const auto isSame = [&](const XQueryStreamPart& other) {
        return other.record == part->record;
      };
      if (std::none_of(_plan.parts.begin(), part, isSame)) length += part->record.size() + 1;
    }
    if (length > mostSteps + 1) refuse(place, "the paths to the records are too long");
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
    _now.first = *from;
    if (length == XQueryNoPlace) return;
    const auto number = literalAt(length);
    if (!number) refuse(length, "the number of items is not written there");
    _now.last = *from - 1 + *number;
  }

  // (...)[3], (...)[position() < 3]
  bool takePosition(XQueryPlaceID place) {
    const auto* path = dyn_cast<XQueryPathExpr>(exprAt(place));
    const XQueryStep* step = path ? path->step() : nullptr;
    const bool isFiltered =
        step && step->kind() == Kind::FilterStep && !step->next() && step->predicates().size() == 1;
    if (!isFiltered || !goesThroughRecords(inside(_program.firstPart(place)))) return false;
    if (step->asksForPosition(0)) {
      _now.first = _now.last = *step->literalPosition(0);
    } else if (!takeComparedPosition(inside(_program.nextPart(_program.firstPart(place))))) {
      return false;
    }
    _now.fold = XQueryStreamFold::Part;
    _now.each = _program.firstPart(place);
    takeItems(inside(_now.each));
    return true;
  }

  // Of a predicate that compares the position with an integer that is written there.
  bool takeComparedPosition(XQueryPlaceID predicate) {
    const auto* comparison = dyn_cast<XQueryOperatorExpr>(exprAt(predicate));
    if (!comparison) return false;
    const XQueryPlaceID left = _program.firstPart(predicate);
    const auto* call = dyn_cast<XQueryFunctionCall>(exprAt(inside(left)));
    const bool isPosition = call && call->builtIn() && !call->args() &&
                            call->builtIn()->row().has(XQueryBuiltInFunction::ReadsPosition);
    const auto number = isPosition ? literalAt(_program.nextPart(left)) : std::nullopt;
    if (!number) return false;
    switch (comparison->operatorType()) {
      case XQueryOperatorEqual:
      case XQueryOperatorEq:
        _now.first = _now.last = *number;
        return *number > 0;
      case XQueryOperatorLess:
      case XQueryOperatorLt:
        _now.last = *number - std::min<uint64_t>(*number, 1);
        return true;
      case XQueryOperatorLessEqual:
      case XQueryOperatorLe:
        _now.last = *number;
        return true;
      case XQueryOperatorGreater:
      case XQueryOperatorGt:
        _now.first = *number + 1;
        return true;
      case XQueryOperatorGreaterEqual:
      case XQueryOperatorGe:
        _now.first = std::max<uint64_t>(*number, 1);
        return true;
      default:
        return false;
    }
  }
};

}  // namespace

namespace {

std::string pathOf(const XQueryStreamPart& part) {
  std::string path;
  for (const XQueryStreamStep& step : part.record) {
    path += step.isAnywhere ? "//" : "/";
    path += step.name ? step.name->name()->utf8() : "*";
  }
  return path;
}

std::string resultOf(const XQueryStreamPart& part) {
  if (part.fold == XQueryStreamFold::Items) return "items as they are found";
  if (part.fold == XQueryStreamFold::Some) return "some";
  if (part.fold == XQueryStreamFold::Every) return "every";
  if (part.fold == XQueryStreamFold::Part) {
    const bool isOpen = part.last == std::numeric_limits<uint64_t>::max();
    return "items from position " + std::to_string(part.first) +
           (isOpen ? "" : " to " + std::to_string(part.last));
  }
  for (const FoldOfFunction& row : folds) {
    if (row.fold == part.fold) return std::string(row.name);
  }
  return {};
}

// With commas between, each once.
void addTo(std::vector<std::string>& list, std::string text) {
  if (std::find(list.begin(), list.end(), text) == list.end()) list.push_back(std::move(text));
}

std::string joined(const std::vector<std::string>& list) {
  std::string all;
  for (const std::string& each : list) all += (all.empty() ? "" : ", ") + each;
  return all;
}

}  // namespace

bool XQueryStreamStep::operator==(const XQueryStreamStep& other) const {
  if (isAnywhere != other.isAnywhere || !name != !other.name) return false;
  if (!name || name == other.name) return true;
  if (!name->isDeferred()) return name->boundName() && name->boundName() == other.name->boundName();
  return other.name->isDeferred() && name->name()->isEqualToString(*other.name->name());
}

std::string XQueryStreamPlan::recordPath() const {
  std::vector<std::string> paths;
  for (const XQueryStreamPart& part : parts) addTo(paths, pathOf(part));
  return joined(paths);
}

std::string XQueryStreamPlan::description() const {
  std::vector<std::string> results;
  for (const XQueryStreamPart& part : parts) addTo(results, resultOf(part));
  return "record: " + recordPath() +
         "\nresult: " + (around == XQueryNoPlace ? "" : "an expression of ") + joined(results) +
         "\n";
}

XQueryStreamPlan XQueryPlanStream(const XQueryProgram& program, const XQueryFactTable& facts) {
  return Analysis(program, facts).run();
}

}  // namespace xquery
