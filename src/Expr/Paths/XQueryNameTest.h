// Name tests of path steps and kind tests.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Platform/Tree/Names.h"
#include "Types/XQueryQName.h"
#include "xquery/XMLNode.h"

namespace xquery {

class XQueryNameTest : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::NameTest; }

  [[nodiscard]] static Ref<XQueryNameTest> nameTest(Ref<NSString> name);

  const Ref<NSString>& name() const { return _name; }
  bool attribute() const { return _attribute; }
  void setAttribute(bool attribute) { _attribute = attribute; }
  // The bound name, or the deferred reference evaluated in the context (raises error 1); null when
  // there is neither. Without a context only a name without a prefix can be resolved: to no
  // namespace.
  Ref<XQueryQName> qNameForContext(XQueryContext* context) const;
  // For element and attribute nodes.
  bool isValidNode(const NSXMLNode& node, XQueryContext* context) const;

  // The interned name when binding resolved it, else null: a node matches exactly when its expanded
  // name is this pointer.
  const NSXMLExpandedName* boundName() const {
    return isDeferred() ? nullptr : _expandedName.get();
  }
  // Whether the name waits for the namespaces of the context it is evaluated in.
  bool isDeferred() const { return _qName && _qName->kind() == Kind::QNameReference; }
  // The interned name that a deferred name without a prefix has in a context without a default
  // namespace; null for any other name.
  const NSXMLExpandedName* nameWithoutNamespace() const {
    return isDeferred() ? _expandedName.get() : nullptr;
  }
  // Whether resolving the name can raise an error.
  bool mayRaise() const { return isDeferred() && !_expandedName; }

  // The name as nodes carry it; null for a name that no node can have.
  [[nodiscard]] static NSXMLExpandedNameRef interned(const XQueryQName& name);

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}

 protected:
  explicit XQueryNameTest(Ref<NSString> name)
      : XQueryExpr(Kind::NameTest), _name(std::move(name)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<XQueryQName> resolved(XQueryProlog& prolog) const;

  Ref<NSString> _name;
  Value _qName;  // XQueryQName, or XQueryQNameReference when resolution had to wait
  NSXMLExpandedNameRef _expandedName;
  bool _attribute = false;
};

class XQueryWildCardNameTest : public XQueryExpr {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::WildCardNameTest; }

  // A null prefix means any namespace, a null local name any local name.
  [[nodiscard]] static Ref<XQueryWildCardNameTest> nameTest(Ref<NSString> prefix,
                                                            Ref<NSString> localName);

  const Ref<NSString>& prefix() const { return _prefix; }
  const Ref<NSString>& localName() const { return _localName; }
  Ref<NSString> uriForContext(XQueryContext* context) const;
  bool isValidNode(const NSXMLNode& node, XQueryContext* context) const;
  // Whether resolving the prefix can raise an error.
  bool mayRaise() const { return static_cast<bool>(_qNameReference); }

  void bindInfoForProlog(XQueryProlog& prolog) override;
  Value computeValue(XQueryContext& context) const override;
  void visitParts(XQueryPartVisitor&) override {}

 protected:
  XQueryWildCardNameTest(Ref<NSString> prefix, Ref<NSString> localName)
      : XQueryExpr(Kind::WildCardNameTest),
        _prefix(std::move(prefix)),
        _localName(std::move(localName)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _prefix;
  Ref<NSString> _localName;
  Ref<NSString> _uri;
  Ref<XQueryQNameReference> _qNameReference;
};

}  // namespace xquery
