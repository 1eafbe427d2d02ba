// Shorthands for building prologs by hand.
#pragma once

#include "Expr/XQueryLeaves.h"
#include "Prolog/XQueryDeclarations.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

using Items = std::vector<Ref<XQueryPrologItem>>;
using Params = std::vector<Ref<XQueryParam>>;

inline Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}

// An expression that does what the test says when it is bound.
class ProbeExpr : public XQueryExpr {
 public:
  explicit ProbeExpr(std::function<void(XQueryProlog&)> onBind)
      : XQueryExpr(Kind::OtherExpr), _onBind(std::move(onBind)) {}
  void bindInfoForProlog(XQueryProlog& prolog) override { _onBind(prolog); }
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext&) const override { return NSNull::null(); }

 private:
  std::function<void(XQueryProlog&)> _onBind;
};

inline Ref<XQueryExpr> probe(std::function<void(XQueryProlog&)> onBind) {
  return make<ProbeExpr>(std::move(onBind));
}
inline Ref<XQueryExpr> nothing() {
  return XQueryLiteral::literalWithValue(NSNull::null());
}

inline Ref<XQueryProlog> prologOf(const Items& items) {
  return XQueryProlog::prologWithItems(items, nullptr, nullptr, nullptr);
}
inline Ref<XQueryProlog> prologOf(const Items& items, const Ref<XQueryModules>& modules) {
  return XQueryProlog::prologWithItems(items, nullptr, modules, nullptr);
}

// A registry that no main module made: emptied by hand.
class OwnRegistry {
 public:
  OwnRegistry() = default;
  OwnRegistry(const OwnRegistry&) = delete;
  OwnRegistry& operator=(const OwnRegistry&) = delete;
  ~OwnRegistry() { _modules->removePrologs(); }
  operator const Ref<XQueryModules>&() const { return _modules; }
  XQueryModules* operator->() const { return _modules.get(); }
  XQueryModules* get() const { return _modules.get(); }

 private:
  Ref<XQueryModules> _modules = XQueryModules::modules();
};

inline Ref<XQueryPrologItem> moduleNamespace(std::string_view prefix, std::string_view URI) {
  return XQueryPrologItemModuleNamespace::moduleNamespace(text(URI), text(prefix), 0);
}
inline Ref<XQueryPrologItem> declareNamespace(std::string_view prefix, std::string_view URI,
                                              int64_t line = 0) {
  return XQueryPrologItemDeclareNamespace::declareNamespace(text(URI), text(prefix), line);
}
inline Ref<XQueryPrologItem> variable(std::string_view name, Ref<XQueryExpr> expr = nothing()) {
  const bool isExternal = !expr;
  return XQueryPrologItemVariableDeclaration::variable(text(name), nullptr, std::move(expr),
                                                       isExternal, 0);
}
inline Params params(std::initializer_list<std::string_view> names) {
  Params result;
  for (const auto name : names) result.push_back(XQueryParam::paramWithName(text(name), nullptr));
  return result;
}
inline Ref<XQueryPrologItem> function(std::string_view name, Params withParams = {},
                                      Ref<XQueryExpr> expr = nothing()) {
  const bool isExternal = !expr;
  return XQueryPrologItemFunctionDeclaration::function(text(name), std::move(withParams), nullptr,
                                                       std::move(expr), isExternal, 0);
}

inline Ref<XQueryQName> qName(std::string_view local, std::string_view URI = {}) {
  return XQueryQName::qname(text(local), URI.empty() ? nullptr : text(URI));
}

// The errors as "number: message", followed by the line where there is one.
inline std::vector<std::string> errorsOf(const XQueryProlog& prolog) {
  std::vector<std::string> result;
  for (const auto& error : prolog.errors()) {
    std::string line = error->line() == 0 ? "" : " at " + std::to_string(error->line());
    result.push_back(std::to_string(error->err()) + ": " + error->msg()->utf8() + line);
  }
  return result;
}

// A string's text, the elements of an array joined with ",", "(none)" for null.
inline std::string shown(const Value& value) {
  if (!value) return "(none)";
  if (auto* array = dyn_cast<NSArray>(value)) {
    std::string result;
    for (const auto& element : array->objects()) {
      result += (result.empty() ? "" : ",") + shown(element);
    }
    return "[" + result + "]";
  }
  return cast<NSString>(value)->utf8();
}
inline std::string shown(const Ref<NSString>& string) {
  return shown(Value(string));
}

}  // namespace xquery
