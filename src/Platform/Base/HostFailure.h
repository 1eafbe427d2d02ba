// What a host's own code throws, on its way through the engine to whoever called it.
#pragma once

#include <exception>
#include <new>
#include <stdexcept>

namespace xquery {

// In place of an exception that would be taken for a failure of the engine's own.
struct HostFailure {
  std::exception_ptr thrown;

  // Where the engine is left.
  [[noreturn]] void giveBack() const { std::rethrow_exception(thrown); }
};

// Calls the host.
template <class Call>
auto passingOnHostFailures(Call call) {
  try {
    return call();
  } catch (const std::bad_alloc&) {
    throw HostFailure{std::current_exception()};
  } catch (const std::length_error&) {
    throw HostFailure{std::current_exception()};
  }
}

}  // namespace xquery
