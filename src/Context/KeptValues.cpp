#include "Context/KeptValues.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "xquery/Collection.h"

#include <algorithm>

namespace xquery {
namespace {

// Asks for each tree once as long as its nodes come in a row: a list may hold very many that lie
// very deep.
class SettledNodes {
 public:
  explicit SettledNodes(bool around) : _around(around) {}

  bool holds(const NSObject* item) {
    // A list within a list comes from the host and may hold anything.
    if (_around && isa<NSArray>(item)) return false;
    const auto* node = dyn_cast<NSXMLNode>(item);
    if (!node || isInLastTree(node)) return true;
    const NSXMLNode* root = node->rootNode();
    _lastTree = NSXMLTree::of(node);
    return !NSXMLTree::isUnfinished(root) && (!_around || root->kind() == Kind::Document);
  }

 private:
  bool isInLastTree(const NSXMLNode* node) const {
    return _lastTree == NSXMLTree::of(node) && !_lastTree->hasSeveralRoots();
  }

  const bool _around;
  const NSXMLTree* _lastTree = nullptr;
};

}  // namespace

bool XQueryAreSettled(std::span<const Value> values, bool around) {
  SettledNodes settled(around);
  WorkPacer pacer;
  const auto isSettled = [&](const Value& item) {
    pacer.turn();
    return settled.holds(item.get());
  };
  return std::all_of(values.begin(), values.end(), [&](const Value& value) {
    const auto* items = dyn_cast<NSArray>(value);
    return items ? std::all_of(items->objects().begin(), items->objects().end(), isSettled)
                 : isSettled(value);
  });
}

// After a few first uses in a row all but two, one after the other, of every so many uses.
bool XQueryKeptValues::looksAway(const XQueryExpr& expr) {
  constexpr uint32_t patience = 16;
  constexpr uint32_t period = 32;
  const auto found = _entries.find(&expr);
  if (found == _entries.end() || found->second.firsts < patience) return false;
  uint32_t& firsts = found->second.firsts;
  ++firsts;
  if (firsts < patience + period) return true;
  firsts = patience - 2;
  return false;
}

bool XQueryKeptValues::Entry::isFor(std::span<const Value> others) const {
  return std::equal(dependencies.begin(), dependencies.end(), others.begin(), others.end());
}

uint64_t XQueryKeptValues::stamp() const {
  return _globalChanges + NSXMLTree::finishedChangeCount();
}

XQueryKeptValues::Entry* XQueryKeptValues::find(Entries& entries,
                                                std::span<const Value> dependencies) {
  std::vector<Entry>& all = entries.entries;
  const auto isFor = [dependencies](const Entry& entry) { return entry.isFor(dependencies); };
  const auto found = std::find_if(all.begin(), all.end(), isFor);
  if (found == all.end()) return nullptr;
  std::rotate(all.begin(), found, found + 1);
  return &all.front();
}

XQueryKeptValues::Use XQueryKeptValues::use(const XQueryExpr& expr,
                                            std::span<const Value> dependencies, bool looksAround,
                                            std::shared_ptr<XQueryKeptValue>& kept) {
  Entries& entries = _entries[&expr];
  Entry* entry = find(entries, dependencies);
  if (!entry || entry->stamp != stamp()) {
    if (!entry) {
      std::vector<Entry>& all = entries.entries;
      if (all.size() == mostEntries) all.pop_back();
      entry = &*all.insert(all.begin(), Entry());
      entry->dependencies.assign(dependencies.begin(), dependencies.end());
    }
    entry->stamp = stamp();
    entry->isDecided = false;
    entry->value = nullptr;
    ++entries.firsts;
    return Use::First;
  }
  entries.firsts = 0;
  if (!entry->isDecided && !XQueryAreSettled(dependencies, looksAround)) entry->isDecided = true;
  kept = entry->value;
  return entry->isDecided ? Use::Further : Use::Second;
}

XQueryKeptValues::Use XQueryKeptValues::useAtOnce(const XQueryExpr& expr,
                                                  std::span<const Value> dependencies,
                                                  bool looksAround,
                                                  std::shared_ptr<XQueryKeptValue>& kept) {
  const Use found = use(expr, dependencies, looksAround, kept);
  if (found != Use::First) return found;
  Entry& entry = _entries[&expr].entries.front();
  entry.isDecided = !XQueryAreSettled(dependencies, looksAround);
  kept = nullptr;
  return entry.isDecided ? Use::Further : Use::Second;
}

void XQueryKeptValues::keep(const XQueryExpr& expr, std::span<const Value> dependencies,
                            std::shared_ptr<XQueryKeptValue> value) {
  Entry* entry = find(_entries[&expr], dependencies);
  if (!entry) return;
  entry->isDecided = true;
  entry->value = std::move(value);
}

}  // namespace xquery
