#include "Platform/Loading/HostLoad.h"

#include "Platform/Base/HostFailure.h"
#include "Platform/Base/WorkerThread.h"
#include "Platform/Base/WorkMeter.h"

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <exception>
#include <mutex>
#include <pthread.h>
#include <thread>
#include <utility>

namespace xquery {

namespace {

constexpr auto timeBetweenLooks = std::chrono::milliseconds(5);
// What a thread has where nobody says otherwise.
constexpr size_t stackBytes = size_t{8} << 20;

std::atomic<int> leftBehind = 0;

// A watcher that has nothing to look for lets its thread work on for as good as ever.
bool workMayBeEnded() {
  return workMeter.watcher && workMeter.stepsLeft < WorkMeter::manySteps / 2;
}

std::optional<XQueryResource> callHere(XQueryLoader& loader, const NSURL& URL,
                                       XQueryLoadPurpose purpose) {
  return passingOnHostFailures([&] { return loader.load(URL, purpose); });
}

// Owned by the caller and by the thread of the call, whichever lives longer.
class HostLoad : public std::enable_shared_from_this<HostLoad> {
 public:
  HostLoad(std::shared_ptr<XQueryLoader> loader, const NSURL& URL, XQueryLoadPurpose purpose)
      : _loader(std::move(loader)), _URL(&const_cast<NSURL&>(URL)), _purpose(purpose) {}

  std::optional<XQueryResource> run(const std::function<void()>& checkpoint) {
    pthread_t thread;
    _self = shared_from_this();
    if (!startWorkerThread(thread, stackBytes, start, this)) {
      _self = nullptr;
      return callHere(*_loader, *_URL, _purpose);
    }
    try {
      waitFor(checkpoint);
    } catch (...) {
      isLeftBehind() ? pthread_detach(thread) : pthread_join(thread, nullptr);
      throw;
    }
    pthread_join(thread, nullptr);
    if (_thrown) std::rethrow_exception(std::exchange(_thrown, nullptr));
    return std::move(_resource);
  }

 private:
  static void* start(void* self) {
    auto load = std::move(static_cast<HostLoad*>(self)->_self);
    load->work();
    return nullptr;
  }

  void work() {
    std::optional<XQueryResource> resource;
    std::exception_ptr thrown;
    try {
      resource = callHere(*_loader, *_URL, _purpose);
    } catch (...) {
      thrown = std::current_exception();
    }
    const std::lock_guard lock(_mutex);
    _resource = std::move(resource);
    _thrown = std::move(thrown);
    _isDone = true;
    if (_isLeftBehind) --leftBehind;
    _done.notify_all();
  }

  void waitFor(const std::function<void()>& checkpoint) {
    std::unique_lock lock(_mutex);
    while (!_done.wait_for(lock, timeBetweenLooks, [this] { return _isDone; })) {
      lock.unlock();
      checkpoint();
      lock.lock();
    }
  }

  bool isLeftBehind() {
    const std::lock_guard lock(_mutex);
    if (_isDone) return false;
    _isLeftBehind = true;
    ++leftBehind;
    return true;
  }

  const std::shared_ptr<XQueryLoader> _loader;
  const Ref<NSURL> _URL;
  const XQueryLoadPurpose _purpose;
  std::shared_ptr<HostLoad> _self;  // for the thread to take

  std::mutex _mutex;
  std::condition_variable _done;
  bool _isDone = false;
  bool _isLeftBehind = false;
  std::optional<XQueryResource> _resource;
  std::exception_ptr _thrown;
};

}  // namespace

std::optional<XQueryResource> loadFromHost(const std::shared_ptr<XQueryLoader>& loader,
                                           const NSURL& URL, XQueryLoadPurpose purpose,
                                           const std::function<void()>& checkpoint) {
  if (!workMayBeEnded()) return callHere(*loader, URL, purpose);
  while (leftBehind >= mostHostLoadsLeftBehind) {
    checkpoint();
    std::this_thread::sleep_for(timeBetweenLooks);
  }
  return std::make_shared<HostLoad>(loader, URL, purpose)->run(checkpoint);
}

}  // namespace xquery
