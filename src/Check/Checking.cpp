#include "Check/Checking.h"

#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Labels.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Base/XQueryPlaceColumns.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <array>
#include <tuple>
#include <utility>

namespace xquery {
namespace {

// What is quoted of a query stays on one line and short.
std::string quoted(std::string_view text) {
  constexpr size_t mostBytes = 120;
  std::string shown(text.substr(0, mostBytes));
  if (text.size() > mostBytes) {
    // No character is cut in two.
    while (!shown.empty() && (static_cast<unsigned char>(shown.back()) & 0xC0) == 0x80) {
      shown.pop_back();
    }
    if (!shown.empty() && static_cast<unsigned char>(shown.back()) >= 0xC0) shown.pop_back();
    shown += "...";
  }
  for (char& each : shown) {
    if (static_cast<unsigned char>(each) < ' ') each = ' ';
  }
  return shown;
}

}  // namespace

XQueryChecking::XQueryChecking(const XQueryProgram& ofProgram, const XQueryFactTable& known,
                               const XQueryProlog& mainProlog)
    : program(ofProgram), facts(known), main(mainProlog) {
  numberOf(main);
  for (const XQueryProgramBody& body : program.bodies()) {
    numberOf(*body.prolog);
    if (body.function) _bodies.emplace(body.function, &body);
    if (body.variable) _bodies.emplace(body.variable, &body);
  }
  for (const auto& reference : main.qNameReferences()) _waitingNames.insert(reference.get());
}

// --- warnings ------------------------------------------------------------------------------------

size_t XQueryChecking::numberOf(const XQueryProlog& module) {
  return _modules.emplace(&module, _modules.size()).first->second;
}

// "." is one expression for all places and carries no place: that of the nearest whole serves.
XQueryChecking::Spot XQueryChecking::spotOf(const XQueryProgram& program, XQueryPlaceID place) {
  Spot spot{0};
  for (int level = 0; place != XQueryNoPlace && level < mostLevels; ++level) {
    const XQueryExpr& expr = *program[place].expr;
    spot.line = std::max(spot.line, expr.exprLine());
    spot.number = expr.exprPlace();
    if (spot.number != 0) break;
    place = program[place].parent;
  }
  return spot;
}

XQueryWarning XQueryChecking::warningOf(ID id, Parts parts, const Ref<NSString>& name) {
  constexpr std::string_view dots = "…";
  const XQueryWarningRow& row = XQueryWarningRowOf(id);
  std::string text;
  std::string_view rest = row.text;
  for (const std::string& part : parts) {
    const size_t place = std::min(rest.find(dots), rest.size());
    text += rest.substr(0, place);
    rest.remove_prefix(std::min(place + dots.size(), rest.size()));
    text += quoted(part);
  }
  text += rest;
  XQueryWarning warning;
  warning.identifier = row.identifier;
  warning.text = NSString::stringWithUTF8Replacing(text);
  warning.name = name;
  return warning;
}

void XQueryChecking::add(const XQueryProlog& module, XQueryPlaceID place, Spot spot,
                         XQueryWarning warning) {
  if (isFull()) return;
  if (&module != &main && module.moduleURL()) warning.module = module.moduleURL()->absoluteString();
  warning.line = spot.line + 1;
  _found.push_back({numberOf(module), place, spot.number, std::move(warning)});
}

void XQueryChecking::warn(XQueryPlaceID place, ID id, Parts parts, const Ref<NSString>& name) {
  add(*program.bodyOf(place).prolog, place, spotOf(program, place), warningOf(id, parts, name));
}

void XQueryChecking::warnAt(const XQueryProlog& module, Spot spot, ID id, Parts parts,
                            const Ref<NSString>& name) {
  add(module, XQueryNoPlace, spot, warningOf(id, parts, name));
}

std::vector<XQueryWarning> XQueryChecking::takeWarnings() {
  XQueryFindColumns(*main.modules().places(), _found,
                    [](Found& found, const XQueryPlaceColumn& at) {
                      found.warning.line = at.line;
                      found.warning.column = at.column;
                      found.warning.length = at.length;
                    });
  const auto keyOf = [](const Found& found) {
    const XQueryWarning& warning = found.warning;
    return std::tuple(found.module, warning.line, warning.column == 0, warning.column, found.place);
  };
  std::stable_sort(_found.begin(), _found.end(),
                   [&](const Found& a, const Found& b) { return keyOf(a) < keyOf(b); });
  std::vector<XQueryWarning> warnings;
  warnings.reserve(_found.size());
  for (Found& each : _found) warnings.push_back(std::move(each.warning));
  return warnings;
}

// --- looking at places ---------------------------------------------------------------------------

XQueryPlaceID XQueryChecking::argument(XQueryPlaceID call, size_t index) const {
  const XQueryPlaceID list = program.part(call, XQueryRole::Arguments);
  if (list == XQueryNoPlace) return XQueryNoPlace;
  XQueryPlaceID found = program.firstPart(list);
  while (found != XQueryNoPlace && index-- > 0) found = program.nextPart(found);
  return found;
}

size_t XQueryChecking::argumentCount(XQueryPlaceID call) const {
  const auto* expr = as<XQueryFunctionCall>(call);
  return expr && expr->args() ? expr->args()->count() : 0;
}

XQueryPlaceID XQueryChecking::leftOperand(XQueryPlaceID whole) const {
  const XQueryPlaceID first = program.firstPart(whole);
  return first != XQueryNoPlace && program.nextPart(first) != XQueryNoPlace ? first : XQueryNoPlace;
}

XQueryPlaceID XQueryChecking::rightOperand(XQueryPlaceID whole) const {
  const XQueryPlaceID left = leftOperand(whole);
  return left == XQueryNoPlace ? left : program.nextPart(left);
}

std::string_view XQueryChecking::functionCalledIn(XQueryPlaceID place) const {
  const auto* call = inside<XQueryFunctionCall>(place);
  if (!call || !call->builtIn()) return {};
  const auto& row = call->builtIn()->row();
  return row.namespaceID == XQueryNamespaceFN ? row.localName : std::string_view();
}

const XQueryProgramBody* XQueryChecking::bodyOf(const XQueryFunctionDecl* function) const {
  const auto found = _bodies.find(function);
  return found == _bodies.end() ? nullptr : found->second;
}

const XQueryProgramBody* XQueryChecking::bodyOf(const XQueryVarDecl* variable) const {
  const auto found = _bodies.find(variable);
  return found == _bodies.end() ? nullptr : found->second;
}

const XQueryChecking::Functions& XQueryChecking::functionsNamed(const XQueryProlog& prolog,
                                                                const std::string& localName) {
  const auto [entry, isNew] = _functions.try_emplace(&prolog);
  WorkPacer pacer;
  for (const Value& declaration : prolog.declarations()) {
    if (!isNew) break;
    pacer.turn();
    const auto* function = dyn_cast<XQueryFunctionDecl>(declaration);
    if (function) entry->second[function->name()->localPart()->utf8()].push_back(function);
  }
  return entry->second[localName];
}

const NSObject* XQueryChecking::literalIn(XQueryPlaceID place) const {
  const auto* literal = inside<XQueryLiteral>(place);
  return literal ? literal->literalValue().get() : nullptr;
}

const NSString* XQueryChecking::textIn(XQueryPlaceID place) const {
  return dyn_cast<NSString>(literalIn(place));
}

bool XQueryChecking::hasUnknownPrefix(const NSString& name, XQueryPlaceID place) const {
  const auto colon = name.view().find(u':');
  if (colon == NSStringView::notFound || colon == 0) return false;
  return !program.bodyOf(place).prolog->namespaceForPrefix(name.view().substring(0, colon));
}

bool XQueryChecking::givesUntypedText(XQueryPlaceID place) const {
  if (place == XQueryNoPlace) return false;
  const std::string_view name = functionCalledIn(place);
  return name == "concat" || name == "replace" || name == "tokenize" || name == "in-scope-prefixes";
}

bool XQueryChecking::mayWellBeEmpty(XQueryPlaceID place) const {
  const XQueryFacts& known = factsOf(place);
  if (known.least > 0) return false;
  const Kind kind = at(program.withoutParentheses(place)).expr->kind();
  return known.most == 0 || kind == Kind::PathExpr || kind == Kind::FLWORExpr;
}

std::string XQueryChecking::labelOf(XQueryPlaceID place) const {
  return XQueryLabelOf(*at(program.withoutParentheses(place)).expr);
}

XQueryItemKinds XQueryChecking::atomicKinds(XQueryPlaceID place) const {
  if (place == XQueryNoPlace || factsOf(place).most == 0) return XQueryItems::None;
  const XQueryItemKinds kinds = factsOf(place).kinds;
  if (kinds & XQueryItems::Other) return XQueryItems::None;
  return XQueryAtomizedKinds(kinds);
}

bool XQueryIsCodepointCollation(std::string_view URI) {
  return URI == "http://www.w3.org/2004/10/xpath-functions/collation/codepoint" ||
         URI == "http://www.w3.org/2005/xpath-functions/collation/codepoint";
}

// --- names of kinds ------------------------------------------------------------------------------

std::string XQueryNameOfKinds(XQueryItemKinds kinds) {
  using namespace XQueryItems;
  struct Row {
    XQueryItemKinds kinds;
    std::string_view name;
  };
  // The first that holds all of the kinds.
  static constexpr std::array rows = {
      Row{Document, "a document"},
      Row{Element, "an element"},
      Row{Attribute, "an attribute"},
      Row{Text, "a text node"},
      Row{Comment, "a comment"},
      Row{Instruction, "a processing instruction"},
      Row{Node, "a node"},
      Row{Untyped, "an untyped value"},
      Row{String, "a string"},
      Row{Boolean, "a truth value"},
      Row{Numeric, "a number"},
      Row{URI, "a URI"},
      Row{QName, "a QName"},
      Row{DateTime, "a dateTime"},
      Row{Date, "a date"},
      Row{Time, "a time"},
      Row{Duration, "a duration"},
      Row{Gregorian, "a part of a date"},
      Row{HexBinary | Base64Binary, "binary data"},
      Row{Any, "such a value"},
  };
  for (const Row& row : rows) {
    if ((kinds & ~row.kinds) == 0) return std::string(row.name);
  }
  return "such a value";
}

}  // namespace xquery
