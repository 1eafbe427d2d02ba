// The bounds on evaluation: nesting, by the stack space that is really left on the calling thread,
// and the limits that the host set. Evaluation and binding recurse with the nesting of the query,
// which has no other limit.
#pragma once

#include "Platform/Base/WorkMeter.h"

#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryContext;
class XQueryContextInternal;
class XQueryProlog;

// Whether enough stack is left to go one level deeper.
bool XQueryStackHasRoom();

// Down to which address a stack of that size, whose lowest address is the base, may grow. Of a very
// large one, such as a main thread's after "ulimit -s unlimited", not all is used: an endless
// recursion would take all memory before it came to the end, or the time that a limit has.
uintptr_t XQueryLowestStackAddress(uintptr_t base, size_t size);

// What XQueryCheckStack does when its two comparisons do not settle the matter.
void XQueryCheckStackClosely(XQueryContext& context);

// Where the stack ends at the moment. Asking for the frame's address instead would give every
// caller a frame, even those whose last call is a jump.
[[gnu::always_inline]] inline uintptr_t XQueryStackAddress() {
#if defined(__x86_64__)
  uintptr_t address;
  __asm__("movq %%rsp, %0" : "=r"(address));
  return address;
#elif defined(__aarch64__)
  uintptr_t address;
  __asm__("mov %0, sp" : "=r"(address));
  return address;
#else
  return reinterpret_cast<uintptr_t>(__builtin_frame_address(0));
#endif
}

// For every call and every nested expression, once per evaluation of it: raises error 0 "limit:
// expression nested too deeply" when too little stack is left, and counts a step of work, which
// raises the error of the context's limit that is reached. A loop inside an expression whose turns
// evaluate nothing has a WorkPacer besides.
[[gnu::always_inline]] inline void XQueryCheckStack(XQueryContext& context) {
  if (XQueryStackAddress() <= workMeter.stackLimit || --workMeter.stepsLeft <= 0) [[unlikely]] {
    XQueryCheckStackClosely(context);
  }
}
// Before work of a library that takes so many bytes of the stack, of which a small one may not have
// enough left even where evaluation may go on: raises the same error then.
inline constexpr size_t XQueryMostLibraryStack = 256 * 1024;
void XQueryCheckStackFor(XQueryContextInternal& context, size_t bytes);
// The same while binding. Nesting too deep adds the error to the prolog (once) and answers false; a
// limit that is reached ends the evaluation that the binding is part of, if any.
bool XQueryCheckStack(XQueryProlog& prolog);

}  // namespace xquery
