#include "Plan/Projection/XQueryProjectionPlan.h"

#include "Context/StackGuard.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryBinding.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryBuiltInFunction.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/DocumentAnalysis.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {

namespace {

// Programs that nest deeper, or have more paths, are no questions that need little.
constexpr int mostDepth = 200;
constexpr size_t mostPlaces = 200;

constexpr size_t unknownLevel = SIZE_MAX;

// What nodes of the document a value may hold.
class Sources {
 public:
  using Place = XMLProjection::PlaceID;

  static Sources of(Place place) {
    Sources sources;
    sources._places.push_back(place);
    return sources;
  }
  void add(Place place) {
    if (std::find(_places.begin(), _places.end(), place) == _places.end()) {
      _places.push_back(place);
    }
  }
  void add(const Sources& others) {
    for (const Place place : others._places) add(place);
    hasLeaves = hasLeaves || others.hasLeaves;
    hasInner = hasInner || others.hasInner;
  }
  const std::vector<Place>& places() const { return _places; }
  bool isNone() const { return _places.empty() && !hasLeaves && !hasInner; }

  // Attributes and texts, which are there as a whole.
  bool hasLeaves = false;
  // What is below an element of which all is there.
  bool hasInner = false;

 private:
  std::vector<Place> _places;
};

std::string localPart(const std::string& name) {
  const size_t colon = name.find(':');
  return colon == std::string::npos ? name : name.substr(colon + 1);
}

// What a node test asks for, among elements.
struct Test {
  enum Kind : uint8_t { Elements, Texts, Anything } kind;
  std::string name;        // local; empty for any
  bool findsInstructions;  // by their names, too
};

Test testOf(const XQueryExpr& expr) {
  if (const auto* name = dyn_cast<XQueryNameTest>(&expr)) {
    return {Test::Elements, localPart(name->name()->utf8()), false};
  }
  if (const auto* wildCard = dyn_cast<XQueryWildCardNameTest>(&expr)) {
    const Ref<NSString>& name = wildCard->localName();
    return {Test::Elements, name ? name->utf8() : std::string(), true};
  }
  const auto* type = dyn_cast<XQueryTypeDeclaration>(&expr);
  if (type && type->type() == XQueryTypeDeclaration::TextTest) return {Test::Texts, {}, false};
  if (type && type->type() == XQueryTypeDeclaration::ElementTest) {
    return {Test::Elements, {}, false};
  }
  return {Test::Anything, {}, true};
}

class Analysis : private XQueryDocumentAnalysis<XQueryProjectionPlan> {
 public:
  using XQueryDocumentAnalysis::XQueryDocumentAnalysis;

  XQueryProjectionPlan run() {
    return planBy([this] {
      for (const XQueryProgramBody& body : _program.bodies()) {
        if (!body.expr) continue;
        if (body.variable) takeGlobal(body);
        if (!body.variable && !body.function) takeBody(body.place);
      }
    });
  }

 private:
  XMLProjection& projection() { return _plan.projection; }

  void takeBody(XQueryPlaceID body) {
    const Sources result = visit(body, document());
    _plan.answersNodes = !result.isNone();
    need(result, XMLProjection::AllBelow, body);
  }

  // Its value is known by its variable alone.
  void takeGlobal(const XQueryProgramBody& body) {
    if (!looksAtFocus(_facts[body.place])) return;
    const Sources value = visit(body.place, document());
    if (!value.isNone()) refuse(body.place, "a global variable holds nodes of the document");
  }

  static bool looksAtFocus(const XQueryFacts& facts) {
    return facts.does(XQueryDeeds::ReadsFocus | XQueryDeeds::IsUnrepeatable);
  }

  static Sources document() { return Sources::of(XMLProjection::document); }

  void need(const Sources& sources, unsigned needs, XQueryPlaceID at) {
    for (const XMLProjection::PlaceID place : sources.places()) {
      if (place == XMLProjection::document && (needs & XMLProjection::Below)) {
        refuse(at, "the document is used as a whole");
      }
      projection().need(place, needs);
    }
  }

  // --- expressions -----------------------------------------------------------------------------

  // Once for each place. `focus` is what "." may be.
  Sources visit(XQueryPlaceID place, const Sources& focus) {
    if (++_depth > mostDepth || !XQueryStackHasRoom()) refuse(place, "the query nests too deeply");
    Sources sources = visitHere(place, focus);
    --_depth;
    return sources;
  }

  Sources visitHere(XQueryPlaceID place, const Sources& focus) {
    switch (exprAt(place)->kind()) {
      case Kind::Literal:
      case Kind::QNameReference:
        return {};
      case Kind::Variable:
        return variable(place);
      case Kind::ContextItemExpr:
        _plan.isUsed = _plan.isUsed || !focus.isNone();
        return focus;
      case Kind::RootStepExpr:
        _plan.isUsed = true;
        return document();
      case Kind::PathExpr:
        return path(place, focus);
      case Kind::ExprList:
      case Kind::OrderExpr:
        return all(place, focus);
      case Kind::OperatorExpr:
        return operation(place, focus);
      case Kind::CastExpr:
      case Kind::CastableExpr:
        return value(place, focus);
      case Kind::InstanceOfExpr:
      case Kind::TreatExpr:
        return typed(place, focus);
      case Kind::FLWORExpr:
      case Kind::QuantifiedExpr:
      case Kind::ConditionalExpr:
      case Kind::TypeswitchExpr:
        return clauses(place, focus);
      case Kind::ElementExpr:
      case Kind::DocumentExpr:
        return element(place, focus);
      case Kind::AttributeExpr:
      case Kind::ComputedAttributeExpr:
      case Kind::TextExpr:
      case Kind::CommentExpr:
      case Kind::ProcessingInstructionExpr:
      case Kind::NamespaceExpr:
        return value(place, focus);
      case Kind::FunctionCall:
        return call(place, focus);
      default:
        refuse(place, "it is not known what it looks at");
    }
  }

  template <class Take>
  void forEachPart(XQueryPlaceID place, Take take) {
    for (XQueryPlaceID part = _program.firstPart(place); part != XQueryNoPlace;
         part = _program.nextPart(part)) {
      if (!XQueryTraitsOf(_program[part].role).isNoValue) take(part);
    }
  }

  Sources all(XQueryPlaceID place, const Sources& focus) {
    Sources sources;
    forEachPart(place, [&](XQueryPlaceID part) { sources.add(visit(part, focus)); });
    return sources;
  }

  // Of the parts the string values are looked at, and the answer holds none of their nodes.
  Sources value(XQueryPlaceID place, const Sources& focus) {
    forEachPart(place, [&](XQueryPlaceID part) {
      need(visit(part, focus), XMLProjection::StringValue, part);
    });
    return {};
  }

  // The same of the truth of parts, which nodes have by being there.
  void truth(XQueryPlaceID part, const Sources& focus) {
    need(visit(part, focus), XMLProjection::Itself, part);
  }

  Sources variable(XQueryPlaceID place) {
    const int64_t varID = cast<XQueryVariable>(exprAt(place))->varID();
    const XQueryPlaceID binder = _program[place].binder;
    if (varID == 0) return {};
    const auto found = _variables.find(binder);
    if (found == _variables.end() || !_facts.isSurelySet(place)) {
      refuse(place, "it is not known what the variable holds");
    }
    const auto* forClause = dyn_cast<XQueryForExpr>(exprAt(binder));
    if (forClause && forClause->posVarID() == varID) return {};
    return found->second;
  }

  Sources typed(XQueryPlaceID place, const Sources& focus) {
    const Sources sources = all(place, focus);
    if (!sources.isNone()) refuse(place, "a type is asked of nodes of the document");
    return {};
  }

  Sources operation(XQueryPlaceID place, const Sources& focus) {
    const int type = cast<XQueryOperatorExpr>(exprAt(place))->operatorType();
    switch (type) {
      case XQueryOperatorOr:
      case XQueryOperatorAnd:
        forEachPart(place, [&](XQueryPlaceID part) { truth(part, focus); });
        return {};
      case XQueryOperatorUnion:
      case XQueryOperatorIntersect:
      case XQueryOperatorExcept: {
        const Sources sources = all(place, focus);
        need(sources, XMLProjection::Itself, place);
        return sources;
      }
      default:
        break;
    }
    if (type >= XQueryOperatorPlus && type <= XQueryOperatorGe) return value(place, focus);
    if (!all(place, focus).isNone()) refuse(place, "nodes of the document are compared");
    return {};
  }

  // --- clauses ---------------------------------------------------------------------------------

  Sources clauses(XQueryPlaceID place, const Sources& focus) {
    Sources result;
    forEachPart(place, [&](XQueryPlaceID part) {
      switch (_program[part].role) {
        case XQueryRole::Clause:
          return clause(part, focus, result);
        case XQueryRole::Test:
        case XQueryRole::Where:
        case XQueryRole::Satisfies:
          return truth(part, focus);
        case XQueryRole::Branch:
        case XQueryRole::Return:
          return result.add(visit(part, focus));
        case XQueryRole::Switched:
          if (!visit(part, focus).isNone())
            refuse(part, "a type is asked of nodes of the document");
          return;
        default:
          refuse(part, "it is not known what it looks at");
      }
    });
    return result;
  }

  void clause(XQueryPlaceID place, const Sources& focus, Sources& result) {
    const auto* binding = dyn_cast<XQueryBindingExpr>(exprAt(place));
    if (!binding) {
      if (exprAt(place)->kind() != Kind::OrderSpec) refuse(place, "it is not known what it does");
      static_cast<void>(value(place, focus));
      return;
    }
    if (exprAt(place)->kind() == Kind::CaseClause) {
      _variables[place] = {};
      result.add(all(place, focus));
      return;
    }
    const Sources bound = all(place, focus);
    if (binding->type() && !bound.isNone()) {
      refuse(place, "a type is asked of nodes of the document");
    }
    if (binding->kind() != Kind::LetExpr) need(bound, XMLProjection::Itself, place);
    _variables[place] = bound;
  }

  // --- constructors ----------------------------------------------------------------------------

  // What it takes in are copies of nodes with what is below them, and with the namespaces in scope:
  // whatever is above a node is there with those it declares. Of what is around the node a copy
  // shows nothing, nor is one a node of the document.
  Sources element(XQueryPlaceID place, const Sources& focus) {
    forEachPart(place, [&](XQueryPlaceID part) {
      const bool isContent = _program[part].role == XQueryRole::Content;
      need(visit(part, focus), isContent ? XMLProjection::AllBelow : XMLProjection::StringValue,
           part);
    });
    return {};
  }

  // --- calls -----------------------------------------------------------------------------------

  Sources call(XQueryPlaceID place, const Sources& focus) {
    const auto* call = cast<XQueryFunctionCall>(exprAt(place));
    if (call->builtIn()) return callBuiltIn(place, call->builtIn()->row(), focus);
    const XQueryFunctionDecl* const function = call->functionDecl();
    if (function && looksAtFocus(_facts.ofFunction(function))) {
      refuse(place, "a declared function looks at the document");
    }
    forEachPart(place, [&](XQueryPlaceID list) {
      if (!all(list, focus).isNone())
        refuse(place, "nodes of the document are given to a function");
    });
    return {};
  }

  Sources callBuiltIn(XQueryPlaceID place, const XQueryBuiltInFunction::Registration& row,
                      const Sources& focus) {
    using Function = XQueryBuiltInFunction;
    const bool isOfValues = row.has(Function::LooksAtValues);
    const bool isOfNames = row.has(Function::LooksAtNames);
    if (!isOfValues && !isOfNames && !row.has(Function::LooksAtCount)) {
      refuse(place, "it is not known what of a node the function looks at");
    }
    const unsigned ofFirst = isOfValues ? XMLProjection::StringValue : XMLProjection::Itself;
    const unsigned ofOthers = isOfNames ? XMLProjection::Itself : XMLProjection::StringValue;
    constexpr XQueryItemKinds nodes = XQueryItems::Node | XQueryItems::Other | Function::OfAll;
    const bool handsOnOthers = (row.answer.kinds & nodes) != 0;
    const bool handsOnFirst =
        !isOfValues && (handsOnOthers || (row.answer.kinds & Function::OfFirst) != 0);
    Sources handedOn;
    size_t count = 0;
    forEachPart(place, [&](XQueryPlaceID list) {
      forEachPart(list, [&](XQueryPlaceID argument) {
        const Sources sources = visit(argument, focus);
        const bool isFirst = count++ == 0;
        need(sources, isFirst ? ofFirst : ofOthers, argument);
        if (isFirst ? handsOnFirst : handsOnOthers) handedOn.add(sources);
      });
    });
    if (!row.takes(count)) refuse(place, "the function takes another number of arguments");
    if (row.readsContextItem(count)) {
      _plan.isUsed = _plan.isUsed || !focus.isNone();
      need(focus, ofFirst, place);
    }
    return handedOn;
  }

  // The first half of "//".
  static bool skipsLevels(const XQueryAxisStep& step) {
    return step.axis() == XQueryAxisDescendantOrSelf && asksForAnyNode(step.expr()) &&
           step.predicates().empty();
  }

  // --- paths -----------------------------------------------------------------------------------

  Sources path(XQueryPlaceID place, const Sources& focus) {
    const XQueryStep* step = cast<XQueryPathExpr>(exprAt(place))->step();
    XQueryPlaceID part = _program.firstPart(place);
    Sources found = focus;
    bool isBelowAny = false;  // the first half of "//" has been met
    for (bool isFirst = true; step; step = step->next(), isFirst = false) {
      const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
      if (axisStep) {
        if (isFirst) _plan.isUsed = _plan.isUsed || !focus.isNone();
        if (!axisStep->expr()) refuse(place, "a step asks for nothing");
        if (!found.isNone() && axisStep->testMayRaise()) {
          refuse(place, "the namespace of a name is not known");
        }
        const bool isHalf = !found.isNone() && skipsLevels(*axisStep);
        if (isHalf && isBelowAny) refuse(place, "a step leads down from any node");
        if (!isHalf) found = next(found, *axisStep, isBelowAny, place);
        isBelowAny = isHalf;
        part = _program.nextPart(part);
      } else {
        if (isBelowAny) refuse(place, "a step leads down from any node");
        if (!isFirst) need(found, XMLProjection::Itself, place);
        if (step->expr()) {
          found = visit(part, found);
          part = _program.nextPart(part);
        } else {
          found = {};
        }
      }
      takePredicates(*step, part, found);
    }
    if (isBelowAny) refuse(place, "a step leads down from any node");
    return found;
  }

  void takePredicates(const XQueryStep& step, XQueryPlaceID& part, const Sources& focus) {
    for (const auto& predicate : step.predicates()) {
      if (!predicate) break;
      need(focus, XMLProjection::Itself, part);
      truth(part, focus);
      part = _program.nextPart(part);
    }
  }

  XMLProjection::PlaceID stepTo(XMLProjection::PlaceID from, bool isAnywhere, std::string_view name,
                                XQueryPlaceID path) {
    const XMLProjection::PlaceID to = projection().step(from, isAnywhere, name);
    if (to >= mostPlaces) refuse(path, "there are too many paths");
    if (to == _levels.size()) {
      const bool isKnown = !isAnywhere && _levels[from] != unknownLevel;
      _levels.push_back(isKnown ? _levels[from] + 1 : unknownLevel);
    }
    return to;
  }

  Sources next(const Sources& from, const XQueryAxisStep& step, bool isBelowAny,
               XQueryPlaceID path) {
    if (from.isNone()) return {};
    const Test test = testOf(*step.expr());
    switch (step.axis()) {
      case XQueryAxisChild:
        return isBelowAny ? below(from, test, true, path) : children(from, test, path);
      case XQueryAxisAttribute:
        return attributes(from, *step.expr(), isBelowAny, path);
      case XQueryAxisSelf:
        if (isBelowAny) break;
        return from;
      case XQueryAxisDescendant:
        if (isBelowAny) break;
        return below(from, test, false, path);
      case XQueryAxisDescendantOrSelf: {
        if (isBelowAny) break;
        Sources found = below(from, test, false, path);
        found.add(from);
        return found;
      }
      default:
        refuse(path, "a step leads sideways or upwards");
    }
    refuse(path, "a step leads down from any node");
  }

  Sources children(const Sources& from, const Test& test, XQueryPlaceID path) {
    Sources found;
    found.hasInner = from.hasInner;
    for (const XMLProjection::PlaceID place : from.places()) {
      if (test.kind == Test::Anything) {
        need(Sources::of(place), XMLProjection::AllBelow, path);
        found.hasInner = true;
      } else if (test.kind == Test::Texts) {
        projection().need(place, XMLProjection::Texts);
        found.hasLeaves = true;
      } else {
        found.add(stepTo(place, false, test.name, path));
        if (test.findsInstructions) {
          projection().need(place, XMLProjection::Instructions);
          found.hasLeaves = true;
        }
      }
    }
    return found;
  }

  // Nothing is known of where the axis ends that begins at other nodes.
  void checkHoldsDescendants(const Sources& from, XQueryPlaceID path) const {
    bool isKnown = !from.hasLeaves && !from.hasInner;
    for (const XMLProjection::PlaceID place : from.places()) {
      isKnown = isKnown && _levels[place] <= levelsThatHoldDescendants;
    }
    if (!isKnown) refuse(path, "the descendant axis may lead out of its node");
  }

  // `areChildren` of the nodes or of what is below them; the axis itself may run on to the
  // instructions behind the document element.
  Sources below(const Sources& from, const Test& test, bool areChildren, XQueryPlaceID path) {
    checkHoldsDescendants(from, path);
    Sources found;
    for (const XMLProjection::PlaceID place : from.places()) {
      const bool mayRunOn = !areChildren && place != XMLProjection::document;
      if (test.kind == Test::Anything || (test.findsInstructions && mayRunOn)) {
        refuse(path, "a step leads down to any node");
      }
      const XMLProjection::PlaceID to = stepTo(place, true, test.name, path);
      if (test.kind == Test::Texts) {
        projection().need(place, XMLProjection::Texts);
        projection().need(to, XMLProjection::Texts);
        found.hasLeaves = true;
        continue;
      }
      found.add(to);
      if (test.findsInstructions) {
        const XMLProjection::PlaceID any = stepTo(place, true, {}, path);
        projection().need(place, XMLProjection::Instructions);
        projection().need(any, XMLProjection::Instructions);
        found.hasLeaves = true;
      }
    }
    return found;
  }

  Sources attributes(const Sources& from, const XQueryExpr& test, bool isBelowAny,
                     XQueryPlaceID path) {
    Sources found;
    found.hasLeaves = from.hasInner;
    if (isBelowAny) checkHoldsDescendants(from, path);
    for (const XMLProjection::PlaceID place : from.places()) {
      found.hasLeaves = true;
      needAttributes(place, test);
      if (isBelowAny) needAttributes(stepTo(place, true, {}, path), test);
    }
    return found;
  }

  void needAttributes(XMLProjection::PlaceID place, const XQueryExpr& test) {
    if (const auto* name = dyn_cast<XQueryNameTest>(&test)) {
      projection().needAttribute(place, localPart(name->name()->utf8()));
    } else {
      projection().need(place, XMLProjection::Attributes);
    }
  }

  std::vector<size_t> _levels = {0};                      // of the places
  std::unordered_map<XQueryPlaceID, Sources> _variables;  // by the clause that sets them
  int _depth = 0;
};

}  // namespace

XQueryProjectionPlan XQueryPlanProjection(const XQueryProgram& program,
                                          const XQueryFactTable& facts) {
  return Analysis(program, facts).run();
}

}  // namespace xquery
