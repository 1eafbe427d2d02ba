// The stack of the calling thread, for libraries that recurse with what they read.
#pragma once

#include <cstddef>
#include <functional>

namespace xquery {

// What is left of it below the caller's frame; without a bound where the system does not tell.
size_t stackLeft();

// Calls the function where that much stack is left: here, or else on a thread that is made for it,
// for which this one waits. What the function counts as work and as memory counts for this thread,
// whose limits end it, and what it throws is thrown here. Throws std::bad_alloc when no thread can
// be had.
void withStack(size_t bytes, const std::function<void()>& function);

}  // namespace xquery
