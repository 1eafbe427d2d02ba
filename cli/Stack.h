// Room for deep recursion: a query may recurse as deep as the stack is, so the work wants a large
// one: a hundred thousand calls within clauses and constructors find room. Only what is used of it
// is ever touched.
//
// The stack of the main thread grows up to a limit, which is raised, as far as there is room below
// it: what the kernel left free there when the program started. That was at random, at least half
// of what is wanted and nearly always all; where it is not, the program is started anew, so that
// the limit makes the room. Starting takes as long again, which is why it is looked at first. A
// thread with a large stack would do without either, but a process with two threads counts
// references and allocates with atomic steps: arithmetic over a range took 1.7 times as long. It
// remains for where the limit cannot be raised, and for where the address space is bounded: the
// room for a thread's stack is taken beforehand, whereas a main thread that finds none when its
// stack grows is killed.
#pragma once

#include <functional>
#include <optional>
#include <pthread.h>

namespace cli {

// Comes back on a main thread with a large stack, started anew if need be, or where it cannot have
// one. To be called before anything else.
void takeLargeStack(char** argv);

// Runs the work, on this thread where its stack is large and on another one otherwise. False when
// no thread can be started.
bool runOnLargeStack(const std::function<void()>& work);

// A thread with a large stack, or as large a one as is to be had, when there will be so many; to be
// joined. `work` must outlive it. Nothing when there is no room for one.
std::optional<pthread_t> startWithLargeStack(const std::function<void()>& work, unsigned threads);

}  // namespace cli
