#include "Functions/XQueryBuiltInFunction.h"

#include "Functions/FunctionsAggregate.h"
#include "Functions/FunctionsBinary.h"
#include "Functions/FunctionsBoolean.h"
#include "Functions/FunctionsCodepoints.h"
#include "Functions/FunctionsConstructors.h"
#include "Functions/FunctionsContext.h"
#include "Functions/FunctionsDate.h"
#include "Functions/FunctionsDeepEqual.h"
#include "Functions/FunctionsDuration.h"
#include "Functions/FunctionsError.h"
#include "Functions/FunctionsExtension.h"
#include "Functions/FunctionsNode.h"
#include "Functions/FunctionsNodeText.h"
#include "Functions/FunctionsNumeric.h"
#include "Functions/FunctionsQName.h"
#include "Functions/FunctionsRegEx.h"
#include "Functions/FunctionsSequence.h"
#include "Functions/FunctionsString.h"
#include "Functions/FunctionsStringMapping.h"
#include "Functions/FunctionsSubstring.h"
#include "Functions/FunctionsURI.h"
#include "Functions/FunctionsXSLT.h"

#include <algorithm>
#include <array>
#include <new>
#include <unordered_map>

namespace xquery {
namespace {

constexpr auto FN = XQueryNamespaceFN;
constexpr auto XS = XQueryNamespaceXS;
constexpr auto XDT = XQueryNamespaceXDT;
constexpr auto EXT = XQueryNamespaceExt;

// A row without a procedure is a name that the engine knows and has no answer for.
constexpr auto table = std::to_array<XQueryBuiltInFunction::Registration>({
    {FN, "node-name", fn_node_name},
    {FN, "nilled", fn_nilled},
    {FN, "string", fn_string},
    {FN, "data", fn_data},
    {FN, "base-uri", fn_base_uri},
    {FN, "static-base-uri", fn_static_base_uri},
    {FN, "document-uri", fn_document_uri},
    {FN, "error", fn_error},
    {FN, "trace", fn_trace},
    {FN, "codepoints-to-string", fn_codepoints_to_string},
    {FN, "string-to-codepoints", fn_string_to_codepoints},
    {FN, "compare", fn_compare},
    {FN, "concat", fn_concat},
    {FN, "string-join", fn_string_join},
    {FN, "starts-with", fn_starts_with},
    {FN, "ends-with", fn_ends_with},
    {FN, "contains", fn_contains},
    {FN, "substring", fn_substring},
    {FN, "string-length", fn_string_length},
    {FN, "substring-before", fn_substring_before},
    {FN, "substring-after", fn_substring_after},
    {FN, "normalize-space", fn_normalize_space},
    {FN, "normalize-unicode", fn_normalize_unicode},
    {FN, "upper-case", fn_upper_case},
    {FN, "lower-case", fn_lower_case},
    {FN, "translate", fn_translate},
    {FN, "escape-uri", fn_escape_uri},
    {FN, "matches", fn_matches},
    {FN, "replace", fn_replace},
    {FN, "tokenize", fn_tokenize},
    {FN, "true", fn_true},
    {FN, "false", fn_false},
    {FN, "not", fn_not},
    {FN, "abs", fn_abs},
    {FN, "floor", fn_floor},
    {FN, "ceiling", fn_ceiling},
    {FN, "round", fn_round},
    {FN, "round-half-to-even", fn_round_half_to_even},
    {FN, "resolve-QName", fn_resolve_QName},
    {FN, "QName", fn_QName},
    {FN, "local-name-from-QName", fn_local_name_from_QName},
    {FN, "namespace-uri-from-QName", fn_namespace_uri_from_QName},
    {FN, "namespace-uri-for-prefix", fn_namespace_uri_for_prefix},
    {FN, "in-scope-prefixes", fn_in_scope_prefixes},
    {FN, "resolve-uri", fn_resolve_uri},
    {FN, "name", fn_name},
    {FN, "local-name", fn_local_name},
    {FN, "namespace-uri", fn_namespace_uri},
    {FN, "number", fn_number},
    {FN, "lang", fn_lang},
    {FN, "root", fn_root},
    {FN, "zero-or-one", fn_zero_or_one},
    {FN, "one-or-more", fn_one_or_more},
    {FN, "exactly-one", fn_exactly_one},
    {FN, "boolean", fn_boolean},
    {FN, "index-of", fn_index_of},
    {FN, "empty", fn_empty},
    {FN, "exists", fn_exists},
    {FN, "distinct-values", fn_distinct_values},
    {FN, "insert-before", fn_insert_before},
    {FN, "remove", fn_remove},
    {FN, "reverse", fn_reverse},
    {FN, "subsequence", fn_subsequence},
    {FN, "unordered", fn_unordered},
    {FN, "deep-equal", fn_deep_equal},
    {FN, "count", fn_count},
    {FN, "avg", fn_avg},
    {FN, "max", fn_max},
    {FN, "min", fn_min},
    {FN, "sum", fn_sum},
    {FN, "id", fn_id},
    {FN, "idref", fn_idref},
    {FN, "doc", fn_doc},
    {FN, "collection", nullptr},
    {FN, "position", fn_position},
    {FN, "last", fn_last},
    {FN, "years-from-duration", fn_years_from_duration},
    {FN, "months-from-duration", fn_months_from_duration},
    {FN, "days-from-duration", fn_days_from_duration},
    {FN, "hours-from-duration", fn_hours_from_duration},
    {FN, "minutes-from-duration", fn_minutes_from_duration},
    {FN, "seconds-from-duration", fn_seconds_from_duration},
    {FN, "year-from-dateTime", fn_year_from_dateTime},
    {FN, "month-from-dateTime", fn_month_from_dateTime},
    {FN, "day-from-dateTime", fn_day_from_dateTime},
    {FN, "hours-from-dateTime", fn_hours_from_dateTime},
    {FN, "minutes-from-dateTime", fn_minutes_from_dateTime},
    {FN, "seconds-from-dateTime", fn_seconds_from_dateTime},
    {FN, "timezone-from-dateTime", fn_timezone_from_dateTime},
    {FN, "year-from-date", fn_year_from_date},
    {FN, "month-from-date", fn_month_from_date},
    {FN, "day-from-date", fn_day_from_date},
    {FN, "timezone-from-date", fn_timezone_from_date},
    {FN, "hours-from-time", fn_hours_from_time},
    {FN, "minutes-from-time", fn_minutes_from_time},
    {FN, "seconds-from-time", fn_seconds_from_time},
    {FN, "timezone-from-time", fn_timezone_from_time},
    {FN, "adjust-dateTime-to-timezone", fn_adjust_dateTime_to_timezone},
    {FN, "adjust-date-to-timezone", fn_adjust_date_to_timezone},
    {FN, "adjust-time-to-timezone", fn_adjust_time_to_timezone},
    {FN, "subtract-dateTimes-yielding-dayTimeDuration",
     fn_subtract_dateTimes_yielding_dayTimeDuration},
    {FN, "subtract-dates-yielding-dayTimeDuration", fn_subtract_dates_yielding_dayTimeDuration},
    {FN, "subtract-times", fn_subtract_times},
    {FN, "current-date", fn_current_date},
    {FN, "current-dateTime", fn_current_dateTime},
    {FN, "current-time", fn_current_time},
    {FN, "dateTime", fn_dateTime},
    {FN, "implicit-timezone", fn_implicit_timezone},
    {FN, "default-collation", fn_default_collation},
    {XS, "string", xs_string},
    {XS, "boolean", xs_boolean},
    {XS, "decimal", xs_decimal},
    {XS, "float", xs_float},
    {XS, "double", xs_double},
    {XS, "duration", xs_duration},
    {XS, "dateTime", xs_dateTime},
    {XS, "time", xs_time},
    {XS, "date", xs_date},
    {XS, "gYearMonth", xs_gYearMonth},
    {XS, "gYear", xs_gYear},
    {XS, "gMonthDay", xs_gMonthDay},
    {XS, "gDay", xs_gDay},
    {XS, "gMonth", xs_gMonth},
    {XS, "hexBinary", xs_hexBinary},
    {XS, "base64Binary", xs_base64Binary},
    {XS, "anyURI", xs_anyURI},
    {XS, "QName", xs_QName},
    {XS, "normalizedString", xs_normalizedString},
    {XS, "token", xs_token},
    {XS, "language", xs_language},
    {XS, "NMTOKEN", xs_NMTOKEN},
    {XS, "Name", xs_Name},
    {XS, "NCName", xs_NCName},
    {XS, "ID", xs_ID},
    {XS, "IDREF", xs_IDREF},
    {XS, "ENTITY", xs_ENTITY},
    {XS, "integer", xs_integer},
    {XS, "nonPositiveInteger", xs_nonPositiveInteger},
    {XS, "negativeInteger", xs_negativeInteger},
    {XS, "long", xs_long},
    {XS, "int", xs_int},
    {XS, "short", xs_short},
    {XS, "byte", xs_byte},
    {XS, "nonNegativeInteger", xs_nonNegativeInteger},
    {XS, "unsignedLong", xs_unsignedLong},
    {XS, "unsignedInt", xs_unsignedInt},
    {XS, "unsignedShort", xs_unsignedShort},
    {XS, "unsignedByte", xs_unsignedByte},
    {XS, "positiveInteger", xs_positiveInteger},
    {XS, "NOTATION", xs_NOTATION},
    {XDT, "yearMonthDuration", xdt_yearMonthDuration},
    {XDT, "dayTimeDuration", xdt_dayTimeDuration},
    {XDT, "untypedAtomic", xdt_untypedAtomic},
    {EXT, "_test", ext_test},
    {EXT, "eval", ext_eval},
    {EXT, "string-from-node", ext_string_from_node},
    {EXT, "node-from-string", ext_node_from_string},
    {EXT, "binary-from-string", ext_binary_from_string},
    {EXT, "string-from-binary", ext_string_from_binary},
    {EXT, "binary-hex-to-base64", ext_binary_hex_to_base64},
    {EXT, "binary-base64-to-hex", ext_binary_base64_to_hex},
    {EXT, "binary-length", ext_binary_length},
    {EXT, "binary-insert", ext_binary_insert},
    {EXT, "binary-remove", ext_binary_remove},
    {EXT, "binary-find", ext_binary_find},
    {EXT, "binary-find-all", ext_binary_find_all},
    {EXT, "real-date-time", ext_real_date_time},
    {EXT, "uri-body", ext_uri_body},
    {EXT, "xslt", ext_xslt},
    {EXT, "xslt-uri", ext_xslt_uri},
    {EXT, "node-xquery", ext_node_xquery},
    {EXT, "node-xpath", ext_node_xpath},
    {EXT, "xpath-for-node", ext_xpath_for_node},
});

// The functions of the standard namespace that read their arguments only. The constructors of the
// type namespaces all do, apart from those of names, which look for prefixes in what is around
// them. A document is fetched once per context, so doc is one of them.
constexpr auto readers = std::to_array<std::string_view>({
    "abs",
    "avg",
    "boolean",
    "ceiling",
    "codepoints-to-string",
    "compare",
    "concat",
    "contains",
    "count",
    "data",
    "day-from-date",
    "day-from-dateTime",
    "days-from-duration",
    "deep-equal",
    "distinct-values",
    "doc",
    "empty",
    "ends-with",
    "escape-uri",
    "exists",
    "floor",
    "hours-from-dateTime",
    "hours-from-duration",
    "hours-from-time",
    "index-of",
    "insert-before",
    "local-name",
    "lower-case",
    "matches",
    "max",
    "min",
    "minutes-from-dateTime",
    "minutes-from-duration",
    "minutes-from-time",
    "month-from-date",
    "month-from-dateTime",
    "months-from-duration",
    "name",
    "namespace-uri",
    "normalize-space",
    "normalize-unicode",
    "not",
    "number",
    "remove",
    "replace",
    "reverse",
    "round",
    "round-half-to-even",
    "seconds-from-dateTime",
    "seconds-from-duration",
    "seconds-from-time",
    "starts-with",
    "string",
    "string-join",
    "string-length",
    "string-to-codepoints",
    "subsequence",
    "substring",
    "substring-after",
    "substring-before",
    "sum",
    "tokenize",
    "translate",
    "upper-case",
    "year-from-date",
    "year-from-dateTime",
    "years-from-duration",
});

bool readsArgumentsOnly(const XQueryBuiltInFunction::Registration& row) {
  if (row.namespaceID == XS || row.namespaceID == XDT) {
    return row.proc != xs_QName && row.proc != xs_NOTATION;
  }
  return row.namespaceID == FN &&
         std::find(readers.begin(), readers.end(), row.localName) != readers.end();
}

Value noAnswer(const Value*, size_t, XQueryContext&) {
  return Value();
}

using Registry = std::unordered_map<Ref<XQueryQName>, Ref<XQueryBuiltInFunction>, XQueryQNameHash,
                                    XQueryQNameEqual>;

Registry* makeRegistry() {
  // Never destroyed: queries may be compiled by destructors that run at exit.
  alignas(Registry) static unsigned char storage[sizeof(Registry)];
  auto* registry = ::new (storage) Registry;
  registry->reserve(table.size());
  for (const auto& row : table) {
    const Ref<NSString> URI = XQueryModules::builtinNamespaceForID(row.namespaceID);
    registry->emplace(
        XQueryQName::qname(NSString::stringWithASCII(row.localName), URI),
        make<XQueryBuiltInFunction>(row.proc ? row.proc : noAnswer, readsArgumentsOnly(row)));
  }
  return registry;
}

}  // namespace

Ref<XQueryBuiltInFunction> XQueryBuiltInFunction::builtInFunctionWithProc(XQueryProcedure proc) {
  return make<XQueryBuiltInFunction>(proc);
}

const XQueryBuiltInFunction* XQueryBuiltInFunction::entryForQName(const Ref<XQueryQName>& qName) {
  static const Registry* const registry = makeRegistry();
  const auto found = registry->find(qName);
  return found == registry->end() ? nullptr : found->second.get();
}

bool XQueryBuiltInFunction::loadsDocuments() const {
  return _proc == fn_doc;
}

bool XQueryBuiltInFunction::answersTruth() const {
  constexpr auto truths = std::to_array<XQueryProcedure>({
      fn_boolean,
      fn_contains,
      fn_deep_equal,
      fn_empty,
      fn_ends_with,
      fn_exists,
      fn_matches,
      fn_not,
      fn_starts_with,
  });
  return std::find(truths.begin(), truths.end(), _proc) != truths.end();
}

XQueryProcedure XQueryBuiltInFunction::functionForQName(const Ref<XQueryQName>& qName) {
  const XQueryBuiltInFunction* entry = entryForQName(qName);
  return entry ? entry->proc() : nullptr;
}

std::span<const XQueryBuiltInFunction::Registration> XQueryBuiltInFunction::registrations() {
  return table;
}

}  // namespace xquery
