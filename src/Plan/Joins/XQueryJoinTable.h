// Items with their keys read, so that the items which meet a comparison with a probe are found
// without evaluating the comparison for each item.
//
// The table answers what the comparison would answer. A key or a probe is
//
//   untyped   a node or an untyped value: compared by its text with text, as a number with numbers
//   text      exactly xs:string: compared with text only
//   number    compared with numbers, exactly when both are decimal and as doubles otherwise: where
//             some keys are decimal and others are not, those that are equal as doubles are asked
//
// and everything else (dates, other string types, truth values) is compared the plain way. So are
// items whose key could not be read, or mixes kinds, or is no number where a number is asked for:
// comparing them may be an error, which must come up where it always does. A selection names these
// items too and leaves it to the caller to ask for each.
#pragma once

#include "Context/KeptValues.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/XQueryPicker.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinKeyOrder.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Object.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <numeric>
#include <optional>
#include <span>
#include <type_traits>
#include <vector>

namespace xquery {

// How keys are compared with a probe.
struct XQueryJoinRelation {
  XQueryRelation relation{};  // of a key to a probe
  // A value comparison wants one item on each side, a general one takes any number.
  bool isValueComparison = false;
  // starts-with(): whether a key begins with a probe. The relation above is then an order.
  bool isPrefix = false;
  // "is": whether both sides are the same node.
  bool isIdentity = false;
  // There are several value comparisons, any of which may hold: one for each key, for each probe.
  bool keysAreOfEach = false;
  bool probesAreOfEach = false;
  // The condition is that the relation does not hold, which is the same as another relation only
  // where both sides are one item, and no NaN.
  bool isComplement = false;
};

class XQueryJoinTable final : public XQueryKeptValue {
 public:
  using Selection = std::vector<XQueryPick>;
  // The value of the key for the item at a position; null when it cannot be had.
  using KeyReader = std::function<Value(size_t position)>;

  // A table for fewer items costs more than it saves.
  static constexpr size_t fewestItems = 8;
  static constexpr size_t mostItems = UINT32_MAX / 4;
  // Keys by the thousand in every item, as "preceding::a" has them, would fill the memory that the
  // plain way does not need. So many are taken however few the items are.
  static constexpr size_t mostKeysPerItem = 32;
  static constexpr size_t keysOfAnyItems = size_t{1} << 18;

  using Items = std::shared_ptr<const std::vector<Value>>;
  // The positions count the items, which the table keeps alive.
  XQueryJoinTable(const XQueryJoinRelation& by, Items items, const KeyReader& keyOf);
  ~XQueryJoinTable() override;

  // Whether it holds all keys. It does not when they are too many, or would take too much of the
  // memory that is left to the evaluation; such a table must not be asked.
  bool isComplete() const { return _isComplete; }

  // A probe made ready to be asked about, good as long as the table and the tree of the probe.
  class Question;

  // Not for several threads at once: the table is completed by what it is asked.
  //
  // Nothing for a probe, null for one that could not be had, that has to be compared the plain way.
  // Unless `isDistinct`, a key may be found twice.
  std::optional<Question> questionOf(const Value& probe, bool isDistinct = true);
  // About how many items it will select.
  size_t estimateFor(const Question& question);
  // Puts the items that meet the comparison with the probe, and those that have to be asked, into
  // the list, in the order of the items, each once. With `wantsFirst`, sure items behind the first
  // one may be left out.
  void select(const Question& question, Selection& selection, bool wantsFirst = false);
  // How many items `select` puts into the list; nothing where some have to be asked, and where
  // counting takes the list.
  std::optional<uint64_t> numberFor(const Question& question);
  // Whether one item does; nothing where it has to be asked.
  std::optional<bool> isMetBy(const Question& question, uint32_t position);
  // Whether the item has always to be asked.
  bool isIrregular(uint32_t position) const {
    return std::binary_search(_irregular.begin(), _irregular.end(), position);
  }
  // Whether no item has to be asked whatever it is compared with.
  bool isRegular() const { return _irregular.empty(); }
  // Whether no other item has to be asked because of what it is compared with.
  bool isRegularFor(const Question& question) const;
  // Whether each item has one key at most, and none has to be asked.
  bool hasOneAnswerFor(const Question& question) const;
  // Whether any item meets the comparison with the probe; nothing when it has to be compared the
  // plain way.
  std::optional<bool> meets(const Value& probe);

 private:
  friend class XQueryJoinPair;
  using Operand = XQueryJoinOperand;
  using Operands = std::vector<Operand>;

  // The keys by their hash, those of one bucket in their order.
  class Buckets {
   public:
    template <class Key>
    void build(const std::vector<Key>& keys);
    bool isBuilt() const { return !_starts.empty(); }
    // Keys of this hash, and others.
    std::span<const uint32_t> at(uint32_t hash) const {
      const size_t bucket = hash & (_starts.size() - 2);
      return std::span(_keys).subspan(_starts[bucket], _starts[bucket + 1] - _starts[bucket]);
    }
    size_t bytes() const { return (_starts.size() + _keys.size()) * sizeof(uint32_t); }

   private:
    std::vector<uint32_t> _starts;  // a power of two, and one for the end
    std::vector<uint32_t> _keys;
  };

  // Keys by their order, least first; without those that meet nothing. So many probes are compared
  // with every key, before they are sorted.
  static constexpr uint32_t askedToSort = 16;
  struct Order {
    std::vector<uint32_t> keys;
    uint32_t asked = 0;
  };

  // The keys as they are compared with certain probes, and ways to find them.
  template <class Key>
  struct Form {
    std::vector<Key> keys;
    Buckets buckets;
    Order order;
    size_t bytes() const {
      return keys.size() * sizeof(Key) + buckets.bytes() + order.keys.size() * sizeof(uint32_t);
    }
  };

  void readKeys(const KeyReader& keyOf);
  void read(uint32_t position, const Value& value);
  bool readNode(uint32_t position, const XQueryItemList& keys);
  bool isTooLarge(int64_t bytesBefore) const;
  bool takes(std::span<const Operand> keys);
  // How the keys are compared with certain probes. Decimals that are equal as doubles need not be
  // equal, which leaves it open what they meet where not all keys are decimals.
  enum class Way : uint8_t { Plain, Nothing, Nodes, Texts, Numbers, NumbersButTies, Exacts };
  struct Asked {
    bool areTiesOpen;
    bool wantsFirst;
  };
  Way wayFor(const Value& probe, Operands& probes) const;
  Way wayOfNumbers(const Operands& probes) const;
  void scanTexts();
  void readTexts();
  void readExacts();
  void findKeysOfItems();
  static bool isOfNumbers(const Question& question);
  // Calls use(form, probes) for the form that decides a question; not where nothing is met.
  template <class Use>
  void withForm(const Question& question, Use use);
  template <class Key>
  size_t estimate(const std::vector<Key>& probes, Form<Key>& form);
  template <class Key>
  std::optional<bool> isMet(const std::vector<Key>& keys, const std::vector<Key>& probes,
                            bool areTiesOpen, uint32_t position) const;
  // Calls visit(key, isTie) for each key that meets one of the probes, or is a tie with one, until
  // it answers false.
  template <class Visit>
  void forEachMet(const Question& question, bool wantsFirst, Visit visit);
  template <class Key, class Visit>
  void forEachEqual(const std::vector<Key>& probes, Form<Key>& form, Asked asked, Visit visit);
  template <class Key, class Visit>
  void forEachOrdered(const std::vector<Key>& probes, Form<Key>& form, Asked asked, Visit visit);
  template <class Key>
  bool holds(XQueryRelation relation, const Key& key, const Key& probe) const;
  template <class Key>
  std::span<const uint32_t> metInOrder(XQueryRelation relation, const Key& probe,
                                       Form<Key>& form) const;
  template <class Key>
  std::span<const uint32_t> metAmong(XQueryRelation relation, const Key& probe,
                                     const std::vector<Key>& keys,
                                     std::span<const uint32_t> sorted) const;
  void countMemory();

  const XQueryRelation _relation;
  const bool _isValueComparison;
  const bool _isComplement;
  const bool _isIdentity;
  const bool _isPrefix;
  const bool _wantsOneKey;
  const bool _wantsOneProbe;
  bool _isComplete = true;
  bool _holdsTexts = false;    // the keys are untyped or texts ...
  bool _holdsNumbers = false;  // ... or numbers; neither while there is no key
  bool _hasDecimals = false;
  bool _hasInexactDecimals = false;
  bool _hasFloating = false;
  bool _isScanned = false;
  bool _hasSeveralKeys = false;  // of one item
  int64_t _countedBytes = 0;
  const Items _items;
  std::vector<Value> _keptKeys;  // the atomic keys, to which the texts refer
  Operands _keys;
  std::vector<uint32_t> _positions;  // of the item of each key
  std::vector<uint32_t> _irregular;  // positions of the items that have to be asked
  std::vector<uint32_t> _irregularAsNumbers;
  std::vector<uint32_t> _firstKeys;  // of each item, in the list of the positions
  Form<NSStringView> _texts;         // of each key
  Form<double> _numbers;             // of each key; NaN for one that is none
  Form<XQueryExactKey> _exacts;      // of each key, where all are decimals
  Form<const NSObject*> _nodes;      // instead, where nodes are looked for
};

class XQueryJoinTable::Question {
  friend class XQueryJoinPair;
  friend class XQueryJoinTable;
  Way way = Way::Nothing;
  Value probe;
  Operands operands;  // hold what the texts are views of
  // What decides: of an order one, otherwise each once, in order.
  std::vector<NSStringView> texts;
  std::vector<double> numbers;
  std::vector<XQueryExactKey> exacts;
  std::vector<const NSObject*> nodes;
};

inline bool XQueryJoinTable::isOfNumbers(const Question& question) {
  return question.way == Way::Numbers || question.way == Way::NumbersButTies;
}

inline bool XQueryJoinTable::hasOneAnswerFor(const Question& question) const {
  return !_hasSeveralKeys && _irregular.empty() && question.way != Way::NumbersButTies &&
         isRegularFor(question);
}

inline bool XQueryJoinTable::isRegularFor(const Question& question) const {
  return !isOfNumbers(question) || _irregularAsNumbers.empty();
}

template <class Key>
void XQueryJoinTable::Buckets::build(const std::vector<Key>& keys) {
  const size_t buckets = std::bit_ceil(2 * keys.size() + 1);
  _starts.assign(buckets + 1, 0);
  _keys.resize(keys.size());
  std::vector<uint32_t> bucketOf(keys.size());
  WorkPacer pacer;
  for (size_t key = 0; key < keys.size(); ++key) {
    pacer.turn();
    bucketOf[key] = static_cast<uint32_t>(XQueryHashOfKey(keys[key]) & (buckets - 1));
    ++_starts[bucketOf[key] + 1];
  }
  std::partial_sum(_starts.begin(), _starts.end(), _starts.begin());
  // From the last key on: where a bucket ends goes back to where it starts.
  for (size_t key = keys.size(); key-- > 0;) {
    pacer.turn();
    _keys[--_starts[bucketOf[key] + 1]] = static_cast<uint32_t>(key);
  }
  _starts.erase(_starts.begin());
  _starts.push_back(static_cast<uint32_t>(keys.size()));
}

template <class Use>
void XQueryJoinTable::withForm(const Question& question, Use use) {
  switch (question.way) {
    case Way::Nodes:
      return use(_nodes, question.nodes);
    case Way::Texts:
      return use(_texts, question.texts);
    case Way::Numbers:
    case Way::NumbersButTies:
      return use(_numbers, question.numbers);
    case Way::Exacts:
      return use(_exacts, question.exacts);
    default:
      return;
  }
}

template <class Key>
bool XQueryJoinTable::holds(XQueryRelation relation, const Key& key, const Key& probe) const {
  if constexpr (std::is_same_v<Key, NSStringView>) {
    if (_isPrefix) return key.startsWith(probe);
  }
  return relation.holds(XQueryOrderOfKeys(key, probe));
}

// Of some keys that are sorted.
template <class Key>
std::span<const uint32_t> XQueryJoinTable::metAmong(XQueryRelation relation, const Key& probe,
                                                    const std::vector<Key>& keys,
                                                    std::span<const uint32_t> sorted) const {
  const auto isMet = [&](uint32_t key) { return holds(relation, keys[key], probe); };
  const auto isBefore = [&](uint32_t key) { return XQueryOrderOfKeys(keys[key], probe) < 0; };
  if (_isPrefix || relation.test == XQueryRelation::Equal) {
    const auto first = std::partition_point(sorted.begin(), sorted.end(), isBefore);
    return {first, std::partition_point(first, sorted.end(), isMet)};
  }
  const bool fromLeast = (relation.test == XQueryRelation::Less) != relation.negated;
  const auto border = std::partition_point(sorted.begin(), sorted.end(),
                                           [&](uint32_t key) { return isMet(key) == fromLeast; });
  const auto count = static_cast<size_t>(border - sorted.begin());
  return fromLeast ? sorted.first(count) : sorted.subspan(count);
}

}  // namespace xquery
