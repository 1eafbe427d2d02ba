// Shorthands for tests of constructors: queries run on one context, and constructors put together
// by hand.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/Evaluated.h"
#include "Expr/XQueryLeaves.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "xquery/Collection.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"
#include "xquery/XQuery.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class Constructors : public testing::Test {
 protected:
  using Exprs = std::vector<Ref<XQueryExpr>>;

  // An expression that gives the same value every time.
  class Constant : public XQueryExpr {
   public:
    explicit Constant(Value value) : XQueryExpr(Kind::OtherExpr), _value(std::move(value)) {}
    void bindInfoForProlog(XQueryProlog&) override {}
    void visitParts(XQueryPartVisitor&) override {}
    Value computeValue(XQueryContext&) const override { return _value; }

   private:
    Value _value;
  };

  Constructors() { _internal(*context).setActiveProlog(prolog.get()); }
  ~Constructors() override { _internal(*context).setActiveProlog(nullptr); }

  static Ref<NSString> text(std::string_view utf8) { return NSString::stringWithUTF8(utf8); }
  static NSStringView view(std::string_view ascii) { return NSStringView::ascii(ascii); }
  static Ref<XQueryExpr> constant(Value value) { return make<Constant>(std::move(value)); }
  static Ref<XQueryExpr> string(std::string_view utf8) {
    return XQueryLiteral::stringLiteralWithString(text(utf8));
  }
  static Ref<XQueryExpr> integer(std::string_view digits) {
    return XQueryLiteral::integerLiteralWithString(text(digits));
  }
  static Ref<NSXMLElement> element(std::string_view name) {
    return NSXMLElement::elementWithName(view(name));
  }
  static Value sequence(std::vector<Value> items) {
    return NSArray::arrayWithObjects(std::move(items));
  }

  // Binds and evaluates in the fixture's prolog and context.
  Value evaluated(XQueryExpr& expr) {
    expr.bindInfoForProlog(*prolog);
    return evaluatedOrThrown(expr, *context);
  }
  std::string xmlOf(XQueryExpr& expr) {
    const Value value = evaluated(expr);
    const auto* node = dyn_cast<NSXMLNode>(value);
    return node ? node->XMLString()->utf8() : "(no node)";
  }
  // "number line message" of the error that evaluation raises.
  std::string errorOf(XQueryExpr& expr) {
    try {
      evaluated(expr);
    } catch (const NSException&) {
      const auto& error = _internal(*context).error();
      return std::to_string(error->err()) + " " + std::to_string(error->line()) + " " +
             error->msg()->utf8();
    }
    return "(no error)";
  }
  // The items of a whole query, evaluated on the fixture's context.
  std::vector<Value> items(std::string_view query) {
    const auto compiled = XQuery::xqueryWithSource(query);
    Ref<XQueryError> error;
    const auto result = context->evaluateXQuery(*compiled, {}, nullptr, &error);
    EXPECT_FALSE(error) << query << "\n" << (error ? error->description()->utf8() : "");
    return result ? result->objects() : std::vector<Value>();
  }

  Ref<XQueryProlog> prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

}  // namespace xquery
