// The constructor functions: each casts exactly one item to its type.
#include "arguments/Driver.h"

#include <gtest/gtest.h>

namespace xquery::arguments {
namespace {

struct Constructor {
  const char* name;
  int type;
};

constexpr Constructor constructors[] = {
    {"xs:string", 9},
    {"xs:boolean", 10},
    {"xs:decimal", 13},
    {"xs:float", 12},
    {"xs:double", 11},
    {"xs:duration", 24},
    {"xs:dateTime", 21},
    {"xs:time", 23},
    {"xs:date", 22},
    {"xs:gYearMonth", 16},
    {"xs:gYear", 17},
    {"xs:gMonthDay", 18},
    {"xs:gDay", 19},
    {"xs:gMonth", 20},
    {"xs:hexBinary", 26},
    {"xs:base64Binary", 25},
    {"xs:anyURI", 14},
    {"xs:QName", 15},
    {"xs:normalizedString", 30},
    {"xs:token", 31},
    {"xs:language", 32},
    {"xs:NMTOKEN", 40},
    {"xs:Name", 33},
    {"xs:NCName", 34},
    {"xs:ID", 35},
    {"xs:IDREF", 36},
    {"xs:ENTITY", 38},
    {"xs:integer", 42},
    {"xs:nonPositiveInteger", 45},
    {"xs:negativeInteger", 46},
    {"xs:long", 47},
    {"xs:int", 48},
    {"xs:short", 49},
    {"xs:byte", 50},
    {"xs:nonNegativeInteger", 43},
    {"xs:unsignedLong", 51},
    {"xs:unsignedInt", 52},
    {"xs:unsignedShort", 53},
    {"xs:unsignedByte", 54},
    {"xs:positiveInteger", 44},
    {"xs:NOTATION", 27},
    {"xdt:yearMonthDuration", 28},
    {"xdt:dayTimeDuration", 29},
    {"xdt:untypedAtomic", 8},
};

}  // namespace

const std::vector<Function>& constructorFunctions() {
  static const std::vector<Function> functions = [] {
    std::vector<Function> all;
    for (const Constructor& constructor : constructors) {
      all.push_back({constructor.name, 1, 1, [type = constructor.type](const Call& call) {
                       return one(castTo(call[0], type));
                     }});
    }
    return all;
  }();
  return functions;
}

TEST(ConstructorArguments, CastOneItemAsTheTableSays) {
  expectRules(constructorFunctions());
}

}  // namespace xquery::arguments
