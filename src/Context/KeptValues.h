// What one evaluation keeps of an expression for the expression's next evaluation, by expression.
//
// An expression has one kept value at most, for what it depended on when the value was made. What
// is kept says itself what it is: a join keeps a table of keys. It is worth its making only when it
// is used again, so it is made when the expression is evaluated the second time with the same
// things to depend on. Most expressions never are (the path in "for $p in $people return
// $p/profile[@income > 5000]"), and looking costs more than a short path, so after a few
// disappointments in a row nobody looks but now and then.
#pragma once

#include "xquery/Object.h"

#include <cstdint>
#include <memory>
#include <span>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryExpr;

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
  // What is compared of the dependencies is their identity; they are kept alive.
  Use use(const XQueryExpr& expr, std::span<const Value> dependencies,
          std::shared_ptr<XQueryKeptValue>& kept);
  // A null value stands for: take the plain way as long as the dependencies are these.
  void keep(const XQueryExpr& expr, std::shared_ptr<XQueryKeptValue> value);
  void clear() { _entries.clear(); }

 private:
  struct Entry {
    std::vector<Value> dependencies;
    bool isDecided = false;
    uint32_t firsts = 0;  // in a row
    std::shared_ptr<XQueryKeptValue> value;
  };

  std::unordered_map<const XQueryExpr*, Entry> _entries;
};

}  // namespace xquery
