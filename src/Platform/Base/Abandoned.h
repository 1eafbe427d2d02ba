// What an evaluation that is ended at a limit leaves behind, freed where nobody waits for it.
//
// Giving values back takes a good part of the time that making them took, so that after some
// seconds of making them the end would come late by some tenths. From the moment on in which a
// limit is reached, a large list or tree whose last reference goes is set aside whole; when the
// evaluation is over, a thread of its own frees them. What does not add up to a few milliseconds is
// freed at once, so that most processes never have such a thread.
//
// What goes before is freed at once, but a very large list or tree may take longer than a limit
// gives. It is freed in parts, and set aside when a limit turns out to be reached between them.
//
// The memory counts for the thread that made the values until it is free.
#pragma once

#include <cstddef>
#include <vector>

namespace xquery {

class AbandonedValues {
 public:
  using Free = void (*)(const void* object);
  using Ask = bool (*)(void* evaluation) noexcept;

  // Fewer parts are not worth an entry; fewer in all, not a thread.
  static constexpr size_t manyParts = 1024;
  static constexpr size_t manyPartsInAll = 20'000;
  // That are freed before anybody asks: a few milliseconds.
  static constexpr size_t partsPerLook = 16'384;

  // Of an evaluation that is asked whether a limit is reached; null for one that is over.
  explicit AbandonedValues(Ask isReached = nullptr, void* evaluation = nullptr)
      : _isReached(isReached), _evaluation(evaluation) {}
  ~AbandonedValues();
  AbandonedValues(const AbandonedValues&) = delete;
  AbandonedValues& operator=(const AbandonedValues&) = delete;

  // Whether a limit is reached. Until then nothing is taken; once it is, it stays so.
  bool isOver() noexcept;
  void setOver() { _isReached = nullptr; }

  // To be freed later by that function, on any thread; false when it is to be freed now. The parts
  // are the objects and blocks that go with it.
  bool take(const void* object, Free free, size_t parts) noexcept;
  // For an evaluation within another one: the other one frees them.
  void passTo(AbandonedValues& outer) noexcept;
  // For an evaluation within another one that goes on: that one may still change trees of nodes
  // that are in the lists.
  void freeHere() noexcept;

 private:
  struct Entry {
    const void* object;
    Free free;
  };
  struct Job;

  bool add(const Entry& entry) noexcept;
  static void freeEach(const std::vector<Entry>& entries);
  static void* work(void* job);
  bool handOver();

  Ask _isReached;
  void* const _evaluation;
  std::vector<Entry> _entries;
  size_t _parts = 0;
};

// Where this thread sets aside what goes; null without limits.
extern constinit thread_local AbandonedValues* abandonedValues
    __attribute__((tls_model("initial-exec")));

// Uncounts what others have freed for this thread since it last asked.
void settleAbandonedValues();

// Until all that was left behind is free. Whoever changes which tree nodes belong to, of nodes that
// an evaluation that has ended may have held, has to wait.
void waitForAbandonedValues();

}  // namespace xquery
