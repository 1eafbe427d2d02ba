// Base URIs on record for nodes of a tree. They have nothing to do with "xml:base": who makes a
// node may note the base URI that held where it was made, for as long as the node is there.
//
// The records of a tree are nearly always alike, since what one query constructs has one base URI:
// then the node's own flag says that there is a record, and any record says what is in it. Only
// where they differ, in a tree of several makers or modules, is the node's record searched for.
//
// Reading does not change the ring, only the place where the next search starts, so that several
// threads may ask.
#include "Platform/Base/Counting.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"

#include <new>
#include <utility>

namespace xquery {

namespace {

NSXMLBaseURI* findEntry(NSXMLBaseURI* start, const NSXMLNode* node, uint64_t owner) {
  if (!start) return nullptr;
  NSXMLBaseURI* entry = start;
  WorkPacer pacer;
  do {
    pacer.turn();
    entry = entry->next;
    if (entry->node == node && entry->owner == owner) return entry;
  } while (entry != start);
  return nullptr;
}

bool isLike(const NSXMLBaseURI& entry, uint64_t owner, const NSString* URI) {
  return entry.owner == owner && (entry.URI == URI || entry.URI->view() == URI->view());
}

}  // namespace

bool NSXMLTree::recordBaseURI(const NSXMLNode* node, uint64_t owner, const Ref<NSString>& URI) {
  NSXMLTree& tree = *of(node);
  NSXMLBaseURI*& last = tree._baseURIs;
  const bool isAlike = tree._baseURIsAreAlike && (!last || isLike(*last, owner, URI.get()));
  const bool isKnown = (node->_flags & NSXMLNode::BaseURI) != 0;
  if (isKnown && isAlike) return false;
  tree._baseURIsAreAlike = isAlike;
  if (NSXMLBaseURI* entry = isKnown ? findEntry(last, node, owner) : nullptr) {
    NSCounting::release(*entry->URI);
    entry->URI = Ref<NSString>(URI).detach();
    return false;
  }
  void* memory = NSCounted::operator new(sizeof(NSXMLBaseURI));
  auto* entry = ::new (memory) NSXMLBaseURI{nullptr, node, owner, Ref<NSString>(URI).detach()};
  entry->next = last ? last->next : entry;
  if (last) last->next = entry;
  last = entry;
  const_cast<NSXMLNode*>(node)->_flags |= NSXMLNode::BaseURI;
  return true;
}

NSString* NSXMLTree::recordedBaseURI(const NSXMLNode* node, uint64_t owner) {
  if (!(node->_flags & NSXMLNode::BaseURI)) return nullptr;
  NSXMLBaseURI** last = &of(node)->_baseURIs;
  NSXMLBaseURI* start = __atomic_load_n(last, __ATOMIC_RELAXED);
  if (of(node)->_baseURIsAreAlike) return start->owner == owner ? start->URI : nullptr;
  NSXMLBaseURI* entry = findEntry(start, node, owner);
  if (!entry) return nullptr;
  __atomic_store_n(last, entry, __ATOMIC_RELAXED);
  return entry->URI;
}

// Exchanging the successors of two entries of different rings makes them one.
void NSXMLTree::absorbBaseURIs(NSXMLTree* smaller) {
  if (_baseURIs && smaller->_baseURIs) {
    _baseURIsAreAlike = _baseURIsAreAlike && smaller->_baseURIsAreAlike &&
                        isLike(*_baseURIs, smaller->_baseURIs->owner, smaller->_baseURIs->URI);
    std::swap(_baseURIs->next, smaller->_baseURIs->next);
  } else if (smaller->_baseURIs) {
    _baseURIsAreAlike = smaller->_baseURIsAreAlike;
  }
  if (smaller->_baseURIs) _baseURIs = smaller->_baseURIs;
  smaller->_baseURIs = nullptr;
}

void NSXMLTree::freeBaseURIs() {
  if (!_baseURIs) return;
  NSXMLBaseURI* entry = _baseURIs->next;
  _baseURIs->next = nullptr;
  while (entry) {
    NSXMLBaseURI* next = entry->next;
    NSCounting::release(*entry->URI);
    NSCounted::operator delete(entry, sizeof(NSXMLBaseURI));
    entry = next;
  }
}

}  // namespace xquery
