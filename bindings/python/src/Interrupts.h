// Interrupts: what ends an evaluation that runs without the interpreter's lock.
//
// Python runs the handlers of signals on the main thread, when that is back in the interpreter; an
// evaluation is not. So while the main thread evaluates, a handler of our own stands before
// Python's: it raises the flag that the library looks at, and hands the signal on. Where the
// evaluation has ended the handlers run, and what they raise, KeyboardInterrupt unless the program
// has another handler, is raised. Where they raise nothing the evaluation has ended all the same,
// as a cancelled one.
//
// Evaluations of other threads go on at an interrupt: Python's own threads do. They end when their
// `Cancellation` is raised.
#pragma once

#include "Module.h"

#include <atomic>
#include <memory>
#include <mutex>
#include <vector>

namespace xquery::python {

// xquery.Cancellation: ends what is under way with it, and what begins with it later.
class Cancellation {
 public:
  using Flag = std::shared_ptr<std::atomic<bool>>;

  void raise();
  bool isRaised() const;
  // The flag is raised with this one until it is taken away.
  void add(Flag flag);
  void remove(const Flag& flag);

 private:
  mutable std::mutex _mutex;
  bool _isRaised = false;
  std::vector<Flag> _flags;
};

// Exists while the thread compiles or evaluates; made and gone with the interpreter's lock held.
class UnderWay {
 public:
  // `cancellation` may be null.
  explicit UnderWay(std::shared_ptr<Cancellation> cancellation);
  ~UnderWay();
  UnderWay(const UnderWay&) = delete;
  UnderWay& operator=(const UnderWay&) = delete;

  // For the limits; null where nothing can raise it.
  const Cancellation::Flag& flag() const { return _flag; }
  // To be called when the evaluation has ended: runs the handlers of signals that came meanwhile.
  void raiseWhatHandlersRaise() const;

 private:
  Cancellation::Flag _flag;
  std::shared_ptr<Cancellation> _cancellation;
  bool _isMain;
};

}  // namespace xquery::python
