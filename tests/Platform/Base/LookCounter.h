// Ends the work of the thread at a given look.
#pragma once

#include "Platform/Base/WorkMeter.h"

namespace xquery {

struct Ended {};

// Throws `Ended` at each look from that one on, counted from 0; asks for one at every step.
class LookCounter final : public WorkWatcher {
 public:
  explicit LookCounter(int looks) : _looksLeft(looks), _outer(workMeter) {
    workMeter.watcher = this;
    workMeter.stepsLeft = 0;
  }
  ~LookCounter() {
    workMeter.watcher = _outer.watcher;
    workMeter.stepsLeft = _outer.stepsLeft;
  }
  LookCounter(const LookCounter&) = delete;
  LookCounter& operator=(const LookCounter&) = delete;
  void lookAtWork() override {
    workMeter.stepsLeft = 0;
    if (_looksLeft-- <= 0) throw Ended();
  }

 private:
  int _looksLeft;
  const WorkMeter _outer;
};

}  // namespace xquery
