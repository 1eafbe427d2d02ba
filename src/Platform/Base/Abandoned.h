// What an evaluation that is ended at a limit leaves behind, freed where nobody waits for it.
//
// Giving values back takes a good part of the time that making them took, so that after some
// seconds of making them the end would come late by some tenths. From the moment on in which a
// limit is reached, a large list or tree whose last reference goes is set aside whole; when the
// evaluation is over, a thread of its own frees them. What does not add up to a few milliseconds is
// freed at once, so that most processes never have such a thread.
//
//   AbandonedValues abandoned;        // of the evaluation
//   abandonedValues = &abandoned;     // the limit is reached
//   ...                               // on its way out
//   abandonedValues = nullptr;
//
// The memory counts for the thread that made the values until it is free.
#pragma once

#include <cstddef>
#include <vector>

namespace xquery {

class AbandonedValues {
 public:
  using Free = void (*)(const void* object);

  // Fewer parts are not worth an entry; fewer in all, not a thread.
  static constexpr size_t manyParts = 1024;
  static constexpr size_t manyPartsInAll = 20'000;

  AbandonedValues() = default;
  ~AbandonedValues();
  AbandonedValues(const AbandonedValues&) = delete;
  AbandonedValues& operator=(const AbandonedValues&) = delete;

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

  std::vector<Entry> _entries;
  size_t _parts = 0;
};

// Where this thread sets aside what goes; null as long as it frees everything itself.
extern constinit thread_local AbandonedValues* abandonedValues
    __attribute__((tls_model("initial-exec")));

// Uncounts what others have freed for this thread since it last asked.
void settleAbandonedValues();

// Until all that was left behind is free. Whoever changes which tree nodes belong to, of nodes that
// an evaluation that has ended may have held, has to wait.
void waitForAbandonedValues();

}  // namespace xquery
