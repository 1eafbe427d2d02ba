// Casts and lexical forms. The first byte chooses a type, the rest is a text. What the text is as a
// value of that type prints in a form that is read back as itself; "castable" says what "cast"
// does, to every type and from every type; and none of it depends on the plan.
#include "support/Failure.h"
#include "support/Input.h"
#include "support/QueryWords.h"
#include "xquery/xquery.h"

#include <cmath>
#include <cstdlib>
#include <string>
#include <vector>

using namespace xquery;
using namespace xquery::fuzz;

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  ::setenv("TZ", "Europe/Berlin", 1);
  return 0;
}

namespace {

struct Outcome {
  Value value;  // null after an error
  std::string text;
  bool isCastable = false;

  bool isValue() const { return value != nullptr; }
};

// A program for each type: whether $v is castable, and what it is cast.
struct Casts {
  explicit Casts(std::string_view type)
      : castable(compiled("$v castable as ", type, XQueryWay::Plain)),
        plain(compiled("$v cast as ", type, XQueryWay::Plain)),
        planned(compiled("$v cast as ", type, XQueryWay::Planned)) {}

  static Ref<XQuery> compiled(std::string_view operation, std::string_view type, XQueryWay way) {
    const std::string text =
        "declare variable $v external; " + std::string(operation) + std::string(type);
    return XQuery::xqueryWithSource(text, XQueryLoading(), XQueryLimits(), way);
  }

  Ref<XQuery> castable;
  Ref<XQuery> plain;
  Ref<XQuery> planned;
};

const std::vector<Casts>& casts() {
  static const std::vector<Casts> all(atomicTypes().begin(), atomicTypes().end());
  return all;
}

Value evaluated(const XQuery& query, const Value& value, std::string& error) {
  const auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> failure;
  const auto items = context->evaluateXQuery(query, {{"v", value}}, {}, &failure);
  check(items || failure, "neither a value nor an error");
  const auto found = XQueryFirstError(items, failure);
  if (found) {
    error = found->description()->utf8();
    return nullptr;
  }
  check(items->count() == 1, "a cast to many items");
  return items->objectAtIndex(0);
}

std::string textOf(const Value& value, const std::string& error) {
  return value ? XQueryItemTypeName(*value) + " " + XQueryItemStringValue(*value) : error;
}

// What the value shows of itself depends on the type alone that it has.
bool isSpecialNumber(const Value& value) {
  const std::string text = value ? XQueryItemStringValue(*value) : "";
  return text == "INF" || text == "-INF" || text == "NaN";
}

Outcome castTo(size_t type, const Value& value) {
  const Casts& programs = casts()[type];
  Outcome outcome;
  std::string error;
  outcome.value = evaluated(*programs.plain, value, error);
  outcome.text = textOf(outcome.value, error);
  std::string otherError;
  const Value planned = evaluated(*programs.planned, value, otherError);
  checkEqual(textOf(planned, otherError), outcome.text, "a cast that depends on the plan");
  const Value castable = evaluated(*programs.castable, value, error);
  check(castable != nullptr, "castable fails", error);
  outcome.isCastable = cast<NSNumber>(castable)->boolValue();
  return outcome;
}

// The infinities of xs:float are those of xs:double, and so of another type; and a URI that cannot
// be cast answers an error that is not raised.
void checkCastable(size_t type, const Outcome& outcome, std::string_view from) {
  const std::string_view name = atomicTypes()[type];
  if ((name == "xs:float" && isSpecialNumber(outcome.value)) || from == "xs:anyURI") return;
  check(outcome.isCastable == outcome.isValue(),
        std::string(name) +
            (outcome.isCastable ? ": castable but not cast" : ": cast but not castable"),
        std::string(from) + "\n" + outcome.text);
}

// The zeros that begin the fraction of a duration's seconds are lost in reading: 1.05 is read
// as 1.5, which need not be what so many seconds can hold to the last digit.
bool losesZeros(std::string_view name, std::string_view form) {
  return name.ends_with("ration") && form.find(".0") != form.npos;
}

// A small part of a second of a duration prints with an exponent, which no duration is read with.
bool isUnreadable(std::string_view name, std::string_view form) {
  return name.ends_with("ration") && form.find('e') != form.npos;
}

// A dayTimeDuration is a double of seconds: from 2 to the 53rd on it has no units any more, and
// what its days, hours and minutes come to is rounded at each of them.
bool hasNoUnits(std::string_view name, const Value& value) {
  if (name != "xdt:dayTimeDuration") return false;
  const auto seconds = XQueryReadDayTimeDuration(value);
  return !seconds || std::fabs(seconds->count()) >= 9007199254740992.0;
}

// 59.9999999 seconds print as 60.000000, and are read as the next minute.
bool isRoundedUp(std::string_view name, std::string_view form) {
  return name.ends_with("ime") && form.find(".000000") != form.npos;
}

// The types after integer count as derived from all those before them in the table of types, so
// that a value of one of them is cast to another one unchanged, whatever its sign.
bool isKeptUnchanged(std::string_view from, std::string_view to) {
  const auto isIntegral = [](std::string_view name) {
    return name.ends_with("nteger") || name.ends_with("ong") || name.ends_with("nt") ||
           name.ends_with("hort") || name.ends_with("yte");
  };
  return isIntegral(from) && isIntegral(to);
}

void checkForm(size_t type, const Value& value) {
  const std::string_view name = atomicTypes()[type];
  const std::string form = XQueryItemStringValue(*value);
  const bool isReadFromString = name == "xs:NOTATION" || name == "xs:QName";
  // What is cut off decides the sign: 0.5 is a positive integer, and prints as 0.
  const bool isCutOff =
      form == "0" && (name == "xs:positiveInteger" || name == "xs:negativeInteger");
  if (isReadFromString || isCutOff) return;
  const Outcome again = castTo(type, NSString::stringWithUTF8(form));
  check(again.isValue() != isUnreadable(name, form),
        std::string(name) + ": a form that is none of the type, or is none and is read", form);
  if (!again.isValue() || isRoundedUp(name, form) || losesZeros(name, form)) return;
  if (hasNoUnits(name, value)) return;
  checkEqual(XQueryItemStringValue(*again.value), form, "read back otherwise");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const size_t type = input.below(casts().size());
  const std::string_view rest = input.rest();
  const Value text = NSString::stringWithUTF8Replacing(rest);
  const Outcome source = castTo(type, text);
  checkCastable(type, source, "xdt:untypedAtomic");
  if (!source.isValue()) return 0;
  checkForm(type, source.value);
  for (size_t target = 0; target < casts().size(); ++target) {
    const Outcome outcome = castTo(target, source.value);
    checkCastable(target, outcome, atomicTypes()[type]);
    if (outcome.isValue() && !isKeptUnchanged(atomicTypes()[type], atomicTypes()[target])) {
      checkForm(target, outcome.value);
    }
  }
  return 0;
}
