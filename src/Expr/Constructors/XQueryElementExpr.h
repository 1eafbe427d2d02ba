// Element constructors.
#pragma once

#include "Expr/Constructors/XQueryConstructorName.h"
#include "Expr/XQueryExpr.h"
#include "xquery/XMLNode.h"

#include <vector>

namespace xquery {

class XQueryElementExpr : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ElementExpr; }

  using Exprs = std::vector<Ref<XQueryExpr>>;

  // A direct constructor. Each item of the content is evaluated on its own.
  [[nodiscard]] static Ref<XQueryElementExpr> elementeExprWithName(const Ref<NSString>& name,
                                                                   Exprs attributes, Exprs items);
  // A computed constructor, of a constant name (a string) or an expression. `value` may be null.
  [[nodiscard]] static Ref<XQueryElementExpr> elementExprWithNameExpr(const Value& nameExpr,
                                                                      Ref<XQueryExpr> value);

  const XQueryConstructorName& name() const { return _name; }
  // The element is content of the constructor around it and known to nobody else before it is in
  // there: it is made in the tree of its parent. Set while a query is planned.
  void buildInPlace() { _isInPlace = true; }
  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor& visitor) override;

 protected:
  XQueryElementExpr(XQueryConstructorName name, Exprs attributes, Exprs items)
      : XQueryExpr(Kind::ElementExpr),
        _name(std::move(name)),
        _attributes(std::move(attributes)),
        _items(std::move(items)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  size_t roomBytes() const;

  XQueryConstructorName _name;
  Exprs _attributes;  // attribute and namespace expressions
  Exprs _items;
  bool _isInPlace = false;
  size_t _roomBytes = 0;                    // for the attributes and the text of an element
  std::vector<Ref<NSXMLNode>> _namespaces;  // declared with literal URIs; copied into each element
};

}  // namespace xquery
