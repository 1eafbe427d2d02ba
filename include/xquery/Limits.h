// What an evaluation or a compilation may take before it is ended.
//
// Reaching a limit ends it with error 0 and a message that begins with "limit: ". No limit is set
// unless the host sets one; two hold always: nesting, by the stack of the calling thread ("limit:
// expression nested too deeply"), and the memory of the machine.
//
//   XQueryLimits limits;
//   limits.duration = std::chrono::seconds(2);
//   limits.cancelled = std::make_shared<std::atomic<bool>>(false);
//   limits.memoryCeiling = 512 * 1024 * 1024;
//   auto query = XQuery::xqueryWithSource(text, XQueryLoading(), limits);
//   context->contextSetLimits(limits);
//   ... on another thread: limits.cancelled->store(true);
//
// Time and flag are looked at often enough that an evaluation stops within a tenth of a second, the
// freeing of what it made included: where that is much, a thread of the library frees it afterwards
// and ends by itself. A fork of the process, and a change of which tree a node belongs to outside
// of any evaluation, wait for such a thread.
#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <memory>
#include <optional>

namespace xquery {

struct XQueryLimits {
  // How long one evaluation or compilation may take: "limit: deadline passed". Counted from its
  // beginning; zero or less ends it at once.
  std::optional<std::chrono::nanoseconds> duration;
  // The time after which no evaluation goes on; with a duration as well the earlier one counts.
  std::optional<std::chrono::steady_clock::time_point> deadline;
  // Another thread sets it to end the evaluation, and those that begin while it is set: "limit:
  // evaluation cancelled". The engine never clears it; several contexts may share one. Null for
  // none.
  std::shared_ptr<std::atomic<bool>> cancelled;
  // Bytes that the values made by one evaluation may take at a time: "limit: memory ceiling
  // reached". Counted are atomic values and their texts and digits, sequences, constructed nodes,
  // documents read while evaluating with their names, texts being put together, frames of
  // variables, what is noted of a query that is compiled while evaluating, and all that a
  // stylesheet works on; what is freed again no longer counts. Not counted are what exists before
  // the evaluation begins, the stack, names of nodes that stand alone, and lists that are kept only
  // while a path, a comparison or a sort is worked out, which are in proportion to what they work
  // on. A block of 64 KiB or more that would exceed the ceiling is not made; smaller ones, and what
  // a stylesheet asks for, may exceed it by some megabytes before it is noticed.
  std::optional<uint64_t> memoryCeiling;
};

}  // namespace xquery
