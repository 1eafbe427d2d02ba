// Query text: whatever the bytes are, they are a query or a list of errors, the same ones however
// it is compiled, and a query that is explained has a plan in every format. Mutations keep most of
// the grammar.
#include "support/Failure.h"
#include "support/QueryMutator.h"
#include "xquery/Warnings.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <chrono>
#include <cstring>
#include <string>

using namespace xquery;
using namespace xquery::fuzz;

namespace {

XQueryLoading nothing() {
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  return loading;
}

// What takes longer to compile is no finding of this target's.
XQueryLimits limits() {
  XQueryLimits found;
  found.duration = std::chrono::seconds(5);
  found.memoryCeiling = uint64_t{256} << 20;
  return found;
}

std::string errorsOf(const XQuery& query) {
  std::string text;
  const auto errors = query.parseErrors();
  if (!errors) return text;
  check(errors->count() > 0, "no errors in a list of errors");
  for (const Value& each : errors->objects()) {
    const auto* error = cast<XQueryError>(each);
    const std::string line = error->description()->utf8();
    check(!line.empty(), "an error without a description");
    text += std::to_string(error->err()) + " " + std::to_string(error->line()) + " " + line + "\n";
  }
  return text;
}

bool isLimit(const std::string& errors) {
  return errors.find("limit: ") != std::string::npos;
}

void checkExplained(const XQuery& query) {
  using enum XQueryPlanFormat;
  for (const auto format : {Text, JSON, DOT}) {
    const auto plan = query.planDescription(format);
    check(plan != nullptr, "explained without a plan");
  }
  for (const XQueryWarning& warning : XQueryWarnings(query)) {
    check(!warning.identifier.empty() && warning.text, "a warning without a text");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  const auto compiled = [&](XQueryWay way) {
    return XQuery::xqueryWithSource(text, nothing(), limits(), way);
  };
  const auto plain = compiled(XQueryWay::Plain);
  const std::string errors = errorsOf(*plain);
  const auto explained = compiled(XQueryWay::Explained);
  const std::string others = errorsOf(*explained);
  if (isLimit(errors) || isLimit(others)) return 0;
  checkEqual(others, errors, "other errors when it is planned");
  if (errors.empty()) checkExplained(*explained);
  return 0;
}

extern "C" size_t LLVMFuzzerMutate(uint8_t* data, size_t size, size_t most);

extern "C" size_t LLVMFuzzerCustomMutator(uint8_t* data, size_t size, size_t most, unsigned seed) {
  if (seed % 4 == 0) return LLVMFuzzerMutate(data, size, most);
  const std::string changed =
      QueryMutator(seed).mutated(std::string(reinterpret_cast<const char*>(data), size), most);
  const size_t count = std::min(most, changed.size());
  std::memcpy(data, changed.data(), count);
  return count;
}
