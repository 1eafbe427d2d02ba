#include "Functions/XQueryBuiltInFunction.h"

#include "Functions/Aggregate.h"
#include "Functions/Binary.h"
#include "Functions/Boolean.h"
#include "Functions/Codepoints.h"
#include "Functions/Constructors.h"
#include "Functions/Context.h"
#include "Functions/Date.h"
#include "Functions/DeepEqual.h"
#include "Functions/Duration.h"
#include "Functions/Error.h"
#include "Functions/Extension.h"
#include "Functions/Node.h"
#include "Functions/NodeText.h"
#include "Functions/Numeric.h"
#include "Functions/QName.h"
#include "Functions/RegEx.h"
#include "Functions/Sequence.h"
#include "Functions/String.h"
#include "Functions/StringMapping.h"
#include "Functions/Substring.h"
#include "Functions/URI.h"
#include "Functions/XSLT.h"

#include <array>
#include <new>
#include <unordered_map>

namespace xquery {
namespace {

constexpr auto FN = XQueryNamespaceFN;
constexpr auto XS = XQueryNamespaceXS;
constexpr auto XDT = XQueryNamespaceXDT;
constexpr auto EXT = XQueryNamespaceExt;

using namespace XQueryItems;
using Function = XQueryBuiltInFunction;

constexpr auto OfFirst = Function::OfFirst;
constexpr auto OfAll = Function::OfAll;
constexpr auto AtomizedFirst = Function::AtomizedFirst;
constexpr auto LooksAround = Function::LooksAround;
constexpr auto ReadsFocus = Function::ReadsFocus;
constexpr auto FocusByDefault = Function::FocusByDefault;
constexpr auto ReadsPosition = Function::ReadsPosition;
constexpr auto ReadsSize = Function::ReadsSize;
constexpr auto ReadsStatic = Function::ReadsStatic;
constexpr auto LoadsDocuments = Function::LoadsDocuments;
constexpr auto MakesNodes = Function::MakesNodes;
constexpr auto Traces = Function::Traces;
constexpr auto Unrepeatable = Function::Unrepeatable;
constexpr auto NeverFails = Function::NeverFails;
constexpr auto KeepsOrder = Function::KeepsOrder;
constexpr auto KeepsCount = Function::KeepsCount;

constexpr uint8_t Many = Function::many;

constexpr Function::Answer one(XQueryItemKinds kinds) {
  return {kinds, 1, 1};
}
constexpr Function::Answer optional(XQueryItemKinds kinds) {
  return {kinds, 0, 1};
}
constexpr Function::Answer several(XQueryItemKinds kinds) {
  return {kinds, 0, Many};
}
constexpr Function::Answer someOf(XQueryItemKinds kinds) {
  return {kinds, 1, Many};
}

// Numbers of arguments, what is answered, traits. A document is fetched once per context, so that
// doc answers alike for equal arguments; of the constructors only that of QNames looks for prefixes
// in what is around it.
constexpr auto table = std::to_array<XQueryBuiltInFunction::Registration>({
    {FN, "node-name", fn_node_name, {0, 1}, optional(QName), NeverFails},
    {FN, "nilled", fn_nilled, {1, 1}, optional(Boolean), NeverFails},
    {FN, "string", fn_string, {0, 1}, one(PlainString), FocusByDefault},
    {FN, "data", fn_data, {1, 1}, several(AtomizedFirst)},
    {FN, "base-uri", fn_base_uri, {0, 1}, optional(URI), LooksAround | ReadsStatic},
    {FN, "static-base-uri", fn_static_base_uri, {0, 0}, optional(URI), ReadsStatic},
    {FN, "document-uri", fn_document_uri, {1, 1}, optional(URI), LooksAround},
    {FN, "error", fn_error, {0, 3}, several(Any)},
    {FN, "trace", fn_trace, {2, 2}, several(OfFirst), Traces | KeepsOrder | KeepsCount},
    {FN, "codepoints-to-string", fn_codepoints_to_string, {1, 1}, one(String)},
    {FN, "string-to-codepoints", fn_string_to_codepoints, {1, 1}, several(Integer)},
    {FN, "compare", fn_compare, {2, 3}, optional(Integer)},
    {FN, "concat", fn_concat, {2, Many}, one(Untyped)},
    {FN, "string-join", fn_string_join, {2, 2}, one(String)},
    {FN, "starts-with", fn_starts_with, {2, 3}, one(Boolean)},
    {FN, "ends-with", fn_ends_with, {2, 3}, one(Boolean)},
    {FN, "contains", fn_contains, {2, 3}, one(Boolean)},
    {FN, "substring", fn_substring, {2, 3}, one(String)},
    {FN, "string-length", fn_string_length, {0, 1}, one(Integer), FocusByDefault},
    {FN, "substring-before", fn_substring_before, {2, 3}, one(String)},
    {FN, "substring-after", fn_substring_after, {2, 3}, one(String)},
    {FN, "normalize-space", fn_normalize_space, {0, 1}, one(PlainString), FocusByDefault},
    {FN, "normalize-unicode", fn_normalize_unicode, {1, 2}, one(String)},
    {FN, "upper-case", fn_upper_case, {1, 1}, one(PlainString)},
    {FN, "lower-case", fn_lower_case, {1, 1}, one(PlainString)},
    {FN, "translate", fn_translate, {3, 3}, one(PlainString)},
    {FN, "escape-uri", fn_escape_uri, {2, 2}, one(String)},
    {FN, "matches", fn_matches, {2, 3}, one(Boolean)},
    {FN, "replace", fn_replace, {3, 4}, one(Untyped)},
    {FN, "tokenize", fn_tokenize, {2, 3}, several(Untyped | String)},
    {FN, "true", fn_true, {0, 0}, one(Boolean), NeverFails},
    {FN, "false", fn_false, {0, 0}, one(Boolean), NeverFails},
    {FN, "not", fn_not, {1, 1}, one(Boolean)},
    {FN, "abs", fn_abs, {1, 1}, optional(Numeric)},
    {FN, "floor", fn_floor, {1, 1}, optional(Numeric)},
    {FN, "ceiling", fn_ceiling, {1, 1}, optional(Numeric)},
    {FN, "round", fn_round, {1, 1}, optional(Numeric)},
    {FN, "round-half-to-even", fn_round_half_to_even, {1, 2}, optional(Numeric)},
    {FN, "resolve-QName", fn_resolve_QName, {2, 2}, optional(QName), LooksAround},
    {FN, "QName", fn_QName, {2, 2}, one(QName), ReadsStatic},
    {FN, "local-name-from-QName", fn_local_name_from_QName, {1, 1}, optional(String)},
    {FN, "namespace-uri-from-QName", fn_namespace_uri_from_QName, {1, 1}, optional(URI)},
    {FN,
     "namespace-uri-for-prefix",
     fn_namespace_uri_for_prefix,
     {2, 2},
     optional(URI),
     LooksAround},
    {FN, "in-scope-prefixes", fn_in_scope_prefixes, {1, 1}, several(Untyped), LooksAround},
    {FN, "resolve-uri", fn_resolve_uri, {1, 2}, optional(URI), ReadsStatic},
    {FN, "name", fn_name, {0, 1}, one(PlainString), FocusByDefault},
    {FN, "local-name", fn_local_name, {0, 1}, one(PlainString), FocusByDefault},
    {FN, "namespace-uri", fn_namespace_uri, {0, 1}, one(URI), FocusByDefault},
    {FN, "number", fn_number, {0, 1}, one(Double), FocusByDefault},
    {FN, "lang", fn_lang, {1, 2}, one(Boolean), FocusByDefault | LooksAround},
    {FN, "root", fn_root, {0, 1}, optional(Node), FocusByDefault | LooksAround},
    {FN, "zero-or-one", fn_zero_or_one, {1, 1}, optional(OfFirst), KeepsOrder | KeepsCount},
    {FN, "one-or-more", fn_one_or_more, {1, 1}, someOf(OfFirst), KeepsOrder | KeepsCount},
    {FN, "exactly-one", fn_exactly_one, {1, 1}, one(OfFirst), KeepsOrder | KeepsCount},
    {FN, "boolean", fn_boolean, {1, 1}, one(Boolean)},
    {FN, "index-of", fn_index_of, {2, 3}, several(Integer)},
    {FN, "empty", fn_empty, {1, 1}, one(Boolean), NeverFails},
    {FN, "exists", fn_exists, {1, 1}, one(Boolean), NeverFails},
    {FN, "distinct-values", fn_distinct_values, {1, 2}, several(AtomizedFirst | String)},
    {FN, "insert-before", fn_insert_before, {3, 3}, several(OfAll)},
    {FN, "remove", fn_remove, {2, 2}, several(OfFirst), KeepsOrder},
    {FN, "reverse", fn_reverse, {1, 1}, several(OfFirst), KeepsCount},
    {FN, "subsequence", fn_subsequence, {2, 3}, several(OfFirst), KeepsOrder},
    {FN, "unordered", fn_unordered, {1, 1}, several(OfFirst), KeepsOrder | KeepsCount},
    {FN, "deep-equal", fn_deep_equal, {2, 3}, one(Boolean)},
    {FN, "count", fn_count, {1, 1}, one(Integer), NeverFails},
    {FN, "avg", fn_avg, {1, 1}, optional(Atomic)},
    {FN, "max", fn_max, {1, 2}, optional(Atomic)},
    {FN, "min", fn_min, {1, 2}, optional(Atomic)},
    {FN, "sum", fn_sum, {1, 2}, several(Any)},
    {FN, "id", fn_id, {1, 1}, several(Node), ReadsFocus | LooksAround},
    {FN, "idref", fn_idref, {1, 1}, several(Node), ReadsFocus | LooksAround},
    {FN, "doc", fn_doc, {1, 1}, optional(Document), LoadsDocuments},
    {FN, "collection", fn_collection, {0, Many}, several(Any)},
    {FN, "position", fn_position, {0, 0}, one(Integer), ReadsPosition},
    {FN, "last", fn_last, {0, 0}, one(Integer), ReadsSize},
    {FN, "years-from-duration", fn_years_from_duration, {1, 1}, optional(Integer)},
    {FN, "months-from-duration", fn_months_from_duration, {1, 1}, optional(Integer)},
    {FN, "days-from-duration", fn_days_from_duration, {1, 1}, optional(Integer)},
    {FN, "hours-from-duration", fn_hours_from_duration, {1, 1}, optional(Integer)},
    {FN, "minutes-from-duration", fn_minutes_from_duration, {1, 1}, optional(Integer)},
    {FN, "seconds-from-duration", fn_seconds_from_duration, {1, 1}, optional(AnyDecimal)},
    {FN, "year-from-dateTime", fn_year_from_dateTime, {1, 1}, optional(Integer)},
    {FN, "month-from-dateTime", fn_month_from_dateTime, {1, 1}, optional(Integer)},
    {FN, "day-from-dateTime", fn_day_from_dateTime, {1, 1}, optional(Integer)},
    {FN, "hours-from-dateTime", fn_hours_from_dateTime, {1, 1}, optional(Integer)},
    {FN, "minutes-from-dateTime", fn_minutes_from_dateTime, {1, 1}, optional(Integer)},
    {FN, "seconds-from-dateTime", fn_seconds_from_dateTime, {1, 1}, optional(AnyDecimal)},
    {FN, "timezone-from-dateTime", fn_timezone_from_dateTime, {1, 1}, optional(DayTimeDuration)},
    {FN, "year-from-date", fn_year_from_date, {1, 1}, optional(Integer)},
    {FN, "month-from-date", fn_month_from_date, {1, 1}, optional(Integer)},
    {FN, "day-from-date", fn_day_from_date, {1, 1}, optional(Integer)},
    {FN, "timezone-from-date", fn_timezone_from_date, {1, 1}, optional(DayTimeDuration)},
    {FN, "hours-from-time", fn_hours_from_time, {1, 1}, optional(Integer)},
    {FN, "minutes-from-time", fn_minutes_from_time, {1, 1}, optional(Integer)},
    {FN, "seconds-from-time", fn_seconds_from_time, {1, 1}, optional(AnyDecimal)},
    {FN, "timezone-from-time", fn_timezone_from_time, {1, 1}, optional(DayTimeDuration)},
    {FN,
     "adjust-dateTime-to-timezone",
     fn_adjust_dateTime_to_timezone,
     {1, 2},
     optional(DateTime),
     ReadsStatic},
    {FN,
     "adjust-date-to-timezone",
     fn_adjust_date_to_timezone,
     {1, 2},
     optional(Date),
     ReadsStatic},
    {FN,
     "adjust-time-to-timezone",
     fn_adjust_time_to_timezone,
     {1, 2},
     optional(Time),
     ReadsStatic},
    {FN,
     "subtract-dateTimes-yielding-dayTimeDuration",
     fn_subtract_dateTimes_yielding_dayTimeDuration,
     {2, 2},
     optional(DayTimeDuration),
     ReadsStatic},
    {FN,
     "subtract-dates-yielding-dayTimeDuration",
     fn_subtract_dates_yielding_dayTimeDuration,
     {2, 2},
     optional(DayTimeDuration),
     ReadsStatic},
    {FN, "subtract-times", fn_subtract_times, {2, 2}, optional(DayTimeDuration), ReadsStatic},
    {FN, "current-date", fn_current_date, {0, 0}, one(Date), ReadsStatic | NeverFails},
    {FN, "current-dateTime", fn_current_dateTime, {0, 0}, one(DateTime), ReadsStatic | NeverFails},
    {FN, "current-time", fn_current_time, {0, 0}, one(Time), ReadsStatic | NeverFails},
    {FN, "dateTime", fn_dateTime, {2, 2}, optional(DateTime), ReadsStatic},
    {FN,
     "implicit-timezone",
     fn_implicit_timezone,
     {0, 0},
     one(DayTimeDuration),
     ReadsStatic | NeverFails},
    {FN, "default-collation", fn_default_collation, {0, 0}, one(String), ReadsStatic | NeverFails},
    {XS, "string", xs_string, {1, 1}, one(PlainString)},
    {XS, "boolean", xs_boolean, {1, 1}, one(Boolean)},
    {XS, "decimal", xs_decimal, {1, 1}, one(AnyDecimal)},
    {XS, "float", xs_float, {1, 1}, one(Float | Double)},
    {XS, "double", xs_double, {1, 1}, one(Double)},
    {XS, "duration", xs_duration, {1, 1}, one(Duration)},
    {XS, "dateTime", xs_dateTime, {1, 1}, one(DateTime)},
    {XS, "time", xs_time, {1, 1}, one(Time)},
    {XS, "date", xs_date, {1, 1}, one(Date)},
    {XS, "gYearMonth", xs_gYearMonth, {1, 1}, one(Gregorian)},
    {XS, "gYear", xs_gYear, {1, 1}, one(Gregorian)},
    {XS, "gMonthDay", xs_gMonthDay, {1, 1}, one(Gregorian)},
    {XS, "gDay", xs_gDay, {1, 1}, one(Gregorian)},
    {XS, "gMonth", xs_gMonth, {1, 1}, one(Gregorian)},
    {XS, "hexBinary", xs_hexBinary, {1, 1}, one(HexBinary)},
    {XS, "base64Binary", xs_base64Binary, {1, 1}, one(Base64Binary)},
    {XS, "anyURI", xs_anyURI, {1, 1}, one(URI)},
    {XS, "QName", xs_QName, {1, 1}, one(QName), ReadsStatic},
    {XS, "normalizedString", xs_normalizedString, {1, 1}, one(String)},
    {XS, "token", xs_token, {1, 1}, one(String)},
    {XS, "language", xs_language, {1, 1}, one(String)},
    {XS, "NMTOKEN", xs_NMTOKEN, {1, 1}, one(String)},
    {XS, "Name", xs_Name, {1, 1}, one(String)},
    {XS, "NCName", xs_NCName, {1, 1}, one(String)},
    {XS, "ID", xs_ID, {1, 1}, one(String)},
    {XS, "IDREF", xs_IDREF, {1, 1}, one(String)},
    {XS, "ENTITY", xs_ENTITY, {1, 1}, one(String)},
    {XS, "integer", xs_integer, {1, 1}, one(Integer)},
    {XS, "nonPositiveInteger", xs_nonPositiveInteger, {1, 1}, one(Integer)},
    {XS, "negativeInteger", xs_negativeInteger, {1, 1}, one(Integer)},
    {XS, "long", xs_long, {1, 1}, one(Integer)},
    {XS, "int", xs_int, {1, 1}, one(Integer)},
    {XS, "short", xs_short, {1, 1}, one(Integer)},
    {XS, "byte", xs_byte, {1, 1}, one(Integer)},
    {XS, "nonNegativeInteger", xs_nonNegativeInteger, {1, 1}, one(Integer)},
    {XS, "unsignedLong", xs_unsignedLong, {1, 1}, one(Integer)},
    {XS, "unsignedInt", xs_unsignedInt, {1, 1}, one(Integer)},
    {XS, "unsignedShort", xs_unsignedShort, {1, 1}, one(Integer)},
    {XS, "unsignedByte", xs_unsignedByte, {1, 1}, one(Integer)},
    {XS, "positiveInteger", xs_positiveInteger, {1, 1}, one(Integer)},
    {XS, "NOTATION", xs_NOTATION, {1, 1}, one(Notation)},
    {XDT, "yearMonthDuration", xdt_yearMonthDuration, {1, 1}, one(YearMonthDuration)},
    {XDT, "dayTimeDuration", xdt_dayTimeDuration, {1, 1}, one(DayTimeDuration)},
    {XDT, "untypedAtomic", xdt_untypedAtomic, {1, 1}, one(Untyped)},
    {EXT, "_test", ext_test, {2, 2}, several(Any), MakesNodes | LooksAround | Unrepeatable},
    {EXT, "eval", ext_eval, {1, 2}, several(Any), MakesNodes | LooksAround | Unrepeatable},
    {EXT, "string-from-node", ext_string_from_node, {1, 1}, one(Untyped), LooksAround},
    {EXT, "node-from-string", ext_node_from_string, {1, 2}, several(Node), MakesNodes},
    {EXT, "binary-from-string", ext_binary_from_string, {1, 2}, one(HexBinary)},
    {EXT, "string-from-binary", ext_string_from_binary, {1, 2}, one(Untyped)},
    {EXT, "binary-hex-to-base64", ext_binary_hex_to_base64, {1, 1}, one(Base64Binary)},
    {EXT, "binary-base64-to-hex", ext_binary_base64_to_hex, {1, 1}, one(HexBinary)},
    {EXT, "binary-length", ext_binary_length, {1, 1}, one(Integer)},
    {EXT, "binary-insert", ext_binary_insert, {0, Many}, several(Any)},
    {EXT, "binary-remove", ext_binary_remove, {0, Many}, several(Any)},
    {EXT, "binary-find", ext_binary_find, {3, 3}, one(Other)},
    {EXT, "binary-find-all", ext_binary_find_all, {3, 3}, several(Other)},
    {EXT, "real-date-time", ext_real_date_time, {0, 0}, one(DateTime), Unrepeatable},
    {EXT, "uri-body", ext_uri_body, {1, 1}, one(HexBinary), ReadsStatic | Unrepeatable},
    {EXT, "xslt", ext_xslt, {2, 2}, several(Any), MakesNodes | LooksAround},
    {EXT,
     "xslt-uri",
     ext_xslt_uri,
     {2, 2},
     several(Any),
     MakesNodes | LooksAround | ReadsStatic | Unrepeatable},
    {EXT,
     "node-xquery",
     ext_node_xquery,
     {2, 2},
     several(Any),
     MakesNodes | LooksAround | Unrepeatable},
    {EXT,
     "node-xpath",
     ext_node_xpath,
     {2, 2},
     several(Any),
     MakesNodes | LooksAround | Unrepeatable},
    {EXT, "xpath-for-node", ext_xpath_for_node, {1, 1}, one(String), LooksAround},
});

using Registry = std::unordered_map<Ref<XQueryQName>, Ref<XQueryBuiltInFunction>, XQueryQNameHash,
                                    XQueryQNameEqual>;

Registry* makeRegistry() {
  // Never destroyed: queries may be compiled by destructors that run at exit.
  alignas(Registry) static unsigned char storage[sizeof(Registry)];
  auto* registry = ::new (storage) Registry;
  registry->reserve(table.size());
  for (const auto& row : table) {
    const Ref<NSString> URI = XQueryModules::builtinNamespaceForID(row.namespaceID);
    registry->emplace(XQueryQName::qname(NSString::stringWithASCII(row.localName), URI),
                      make<XQueryBuiltInFunction>(row));
  }
  return registry;
}

}  // namespace

Ref<XQueryBuiltInFunction> XQueryBuiltInFunction::builtInFunctionWithProc(XQueryProcedure proc) {
  return make<XQueryBuiltInFunction>(Registration{{}, {}, proc, {0, many}, {Any, 0, many}});
}

const XQueryBuiltInFunction* XQueryBuiltInFunction::entryForQName(const Ref<XQueryQName>& qName) {
  static const Registry* const registry = makeRegistry();
  const auto found = registry->find(qName);
  return found == registry->end() ? nullptr : found->second.get();
}

XQueryProcedure XQueryBuiltInFunction::functionForQName(const Ref<XQueryQName>& qName) {
  const XQueryBuiltInFunction* entry = entryForQName(qName);
  return entry ? entry->proc() : nullptr;
}

bool XQueryBuiltInFunction::Registration::readsContextItem(size_t argumentCount) const {
  return has(ReadsFocus) || (has(FocusByDefault) && argumentCount < arguments.most);
}

bool XQueryBuiltInFunction::Registration::readsArgumentsOnly(size_t argumentCount) const {
  constexpr uint32_t more =
      LooksAround | ReadsPosition | ReadsSize | ReadsStatic | MakesNodes | Traces | Unrepeatable;
  return (traits & more) == 0 && !readsContextItem(argumentCount);
}

std::span<const XQueryBuiltInFunction::Registration> XQueryBuiltInFunction::registrations() {
  return table;
}

}  // namespace xquery
