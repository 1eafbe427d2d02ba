// Functions, variables, prefixes and types that do not exist. All of them are found out only when
// they are reached.
#include "Check/Checking.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Constructors/XQueryAttributeExpr.h"
#include "Expr/Constructors/XQueryElementExpr.h"
#include "Expr/Constructors/XQueryNodeExprs.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryProlog.h"

#include <algorithm>
#include <array>

namespace xquery {
namespace {

using ID = XQueryWarningID;

// --- functions -----------------------------------------------------------------------------------

constexpr std::string_view finalFunctions = "http://www.w3.org/2005/xpath-functions";

struct AbsentFunction {
  std::string_view name;  // the local one
  bool isType;            // of the namespace of types
  std::string_view instead;
};

constexpr auto absentFunctions = std::to_array<AbsentFunction>({
    {"codepoint-equal", false, "compare($a, $b) = 0"},
    {"doc-available", false, "exists(doc($uri))"},
    {"encode-for-uri", false, "escape-uri($text, true())"},
    {"iri-to-uri", false, "escape-uri($text, false())"},
    {"escape-html-uri", false, "escape-uri($text, false())"},
    {"prefix-from-QName", false, "substring-before(string($name), ':')"},
    {"untypedAtomic", true, "xdt:untypedAtomic"},
    {"dayTimeDuration", true, "xdt:dayTimeDuration"},
    {"yearMonthDuration", true, "xdt:yearMonthDuration"},
});

bool isNamed(const XQueryQName& name, std::string_view local) {
  return name.localPart() && name.localPart()->view() == local;
}

bool isIn(const XQueryQName& name, XQueryNamespaceID space) {
  const auto URI = XQueryModules::builtinNamespaceForID(space);
  return name.namespaceURI() && name.namespaceURI()->isEqualToString(*URI);
}

bool warnOfAbsent(XQueryChecking& checking, XQueryPlaceID place, const XQueryFunctionCall& call,
                  const XQueryQName& name) {
  for (const AbsentFunction& row : absentFunctions) {
    const auto space = row.isType ? XQueryNamespaceXS : XQueryNamespaceFN;
    if (!isNamed(name, row.name) || !isIn(name, space)) continue;
    checking.warn(place, ID::AbsentFunction, {call.name()->utf8(), std::string(row.instead)},
                  call.name());
    return true;
  }
  return false;
}

// "1", "2 or 3", "2 or more": how many arguments the declared functions of a name take; empty where
// there is none of that name.
std::string declaredCounts(XQueryChecking& checking, const XQueryProlog& prolog,
                           const XQueryQName& name) {
  std::vector<size_t> counts;
  for (const auto* function : checking.functionsNamed(prolog, name.localPart()->utf8())) {
    if (function->name()->isEqual(name)) counts.push_back(function->params().size());
  }
  std::sort(counts.begin(), counts.end());
  std::string text;
  for (const size_t count : counts) text += (text.empty() ? "" : " or ") + std::to_string(count);
  return text.empty() ? text : text + (text == "1" ? " argument" : " arguments");
}

std::string countsOf(const XQueryBuiltInFunction::Arguments& arguments) {
  const std::string least = std::to_string(arguments.least);
  if (arguments.most == XQueryBuiltInFunction::many) return least + " or more arguments";
  if (arguments.most == 1 && arguments.least == 1) return "1 argument";
  const std::string most = std::to_string(arguments.most);
  return (arguments.most == arguments.least ? least : least + " to " + most) + " arguments";
}

}  // namespace

void XQueryCheckCallName(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& call = *checking.as<XQueryFunctionCall>(place);
  const size_t count = checking.argumentCount(place);
  const std::string name = call.name()->utf8();
  if (const auto* builtIn = call.builtIn()) {
    if (builtIn->row().takes(count)) return;
    checking.warn(place, ID::ArgumentCount,
                  {name, countsOf(builtIn->row().arguments), std::to_string(count)}, call.name());
    return;
  }
  if (call.functionDecl()) return;
  const XQueryProlog& prolog = *checking.program.bodyOf(place).prolog;
  if (const auto qName = prolog.functionQNameFromString(call.name())) {
    if (warnOfAbsent(checking, place, call, *qName)) return;
    if (qName->namespaceURI() && qName->namespaceURI()->view() == finalFunctions) {
      checking.warn(place, ID::FunctionsNamespace, {name}, call.name());
      return;
    }
    const std::string counts = declaredCounts(checking, prolog, *qName);
    if (!counts.empty()) {
      checking.warn(place, ID::ArgumentCount, {name, counts, std::to_string(count)}, call.name());
      return;
    }
  }
  checking.warn(place, ID::UnknownFunction,
                {name, std::to_string(count) + (count == 1 ? " argument" : " arguments")},
                call.name());
}

// --- variables -----------------------------------------------------------------------------------

namespace {

// Of a quantifier or a typeswitch, whose variables stay known behind it.
bool isLeaked(const XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryPlaceID binder = checking.at(place).binder;
  if (binder == XQueryNoPlace) return false;
  const Kind kind = checking.at(binder).expr->kind();
  if (kind == Kind::CaseClause) return place >= checking.at(binder).end;
  return kind == Kind::QuantifiedItem && place >= checking.at(checking.at(binder).parent).end;
}

// Whether the declaration stands behind the one whose value reads it, or is that one. The bodies of
// a module are in the order of its declarations; external variables have their values before.
bool isDeclaredLater(const XQueryChecking& checking, const XQueryProgramBody& reader,
                     const XQueryVarDecl& read) {
  if (!reader.variable || &read.prolog() != reader.prolog) return false;
  const XQueryProgramBody* const body = checking.bodyOf(&read);
  return body && body >= &reader;
}

// Prefixes that a constructor around it declares are not known any more.
bool mayHaveOtherPrefixes(const XQueryChecking& checking, XQueryPlaceID place) {
  for (int level = 0; place != XQueryNoPlace; place = checking.at(place).parent) {
    if (++level > XQueryChecking::mostLevels || checking.as<XQueryElementExpr>(place)) return true;
  }
  return false;
}

}  // namespace

void XQueryCheckVariable(XQueryChecking& checking, XQueryPlaceID place) {
  const auto& variable = *checking.as<XQueryVariable>(place);
  const std::string name = variable.name()->utf8();
  if (variable.varID() != 0) {
    if (isLeaked(checking, place)) {
      checking.warn(place, ID::LeakedVariable, {name}, variable.name());
    }
    return;
  }
  const XQueryProgramBody& body = checking.program.bodyOf(place);
  const auto qName = body.prolog->variableQNameFromString(variable.name());
  const bool hasPrefix = name.find(':') != name.npos;
  if (!qName && hasPrefix && mayHaveOtherPrefixes(checking, place)) return;
  const auto* declaration = qName ? body.prolog->variableInfoForQName(qName) : nullptr;
  if (!declaration) {
    checking.warn(place, ID::UnknownVariable, {name}, variable.name());
  } else if (isDeclaredLater(checking, body, *declaration)) {
    checking.warn(place, ID::LaterVariable, {name}, variable.name());
  }
}

// --- prefixes ------------------------------------------------------------------------------------

namespace {

void warnOfPrefix(XQueryChecking& checking, XQueryPlaceID place, const Ref<NSString>& name) {
  const NSStringView text = name ? name->view() : NSStringView();
  const auto colon = text.find(u':');
  if (colon == NSStringView::notFound || colon == 0) return;
  const auto prefix = NSString::stringWithView(text.substring(0, colon));
  checking.warn(place, ID::UndeclaredPrefix, {prefix->utf8()}, prefix);
}

// The namespace that a constructor gives to names without a prefix; null where it says nothing of
// them. Of attributes there are few.
Ref<NSString> defaultNamespaceOf(const XQueryChecking& checking, XQueryPlaceID element) {
  int parts = 0;
  for (XQueryPlaceID part = checking.program.firstPart(element);
       part != XQueryNoPlace && ++parts <= XQueryChecking::mostLevels;
       part = checking.program.nextPart(part)) {
    const auto* declaration = checking.as<XQueryNamespaceExpr>(part);
    const Ref<NSXMLNode> node = declaration ? declaration->constantNode() : nullptr;
    if (node && node->name()->length() == 0) return node->stringValue();
  }
  return nullptr;
}

// Constructors do not change what name tests find, whatever namespace they declare.
void checkConstructorNamespace(XQueryChecking& checking, XQueryPlaceID place,
                               const XQueryNameTest& test) {
  const bool hasPrefix = test.name()->view().find(u':') != NSStringView::notFound;
  if (test.attribute() || hasPrefix) return;
  XQueryPlaceID around = checking.at(place).parent;
  Ref<NSString> URI;
  for (int level = 0; around != XQueryNoPlace && level < XQueryChecking::mostLevels; ++level) {
    if (checking.as<XQueryElementExpr>(around)) URI = defaultNamespaceOf(checking, around);
    if (URI) break;
    around = checking.at(around).parent;
  }
  if (!URI) return;
  const auto& declared = checking.program.bodyOf(place).prolog->defaultElementNamespace();
  const bool isSame = declared ? declared->isEqualToString(*URI) : URI->length() == 0;
  if (isSame || !checking.isFirstIn(around)) return;
  checking.warn(place, ID::ConstructorNamespace, {test.name()->utf8()});
}

}  // namespace

void XQueryCheckNameTest(XQueryChecking& checking, XQueryPlaceID place) {
  if (const auto* test = checking.as<XQueryNameTest>(place)) {
    if (test->isDeferred()) warnOfPrefix(checking, place, test->name());
    checkConstructorNamespace(checking, place, *test);
  } else if (const auto* any = checking.as<XQueryWildCardNameTest>(place); any->mayRaise()) {
    checking.warn(place, ID::UndeclaredPrefix, {any->prefix()->utf8()}, any->prefix());
  }
}

// A name that could not be resolved stands in its constructor as an expression.
void XQueryCheckConstructorName(XQueryChecking& checking, XQueryPlaceID place) {
  const bool isName = checking.at(place).role == XQueryRole::Name;
  if (!isName || !checking.waitsForCaller(checking.at(place).expr)) return;
  const XQueryPlaceID whole = checking.at(place).parent;
  if (const auto* element = checking.as<XQueryElementExpr>(whole)) {
    warnOfPrefix(checking, whole, element->name().constantName());
  } else if (const auto* attribute = checking.as<XQueryAttributeExpr>(whole)) {
    warnOfPrefix(checking, whole, attribute->name().constantName());
  }
}

// The name is cast to a QName when the constructor is evaluated.
void XQueryCheckComputedName(XQueryChecking& checking, XQueryPlaceID place) {
  const XQueryPlaceID name = checking.program.part(place, XQueryRole::Name);
  const NSString* const text = name == XQueryNoPlace ? nullptr : checking.textIn(name);
  if (!text || !checking.hasUnknownPrefix(*text, place)) return;
  checking.warn(place, ID::CastFails, {checking.labelOf(name), "xs:QName"});
}

}  // namespace xquery
