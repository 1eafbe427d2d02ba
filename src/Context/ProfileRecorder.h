// What the expressions of a query cost, counted while it is evaluated in one context.
//
// A profiled expression has a number, that of its counter, and says when it begins and when it is
// done. The clock is read at both; the time since the last reading belongs to the expression that
// was under way meanwhile, the innermost one. So every nanosecond is that of one expression: its
// own time. Its total is from where it begins to where it is done, and counts once where an
// expression is evaluated within itself.
//
// Beside the counters stands a tree of calls, in which an expression has a node for each way that
// led to it:
//
//   node 0: the evaluation           own time only; the total of a node is that of all below it
//     query
//       local:f(...)
//         function local:f#1         a recursive call is told of here and adds to this node
//
// The tree is bounded: what would lie deeper than mostDepth, or exceed mostNodes, adds to the node
// around it, which tells how often. Nothing here counts as memory of the evaluation.
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {

struct XQueryProfiledProgram;

using XQueryCounterID = uint32_t;
inline constexpr XQueryCounterID XQueryNoCounter = UINT32_MAX;

struct XQueryProfileCounter {
  uint64_t calls = 0;
  uint64_t items = 0;
  uint64_t failures = 0;
  int64_t total = 0;  // nanoseconds
  int64_t own = 0;
  uint64_t recursions = 0;  // of the calls, those within another one
  uint32_t deepest = 0;     // how many were under way at a time
};

struct XQueryProfileNode {
  XQueryCounterID counter;
  uint32_t parent;  // a smaller number; that of the first node is its own
  uint32_t depth;
  uint64_t calls = 0;
  uint64_t items = 0;
  uint64_t folded = 0;  // calls of others, for which there was no room below
  int64_t own = 0;
};

// The sum of any number of evaluations of one program.
class XQueryProfileCounts {
 public:
  static constexpr uint32_t mostDepth = 250;
  static constexpr size_t mostNodes = 10'000;

  explicit XQueryProfileCounts(size_t counters);

  const std::vector<XQueryProfileCounter>& counters() const { return _counters; }
  // Parents before their children.
  const std::vector<XQueryProfileNode>& nodes() const { return _nodes; }
  uint64_t evaluations() const { return _evaluations; }
  int64_t nanoseconds() const { return _nanoseconds; }

  // Of the same program.
  void add(const XQueryProfileCounts& other);
  // The node of that expression below another one, made where there is room for it; otherwise that
  // other one.
  uint32_t nodeBelow(uint32_t parent, XQueryCounterID counter);

 private:
  friend class XQueryProfileRecorder;

  uint32_t makeNode(uint32_t parent, XQueryCounterID counter);

  // Where the children of a node were found last: mostly they take turns.
  struct Links {
    uint32_t last = 0;  // 0: none
    uint32_t next = 0;  // the sibling made after this one
    uint32_t youngest = 0;
  };

  std::vector<XQueryProfileCounter> _counters;
  std::vector<XQueryProfileNode> _nodes;
  std::vector<Links> _links;  // beside the nodes
  std::unordered_map<uint64_t, uint32_t> _children;
  uint64_t _evaluations = 0;
  int64_t _nanoseconds = 0;
};

class XQueryProfileRecorder {
 public:
  XQueryProfileRecorder(std::shared_ptr<const XQueryProfiledProgram> program, size_t counters)
      : _program(std::move(program)), _counts(counters), _running(counters) {}

  const std::shared_ptr<const XQueryProfiledProgram>& program() const { return _program; }
  const XQueryProfileCounts& counts() const { return _counts; }

  // One evaluation.
  void begin();
  void end();

  // The expression that is under way, and its node.
  struct Position {
    XQueryCounterID counter = XQueryNoCounter;
    uint32_t node = 0;
  };
  // The expression begins; what was under way before is to be given back when it is done.
  Position enter(XQueryCounterID counter);
  void leave(Position before, uint64_t items, bool hasFailed);
  // For what turned out to be no evaluation at all.
  void leaveUncounted(Position before);

 private:
  struct Running {
    uint32_t active = 0;  // how many are under way
    uint32_t node = 0;    // of the outermost
    int64_t since = 0;    // when that began
  };

  static int64_t now() {
    return std::chrono::duration_cast<std::chrono::nanoseconds>(
               std::chrono::steady_clock::now().time_since_epoch())
        .count();
  }
  // Gives the time up to now to what is under way.
  void charge() {
    const int64_t time = now();
    const int64_t taken = time - std::exchange(_lastReading, time);
    _counts._nodes[_current.node].own += taken;
    if (_current.counter != XQueryNoCounter) _counts._counters[_current.counter].own += taken;
  }
  void close(Position before);

  std::shared_ptr<const XQueryProfiledProgram> _program;
  XQueryProfileCounts _counts;
  std::vector<Running> _running;  // beside the counters
  Position _current;
  int64_t _lastReading = 0;
  int64_t _start = 0;
};

}  // namespace xquery
