// sum, avg, max and min.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>

namespace xquery::arguments {
namespace {

Sequence summands(const Sequence& value) {
  Sequence items = atomized(value);
  for (Item& item : items) {
    if (item.type == 8) item = castItem(item, 11);
  }
  return items;
}

bool isNaN(const Item& item) {
  return item.text == "NaN" && isNumericType(item.type);
}

bool isOrderedDuration(int type) {
  return type == 28 || type == 29;
}

bool canBeSummed(const Item& item) {
  const bool isDate = item.type >= 16 && item.type <= 23;
  return isNumericType(item.type) || isDate || isOrderedDuration(item.type);
}

std::string monthsText(double months) {
  const int64_t size = std::llabs(static_cast<int64_t>(months));
  std::string text = months < 0 ? "-P" : "P";
  if (size >= 12) text += std::to_string(size / 12) + "Y";
  if (size < 12 || size % 12) text += std::to_string(size % 12) + "M";
  return text;
}

int commonType(int a, int b) {
  if (a == b) return a;
  if (a == 11 || b == 11 || a == 12 || b == 12) return 11;
  return a == 13 || b == 13 ? 13 : 42;
}

Item plus(const Item& a, const Item& b) {
  if (a.type == 28 && b.type == 28) return {28, monthsText(durationValue(a) + durationValue(b))};
  if (!isNumericType(a.type) || !isNumericType(b.type)) fail(6, invalidOperator);
  return numberOf(commonType(a.type, b.type), numericValue(a) + numericValue(b));
}

Sequence sumOf(const Sequence& items) {
  if (isNaN(items[0])) return one(items[0]);
  if (!canBeSummed(items[0])) throw Refused();
  Item total = items[0];
  for (size_t i = 1; i < items.size(); ++i) {
    if (isNaN(items[i])) return one(items[i]);
    total = plus(total, items[i]);
  }
  return one(total);
}

Sequence sum(const Call& call) {
  const Sequence items = summands(call[0]);
  if (!items.empty()) return sumOf(items);
  return call.count() > 1 ? call[1] : one(number(0));
}

Sequence average(const Call& call) {
  const Sequence items = summands(call[0]);
  if (items.empty()) return {};
  const Item total = sumOf(items)[0];
  const double count = static_cast<double>(items.size());
  if (items.size() == 1 || isNaN(total)) return one(total);
  if (total.type == 28) return one({28, monthsText(durationValue(total) / count)});
  const double quotient = numericValue(total) / count;
  return one(numberOf(total.type == 42 ? 13 : total.type, quotient));
}

// Whether a is greater than b; the left value's type decides how they are compared.
bool isGreater(const Item& a, const Item& b) {
  if (isStringType(a.type)) return promotedToString({a}).text > promotedToString({b}).text;
  if (a.type == 10) return a.text == "true" && b.text == "false";
  if (isOrderedDuration(a.type) && a.type == b.type) return durationValue(a) > durationValue(b);
  if (isNumericType(a.type) && isNumericType(b.type)) return numericValue(a) > numericValue(b);
  fail(6, invalidOperator);
}

bool isLess(const Item& a, const Item& b) {
  if (isStringType(a.type)) return promotedToString({a}).text < promotedToString({b}).text;
  if (a.type == 10) return a.text == "false" && b.text == "true";
  return isGreater(b, a);
}

Rule extreme(bool isMaximum) {
  return [=](const Call& call) -> Sequence {
    Attempts attempt;
    const Sequence best = attempt([&]() -> Sequence {
      const Sequence items = summands(call[0]);
      if (items.empty()) return {};
      if (isNaN(items[0])) return one(items[0]);
      const int type = items[0].type;
      if (!canBeSummed(items[0]) && !isStringType(type) && type != 10) throw Refused();
      Item current = items[0];
      for (size_t i = 1; i < items.size(); ++i) {
        if (isNaN(items[i])) return one(items[i]);
        const bool isBetter = isMaximum ? isGreater(items[i], current) : isLess(items[i], current);
        if (isBetter) current = items[i];
      }
      return one(current);
    });
    if (call.count() > 1) attempt([&] { return promotedToString(call[1]); });
    attempt.finish();
    return best;
  };
}

}  // namespace

const std::vector<Function>& aggregateFunctions() {
  static const std::vector<Function> functions = {
      {"fn:sum", 1, 2, sum},
      {"fn:avg", 1, 1, average},
      {"fn:max", 1, 2, extreme(true)},
      {"fn:min", 1, 2, extreme(false)},
  };
  return functions;
}

TEST(AggregateArguments, EndAsTheRulesSay) {
  expectRules(aggregateFunctions());
}

}  // namespace xquery::arguments
