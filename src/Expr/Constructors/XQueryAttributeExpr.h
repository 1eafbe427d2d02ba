// Attribute constructors.
#pragma once

#include "Expr/Constructors/XQueryConstructorName.h"
#include "Expr/XQueryExpr.h"
#include "xquery/XMLNode.h"

#include <vector>

namespace xquery {

class XQueryElementContent;

// An attribute of a direct constructor.
class XQueryAttributeExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::AttributeExpr; }

  // The parts of the value are literals and enclosed expressions; `quoteChar` is the delimiter in
  // the query, 34 or 39.
  [[nodiscard]] static Ref<XQueryAttributeExpr> attributeExprWithName(
      const Ref<NSString>& name, std::vector<Ref<XQueryExpr>> forItems, char16_t enclosedWith);

  const XQueryConstructorName& name() const { return _name; }
  char16_t quoteChar() const { return _quoteChar; }
  // Evaluates straight into an element that has no content yet. False for an error.
  bool addTo(XQueryElementContent& content, XQueryContext& context) const;
  // A guess at the length of the value: the literal parts, and a few digits for the rest.
  size_t expectedTextLength() const;
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryAttributeExpr(const Ref<NSString>& name, std::vector<Ref<XQueryExpr>> items,
                      char16_t quoteChar)
      : XQueryExpr(Kind::AttributeExpr),
        _name(name),
        _items(std::move(items)),
        _quoteChar(quoteChar) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  bool appendValueText(NSMutableString& text, XQueryContext& context) const;

  XQueryConstructorName _name;
  std::vector<Ref<XQueryExpr>> _items;
  char16_t _quoteChar;
};

// attribute {...} {...}
class XQueryComputedAttributeExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ComputedAttributeExpr;
  }

  // `value` may be null.
  [[nodiscard]] static Ref<XQueryComputedAttributeExpr> computedAttributeExprWithName(
      Ref<XQueryExpr> name, Ref<XQueryExpr> value);

  // As XQueryElementExpr::buildInPlace.
  void buildInPlace() { _isInPlace = true; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryComputedAttributeExpr(Ref<XQueryExpr> name, Ref<XQueryExpr> value)
      : XQueryExpr(Kind::ComputedAttributeExpr), _name(std::move(name)), _value(std::move(value)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  XQueryConstructorName _name;
  Ref<XQueryExpr> _value;
  bool _isInPlace = false;
};

}  // namespace xquery
