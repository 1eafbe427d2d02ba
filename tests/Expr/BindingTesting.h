// Shorthands for building expressions that bind variables by hand and for watching what they do.
#pragma once

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/OperatorTestSupport.h"
#include "Expr/ProbeExpr.h"
#include "Expr/TypeTests/XQueryTypeDeclaration.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <functional>
#include <initializer_list>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery::bindingtest {

using namespace operatortest;  // NOLINT: a test support header over another one

inline Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}

inline Ref<XQueryExpr> onBind(ProbeExpr::Bind bind) {
  return probe([](XQueryContext&) -> Value { return NSNull::null(); }, std::move(bind));
}
inline Ref<XQueryExpr> variable(std::string_view name) {
  return XQueryVariable::variableWithName(text(name));
}
inline Ref<XQueryExpr> commas(std::initializer_list<Ref<XQueryExpr>> parts) {
  auto list = XQueryExprList::exprList();
  for (const auto& part : parts) list->addObject(part);
  return list;
}
inline Ref<XQueryExpr> operation(int code, const Ref<XQueryExpr>& left, Ref<XQueryExpr> right) {
  auto expr = XQueryOperatorExpr::operatorExpr(code, std::move(right));
  expr->setLeftExpr(left);
  return expr;
}
template <class T>
Ref<T> atLine(Ref<T> expr, int64_t line) {
  expr->setExprLine(line);
  return expr;
}

// A type of the schema namespace, as "integer".
inline Ref<XQueryTypeDeclaration> atomicType(std::string_view name, int32_t occurrence = 0) {
  auto type = XQueryTypeDeclaration::atomic(text("xs:" + std::string(name)));
  type->setOccuranceType(occurrence);
  return type;
}
inline Ref<XQueryTypeDeclaration> anyItems() {
  auto type = XQueryTypeDeclaration::item();
  type->setOccuranceType(XQueryTypeDeclaration::ZeroOrMore);
  return type;
}

inline Value error(int64_t number, std::string_view message) {
  return XQueryError::error(number, text(message));
}

inline Value integers(std::initializer_list<int64_t> values) {
  std::vector<Value> items;
  for (const int64_t value : values) items.push_back(integer(value));
  return sequence(std::move(items));
}

inline Ref<XQueryBindingExpr> forClause(std::string_view name, Ref<XQueryExpr> expr,
                                        Ref<XQueryTypeDeclaration> type = {},
                                        std::string_view position = {}) {
  return XQueryForExpr::exprWithName(text(name), std::move(type), text(position), std::move(expr));
}
inline Ref<XQueryBindingExpr> letClause(std::string_view name, Ref<XQueryExpr> expr,
                                        Ref<XQueryTypeDeclaration> type = {}) {
  return XQueryLetExpr::exprWithName(text(name), std::move(type), std::move(expr));
}
inline Ref<XQueryFLWORExpr> flwor(XQueryFLWORExpr::Clauses clauses, Ref<XQueryExpr> returns,
                                  Ref<XQueryExpr> where = {},
                                  XQueryFLWORExpr::OrderSpecs specs = {}) {
  return XQueryFLWORExpr::exprWithForLet(std::move(clauses), std::move(where), std::move(specs),
                                         std::move(returns));
}

class BindingTesting : public testing::Test {
 protected:
  XQueryContextInternal& dynamic() { return _internal(*context); }

  Ref<XQueryQName> qName(std::string_view name) const {
    return prolog->variableQNameFromString(text(name));
  }
  int64_t idOf(std::string_view name) const { return prolog->localVariableIDForQName(qName(name)); }

  // An expression that writes down its name when it is bound.
  Ref<XQueryExpr> logged(const std::string& name) {
    return onBind([this, name](XQueryProlog&) { log.push_back(name); });
  }
  // One that writes down its name and the IDs that variables have then.
  Ref<XQueryExpr> loggedWith(const std::string& name, const std::vector<std::string>& variables) {
    return onBind([this, name, variables](XQueryProlog&) {
      std::string line = name;
      for (const auto& each : variables) line += " " + each + "=" + std::to_string(idOf(each));
      log.push_back(line);
    });
  }
  // One that writes down its name when it is evaluated.
  Ref<XQueryExpr> traced(const std::string& name, Value value) {
    return probe([this, name, value](XQueryContext&) {
      log.push_back(name);
      return value;
    });
  }
  // A call that writes down the value of a variable.
  Ref<XQueryExpr> tracedVariable(const std::string& name) {
    const auto reference = variable(name);
    return probe(
        [this, reference](XQueryContext& with) {
          Value value = reference->evaluateWithContext(with);
          log.push_back(show(value));
          return value;
        },
        [reference](XQueryProlog& with) { reference->bindInfoForProlog(with); });
  }

  // What evaluation answers, or "error 6 message" with " line 3" from the second line on.
  std::string evaluated(const XQueryExpr& expr) {
    try {
      return show(evaluatedOrThrown(expr, *context));
    } catch (const NSException& exception) {
      EXPECT_EQ(exception.name(), "XQueryError");
      const auto& raised = dynamic().error();
      std::string line = raised->line() > 1 ? " line " + std::to_string(raised->line()) : "";
      return "error " + std::to_string(raised->err()) + " " + raised->msg()->utf8() + line;
    }
  }
  // Binds in a main module and evaluates.
  std::string outcomeOf(const Ref<XQueryExpr>& expr) {
    expr->bindInfoForProlog(*prolog);
    EXPECT_TRUE(prolog->errors().empty());
    return evaluated(*expr);
  }
  std::string outcomeOf(Value value, std::function<Ref<XQueryExpr>(Ref<XQueryExpr>)> wrap) {
    return outcomeOf(wrap(always(std::move(value))));
  }

  using Log = std::vector<std::string>;
  Log log;
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryProlog> prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
};

}  // namespace xquery::bindingtest
