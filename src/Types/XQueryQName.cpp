#include "Types/XQueryQName.h"

#include "Platform/Tree/Names.h"

#include <mutex>

namespace xquery {

namespace {

bool sameText(const Ref<NSString>& a, const Ref<NSString>& b) {
  if (a == b) return true;
  return a && b && a->isEqualToString(*b);
}

Ref<NSString> textOrNull(const Ref<NSString>& text) {
  return text ? text : NSString::stringWithASCII("(null)");
}

}  // namespace

XQueryQName::XQueryQName(Ref<NSString> namespaceURI, Ref<NSString> localPart,
                         Ref<NSString> prefixHint)
    : NSCounted(Kind::QName),
      _namespaceURI(std::move(namespaceURI)),
      _localPart(std::move(localPart)),
      _prefixHint(std::move(prefixHint)),
      _hash(_localPart->hash()) {}

Ref<XQueryQName> XQueryQName::qname(const Ref<NSString>& name, const Ref<NSString>& forNamespace) {
  Ref<NSString> prefix;
  Ref<NSString> localPart;
  parseQNameString(name, prefix, localPart);
  return make<XQueryQName>(forNamespace, std::move(localPart), std::move(prefix));
}

Ref<XQueryQName> XQueryQName::qnameWithLocalPart(const Ref<NSString>& localPart,
                                                 const Ref<NSString>& forNamespace) {
  return make<XQueryQName>(forNamespace, localPart, Ref<NSString>());
}

void XQueryQName::parseQNameString(const Ref<NSString>& name, Ref<NSString>& toPrefix,
                                   Ref<NSString>& localPart) {
  const NSStringView text = name->view();
  const uint32_t colon = text.find(u':');
  if (colon == notFound || colon == 0) {
    toPrefix = NSString::empty();
    localPart = name;
    return;
  }
  toPrefix = NSString::stringWithView(text.substring(0, colon));
  localPart = NSString::stringWithView(text.substring(colon + 1));
}

void XQueryQName::parseQNameString(NSStringView name, Range& prefixRange, Range& localPartRange) {
  const uint32_t colon = name.find(u':');
  if (colon == notFound) {
    prefixRange = {0, 0};
    localPartRange = {0, name.length()};
  } else if (name.length() >= 3) {
    prefixRange = {0, colon};
    localPartRange = {colon + 1, name.length() - colon - 1};
  } else {
    prefixRange = localPartRange = {notFound, 0};
  }
}

bool XQueryQName::isEqual(const XQueryQName& other) const {
  return this == &other || (_hash == other._hash && sameText(_localPart, other._localPart) &&
                            sameText(_namespaceURI, other._namespaceURI));
}

Ref<NSString> XQueryQName::XQueryStringValue() const {
  if (!_prefixHint || _prefixHint->length() == 0) return _localPart;
  NSMutableString text;
  text.append(_prefixHint->view());
  text.append(u':');
  text.append(_localPart->view());
  return text.string();
}

Ref<NSString> XQueryQName::description() const {
  NSMutableString text;
  text.appendASCII("<XQueryQName namespace:");
  text.append(textOrNull(_namespaceURI)->view());
  text.appendASCII(" prefix:");
  text.append(textOrNull(_prefixHint)->view());
  text.appendASCII(" localpart:");
  text.append(textOrNull(_localPart)->view());
  text.append(u'>');
  return text.string();
}

// Interning takes the name table's lock, which a QName that is only ever a value need not pay for.
// A compiled query's names are shared by threads, so the first use is guarded.
const NSXMLExpandedNameRef& XQueryQName::expandedName() const {
  static std::mutex lock;
  if (!__atomic_load_n(&_isInterned, __ATOMIC_ACQUIRE)) {
    const std::lock_guard guard(lock);
    if (!_isInterned) {
      _expandedName = NSXMLExpandedNameRef(_namespaceURI ? _namespaceURI->view() : NSStringView(),
                                           _localPart->view());
      __atomic_store_n(&_isInterned, true, __ATOMIC_RELEASE);
    }
  }
  return _expandedName;
}

}  // namespace xquery
