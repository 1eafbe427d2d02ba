// Programs that may recurse further than the stack goes.
#pragma once

#include "Plan/PlanTesting.h"

#include <string_view>

namespace xquery::plantest {

// Both ways agree, or both end at a limit: where the stack ends depends on the way.
inline void agreeUnlessLimited(std::string_view text, const Value& contextItem = {}) {
  const Outcome plain = outcomeOf(*compiled(text), contextItem);
  const Outcome planned = outcomeOf(*compiled(text, XQueryWay::Planned), contextItem);
  if (endedAtLimit(plain) && endedAtLimit(planned)) return;
  EXPECT_EQ(plain.lines, planned.lines) << text;
}

}  // namespace xquery::plantest
