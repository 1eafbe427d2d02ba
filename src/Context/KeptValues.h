// What one evaluation keeps of an expression for the expression's next evaluation, by expression.
//
// A value is kept only while nothing it was made from has changed. What it is made from are the
// values that the expression depends on, what is inside their nodes, and what is around these where
// the expression looks there.
//
//   other values to depend on       their identity is compared
//   a node that is being filled     nothing is kept: whoever holds a node that was taken into a new
//                                   element sees that element grow between two of its content items
//   what is around other nodes      nothing is kept unless they are in documents: a node without a
//                                   parent may be taken into an element at any time
//   any other change of a tree,     a stamp is compared, so that the host may change its trees
//   while and of a global variable        it is called back, and a declaration may replace a global
//
// So a use compares a few words, whatever the size of what was kept, and writes nothing that
// another thread could look at.
//
// An expression has a few kept values at most, for what it depended on when they were made: those
// of the dependencies that were used last, so that a function may be called with one list and
// another in turn. What is kept says itself what it is: a join keeps a table of keys. It is worth
// its making only when it is used again, so it is made when the expression is evaluated the second
// time with the same things to depend on. Most expressions never are (the path in "for $p in
// $people return $p/profile[@income > 5000]"), and looking costs more than a short path, so after a
// few disappointments in a row nobody looks but now and then.
#pragma once

#include "xquery/Object.h"

#include <cstdint>
#include <memory>
#include <span>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryExpr;

// Whether what is inside the nodes of the values stays as it is until a stamp changes, and what is
// around them where that is asked for.
bool XQueryAreSettled(std::span<const Value> values, bool around);

class XQueryKeptValue {
 public:
  XQueryKeptValue() = default;
  XQueryKeptValue(const XQueryKeptValue&) = delete;
  XQueryKeptValue& operator=(const XQueryKeptValue&) = delete;
  virtual ~XQueryKeptValue() = default;
};

class XQueryKeptValues {
 public:
  enum class Use : uint8_t {
    First,    // of these dependencies: take the plain way
    Second,   // make the value, or find that none can be made, and tell with `keep`
    Further,  // `kept` is what was kept
  };
  // To be asked before every use: whether to take the plain way without looking.
  bool looksAway(const XQueryExpr& expr);
  // The dependencies are all that the expression reads, globals apart; they are kept alive.
  Use use(const XQueryExpr& expr, std::span<const Value> dependencies, bool looksAround,
          std::shared_ptr<XQueryKeptValue>& kept);
  // The same where the expression is known to be evaluated often with the same dependencies: the
  // value is to be made at the first use (Second), and First is never answered.
  Use useAtOnce(const XQueryExpr& expr, std::span<const Value> dependencies, bool looksAround,
                std::shared_ptr<XQueryKeptValue>& kept);
  // Keeps what was made for these dependencies. Making it may have used the same expression for so
  // many others, as a function does that calls itself, that they are forgotten: then nothing is
  // kept. A null value stands for: take the plain way as long as the dependencies are these.
  void keep(const XQueryExpr& expr, std::span<const Value> dependencies,
            std::shared_ptr<XQueryKeptValue> value);
  void clear() { _entries.clear(); }
  // Before a global variable gets a value, or another one.
  void noteGlobalChange() { ++_globalChanges; }

 private:
  // Grows with every change of a finished tree and of a global. What is kept is kept and used by
  // one thread.
  uint64_t stamp() const;

  struct Entry {
    bool isFor(std::span<const Value> others) const;

    uint64_t stamp = UINT64_MAX;  // no stamp
    std::vector<Value> dependencies;
    bool isDecided = false;
    std::shared_ptr<XQueryKeptValue> value;
  };
  static constexpr size_t mostEntries = 3;
  struct Entries {
    std::vector<Entry> entries;  // the one used last first
    uint32_t firsts = 0;         // in a row
  };
  // The one for these dependencies, which is then the first; null when there is none.
  static Entry* find(Entries& entries, std::span<const Value> dependencies);

  uint64_t _globalChanges = 0;
  std::unordered_map<const XQueryExpr*, Entries> _entries;
};

}  // namespace xquery
