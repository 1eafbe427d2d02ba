// Calls of a host's own loader.
#pragma once

#include "xquery/Loading.h"

#include <functional>
#include <memory>
#include <optional>

namespace xquery {

// On this thread, unless its work may be ended: then on a thread of its own, so that a loader that
// does not answer is no reason to go on. `checkpoint` is called every few milliseconds meanwhile;
// what it throws leaves the call behind and passes through, as does what the loader throws.
std::optional<XQueryResource> loadFromHost(const std::shared_ptr<XQueryLoader>& loader,
                                           const NSURL& URL, XQueryLoadPurpose purpose,
                                           const std::function<void()>& checkpoint);

// Calls that nobody waits for any more. While there are as many no further one is begun.
constexpr int mostHostLoadsLeftBehind = 32;

}  // namespace xquery
