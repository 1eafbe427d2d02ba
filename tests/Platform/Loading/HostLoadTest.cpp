// Loaders of a host's own that do not answer, or fail.
#include "Platform/Base/HostFailure.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Loading/HostLoad.h"
#include "Platform/Loading/LoadingTestSupport.h"

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <new>
#include <stdexcept>
#include <thread>
#include <vector>

namespace xquery {
namespace {

struct Ended {};

// Whoever works under it may be ended; it is after some looks.
class Watcher final : public WorkWatcher {
 public:
  explicit Watcher(int looks) : _looks(looks) {
    workMeter.watcher = this;
    workMeter.stepsLeft = 1000;
  }
  ~Watcher() {
    workMeter.watcher = nullptr;
    workMeter.stepsLeft = WorkMeter::manySteps;
  }
  void lookAtWork() override {
    if (--_looks < 0) throw Ended();
  }

 private:
  int _looks;
};

constexpr int manyLooks = 1'000'000;

// Answers when it is told to, "late" or the thread that it was called on.
class Gate : public XQueryLoader {
 public:
  std::optional<XQueryResource> load(const NSURL&, XQueryLoadPurpose) override {
    thread = std::this_thread::get_id();
    std::unique_lock lock(_mutex);
    ++calls;
    _opened.wait(lock, [this] { return _isOpen; });
    ++answers;
    if (toThrow) std::rethrow_exception(toThrow);
    return XQueryResource{"answer", {}, {}, {}};
  }
  void open() {
    const std::lock_guard lock(_mutex);
    _isOpen = true;
    _opened.notify_all();
  }
  std::thread::id thread;
  std::atomic<int> calls = 0;
  std::atomic<int> answers = 0;
  std::exception_ptr toThrow;

 private:
  std::mutex _mutex;
  std::condition_variable _opened;
  bool _isOpen = false;
};

std::string load(const std::shared_ptr<Gate>& gate) {
  const auto resource =
      loadFromHost(gate, *URLOf("app:a"), XQueryLoadPurpose::Document, lookAtWork);
  return resource ? resource->data : "(nothing)";
}

void waitUntil(const std::function<bool()>& isSo) {
  while (!isSo()) std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

TEST(HostLoad, IsOfTheCallingThreadWhereNothingMayEndIt) {
  const auto gate = std::make_shared<Gate>();
  gate->open();
  EXPECT_EQ(load(gate), "answer");
  EXPECT_EQ(gate->thread, std::this_thread::get_id());
  const Watcher watcher(manyLooks);
  workMeter.stepsLeft = WorkMeter::manySteps;
  EXPECT_EQ(load(gate), "answer");
  EXPECT_EQ(gate->thread, std::this_thread::get_id());
  workMeter.stepsLeft = 1000;
  EXPECT_EQ(load(gate), "answer");
  EXPECT_NE(gate->thread, std::this_thread::get_id());
}

TEST(HostLoad, IsLeftBehindWhereItDoesNotAnswer) {
  const auto gate = std::make_shared<Gate>();
  {
    const Watcher watcher(3);
    EXPECT_THROW(load(gate), Ended);
  }
  EXPECT_EQ(gate->answers, 0);
  gate->open();
  waitUntil([&] { return gate->answers == 1; });
}

TEST(HostLoad, KeepsTheLoaderUntilItHasAnswered) {
  auto gate = std::make_shared<Gate>();
  const std::weak_ptr<Gate> kept = gate;
  {
    const Watcher watcher(3);
    EXPECT_THROW(load(gate), Ended);
  }
  Gate& raw = *gate;
  gate = nullptr;
  EXPECT_FALSE(kept.expired());
  raw.open();
  waitUntil([&] { return kept.expired(); });
}

TEST(HostLoad, WaitsForItsTurnWhileManyAreLeftBehind) {
  const auto gate = std::make_shared<Gate>();
  for (int count = 0; count < mostHostLoadsLeftBehind; ++count) {
    const Watcher watcher(2);
    EXPECT_THROW(load(gate), Ended);
  }
  waitUntil([&] { return gate->calls == mostHostLoadsLeftBehind; });
  const auto next = std::make_shared<Gate>();
  next->open();
  {
    const Watcher watcher(3);
    EXPECT_THROW(load(next), Ended);
  }
  EXPECT_EQ(next->calls, 0);
  gate->open();
  const Watcher watcher(manyLooks);
  EXPECT_EQ(load(next), "answer");
}

TEST(HostLoad, PassesOnWhatTheLoaderThrows) {
  const auto gate = std::make_shared<Gate>();
  gate->open();
  gate->toThrow = std::make_exception_ptr(std::runtime_error("mine"));
  EXPECT_THROW(load(gate), std::runtime_error);
  {
    const Watcher watcher(manyLooks);
    EXPECT_THROW(load(gate), std::runtime_error);
  }
  // These mean something else inside the engine.
  for (const auto& thrown : {std::make_exception_ptr(std::bad_alloc()),
                             std::make_exception_ptr(std::length_error("mine"))}) {
    gate->toThrow = thrown;
    EXPECT_THROW(load(gate), HostFailure);
    const Watcher watcher(manyLooks);
    EXPECT_THROW(load(gate), HostFailure);
  }
}

}  // namespace
}  // namespace xquery
