#include "TypesTestSupport.h"
#include "ValuesTesting.h"
#include "xquery/Data.h"

#include <set>

namespace xquery {
namespace {

using Type = XQueryItemType;

TEST(ValueTypes, EachAtomicTypeHasANameThatNamesIt) {
  std::set<std::string> names;
  for (int number = 8; number <= 54; ++number) {
    const auto type = static_cast<Type>(number);
    const std::string name = XQueryNameOfType(type);
    EXPECT_TRUE(names.insert(name).second) << name;
    EXPECT_EQ(XQueryTypeNamed(name), type) << name;
    EXPECT_TRUE(XQueryIsAtomicItemType(type)) << name;
    EXPECT_FALSE(XQueryIsNodeType(type)) << name;
  }
  EXPECT_TRUE(names.contains("xdt:dayTimeDuration"));
  EXPECT_TRUE(names.contains("xs:unsignedByte"));
}

TEST(ValueTypes, NamesThatAreNoneOfAnAtomicTypeNameNothing) {
  for (const char* name : {"", "integer", "xs:", "xs:anyType", "xdt:anyAtomicType",
                           "xs:untypedAtomic", "xdt:integer", "element()", "item()"}) {
    EXPECT_EQ(XQueryTypeNamed(name), std::nullopt) << name;
  }
}

TEST(ValueTypes, NumbersWithoutATypeAreNamedItem) {
  for (const int number : {0, 1, 2, 5, 55, 64, 72, 255}) {
    EXPECT_EQ(XQueryNameOfType(static_cast<Type>(number)), "item()") << number;
  }
}

TEST(ValueTypes, FamiliesAreThoseOfTheTable) {
  EXPECT_TRUE(XQueryIsIntegerType(Type::UnsignedByte));
  EXPECT_FALSE(XQueryIsIntegerType(Type::Decimal));
  EXPECT_TRUE(XQueryIsStringType(Type::NMTOKEN));
  EXPECT_FALSE(XQueryIsStringType(Type::UntypedAtomic));
  EXPECT_TRUE(XQueryIsDateType(Type::GMonth));
  EXPECT_FALSE(XQueryIsDateType(Type::Duration));
  EXPECT_FALSE(XQueryIsAtomicItemType(Type::None));
  EXPECT_FALSE(XQueryIsAtomicItemType(Type::Text));
}

TEST(ValueTypes, OfItems) {
  EXPECT_EQ(XQueryTypeOfItem(*testing::parse("<a/>")), Type::Document);
  EXPECT_EQ(XQueryTypeOfItem(*NSXMLNode::textWithStringValue({})), Type::Text);
  EXPECT_EQ(XQueryTypeOfItem(*testing::integer(1)), Type::Integer);
  EXPECT_EQ(XQueryTypeOfItem(*NSNumber::trueValue()), Type::Boolean);
  EXPECT_EQ(XQueryTypeOfItem(*testing::text("a")), Type::UntypedAtomic);
  EXPECT_EQ(XQueryTypeOfItem(*NSData::dataWithBytes("a")), Type::None);
  EXPECT_EQ(XQueryTypeOfItem(*XQueryError::error(6, "a")), Type::None);
}

}  // namespace
}  // namespace xquery
