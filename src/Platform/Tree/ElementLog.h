// The elements of a document in the order in which they were read, each with its name and how many
// elements ended before it: what an index of names is made from (NameIndex.h) without a look at the
// nodes, which lie scattered among texts and take twenty times as much memory.
//
//   entries   32 bits an element
//
//             +-------+-----------+------------------+
//             | ended |   name    |     distance     |
//             | 4     |   12      |     16           |
//             +-------+-----------+------------------+
//
//             distance   from the base, in units of 8 bytes
//             name       its number in the list of names; 0 says that the next entry is a new base
//             ended      elements since the one before, those that have ended; where it is
//                        `manyEnded` they are that many or more, and their parents tell
//
//   names     of each as it is written: how many elements have it, and whether each was the only
//             one of its parent (SingleNames.h)
//
// What is added for an element is a store and a few additions, since whoever reads keeps the number
// of a name with the name. A log is of one tree that is built from the beginning to the end. If
// anything is taken back, or there are more names than numbers, it is given up: then only the names
// are good, as far as they go.
#pragma once

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/NodeSpan.h"
#include "Platform/Tree/SingleNames.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <utility>

namespace xquery {

class NSXMLElementLog {
 public:
  // Of a name in this log; 0 for not known.
  using Number = uint16_t;
  static constexpr size_t mostNames = (1U << 12) - 1;
  static constexpr uint32_t manyEnded = (1U << 4) - 1;

  struct Name {
    const NSXMLName* name = nullptr;  // the tree holds it
    uint32_t count = 0;
    uint32_t lastParent = 0;
    bool isSingle = true;
  };

  NSXMLElementLog() : _names(1) {}

  // --- while the tree is built -------------------------------------------------------------------
  // An element begins below the parent, whose order number is good. The number is the caller's, to
  // keep beside the name and to be 0 before the first time.
  void open(const NSXMLNode* element, const NSXMLName* name, Number& number,
            const NSXMLNode& parent) {
    if (!number) [[unlikely]] {
      number = numberOf(name);
    }
    noteParent(_names[number], NSXMLNodeOrder::number(parent));
    const uint32_t ended = std::min(std::exchange(_ended, 0), manyEnded);
    uintptr_t distance = (reinterpret_cast<uintptr_t>(element) - _base) / unit;
    if (distance > mostDistance || _at == _end) [[unlikely]] {
      if (!makeRoom(element)) return;
      distance = (reinterpret_cast<uintptr_t>(element) - _base) / unit;
    }
    *_at++ =
        static_cast<uint32_t>(distance) | uint32_t{number} << numberShift | ended << endedShift;
  }
  void close() { ++_ended; }
  void addInstruction() { _hasInstructions = true; }
  void giveUp();

  // --- afterwards --------------------------------------------------------------------------------
  bool isComplete() const { return !_isGivenUp; }
  bool hasInstructions() const { return _hasInstructions; }
  // By number; the first one is none.
  const NSXMLIndexList<Name>& names() const { return _names; }
  uint64_t count() const;
  // Those that are single; null for none.
  [[nodiscard]] std::unique_ptr<const NSXMLSingleNames> singleNames() const;
  // Calls act(element, number, ended) for each element in document order.
  template <class Act>
  void forEach(Act act) const;

 private:
  static constexpr uintptr_t unit = 8;
  static constexpr uintptr_t mostDistance = UINT16_MAX;
  static constexpr uint32_t numberShift = 16;
  static constexpr uint32_t endedShift = 28;
  static constexpr size_t smallestPart = 64;
  static constexpr size_t largestPart = size_t{1} << 14;

  static void noteParent(Name& name, uint32_t parent) {
    name.isSingle &= parent > name.lastParent;
    name.lastParent = parent;
    ++name.count;
  }
  Number numberOf(const NSXMLName* name);
  Number addName(size_t place, const NSXMLName* name);
  void enterNames(size_t places);
  // Puts down a base that the element is near, and has room for its entry. False when given up.
  bool makeRoom(const NSXMLNode* element);
  void startPart();
  void push(uint32_t entry);

  // Room for entries, which are not set to anything at first.
  class Part {
   public:
    explicit Part(size_t size) : _entries(Allocator().allocate(size)), _size(size) {}
    Part(Part&& other) noexcept
        : _entries(std::exchange(other._entries, nullptr)), _size(other._size) {}
    Part& operator=(Part&&) = delete;
    ~Part() {
      if (_entries) Allocator().deallocate(_entries, _size);
    }
    uint32_t* begin() const { return _entries; }
    uint32_t* end() const { return _entries + _size; }
    size_t size() const { return _size; }

   private:
    using Allocator = ValueAllocator<uint32_t>;
    uint32_t* _entries;
    size_t _size;
  };

  uint32_t* _at = nullptr;  // in the last part
  uint32_t* _end = nullptr;
  uintptr_t _base = 0;
  uint32_t _ended = 0;
  bool _isGivenUp = false;
  bool _hasInstructions = false;
  NSXMLIndexList<Name> _names;
  NSXMLIndexList<Number> _places;  // 2^n, by name, at most half of them taken
  NSXMLIndexList<Part> _parts;     // all but the last one are full
};

template <class Act>
void NSXMLElementLog::forEach(Act act) const {
  if (_parts.empty()) return;
  const uintptr_t start = _base & ~(NSXMLRangeBytes - 1);
  uintptr_t base = 0;
  bool isBase = false;
  for (const Part& part : _parts) {
    const uint32_t* const end = &part == &_parts.back() ? _at : part.end();
    for (const uint32_t* at = part.begin(); at != end; ++at) {
      const uint32_t entry = *at;
      const uint32_t number = entry >> numberShift & mostNames;
      if (isBase) [[unlikely]] {
        base = start + uintptr_t{entry} * unit;
        isBase = false;
      } else if (number == 0) [[unlikely]] {
        isBase = true;
      } else {
        const uintptr_t address = base + (entry & mostDistance) * unit;
        act(reinterpret_cast<const NSXMLNode*>(address), number, entry >> endedShift);
      }
    }
  }
}

}  // namespace xquery
