#include "Platform/Base/Abandoned.h"

#include "Platform/Base/ObjectBlocks.h"
#include "Platform/Base/WorkerThread.h"
#include "Platform/Base/WorkMeter.h"

#include <atomic>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <new>
#include <pthread.h>
#include <utility>

namespace xquery {

namespace {

// More would only compete with those who evaluate; then each frees its own.
constexpr int mostThreads = 4;
// Destruction nests to a fixed depth.
constexpr size_t stackBytes = size_t{256} << 10;

class Threads {
 public:
  static Threads& shared() {
    // Never destroyed: a thread may still be at work when the process ends.
    static auto* const threads = new Threads;
    return *threads;
  }

  bool begin() {
    const std::lock_guard lock(_mutex);
    if (_count == mostThreads) return false;
    ++_count;
    return true;
  }
  void end() {
    const std::lock_guard lock(_mutex);
    --_count;
    _changed.notify_all();
  }
  void wait() {
    if (_count == 0) return;
    std::unique_lock lock(_mutex);
    _changed.wait(lock, [this] { return _count == 0; });
  }
  // Until it is released on the same thread, or on the copy of it in a child process.
  void hold() {
    std::unique_lock lock(_mutex);
    _changed.wait(lock, [this] { return _count == 0; });
    static_cast<void>(lock.release());
  }
  void release() { _mutex.unlock(); }

 private:
  std::mutex _mutex;
  std::condition_variable _changed;
  std::atomic<int> _count = 0;
};

// A child process would have no such thread, and for ever the locks that it held. From before the
// fork until after it none begins.
[[gnu::constructor]] void waitAtFork() {
  ::pthread_atfork([] { Threads::shared().hold(); }, [] { Threads::shared().release(); },
                   [] { Threads::shared().release(); });
}

// Signed like the count of a thread.
using Bytes = std::shared_ptr<std::atomic<int64_t>>;

// Freed by others for this thread; null as long as nobody did.
thread_local Bytes freedElsewhere;

}  // namespace

constinit thread_local AbandonedValues* abandonedValues __attribute__((tls_model("initial-exec"))) =
    nullptr;

bool AbandonedValues::add(const Entry& entry) noexcept {
  try {
    _entries.push_back(entry);
    return true;
  } catch (const std::bad_alloc&) {
    return false;
  }
}

bool AbandonedValues::isOver() noexcept {
  if (_isReached && _isReached(_evaluation)) _isReached = nullptr;
  return !_isReached;
}

bool AbandonedValues::take(const void* object, Free free, size_t parts) noexcept {
  if (_isReached || parts < manyParts || !add({object, free})) return false;
  _parts += parts;
  return true;
}

struct AbandonedValues::Job {
  std::vector<Entry> entries;
  Bytes freed;
};

void AbandonedValues::freeEach(const std::vector<Entry>& entries) {
  for (const Entry& entry : entries) entry.free(entry.object);
}

void* AbandonedValues::work(void* argument) {
  std::unique_ptr<Job> job(static_cast<Job*>(argument));
  freeEach(job->entries);
  job->freed->fetch_sub(workMeter.valueBytes, std::memory_order_relaxed);
  job.reset();
  giveFreeBlocks();
  Threads::shared().end();
  return nullptr;
}

// Whether a thread has taken all.
bool AbandonedValues::handOver() {
  if (!Threads::shared().begin()) return false;
  try {
    if (!freedElsewhere) freedElsewhere = std::make_shared<std::atomic<int64_t>>(0);
    std::unique_ptr<Job> job(new Job{_entries, freedElsewhere});
    pthread_t thread;
    if (startWorkerThread(thread, stackBytes, work, job.get())) {
      static_cast<void>(job.release());
      ::pthread_detach(thread);
      return true;
    }
  } catch (const std::bad_alloc&) {
    // Nor is there memory for a thread.
  }
  Threads::shared().end();
  return false;
}

void AbandonedValues::freeHere() noexcept {
  freeEach(_entries);
  _entries.clear();
  _parts = 0;
}

void AbandonedValues::passTo(AbandonedValues& outer) noexcept {
  for (const Entry& entry : _entries) {
    if (!outer.add(entry)) entry.free(entry.object);
  }
  outer._parts += _parts;
  _entries.clear();
  _parts = 0;
}

AbandonedValues::~AbandonedValues() {
  if (_parts < manyPartsInAll || !handOver()) freeEach(_entries);
}

void settleAbandonedValues() {
  if (freedElsewhere) {
    workMeter.valueBytes -= freedElsewhere->exchange(0, std::memory_order_relaxed);
  }
}

void waitForAbandonedValues() {
  Threads::shared().wait();
}

}  // namespace xquery
