// Documents that never end, and an end to the reading of them.
#pragma once

#include "Platform/Base/LookCounter.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/TextSource.h"

#include <algorithm>
#include <functional>
#include <string>

namespace xquery::readingtest {

constexpr int64_t MiB = int64_t{1} << 20;

// Ends the work of the thread at a look where its values take more than they may, and notes the
// most that it has seen.
class Ceiling final : public WorkWatcher {
 public:
  explicit Ceiling(int64_t bytes) : _start(workMeter.valueBytes), _outer(workMeter) {
    workMeter.watcher = this;
    workMeter.stepsLeft = 0;
    workMeter.mostValueBytes = _start + bytes;
  }
  ~Ceiling() {
    workMeter.watcher = _outer.watcher;
    workMeter.stepsLeft = _outer.stepsLeft;
    workMeter.mostValueBytes = _outer.mostValueBytes;
    workMeter.wasRefused = _outer.wasRefused;
  }
  void lookAtWork() override {
    workMeter.stepsLeft = 1024;
    _most = std::max(_most, workMeter.valueBytes - _start);
    if (workMeter.valueBytes > workMeter.mostValueBytes) throw Ended();
  }
  int64_t most() const { return _most; }

 private:
  const int64_t _start;
  int64_t _most = 0;
  const WorkMeter _outer;
};

// A document that begins and then goes on without end.
struct Endless {
  const char* what;
  std::string beginning;
  std::function<std::string(size_t)> part;
};

inline std::string name(size_t index) {
  return "n" + std::to_string(index);
}

inline const Endless endless[] = {
    {"an attribute's value", "<a b='", [](size_t) { return std::string(1000, 'c'); }},
    {"a comment", "<a><!--", [](size_t) { return std::string(1000, 'c'); }},
    {"an instruction", "<a><?b ", [](size_t) { return std::string(1000, 'c'); }},
    {"a section", "<a><![CDATA[", [](size_t) { return std::string(1000, ']'); }},
    {"the text of an entity", "<!DOCTYPE a [<!ENTITY b '",
     [](size_t) { return std::string(1000, 'c'); }},
    {"entities", "<!DOCTYPE a [",
     [](size_t index) { return "<!ENTITY " + name(index) + " 'text'>"; }},
    {"names of elements", "<a>", [](size_t index) { return "<" + name(index) + "/>"; }},
    {"names of attributes", "<a>", [](size_t index) { return "<b " + name(index) + "='c'/>"; }},
    {"levels", "<a>", [](size_t) { return "<b>"; }},
    {"levels of namespaces", "<a>",
     [](size_t index) { return "<b xmlns:" + name(index) + "='u'>"; }},
};

// The text of it, which cannot be read any more after so many bytes.
inline TextInput inputOf(const Endless& document, size_t mostRead) {
  return [&document, mostRead, parts = size_t{0}, bytes = size_t{0}, held = document.beginning](
             char* buffer, size_t size) mutable -> ptrdiff_t {
    if (bytes > mostRead) return -1;
    while (held.size() < size) held += document.part(parts++);
    const size_t count = held.copy(buffer, size);
    held.erase(0, count);
    bytes += count;
    return static_cast<ptrdiff_t>(count);
  };
}

}  // namespace xquery::readingtest
