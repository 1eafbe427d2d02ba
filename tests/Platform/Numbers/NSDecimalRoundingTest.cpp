#include "Platform/Numbers/DecimalTesting.h"

#include <gtest/gtest.h>

#include <array>
#include <string>

namespace xquery {
namespace {

using namespace decimaltest;

TEST(Decimal, RoundsInEveryMode) {
  struct Row {
    const char* value;
    // TowardZero, Floor, Ceiling, HalfAwayFromZero, HalfUp, HalfEven
    std::array<const char*, 6> expected;
  };
  constexpr Row rows[] = {
      {"2.5", {"2", "2", "3", "3", "3", "2"}},
      {"-2.5", {"-2", "-3", "-2", "-3", "-2", "-2"}},
      {"3.5", {"3", "3", "4", "4", "4", "4"}},
      {"-3.5", {"-3", "-4", "-3", "-4", "-3", "-4"}},
      {"2.4999", {"2", "2", "3", "2", "2", "2"}},
      {"-2.4999", {"-2", "-3", "-2", "-2", "-2", "-2"}},
      {"2.5001", {"2", "2", "3", "3", "3", "3"}},
      {"-2.5001", {"-2", "-3", "-2", "-3", "-3", "-3"}},
      {"0.5", {"0", "0", "1", "1", "1", "0"}},
      {"-0.5", {"0", "-1", "0", "-1", "0", "0"}},
      {"7", {"7", "7", "7", "7", "7", "7"}},
      {"0.0000000000000000000000001", {"0", "0", "1", "0", "0", "0"}},
      {"-0.0000000000000000000000001", {"0", "-1", "0", "0", "0", "0"}},
      {"100000000000000000000.5",
       {"100000000000000000000", "100000000000000000000", "100000000000000000001",
        "100000000000000000001", "100000000000000000001", "100000000000000000000"}},
      {"-100000000000000000000.5",
       {"-100000000000000000000", "-100000000000000000001", "-100000000000000000000",
        "-100000000000000000001", "-100000000000000000000", "-100000000000000000000"}},
  };
  constexpr NSRoundingMode modes[] = {NSRoundingMode::TowardZero, NSRoundingMode::Floor,
                                      NSRoundingMode::Ceiling,    NSRoundingMode::HalfAwayFromZero,
                                      NSRoundingMode::HalfUp,     NSRoundingMode::HalfEven};
  for (const Row& row : rows) {
    for (size_t mode = 0; mode < 6; ++mode) {
      EXPECT_EQ(decimal(row.value).rounded(0, modes[mode]).toString(), row.expected[mode])
          << row.value << " mode " << mode;
    }
  }
}

TEST(Decimal, RoundsAtAnyPlace) {
  EXPECT_EQ(decimal("1.2345").roundedPlain(2).toString(), "1.23");
  EXPECT_EQ(decimal("1.235").roundedPlain(2).toString(), "1.24");
  EXPECT_EQ(decimal("1.2").roundedPlain(5).toString(), "1.2");
  EXPECT_EQ(decimal("1250").roundedPlain(-2).toString(), "1300");
  EXPECT_EQ(decimal("49").roundedPlain(-2).toString(), "0");
  EXPECT_EQ(decimal("50").roundedPlain(-2).toString(), "100");
  EXPECT_EQ(decimal("-50").roundedPlain(-2).toString(), "-100");
  EXPECT_EQ(decimal("12345678901234567890123").roundedPlain(-20).toString(),
            "12300000000000000000000");
  EXPECT_EQ(decimal("12345678901234567890123").roundedPlain(-23).toString(), "0");
  EXPECT_EQ(decimal("5").roundedPlain(INT32_MIN).toString(), "0");
  EXPECT_EQ(decimal("5").roundedPlain(INT32_MAX).toString(), "5");
  EXPECT_EQ(decimal("0.000000000000000000005").roundedPlain(20).toString(),
            "0.00000000000000000001");
}

TEST(Decimal, TruncatedFloorAndCeiling) {
  EXPECT_EQ(decimal("-2.7").truncated().toString(), "-2");
  EXPECT_EQ(decimal("-2.7").floor().toString(), "-3");
  EXPECT_EQ(decimal("-2.7").ceiling().toString(), "-2");
  EXPECT_EQ(decimal("2.7").truncated().toString(), "2");
  EXPECT_EQ(decimal("2.7").floor().toString(), "2");
  EXPECT_EQ(decimal("2.7").ceiling().toString(), "3");
}

}  // namespace
}  // namespace xquery
