#include "Types/XQueryDuration.h"
#include "TypesTestSupport.h"

#include <string>

namespace xquery {
namespace {

using testing::view;

Ref<XQueryDuration> duration(std::string_view text) {
  return XQueryDuration::durationWithString(view(text));
}

std::string printed(std::string_view text) {
  const Ref<XQueryDuration> value = duration(text);
  return value ? value->XQueryStringValue()->utf8() : "(null)";
}

TEST(XQueryDuration, KeepsEachFieldAsWritten) {
  const Ref<XQueryDuration> value = duration("-P1Y14M40DT30H70M90.5S");
  ASSERT_TRUE(value);
  EXPECT_TRUE(value->isNeg());
  EXPECT_EQ(value->year(), 1);
  EXPECT_EQ(value->month(), 14);
  EXPECT_EQ(value->day(), 40);
  EXPECT_EQ(value->hour(), 30);
  EXPECT_EQ(value->minute(), 70);
  EXPECT_EQ(value->second(), 90.5);
  EXPECT_EQ(value->typeID(), 24);
  EXPECT_FALSE(duration("P1Y")->isNeg());
}

struct Row {
  const char* text;
  const char* printed;
};

TEST(XQueryDuration, PrintsItsNonZeroFieldsWithoutASign) {
  const Row rows[] = {
      {"P1Y2M3DT4H5M6S", "P1Y2M3DT4H5M6S"},
      {"P1Y", "P1Y"},
      {"P2M", "P2M"},
      {"P3D", "P3D"},
      {"PT4H", "PT4H"},
      {"PT5M", "PT5M"},
      {"PT6S", "PT6S"},
      {"PT6.5S", "PT6.5S"},
      {"P1YT1S", "P1YT1S"},
      {"P1DT1M", "P1DT1M"},
      {"P0Y1M0DT0H1M0S", "P1MT1M"},
      {"-P1D", "P1D"},
      {"-PT0.5S", "PT0.5S"},
      {"P0D", "P0M"},
      {"P0Y", "P0M"},
      {"PT0S", "P0M"},
      {"PT0.0S", "P0M"},
      {"-P0M", "P0M"},
      {"P14M", "P14M"},
      {"P400D", "P400D"},
      {"P001Y", "P1Y"},
      {"P2147483647Y2147483647M2147483647D", "P2147483647Y2147483647M2147483647D"},
      {"PT9223372036854775807S", "PT9223372036854775807S"},
      {"PT1000000000000S", "PT1000000000000S"},
      // A fraction is read as an integer, which loses its leading zeros.
      {"PT1.05S", "PT1.5S"},
      {"PT1.50S", "PT1.5S"},
      {"PT0.00S", "P0M"},
  };
  for (const Row& row : rows) EXPECT_EQ(printed(row.text), row.printed) << row.text;
}

TEST(XQueryDuration, RejectsEveryDeviation) {
  const char* const texts[] = {"",
                               "P",
                               "-P",
                               "PT",
                               "P1YT",
                               "P5",
                               "PT5",
                               "PT1H5",
                               "1Y",
                               "p1Y",
                               "P1y",
                               "+P1Y",
                               "--P1Y",
                               "P-1Y",
                               "P+1Y",
                               " P1Y",
                               "P1Y ",
                               "P 1Y",
                               "P1Yx",
                               "P1M1Y",
                               "P1D1M",
                               "P1D1Y",
                               "P1H",
                               "P1S",
                               "PT1D",
                               "PT1M1H",
                               "PT1S1M",
                               "PT1Y",
                               "P1Y1Y",
                               "P1.5Y",
                               "P1.5D",
                               "PT1.5H",
                               "PT1.5M",
                               "PT1.S",
                               "PT.5S",
                               "PT1.5",
                               "PT1.5.5S",
                               "PT-1S",
                               "PTT1S",
                               "P2147483648Y",
                               "P99999999999999999999Y",
                               "PT9223372036854775808S"};
  for (const char* text : texts) EXPECT_FALSE(duration(text)) << text;
}

TEST(XQueryDuration, RewritesItselfForTheOrderedDurations) {
  struct {
    const char* text;
    const char* dayTime;
    const char* yearMonth;
  } const rows[] = {
      {"P1Y2M3DT4H5M6S", "P3DT4H5M6S", "P1Y2M"},
      {"-P1Y2M3DT4H5M6.5S", "-P3DT4H5M6.5S", "-P1Y2M"},
      {"P1Y2M", "P0D", "P1Y2M"},
      {"P3D", "P3D", "P0Y0M"},
      {"PT1M", "PT1M", "P0Y0M"},
      {"P1DT1S", "P1DT1S", "P0Y0M"},
      {"-P0M", "-P0D", "-P0Y0M"},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(duration(row.text)->dayTimeText(), row.dayTime) << row.text;
    EXPECT_EQ(duration(row.text)->yearMonthText(), row.yearMonth) << row.text;
  }
}

TEST(XQueryDuration, IsAnAtomicValueOfItsType) {
  const Ref<XQueryDuration> value = duration("P1Y");
  EXPECT_EQ(XQueryObjectTypeID(value.get()), 24);
  EXPECT_EQ(XQueryItemTypeName(*value), "xs:duration");
  EXPECT_EQ(XQueryItemStringValue(*value), "P1Y");
}

TEST(XQueryDuration, IsEqualToItselfOnly) {
  const Ref<XQueryDuration> value = duration("P1Y");
  EXPECT_TRUE(XQueryObjectsEqual(*value, *value));
  EXPECT_FALSE(XQueryObjectsEqual(*value, *duration("P1Y")));
}

}  // namespace
}  // namespace xquery
