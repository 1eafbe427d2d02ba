#include "Prolog/XQueryNamespaceStack.h"

#include "Platform/Base/WorkMeter.h"

namespace xquery {
namespace {

template <class IsWanted>
const NSXMLNode* firstOf(const XQueryNamespaceStack::Entry& entry, IsWanted isWanted) {
  for (const auto& node : entry) {
    if (isWanted(*node)) return node.get();
  }
  return nullptr;
}

}  // namespace

void XQueryNamespaceStack::pop() {
  if (_entries.empty()) return;
  if (_tabulated == _entries.size()) {
    for (const auto& node : _entries.back()) {
      const auto found = _table.find(node->nameView());
      found->second.pop_back();
      if (found->second.empty()) _table.erase(found);
    }
    --_tabulated;
  } else {
    _untabulated -= _entries.back().size();
  }
  _entries.pop_back();
}

void XQueryNamespaceStack::tabulate() const {
  WorkPacer pacer;
  for (; _tabulated < _entries.size(); ++_tabulated) {
    const Entry& entry = _entries[_tabulated];
    for (auto node = entry.rbegin(); node != entry.rend(); ++node) {
      pacer.turn();
      _table[(*node)->nameView()].push_back(node->get());
    }
  }
  _untabulated = 0;
}

const NSXMLNode* XQueryNamespaceStack::forPrefix(NSStringView prefix) const {
  constexpr size_t few = 16;
  if (_untabulated > few) tabulate();
  for (size_t at = _entries.size(); at > _tabulated; --at) {
    const NSXMLNode* found = firstOf(
        _entries[at - 1], [prefix](const NSXMLNode& node) { return node.nameView() == prefix; });
    if (found) return found;
  }
  const auto found = _table.find(prefix);
  return found == _table.end() ? nullptr : found->second.back();
}

const NSXMLNode* XQueryNamespaceStack::forURI(NSStringView URI) const {
  WorkPacer pacer;
  for (auto entry = _entries.rbegin(); entry != _entries.rend(); ++entry) {
    pacer.turn();
    const NSXMLNode* found =
        firstOf(*entry, [URI](const NSXMLNode& node) { return node.textView() == URI; });
    if (found) return found;
  }
  return nullptr;
}

}  // namespace xquery
