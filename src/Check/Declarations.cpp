// The types that functions and global variables declare. Nobody looks at them here, where
// XQuery 1.0 converts a value to its type or refuses it; told is what surely is converted or
// refused there.
#include "Check/Checking.h"
#include "Check/Uses.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Labels.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <array>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using ID = XQueryWarningID;
using namespace XQueryItems;

enum class Fit { Fits, Converted, Refused };

// The values that are of an atomic type in XQuery 1.0.
XQueryItemKinds kindsOf(XQueryTypeID type) {
  return type == XQueryTypeUntypedAtomic ? Untyped : XQueryKindsOfType(type);
}

Fit fitOfAtomic(XQueryTypeID type, XQueryItemKinds kinds) {
  const XQueryItemKinds wanted = kindsOf(type);
  if ((kinds & ~(Node | Untyped)) == 0) {
    const bool isNode = (kinds & ~Node) == 0;
    if (isNode) return Fit::Converted;
    return (kinds & Node) == 0 && (wanted & Untyped) == 0 ? Fit::Converted : Fit::Fits;
  }
  if ((kinds & (Node | Untyped)) != 0 || (kinds & wanted) != 0) return Fit::Fits;
  const bool isPromoted = (type == XQueryTypeDouble && (kinds & ~Numeric) == 0) ||
                          (type == XQueryTypeFloat && (kinds & ~(AnyDecimal | Float)) == 0) ||
                          (type == XQueryTypeString && (kinds & ~URI) == 0);
  return isPromoted ? Fit::Converted : Fit::Refused;
}

// The type that an atomic declaration names: those of results and of variables are not bound.
XQueryTypeID typeOf(const XQueryProlog& prolog, const XQueryTypeDeclaration& type) {
  if (type.typeID() != XQueryTypeNone) return type.typeID();
  auto* const lexical = dyn_cast<NSString>(type.data());
  const auto qName = lexical ? prolog.xmlQNameFromString(Ref<NSString>(lexical)) : nullptr;
  return qName ? XQueryTypeIDForQName(*qName) : XQueryTypeNone;
}

// What XQuery 1.0 does with a value of which so much is known.
Fit fitOf(const XQueryProlog& prolog, const XQueryTypeDeclaration* type, const XQueryFacts& value) {
  if (!type || (value.most == 0 && value.least > 0)) return Fit::Fits;
  const bool mayBeEmpty = type->occuranceType() == XQueryTypeDeclaration::ZeroOrOne ||
                          type->occuranceType() == XQueryTypeDeclaration::ZeroOrMore;
  const bool mayBeSeveral = type->occuranceType() >= XQueryTypeDeclaration::ZeroOrMore;
  if (type->type() == XQueryTypeDeclaration::Empty) {
    return value.least > 0 ? Fit::Refused : Fit::Fits;
  }
  if (value.most == 0) return mayBeEmpty ? Fit::Fits : Fit::Refused;
  if (value.least > 1 && !mayBeSeveral) return Fit::Refused;
  if (type->type() == XQueryTypeDeclaration::Item || value.mayBe(Other)) return Fit::Fits;
  if (type->type() == XQueryTypeDeclaration::Atomic) {
    const XQueryTypeID id = typeOf(prolog, *type);
    return id == XQueryTypeNone ? Fit::Fits : fitOfAtomic(id, value.kinds);
  }
  if (type->data()) return value.mayBe(Node) ? Fit::Fits : Fit::Refused;
  XQueryFacts restricted = value;
  restricted.least = 0;
  XQueryRestrictToType(type, restricted);
  return restricted.kinds == None && value.least > 0 ? Fit::Refused : Fit::Fits;
}

std::string nameOfValue(const XQueryFacts& value) {
  if (value.most == 0) return "nothing";
  if (value.least > 1) return "several items";
  return XQueryNameOfKinds(value.kinds);
}

// Functions to which a node is the text in it.
constexpr auto converting = std::to_array<std::string_view>({"string",          "data",
                                                             "number",          "count",
                                                             "exists",          "empty",
                                                             "string-length",   "upper-case",
                                                             "lower-case",      "contains",
                                                             "starts-with",     "ends-with",
                                                             "substring",       "substring-before",
                                                             "substring-after", "normalize-space",
                                                             "translate",       "concat",
                                                             "string-join",     "matches",
                                                             "replace",         "tokenize"});

class Declarations {
 public:
  Declarations(XQueryChecking& checking, const XQueryUses& uses)
      : _checking(checking), _uses(uses) {}

  void run() {
    for (const XQueryProgramBody& body : _checking.program.bodies()) {
      if (body.function) lookAtFunction(body);
      if (body.variable) lookAtVariable(body);
    }
    WorkPacer pacer;
    for (XQueryPlaceID place = 0; place < _checking.program.placeCount(); ++place) {
      pacer.turn();
      const auto* call = _checking.as<XQueryFunctionCall>(place);
      if (call && call->functionDecl()) lookAtCall(place, *call);
    }
    lookAtExternals();
  }

 private:
  void judge(XQueryPlaceID place, const std::string& what, const XQueryTypeDeclaration* type,
             const XQueryProlog& prolog, const std::vector<XQueryPlaceID>& readers) {
    const XQueryFacts& value = _checking.factsOf(place);
    const Fit fit = fitOf(prolog, type, value);
    if (fit == Fit::Fits) return;
    if (fit == Fit::Converted && areConverting(readers)) return;
    const std::string label = XQueryLabelOf(*type);
    if (fit == Fit::Converted) {
      _checking.warn(place, ID::NotConverted, {what, label, nameOfValue(value)});
    } else {
      _checking.warn(place, ID::NotChecked, {what, label, nameOfValue(value)});
    }
  }

  // Whether whoever reads the value takes the text or the number in it by himself.
  bool areConverting(const std::vector<XQueryPlaceID>& readers) const {
    const auto converts = [&](XQueryPlaceID reader) {
      const XQueryPlace& at = _checking.at(reader);
      if (at.role == XQueryRole::Operand) {
        const Kind kind = _checking.at(at.parent).expr->kind();
        return kind == Kind::CastExpr || kind == Kind::CastableExpr;
      }
      if (at.role != XQueryRole::Argument) return false;
      const XQueryPlaceID whole = _checking.at(at.parent).parent;
      const auto* call = _checking.as<XQueryFunctionCall>(whole);
      if (!call || !call->builtIn()) return false;
      const auto space = call->builtIn()->row().namespaceID;
      if (space == XQueryNamespaceXS || space == XQueryNamespaceXDT) return true;
      const std::string_view name = _checking.functionCalledIn(whole);
      return std::find(converting.begin(), converting.end(), name) != converting.end();
    };
    constexpr size_t mostReaders = 200;  // of more than that nothing is said
    if (readers.size() > mostReaders) return true;
    return !readers.empty() && std::all_of(readers.begin(), readers.end(), converts);
  }

  void lookAtCall(XQueryPlaceID place, const XQueryFunctionCall& call) {
    const auto& params = call.functionDecl()->params();
    const XQueryPlaceID list = _checking.program.part(place, XQueryRole::Arguments);
    if (list == XQueryNoPlace) return;
    size_t index = 0;
    for (XQueryPlaceID each = _checking.program.firstPart(list);
         each != XQueryNoPlace && index < params.size();
         each = _checking.program.nextPart(each), ++index) {
      static const std::vector<XQueryPlaceID> none;
      const auto* body = _checking.bodyOf(call.functionDecl());
      judge(each, "argument " + std::to_string(index + 1) + " of " + call.name()->utf8(),
            params[index]->type(), call.functionDecl()->prolog(),
            body ? _uses.readsOf(body->place, params[index]->varID()) : none);
    }
  }

  static std::string nameOf(const XQueryFunctionDecl& function) {
    const bool isWritten = function.writtenName() != nullptr;
    const auto& name = isWritten ? function.writtenName() : function.name()->localPart();
    return name->utf8();
  }

  void lookAtFunction(const XQueryProgramBody& body) {
    if (!body.expr) return;
    const XQueryFunctionDecl& function = *body.function;
    lookAtType(body, function.type(), function.line());
    for (const auto& param : function.params()) {
      lookAtType(body, param->type(), param->exprLine());
    }
    judge(body.place, "the result of " + nameOf(function), function.type(), *body.prolog,
          _uses.callsOf(&function));
    const XQueryPlaceID end = _checking.at(body.place).end;
    WorkPacer pacer;
    for (XQueryPlaceID place = body.place; place < end; ++place) {
      pacer.turn();
      if (!readsCallersItem(place)) continue;
      _checking.warn(place, ID::ReadsContext, {nameOf(function)}, function.writtenName());
      return;
    }
  }

  bool readsCallersItem(XQueryPlaceID place) const {
    const XQueryPlace& at = _checking.at(place);
    if (at.focus != XQueryNoPlace) return false;
    const Kind kind = at.expr->kind();
    if (kind == Kind::ContextItemExpr || kind == Kind::RootStepExpr) return true;
    if (const auto* path = dyn_cast<XQueryPathExpr>(at.expr)) {
      return path->step() && isa<XQueryAxisStep>(path->step());
    }
    const auto* call = dyn_cast<XQueryFunctionCall>(at.expr);
    if (!call || !call->builtIn()) return false;
    const auto& row = call->builtIn()->row();
    const size_t count = _checking.argumentCount(place);
    return row.takes(count) && row.readsContextItem(count);
  }

  void lookAtVariable(const XQueryProgramBody& body) {
    const XQueryVarDecl& variable = *body.variable;
    if (!body.expr || !variable.writtenName()) return;
    lookAtType(body, variable.type(), variable.line());
    judge(body.place, "variable $" + variable.writtenName()->utf8(), variable.type(), *body.prolog,
          _uses.readsOf(&variable));
  }

  // What a declaration names is part of no expression.
  void lookAtType(const XQueryProgramBody& body, const XQueryTypeDeclaration* type, int64_t line) {
    if (!type || type->type() != XQueryTypeDeclaration::Atomic) return;
    if (typeOf(*body.prolog, *type) != XQueryTypeNone) return;
    _checking.warnAt(*body.prolog, {line}, ID::UnknownType, {XQueryLabelOf(*type)});
  }

  void lookAtExternals() {
    for (const Value& declaration : _checking.main.declarations()) {
      if (const auto* function = dyn_cast<XQueryFunctionDecl>(declaration)) {
        if (!function->isExternal()) continue;
        _checking.warnAt(function->prolog(), {function->line(), function->place()},
                         ID::ExternalFunction, {nameOf(*function)}, function->writtenName());
      } else if (const auto* variable = dyn_cast<XQueryVarDecl>(declaration)) {
        const auto* type = variable->type();
        if (!variable->isExternal() || !type || !variable->writtenName()) continue;
        if (type->type() == XQueryTypeDeclaration::Item) continue;
        _checking.warnAt(variable->prolog(), {variable->line(), variable->place()},
                         ID::ExternalType, {variable->writtenName()->utf8(), XQueryLabelOf(*type)},
                         variable->writtenName());
      }
    }
  }

  XQueryChecking& _checking;
  const XQueryUses& _uses;
};

}  // namespace

void XQueryCheckDeclarations(XQueryChecking& checking, const XQueryUses& uses) {
  Declarations(checking, uses).run();
}

}  // namespace xquery
