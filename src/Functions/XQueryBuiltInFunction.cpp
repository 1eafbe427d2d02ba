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
constexpr auto LooksAtValues = Function::LooksAtValues;
constexpr auto LooksAtNames = Function::LooksAtNames;
constexpr auto LooksAtCount = Function::LooksAtCount;

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
    {FN, "node-name", fn_node_name, {0, 1}, optional(QName), NeverFails | LooksAtNames},
    {FN, "nilled", fn_nilled, {1, 1}, optional(Boolean), NeverFails | LooksAtNames},
    {FN, "string", fn_string, {0, 1}, one(PlainString), FocusByDefault | LooksAtValues},
    {FN, "data", fn_data, {1, 1}, several(AtomizedFirst), LooksAtValues},
    {FN, "base-uri", fn_base_uri, {0, 1}, optional(URI), LooksAround | ReadsStatic},
    {FN, "static-base-uri", fn_static_base_uri, {0, 0}, optional(URI), ReadsStatic | LooksAtValues},
    {FN, "document-uri", fn_document_uri, {1, 1}, optional(URI), LooksAround},
    {FN, "error", fn_error, {0, 3}, several(Any)},
    {FN, "trace", fn_trace, {2, 2}, several(OfFirst), Traces | KeepsOrder | KeepsCount},
    {FN, "codepoints-to-string", fn_codepoints_to_string, {1, 1}, one(String), LooksAtValues},
    {FN, "string-to-codepoints", fn_string_to_codepoints, {1, 1}, several(Integer), LooksAtValues},
    {FN, "compare", fn_compare, {2, 3}, optional(Integer), LooksAtValues},
    {FN, "concat", fn_concat, {2, Many}, one(Untyped), LooksAtValues},
    {FN, "string-join", fn_string_join, {2, 2}, one(String), LooksAtValues},
    {FN, "starts-with", fn_starts_with, {2, 3}, one(Boolean), LooksAtValues},
    {FN, "ends-with", fn_ends_with, {2, 3}, one(Boolean), LooksAtValues},
    {FN, "contains", fn_contains, {2, 3}, one(Boolean), LooksAtValues},
    {FN, "substring", fn_substring, {2, 3}, one(String), LooksAtValues},
    {FN, "string-length", fn_string_length, {0, 1}, one(Integer), FocusByDefault | LooksAtValues},
    {FN, "substring-before", fn_substring_before, {2, 3}, one(String), LooksAtValues},
    {FN, "substring-after", fn_substring_after, {2, 3}, one(String), LooksAtValues},
    {FN,
     "normalize-space",
     fn_normalize_space,
     {0, 1},
     one(PlainString),
     FocusByDefault | LooksAtValues},
    {FN, "normalize-unicode", fn_normalize_unicode, {1, 2}, one(String), LooksAtValues},
    {FN, "upper-case", fn_upper_case, {1, 1}, one(PlainString), LooksAtValues},
    {FN, "lower-case", fn_lower_case, {1, 1}, one(PlainString), LooksAtValues},
    {FN, "translate", fn_translate, {3, 3}, one(PlainString), LooksAtValues},
    {FN, "escape-uri", fn_escape_uri, {2, 2}, one(String), LooksAtValues},
    {FN, "matches", fn_matches, {2, 3}, one(Boolean), LooksAtValues},
    {FN, "replace", fn_replace, {3, 4}, one(Untyped), LooksAtValues},
    {FN, "tokenize", fn_tokenize, {2, 3}, several(Untyped | String), LooksAtValues},
    {FN, "true", fn_true, {0, 0}, one(Boolean), NeverFails | LooksAtValues},
    {FN, "false", fn_false, {0, 0}, one(Boolean), NeverFails | LooksAtValues},
    {FN, "not", fn_not, {1, 1}, one(Boolean), NeverFails | LooksAtCount},
    {FN, "abs", fn_abs, {1, 1}, optional(Numeric), LooksAtValues},
    {FN, "floor", fn_floor, {1, 1}, optional(Numeric), LooksAtValues},
    {FN, "ceiling", fn_ceiling, {1, 1}, optional(Numeric), LooksAtValues},
    {FN, "round", fn_round, {1, 1}, optional(Numeric), LooksAtValues},
    {FN, "round-half-to-even", fn_round_half_to_even, {1, 2}, optional(Numeric), LooksAtValues},
    {FN, "resolve-QName", fn_resolve_QName, {2, 2}, optional(QName), LooksAround},
    {FN, "QName", fn_QName, {2, 2}, one(QName), ReadsStatic | LooksAtValues},
    {FN,
     "local-name-from-QName",
     fn_local_name_from_QName,
     {1, 1},
     optional(String),
     LooksAtValues},
    {FN,
     "namespace-uri-from-QName",
     fn_namespace_uri_from_QName,
     {1, 1},
     optional(URI),
     LooksAtValues},
    {FN,
     "namespace-uri-for-prefix",
     fn_namespace_uri_for_prefix,
     {2, 2},
     optional(URI),
     LooksAround},
    {FN, "in-scope-prefixes", fn_in_scope_prefixes, {1, 1}, several(Untyped), LooksAround},
    {FN, "resolve-uri", fn_resolve_uri, {1, 2}, optional(URI), ReadsStatic | LooksAtValues},
    {FN, "name", fn_name, {0, 1}, one(PlainString), FocusByDefault | LooksAtNames},
    {FN, "local-name", fn_local_name, {0, 1}, one(PlainString), FocusByDefault | LooksAtNames},
    {FN, "namespace-uri", fn_namespace_uri, {0, 1}, one(URI), FocusByDefault | LooksAtNames},
    {FN, "number", fn_number, {0, 1}, one(Double), FocusByDefault | LooksAtValues},
    {FN, "lang", fn_lang, {1, 2}, one(Boolean), FocusByDefault | LooksAround},
    {FN, "root", fn_root, {0, 1}, optional(Node), FocusByDefault | LooksAround},
    {FN,
     "zero-or-one",
     fn_zero_or_one,
     {1, 1},
     optional(OfFirst),
     KeepsOrder | KeepsCount | LooksAtCount},
    {FN,
     "one-or-more",
     fn_one_or_more,
     {1, 1},
     someOf(OfFirst),
     KeepsOrder | KeepsCount | LooksAtCount},
    {FN,
     "exactly-one",
     fn_exactly_one,
     {1, 1},
     one(OfFirst),
     KeepsOrder | KeepsCount | LooksAtCount},
    {FN, "boolean", fn_boolean, {1, 1}, one(Boolean), NeverFails | LooksAtCount},
    {FN, "index-of", fn_index_of, {2, 3}, several(Integer)},
    {FN, "empty", fn_empty, {1, 1}, one(Boolean), NeverFails | LooksAtCount},
    {FN, "exists", fn_exists, {1, 1}, one(Boolean), NeverFails | LooksAtCount},
    {FN,
     "distinct-values",
     fn_distinct_values,
     {1, 2},
     several(AtomizedFirst | PlainString),
     LooksAtValues},
    {FN,
     "insert-before",
     fn_insert_before,
     {3, 3},
     several(OfAll),
     LooksAtCount,
     XQueryInsertIntoOwn},
    {FN,
     "remove",
     fn_remove,
     {2, 2},
     several(OfFirst),
     KeepsOrder | LooksAtCount,
     XQueryRemoveFromOwn},
    {FN,
     "reverse",
     fn_reverse,
     {1, 1},
     several(OfFirst),
     KeepsCount | LooksAtCount,
     XQueryReverseOwn},
    {FN,
     "subsequence",
     fn_subsequence,
     {2, 3},
     several(OfFirst),
     KeepsOrder | LooksAtCount,
     XQuerySubsequenceOfOwn},
    {FN,
     "unordered",
     fn_unordered,
     {1, 1},
     several(OfFirst),
     KeepsOrder | KeepsCount | LooksAtCount},
    {FN, "deep-equal", fn_deep_equal, {2, 3}, one(Boolean)},
    {FN, "count", fn_count, {1, 1}, one(Integer), NeverFails | LooksAtCount},
    {FN, "avg", fn_avg, {1, 1}, optional(Atomic), LooksAtValues},
    {FN, "max", fn_max, {1, 2}, optional(Atomic), LooksAtValues},
    {FN, "min", fn_min, {1, 2}, optional(Atomic), LooksAtValues},
    {FN, "sum", fn_sum, {1, 2}, several(Any), LooksAtValues},
    {FN, "id", fn_id, {1, 1}, several(Node), ReadsFocus | LooksAround},
    {FN, "idref", fn_idref, {1, 1}, several(Node), ReadsFocus | LooksAround},
    {FN, "doc", fn_doc, {1, 1}, optional(Document), LoadsDocuments | LooksAtValues},
    {FN, "collection", fn_collection, {0, Many}, several(Any)},
    {FN, "position", fn_position, {0, 0}, one(Integer), ReadsPosition | LooksAtValues},
    {FN, "last", fn_last, {0, 0}, one(Integer), ReadsSize | LooksAtValues},
    {FN, "years-from-duration", fn_years_from_duration, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "months-from-duration", fn_months_from_duration, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "days-from-duration", fn_days_from_duration, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "hours-from-duration", fn_hours_from_duration, {1, 1}, optional(Integer), LooksAtValues},
    {FN,
     "minutes-from-duration",
     fn_minutes_from_duration,
     {1, 1},
     optional(Integer),
     LooksAtValues},
    {FN,
     "seconds-from-duration",
     fn_seconds_from_duration,
     {1, 1},
     optional(AnyDecimal),
     LooksAtValues},
    {FN, "year-from-dateTime", fn_year_from_dateTime, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "month-from-dateTime", fn_month_from_dateTime, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "day-from-dateTime", fn_day_from_dateTime, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "hours-from-dateTime", fn_hours_from_dateTime, {1, 1}, optional(Integer), LooksAtValues},
    {FN,
     "minutes-from-dateTime",
     fn_minutes_from_dateTime,
     {1, 1},
     optional(Integer),
     LooksAtValues},
    {FN,
     "seconds-from-dateTime",
     fn_seconds_from_dateTime,
     {1, 1},
     optional(AnyDecimal),
     LooksAtValues},
    {FN,
     "timezone-from-dateTime",
     fn_timezone_from_dateTime,
     {1, 1},
     optional(DayTimeDuration),
     LooksAtValues},
    {FN, "year-from-date", fn_year_from_date, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "month-from-date", fn_month_from_date, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "day-from-date", fn_day_from_date, {1, 1}, optional(Integer), LooksAtValues},
    {FN,
     "timezone-from-date",
     fn_timezone_from_date,
     {1, 1},
     optional(DayTimeDuration),
     LooksAtValues},
    {FN, "hours-from-time", fn_hours_from_time, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "minutes-from-time", fn_minutes_from_time, {1, 1}, optional(Integer), LooksAtValues},
    {FN, "seconds-from-time", fn_seconds_from_time, {1, 1}, optional(AnyDecimal), LooksAtValues},
    {FN,
     "timezone-from-time",
     fn_timezone_from_time,
     {1, 1},
     optional(DayTimeDuration),
     LooksAtValues},
    {FN,
     "adjust-dateTime-to-timezone",
     fn_adjust_dateTime_to_timezone,
     {1, 2},
     optional(DateTime),
     ReadsStatic | LooksAtValues},
    {FN,
     "adjust-date-to-timezone",
     fn_adjust_date_to_timezone,
     {1, 2},
     optional(Date),
     ReadsStatic | LooksAtValues},
    {FN,
     "adjust-time-to-timezone",
     fn_adjust_time_to_timezone,
     {1, 2},
     optional(Time),
     ReadsStatic | LooksAtValues},
    {FN,
     "subtract-dateTimes-yielding-dayTimeDuration",
     fn_subtract_dateTimes_yielding_dayTimeDuration,
     {2, 2},
     optional(DayTimeDuration),
     ReadsStatic | LooksAtValues},
    {FN,
     "subtract-dates-yielding-dayTimeDuration",
     fn_subtract_dates_yielding_dayTimeDuration,
     {2, 2},
     optional(DayTimeDuration),
     ReadsStatic | LooksAtValues},
    {FN,
     "subtract-times",
     fn_subtract_times,
     {2, 2},
     optional(DayTimeDuration),
     ReadsStatic | LooksAtValues},
    {FN,
     "current-date",
     fn_current_date,
     {0, 0},
     one(Date),
     ReadsStatic | NeverFails | LooksAtValues},
    {FN,
     "current-dateTime",
     fn_current_dateTime,
     {0, 0},
     one(DateTime),
     ReadsStatic | NeverFails | LooksAtValues},
    {FN,
     "current-time",
     fn_current_time,
     {0, 0},
     one(Time),
     ReadsStatic | NeverFails | LooksAtValues},
    {FN, "dateTime", fn_dateTime, {2, 2}, optional(DateTime), ReadsStatic | LooksAtValues},
    {FN,
     "implicit-timezone",
     fn_implicit_timezone,
     {0, 0},
     one(DayTimeDuration),
     ReadsStatic | NeverFails | LooksAtValues},
    {FN,
     "default-collation",
     fn_default_collation,
     {0, 0},
     one(String),
     ReadsStatic | NeverFails | LooksAtValues},
    {XS, "string", xs_string, {1, 1}, one(PlainString), LooksAtValues},
    {XS, "boolean", xs_boolean, {1, 1}, one(Boolean), LooksAtCount},
    {XS, "decimal", xs_decimal, {1, 1}, one(AnyDecimal), LooksAtValues},
    {XS, "float", xs_float, {1, 1}, one(Float | Double), LooksAtValues},
    {XS, "double", xs_double, {1, 1}, one(Double), LooksAtValues},
    {XS, "duration", xs_duration, {1, 1}, one(Duration), LooksAtValues},
    {XS, "dateTime", xs_dateTime, {1, 1}, one(DateTime), LooksAtValues},
    {XS, "time", xs_time, {1, 1}, one(Time), LooksAtValues},
    {XS, "date", xs_date, {1, 1}, one(Date), LooksAtValues},
    {XS, "gYearMonth", xs_gYearMonth, {1, 1}, one(Gregorian), LooksAtValues},
    {XS, "gYear", xs_gYear, {1, 1}, one(Gregorian), LooksAtValues},
    {XS, "gMonthDay", xs_gMonthDay, {1, 1}, one(Gregorian), LooksAtValues},
    {XS, "gDay", xs_gDay, {1, 1}, one(Gregorian), LooksAtValues},
    {XS, "gMonth", xs_gMonth, {1, 1}, one(Gregorian), LooksAtValues},
    {XS, "hexBinary", xs_hexBinary, {1, 1}, one(HexBinary), LooksAtValues},
    {XS, "base64Binary", xs_base64Binary, {1, 1}, one(Base64Binary), LooksAtValues},
    {XS, "anyURI", xs_anyURI, {1, 1}, one(URI), LooksAtValues},
    {XS, "QName", xs_QName, {1, 1}, one(QName), ReadsStatic | LooksAtValues},
    {XS, "normalizedString", xs_normalizedString, {1, 1}, one(String), LooksAtValues},
    {XS, "token", xs_token, {1, 1}, one(String), LooksAtValues},
    {XS, "language", xs_language, {1, 1}, one(String), LooksAtValues},
    {XS, "NMTOKEN", xs_NMTOKEN, {1, 1}, one(String), LooksAtValues},
    {XS, "Name", xs_Name, {1, 1}, one(String), LooksAtValues},
    {XS, "NCName", xs_NCName, {1, 1}, one(String), LooksAtValues},
    {XS, "ID", xs_ID, {1, 1}, one(String), LooksAtValues},
    {XS, "IDREF", xs_IDREF, {1, 1}, one(String), LooksAtValues},
    {XS, "ENTITY", xs_ENTITY, {1, 1}, one(String), LooksAtValues},
    {XS, "integer", xs_integer, {1, 1}, one(Integer), LooksAtValues},
    {XS, "nonPositiveInteger", xs_nonPositiveInteger, {1, 1}, one(Integer), LooksAtValues},
    {XS, "negativeInteger", xs_negativeInteger, {1, 1}, one(Integer), LooksAtValues},
    {XS, "long", xs_long, {1, 1}, one(Integer), LooksAtValues},
    {XS, "int", xs_int, {1, 1}, one(Integer), LooksAtValues},
    {XS, "short", xs_short, {1, 1}, one(Integer), LooksAtValues},
    {XS, "byte", xs_byte, {1, 1}, one(Integer), LooksAtValues},
    {XS, "nonNegativeInteger", xs_nonNegativeInteger, {1, 1}, one(Integer), LooksAtValues},
    {XS, "unsignedLong", xs_unsignedLong, {1, 1}, one(Integer), LooksAtValues},
    {XS, "unsignedInt", xs_unsignedInt, {1, 1}, one(Integer), LooksAtValues},
    {XS, "unsignedShort", xs_unsignedShort, {1, 1}, one(Integer), LooksAtValues},
    {XS, "unsignedByte", xs_unsignedByte, {1, 1}, one(Integer), LooksAtValues},
    {XS, "positiveInteger", xs_positiveInteger, {1, 1}, one(Integer), LooksAtValues},
    {XS, "NOTATION", xs_NOTATION, {1, 1}, one(Notation), LooksAtValues},
    {XDT,
     "yearMonthDuration",
     xdt_yearMonthDuration,
     {1, 1},
     one(YearMonthDuration),
     LooksAtValues},
    {XDT, "dayTimeDuration", xdt_dayTimeDuration, {1, 1}, one(DayTimeDuration), LooksAtValues},
    {XDT, "untypedAtomic", xdt_untypedAtomic, {1, 1}, one(Untyped), LooksAtValues},
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
