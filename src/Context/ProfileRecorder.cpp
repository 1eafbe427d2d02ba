#include "Context/ProfileRecorder.h"

#include <algorithm>

namespace xquery {

XQueryProfileCounts::XQueryProfileCounts(size_t counters) : _counters(counters) {
  _nodes.push_back({XQueryNoCounter, 0, 0});
  _links.emplace_back();
}

uint32_t XQueryProfileCounts::nodeBelow(uint32_t parent, XQueryCounterID counter) {
  if (const uint32_t last = _links[parent].last) {
    if (_nodes[last].counter == counter) return last;
    const uint32_t next = _links[last].next;
    if (next && _nodes[next].counter == counter) return _links[parent].last = next;
  }
  const auto found = _children.find(uint64_t{parent} << 32 | counter);
  if (found != _children.end()) return _links[parent].last = found->second;
  const bool hasRoom = _nodes.size() < mostNodes && _nodes[parent].depth < mostDepth;
  return hasRoom ? makeNode(parent, counter) : parent;
}

uint32_t XQueryProfileCounts::makeNode(uint32_t parent, XQueryCounterID counter) {
  const auto made = static_cast<uint32_t>(_nodes.size());
  _nodes.push_back({counter, parent, _nodes[parent].depth + 1});
  _links.emplace_back();
  _children.emplace(uint64_t{parent} << 32 | counter, made);
  if (const uint32_t before = std::exchange(_links[parent].youngest, made)) {
    _links[before].next = made;
  }
  return _links[parent].last = made;
}

void XQueryProfileCounts::add(const XQueryProfileCounts& other) {
  _evaluations += other._evaluations;
  _nanoseconds += other._nanoseconds;
  for (size_t i = 0; i < _counters.size(); ++i) {
    XQueryProfileCounter& to = _counters[i];
    const XQueryProfileCounter& from = other._counters[i];
    to.calls += from.calls;
    to.items += from.items;
    to.failures += from.failures;
    to.total += from.total;
    to.own += from.own;
    to.recursions += from.recursions;
    to.deepest = std::max(to.deepest, from.deepest);
  }
  std::vector<uint32_t> places(other._nodes.size());
  for (size_t i = 0; i < other._nodes.size(); ++i) {
    const XQueryProfileNode& from = other._nodes[i];
    const uint32_t around = places[from.parent];
    places[i] = i == 0 ? 0 : nodeBelow(around, from.counter);
    XQueryProfileNode& to = _nodes[places[i]];
    const bool isFolded = i != 0 && places[i] == around;
    (isFolded ? to.folded : to.calls) += from.calls;
    if (!isFolded) to.items += from.items;
    to.folded += from.folded;
    to.own += from.own;
  }
}

void XQueryProfileRecorder::begin() {
  std::fill(_running.begin(), _running.end(), Running());
  _current = {};
  _start = _lastReading = now();
}

void XQueryProfileRecorder::end() {
  charge();
  ++_counts._evaluations;
  ++_counts._nodes[0].calls;
  _counts._nanoseconds += _lastReading - _start;
}

XQueryProfileRecorder::Position XQueryProfileRecorder::enter(XQueryCounterID counter) {
  charge();
  const Position before = _current;
  Running& running = _running[counter];
  XQueryProfileCounter& counts = _counts._counters[counter];
  ++counts.calls;
  if (running.active == 0) {
    running.node = _counts.nodeBelow(before.node, counter);
    running.since = _lastReading;
  } else {
    ++counts.recursions;
  }
  counts.deepest = std::max(counts.deepest, ++running.active);
  XQueryProfileNode& node = _counts._nodes[running.node];
  ++(node.counter == counter ? node.calls : node.folded);
  _current = {counter, running.node};
  return before;
}

void XQueryProfileRecorder::close(Position before) {
  charge();
  Running& running = _running[_current.counter];
  if (--running.active == 0) {
    _counts._counters[_current.counter].total += _lastReading - running.since;
  }
  _current = before;
}

void XQueryProfileRecorder::leave(Position before, uint64_t items, bool hasFailed) {
  const Position done = _current;
  close(before);
  XQueryProfileCounter& counts = _counts._counters[done.counter];
  counts.items += items;
  counts.failures += hasFailed ? 1 : 0;
  XQueryProfileNode& node = _counts._nodes[done.node];
  if (node.counter == done.counter) node.items += items;
}

void XQueryProfileRecorder::leaveUncounted(Position before) {
  const Position done = _current;
  close(before);
  --_counts._counters[done.counter].calls;
  XQueryProfileNode& node = _counts._nodes[done.node];
  --(node.counter == done.counter ? node.calls : node.folded);
}

}  // namespace xquery
