#include "Context/StackGuard.h"
#include "Engine/LimitsTestSupport.h"
#include "Platform/Base/WorkMeter.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <sys/resource.h>

namespace xquery {
namespace {

constexpr uintptr_t base = 0x10000000;
constexpr size_t kibibyte = 1024;
constexpr size_t gibibyte = size_t{1} << 30;

size_t usedOf(size_t size) {
  return base + size - XQueryLowestStackAddress(base, size);
}

TEST(StackGuard, LeavesThePartBelowTheDeepestFrameFree) {
  const size_t kept = XQueryLowestStackAddress(base, 8192 * kibibyte) - base;
  EXPECT_GE(kept, 256 * kibibyte);
  EXPECT_EQ(XQueryLowestStackAddress(base, 65536 * kibibyte) - base, kept);
}

TEST(StackGuard, OfASmallStackHalfIsUsed) {
  EXPECT_EQ(usedOf(128 * kibibyte), 64 * kibibyte);
  EXPECT_EQ(usedOf(0), 0U);
}

TEST(StackGuard, OfAVeryLargeStackNotAllIsUsed) {
  const size_t most = usedOf(64 * gibibyte);
  EXPECT_LE(most, gibibyte);
  EXPECT_GE(most, gibibyte / 8);
  EXPECT_EQ(usedOf(2 * gibibyte), most);
  EXPECT_EQ(usedOf(100000 * gibibyte), most);
}

// Sets a limit of the process for a while.
class ProcessLimit {
 public:
  ProcessLimit(__rlimit_resource_t resource, rlim_t value) : _resource(resource) {
    getrlimit(resource, &_former);
    const rlimit limit = {value, _former.rlim_max};
    EXPECT_EQ(setrlimit(resource, &limit), 0);
  }
  ~ProcessLimit() { setrlimit(_resource, &_former); }
  ProcessLimit(const ProcessLimit&) = delete;
  ProcessLimit& operator=(const ProcessLimit&) = delete;

 private:
  const __rlimit_resource_t _resource;
  rlimit _former = {};
};

// What the system library opens to find the main thread's stack cannot be opened then.
TEST(StackGuard, HoldsOnAMainThreadThatCannotOpenFiles) {
  const ProcessLimit stack(RLIMIT_STACK, rlim_t{8} << 20);
  const ProcessLimit files(RLIMIT_NOFILE, 0);
  const auto context = XQueryContext::xqueryContext();
  workMeter.stackLimit = UINTPTR_MAX;
  EXPECT_EQ(limitstest::evaluate(*context,
                                 "declare function local:f($n) { 1 + local:f($n) }; "
                                 "local:f(0)")
                .error,
            "limit: expression nested too deeply");
  EXPECT_EQ(limitstest::evaluate(*context,
                                 "declare function local:f($n) { if ($n = 0) then 0 "
                                 "else 1 + local:f($n - 1) }; local:f(1000)")
                .result,
            "1000");
  workMeter.stackLimit = UINTPTR_MAX;
}

}  // namespace
}  // namespace xquery
