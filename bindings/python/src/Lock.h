// The interpreter's lock, taken and let go of as C++ survives it.
//
// Threads live on when the interpreter ends, which then ends each thread that asks for the lock, by
// unwinding it. C++ does not survive that where it leaves a destructor, or functions of the
// library. So a thread that is ended stays where it is for as long as the process has left.
#pragma once

#include <cxxabi.h>
#include <pybind11/pybind11.h>
#include <unistd.h>

namespace xquery::python {

[[noreturn]] inline void stay() {
  for (;;) pause();
}

// Without the lock as long as it lives.
class Unlocked {
 public:
  Unlocked() : _state(PyEval_SaveThread()) {}
  ~Unlocked() {
    try {
      PyEval_RestoreThread(_state);
    } catch (abi::__forced_unwind&) {
      stay();
    }
  }
  Unlocked(const Unlocked&) = delete;
  Unlocked& operator=(const Unlocked&) = delete;

 private:
  PyThreadState* _state;
};

// Calls a function with the lock held, on any thread; what it throws is thrown.
template <class Function>
auto locked(Function function) {
  try {
    const pybind11::gil_scoped_acquire acquired;
    // Here already, since a thread that is ended has no lock to give back.
    try {
      return function();
    } catch (abi::__forced_unwind&) {
      stay();
    }
  } catch (abi::__forced_unwind&) {
    stay();
  }
}

}  // namespace xquery::python
