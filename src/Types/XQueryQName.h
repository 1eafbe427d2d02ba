// Expanded names as values.
#pragma once

#include "Platform/Tree/Names.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <functional>

namespace xquery {

class XQueryQName : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::QName; }

  // A range in a lexical name; location notFound when there is none.
  struct Range {
    uint32_t location;
    uint32_t length;
  };
  static constexpr uint32_t notFound = NSStringView::notFound;

  // Splits the lexical name and keeps the prefix as a hint for printing. `namespaceURI` is null
  // for no namespace.
  [[nodiscard]] static Ref<XQueryQName> qname(const Ref<NSString>& name,
                                              const Ref<NSString>& forNamespace);
  // Without a hint.
  [[nodiscard]] static Ref<XQueryQName> qnameWithLocalPart(const Ref<NSString>& localPart,
                                                           const Ref<NSString>& forNamespace);

  static void parseQNameString(const Ref<NSString>& name, Ref<NSString>& toPrefix,
                               Ref<NSString>& localPart);
  static void parseQNameString(NSStringView name, Range& prefixRange, Range& localPartRange);

  const Ref<NSString>& namespaceURI() const { return _namespaceURI; }
  const Ref<NSString>& localPart() const { return _localPart; }
  const Ref<NSString>& prefixHint() const { return _prefixHint; }
  // Namespace and local part; the hint plays no part.
  bool isEqual(const XQueryQName& other) const;
  // The local part's hash; names are keys of every table of variables and functions, so it is kept.
  uint32_t hash() const { return _hash; }
  // prefix:local, or the local part without a hint.
  Ref<NSString> XQueryStringValue() const;
  Ref<NSString> description() const;

  // The interned name that nodes of this name carry; made on first use.
  const NSXMLExpandedNameRef& expandedName() const;

 protected:
  XQueryQName(Ref<NSString> namespaceURI, Ref<NSString> localPart, Ref<NSString> prefixHint);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSString> _namespaceURI;
  Ref<NSString> _localPart;
  Ref<NSString> _prefixHint;
  mutable NSXMLExpandedNameRef _expandedName;
  uint32_t _hash;
  mutable bool _isInterned = false;
};

// For tables keyed by QName, which can be asked with a borrowed name.
struct XQueryQNameHash {
  using is_transparent = void;
  size_t operator()(const XQueryQName& name) const { return name.hash(); }
  size_t operator()(const Ref<XQueryQName>& name) const { return name->hash(); }
};
struct XQueryQNameEqual {
  using is_transparent = void;
  bool operator()(const Ref<XQueryQName>& a, const Ref<XQueryQName>& b) const {
    return a->isEqual(*b);
  }
  bool operator()(const XQueryQName& a, const Ref<XQueryQName>& b) const { return a.isEqual(*b); }
  bool operator()(const Ref<XQueryQName>& a, const XQueryQName& b) const { return a->isEqual(b); }
};

}  // namespace xquery
