// The indexes of a tree: names of elements, names of attributes, values by key; and which names no
// node has two children of, which is known of documents that were read.
//
// They belong to the tree, for whoever reads it, and go when it changes or is freed. What asks for
// one may be one of several threads, each of which evaluates something of its own; what changes the
// tree is alone with it.
//
//   when      An index costs about as much as the walk that it replaces. So the work that an index
//             would have saved is added up, and when it comes to half a walk through the tree,
//             whoever asks next makes the index: a document that is asked once is walked once, and
//             asking never costs much more than twice what it would with what comes later known.
//   on record The elements of a tree that was read are on record (ElementLog.h), from which their
//             index is made in a fifth of the time of a walk: so it is made when an eighth of one
//             is asked for. The ways, which only some ask for, are added when the rest has come
//             together, and then the record goes.
//   who       One thread makes it; others walk meanwhile, so that nobody waits. An index that is
//             made is published by one pointer and never changes.
//   limits    Making one looks at deadline and flag, and what it takes counts towards the ceiling
//             of the evaluation that makes it. One that would take much of what is left below the
//             ceiling is not made: the evaluation would have gone on without it.
//   changes   The tree lets go of all of its indexes at any change of it. Who still has a reference
//             to them sees the tree as it was, and asks `isOf` whether it still is.
//
// Trees with several roots, trees whose order numbers are not good, as those under construction,
// and small trees have none.
#pragma once

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/ElementLog.h"
#include "Platform/Tree/NameIndex.h"
#include "Platform/Tree/SingleNames.h"
#include "Platform/Tree/ValueIndex.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <utility>

namespace xquery {

class NSXMLTreeIndexes;

// How many nodes of each kind a document has; a document that is read is counted meanwhile.
struct NSXMLKindCounts {
  uint64_t attributes = 0;
  uint64_t namespaces = 0;
  uint64_t comments = 0;
  uint64_t instructions = 0;
  uint64_t elements = 0;
  uint64_t texts = 0;

  uint64_t of(Kind kind) const;
};

// A count of the indexes of a tree, or null. The nodes in them live as long as their tree.
class NSXMLIndexesRef {
 public:
  NSXMLIndexesRef() = default;
  explicit NSXMLIndexesRef(NSXMLTreeIndexes* indexes);
  NSXMLIndexesRef(const NSXMLIndexesRef& other) : NSXMLIndexesRef(other._indexes) {}
  NSXMLIndexesRef(NSXMLIndexesRef&& other) noexcept
      : _indexes(std::exchange(other._indexes, nullptr)) {}
  NSXMLIndexesRef& operator=(NSXMLIndexesRef other) noexcept {
    std::swap(_indexes, other._indexes);
    return *this;
  }
  ~NSXMLIndexesRef();
  NSXMLTreeIndexes* operator->() const { return _indexes; }
  explicit operator bool() const { return _indexes != nullptr; }

 private:
  NSXMLTreeIndexes* _indexes = nullptr;
};

class NSXMLTreeIndexes {
 public:
  // A walk through fewer nodes is as quick as looking for them.
  static constexpr uint32_t fewNodes = 256;
  // More keys than these have no index: a host may ask one document ever new questions.
  static constexpr uint32_t mostKeys = 64;

  // Those of the node's tree, to be filled on demand; null for a tree that has none.
  [[nodiscard]] static NSXMLIndexesRef of(const NSXMLNode* node);
  // Whether they are those of the node's tree as it is now.
  bool isOf(const NSXMLNode* node) const;

  // For who has built a document that nobody else knows yet: what has been put down about it, kept
  // until it changes. Elements and texts are counted here. Not for small trees.
  static void begin(const NSXMLNode* document, std::unique_ptr<const NSXMLElementLog> log,
                    const NSXMLKindCounts& counts);
  // Of the whole document; null for not known.
  const NSXMLKindCounts* counts() const { return _counts ? &*_counts : nullptr; }
  // Whether it is known that no sibling of an element has the same name.
  static bool isSingle(const NSXMLNode* element) {
    const NSXMLTreeIndexes* const known =
        NSXMLTree::of(element)->_indexes.load(std::memory_order_acquire);
    return known && known->_singleNames && known->_singleNames->contains(element->expandedName());
  }

  // Whether a walk through the children of a node for those of the element's name may end with it.
  // Not where the node after their parent is near: what lies in a row comes into the cache ahead of
  // the walk, and going on through a few more nodes takes less than waiting for one elsewhere.
  static bool endsWalk(const NSXMLNode* element) {
    constexpr uintptr_t nearBytes = 1024;
    const NSXMLNode* const behind = element->parent()->nextSibling();
    const uintptr_t distance =
        reinterpret_cast<uintptr_t>(behind) - reinterpret_cast<uintptr_t>(element);
    return (!behind || distance >= nearBytes) && isSingle(element);
  }

  // Each answers the index if there is one, or if it is worth making now; null for: walk. `work` is
  // how many nodes that walk will meet.
  const NSXMLNameIndex* elements(uint64_t work);
  const NSXMLNameIndex* attributes(uint64_t work);
  // Elements, if their ways are known as well or are worth finding out now.
  const NSXMLNameIndex* elementsWithWays();
  // For walks that are known when they are done.
  void addWork(uint64_t work) { _elements.workDone.fetch_add(work, std::memory_order_relaxed); }
  // `work` includes the way from each element to its values.
  const NSXMLValueIndex* values(const NSXMLValueKey& key, uint64_t work);
  // What such a walk has come to, where it is not known before.
  void addWork(const NSXMLValueKey& key, uint64_t work);

  // Of the last node.
  uint32_t lastNumber() const { return _lastNumber; }

 private:
  template <class Index>
  struct Place {
    std::atomic<uint64_t> workDone = 0;
    std::atomic<const Index*> index = nullptr;

    ~Place() { delete index.load(std::memory_order_relaxed); }
  };
  struct KeyPlace : Place<NSXMLValueIndex> {
    KeyPlace(const NSXMLValueKey& ofKey, KeyPlace* others) : key(ofKey), next(others) {}
    const NSXMLValueKey key;
    KeyPlace* const next;
  };

  NSXMLTreeIndexes(const NSXMLNode* root, uint32_t lastNumber)
      : _root(root), _lastNumber(lastNumber) {}
  ~NSXMLTreeIndexes();
  NSXMLTreeIndexes(const NSXMLTreeIndexes&) = delete;
  NSXMLTreeIndexes& operator=(const NSXMLTreeIndexes&) = delete;

  static NSXMLTreeIndexes* make(const NSXMLNode* node);
  void retain() { _references.fetch_add(1, std::memory_order_relaxed); }
  void release();
  friend class NSXMLIndexesRef;
  friend class NSXMLTree;

  bool isWorth(std::atomic<uint64_t>& workDone, uint64_t work) const;
  template <class Index, class Make>
  const Index* makeOnce(Place<Index>& place, size_t bytes, Make make);
  const NSXMLNameIndex* makeElements();
  const NSXMLNameIndex* addWays(const NSXMLNameIndex& elements);
  const NSXMLValueIndex* makeOfOwners(KeyPlace& place, const NSXMLNameIndex& names);
  KeyPlace* placeOf(const NSXMLValueKey& key);

  std::atomic<uint32_t> _references = 1;
  uint32_t _keyCount = 0;
  const NSXMLNode* const _root;
  const uint32_t _lastNumber;
  std::mutex _making;
  // While it is of use; only for who makes something. Whether there was one never changes.
  std::unique_ptr<const NSXMLElementLog> _log;
  bool _isLogged = false;
  std::optional<NSXMLKindCounts> _counts;                // known from the beginning, or none
  std::unique_ptr<const NSXMLSingleNames> _singleNames;  // known from the beginning, or null
  Place<NSXMLNameIndex> _elements;
  Place<NSXMLNameIndex> _attributes;
  std::atomic<KeyPlace*> _keys = nullptr;  // added in front, none taken out
};

// Nodes that an index knows, held with it: what changes the tree meanwhile does not change them.
struct NSXMLIndexedNodes {
  NSXMLIndexesRef indexes;
  NSXMLNodeSpan nodes;
  NSXMLNodeList merged{};  // of several names
};

// The elements of the name that a walk in document order meets from `first` on before `stop`, which
// is null for the end of the tree; none for: walk.
[[nodiscard]] std::optional<NSXMLIndexedNodes> NSXMLIndexedElements(const NSXMLExpandedName* name,
                                                                    const NSXMLNode* first,
                                                                    const NSXMLNode* stop);
// The same for several names. `withInstructions`: the walk looks for processing instructions too,
// so that a tree that has some must be walked.
[[nodiscard]] std::optional<NSXMLIndexedNodes> NSXMLIndexedElements(const NSXMLNameSelection& names,
                                                                    bool withInstructions,
                                                                    const NSXMLNode* first,
                                                                    const NSXMLNode* stop);
// How many these are.
[[nodiscard]] std::optional<uint64_t> NSXMLCountIndexedElements(const NSXMLNameSelection& names,
                                                                bool withInstructions,
                                                                const NSXMLNode* first,
                                                                const NSXMLNode* stop);
// How many nodes of some kinds, which are given as a bit for each, a walk of that sort through a
// whole document meets, and how many attributes its elements have; none for: walk.
[[nodiscard]] std::optional<uint64_t> NSXMLCountKinds(uint32_t kinds, const NSXMLNode* first,
                                                      const NSXMLNode* stop);
[[nodiscard]] std::optional<uint64_t> NSXMLCountAttributes(const NSXMLNode* first,
                                                           const NSXMLNode* stop);
// What is known of the elements below a document, which is the root of its tree; null for: walk.
struct NSXMLIndexedWays {
  NSXMLIndexesRef indexes;
  const NSXMLNameIndex* elements = nullptr;

  [[nodiscard]] static NSXMLIndexedWays of(const NSXMLNode* document);
};
// For: walk, after which it is told how many nodes that has met. These are children, which lie
// apart from each other.
void NSXMLNoteWalked(uint64_t nodes, const NSXMLNode* document);
// The elements of the name in the key from `first` on before `stop` by their values; null for:
// walk.
struct NSXMLIndexedValues {
  NSXMLIndexesRef indexes;
  const NSXMLValueIndex* values = nullptr;

  [[nodiscard]] static NSXMLIndexedValues of(const NSXMLValueKey& key, const NSXMLNode* first,
                                             const NSXMLNode* stop);
};
// For: walk, after which it is told how many elements were asked for their values there. These lie
// anywhere, and their values somewhere else, so that each takes as long as many nodes in a row.
void NSXMLNoteAskedValues(const NSXMLValueKey& key, uint64_t elements, const NSXMLNode* node);
// The attributes of the name of the elements from `first` on before `stop`.
[[nodiscard]] std::optional<NSXMLIndexedNodes> NSXMLIndexedAttributes(const NSXMLExpandedName* name,
                                                                      const NSXMLNode* first,
                                                                      const NSXMLNode* stop);

}  // namespace xquery
