// abs, floor, ceiling and the two ways to round.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <cmath>

namespace xquery::arguments {
namespace {

// The value in the type of the argument, for values that no rounding changes as given.
Item inTypeOf(const Item& item, double value) {
  const double given = numericValue(item);
  if (value == given || std::isnan(given)) return item;
  return numberOf(item.type, value);
}

Rule applied(double (*work)(double)) {
  return [=](const Call& call) -> Sequence {
    const std::optional<Item> item = promotedToNumeric(call[0]);
    if (!item) return {};
    return one(inTypeOf(*item, work(numericValue(*item))));
  };
}

double halfUp(double value) {
  return std::floor(value + 0.5);
}

// A negative number has no absolute value in the types that hold none above zero.
Sequence absolute(const Call& call) {
  const std::optional<Item> item = promotedToNumeric(call[0]);
  if (!item) return {};
  const double value = std::fabs(numericValue(*item));
  const bool holdsNoPositive = item->type == 45 || item->type == 46;
  if (holdsNoPositive && value > 0) fail(6, noMatch);
  return one(inTypeOf(*item, value));
}

Sequence halfToEven(const Call& call) {
  Attempts attempt;
  const auto item = attempt([&] { return promotedToNumeric(call[0]); });
  std::optional<Item> precision = integer(0);
  if (call.count() > 1) precision = attempt([&] { return promotedToInteger(call[1]); });
  attempt.finish();
  if (!precision) {
    // What an empty precision does is open.
    call.orRefused();
    call.orElse("()");
    precision = integer(0);
  }
  if (!item) return {};
  const double value = numericValue(*item);
  const double places = numericValue(*precision);
  if (places >= 1 || !std::isfinite(value)) return one(*item);
  const double unit = std::pow(10.0, -places);
  if (std::isinf(unit) || std::fabs(value) < unit / 2) {
    const bool holdsNoZero = item->type == 44 || item->type == 46;
    if (holdsNoZero) fail(6, noMatch);
    return one(numberOf(item->type, 0));
  }
  // Neighbours of a size at which a double is no longer exact.
  if (unit > 1e22) return one(anyOf(item->type));
  return one(inTypeOf(*item, std::nearbyint(value / unit) * unit));
}

}  // namespace

const std::vector<Function>& numericFunctions() {
  static const std::vector<Function> functions = {
      {"fn:abs", 1, 1, absolute},
      {"fn:floor", 1, 1, applied(std::floor)},
      {"fn:ceiling", 1, 1, applied(std::ceil)},
      {"fn:round", 1, 1, applied(halfUp)},
      {"fn:round-half-to-even", 1, 2, halfToEven},
  };
  return functions;
}

TEST(NumericArguments, EndAsTheRulesSay) {
  expectRules(numericFunctions());
}

}  // namespace xquery::arguments
