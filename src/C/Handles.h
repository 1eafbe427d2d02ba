// What the handles of the C interface are, and how each of its functions enters the library.
//
//   handle      head: a tag, one number for each kind of handle
//               what it holds: references to the library's objects
//
// A function first looks at the tags of its handles: a null handle, one of another kind and, as
// long as its memory has not been used again, one that was freed have not the tag that they should
// have. Everything behind that runs under `guarded`, which turns whatever is thrown into a status.
#pragma once

#include "xquery/capi/basics.h"
#include "xquery/Object.h"

#include <cstdint>
#include <memory>
#include <utility>

namespace xquery::capi {

enum class Tag : uint32_t {
  Freed = 0x78710000,
  Cancel,
  Context,
  Error,
  Node,
  Options,
  Profile,
  Query,
  Resource,
  Value,
};

template <Tag tagOfKind>
class Handle {
 public:
  Handle(const Handle&) = delete;
  Handle& operator=(const Handle&) = delete;

  bool isOfKind() const { return _tag == tagOfKind; }

 protected:
  Handle() = default;
  // The tag is the one thing that may still be looked at, so the compiler must not drop the store.
  ~Handle() { const_cast<volatile Tag&>(_tag) = Tag::Freed; }

 private:
  Tag _tag = tagOfKind;
};

// Whether all handles are of the kind that they are said to be.
template <class... Handles>
bool areGood(const Handles*... handles) {
  return ((handles && handles->isOfKind()) && ...);
}

// A callback of the host has failed. Thrown through the engine, which lets pass what it does not
// know.
struct HostFailed {};

// The status for what is being thrown; only within a handler.
xq_status statusOfFailure() noexcept;

template <class Call>
xq_status guarded(Call call) noexcept {
  try {
    return call();
  } catch (...) {
    return statusOfFailure();
  }
}

// Hands a new handle to the host, with what it is made from.
template <class H, class... Arguments>
xq_status giveNew(H** out, Arguments&&... arguments) {
  *out = new H(std::forward<Arguments>(arguments)...);
  return XQ_OK;
}

template <class H>
xq_status freeHandle(H* handle) noexcept {
  if (!handle) return XQ_OK;
  if (!handle->isOfKind()) return XQ_USAGE;
  delete handle;
  return XQ_OK;
}

}  // namespace xquery::capi
