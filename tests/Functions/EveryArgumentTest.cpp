// Every function of the standard namespace with every kind of value in every place: each call
// answers a value, refuses its arguments or fails with an error of the catalogue, and nothing else.
#include "Functions/FunctionsTesting.h"
#include "xquery/Data.h"

#include <algorithm>

namespace xquery {
namespace {

using namespace functiontest;

const std::vector<Value>& values() {
  static const std::vector<Value> all = [] {
    std::vector<Value> list = {
        empty(),
        integer(0),
        integer(-3),
        integer(INT64_MIN),
        typed(XQueryTypeInteger, "123456789012345678901234567890"),
        typed(XQueryTypeByte, "-128"),
        typed(XQueryTypeUnsignedLong, "18446744073709551615"),
        decimal("2.5"),
        number(-0.5),
        number(1e300),
        nan(),
        infinity(),
        minusInfinity(),
        single("1.5"),
        boolean(true),
        Value(NSNumber::numberWithDouble(3)),
        string(""),
        string("a"),
        untyped("2"),
        untyped("2004-10-29"),
        typed(XQueryTypeNCName, "name"),
        typed(XQueryTypeAnyURI, "urn:a"),
        typed(XQueryTypeQName, "local"),
        typed(XQueryTypeDateTime, "2004-02-29T12:00:00.5+02:00"),
        typed(XQueryTypeDate, "2004-02-29"),
        typed(XQueryTypeTime, "12:00:00Z"),
        typed(XQueryTypeGYear, "2004"),
        typed(XQueryTypeDuration, "-P1Y2M3DT4H"),
        months(-18),
        seconds(-90061.5),
        seconds(1e300),
        typed(XQueryTypeHexBinary, "AB"),
        typed(XQueryTypeBase64Binary, "AAAA"),
        NSData::dataWithBytes("ab"),
        document("<a xml:lang='en'><b x='1'>2</b><!--c--><?p i?></a>"),
        elementFrom("<p:a xmlns:p='urn:p' x='1'>2</p:a>"),
        sequence({integer(1), integer(2)}),
        sequence({string("a"), elementFrom("<a>1</a>"), nan()}),
    };
    return list;
  }();
  return all;
}

// Whether the call answers what a call may, or raises an error that it has recorded.
bool isAccepted(XQueryProcedure procedure, const std::vector<Value>& arguments) {
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  try {
    const Value answer = procedure(arguments.data(), arguments.size(), *context);
    const auto* array = dyn_cast<NSArray>(answer);
    return !array || std::all_of(array->objects().begin(), array->objects().end(),
                                 [](const Value& item) { return item && !isa<NSArray>(item); });
  } catch (const NSException& exception) {
    const Ref<XQueryError>& error = context->_internal().error();
    return exception.name() == "XQueryError" && error && error->msg()->length() > 0;
  }
}

std::string shown(std::string_view name, const std::vector<Value>& arguments) {
  return std::string(name) + XQueryDescription(NSArray::arrayWithObjects(arguments).get())->utf8();
}

TEST(EveryArgument, OfEveryStandardFunctionIsAnsweredOrRefused) {
  size_t calls = 0;
  for (const auto& row : XQueryBuiltInFunction::registrations()) {
    // Documents are fetched, and traces logged.
    if (row.namespaceID != XQueryNamespaceFN || !row.proc) continue;
    if (row.localName == "doc" || row.localName == "trace") continue;
    const auto check = [&](const std::vector<Value>& arguments) {
      ++calls;
      EXPECT_TRUE(isAccepted(row.proc, arguments)) << shown(row.localName, arguments);
    };
    for (const Value& first : values()) {
      check({first});
      for (const Value& second : values()) {
        check({first, second});
        check({first, second, values()[calls % values().size()]});
      }
    }
  }
  EXPECT_GT(calls, 100000U);
}

}  // namespace
}  // namespace xquery
