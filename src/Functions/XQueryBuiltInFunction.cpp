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

constexpr auto Reads = XQueryBuiltInFunction::ReadsArgumentsOnly;
constexpr auto Truth = XQueryBuiltInFunction::AnswersTruth;
constexpr auto Loads = XQueryBuiltInFunction::LoadsDocuments;

// Of the constructors all read their arguments only, but for that of QNames, which looks for
// prefixes in what is around it. A document is fetched once per context, so doc reads only too.
constexpr auto table = std::to_array<XQueryBuiltInFunction::Registration>({
    {FN, "node-name", fn_node_name},
    {FN, "nilled", fn_nilled},
    {FN, "string", fn_string, Reads},
    {FN, "data", fn_data, Reads},
    {FN, "base-uri", fn_base_uri},
    {FN, "static-base-uri", fn_static_base_uri},
    {FN, "document-uri", fn_document_uri},
    {FN, "error", fn_error},
    {FN, "trace", fn_trace},
    {FN, "codepoints-to-string", fn_codepoints_to_string, Reads},
    {FN, "string-to-codepoints", fn_string_to_codepoints, Reads},
    {FN, "compare", fn_compare, Reads},
    {FN, "concat", fn_concat, Reads},
    {FN, "string-join", fn_string_join, Reads},
    {FN, "starts-with", fn_starts_with, Reads | Truth},
    {FN, "ends-with", fn_ends_with, Reads | Truth},
    {FN, "contains", fn_contains, Reads | Truth},
    {FN, "substring", fn_substring, Reads},
    {FN, "string-length", fn_string_length, Reads},
    {FN, "substring-before", fn_substring_before, Reads},
    {FN, "substring-after", fn_substring_after, Reads},
    {FN, "normalize-space", fn_normalize_space, Reads},
    {FN, "normalize-unicode", fn_normalize_unicode, Reads},
    {FN, "upper-case", fn_upper_case, Reads},
    {FN, "lower-case", fn_lower_case, Reads},
    {FN, "translate", fn_translate, Reads},
    {FN, "escape-uri", fn_escape_uri, Reads},
    {FN, "matches", fn_matches, Reads | Truth},
    {FN, "replace", fn_replace, Reads},
    {FN, "tokenize", fn_tokenize, Reads},
    {FN, "true", fn_true, Truth},
    {FN, "false", fn_false, Truth},
    {FN, "not", fn_not, Reads | Truth},
    {FN, "abs", fn_abs, Reads},
    {FN, "floor", fn_floor, Reads},
    {FN, "ceiling", fn_ceiling, Reads},
    {FN, "round", fn_round, Reads},
    {FN, "round-half-to-even", fn_round_half_to_even, Reads},
    {FN, "resolve-QName", fn_resolve_QName},
    {FN, "QName", fn_QName},
    {FN, "local-name-from-QName", fn_local_name_from_QName},
    {FN, "namespace-uri-from-QName", fn_namespace_uri_from_QName},
    {FN, "namespace-uri-for-prefix", fn_namespace_uri_for_prefix},
    {FN, "in-scope-prefixes", fn_in_scope_prefixes},
    {FN, "resolve-uri", fn_resolve_uri},
    {FN, "name", fn_name, Reads},
    {FN, "local-name", fn_local_name, Reads},
    {FN, "namespace-uri", fn_namespace_uri, Reads},
    {FN, "number", fn_number, Reads},
    {FN, "lang", fn_lang, Truth},
    {FN, "root", fn_root},
    {FN, "zero-or-one", fn_zero_or_one},
    {FN, "one-or-more", fn_one_or_more},
    {FN, "exactly-one", fn_exactly_one},
    {FN, "boolean", fn_boolean, Reads | Truth},
    {FN, "index-of", fn_index_of, Reads},
    {FN, "empty", fn_empty, Reads | Truth},
    {FN, "exists", fn_exists, Reads | Truth},
    {FN, "distinct-values", fn_distinct_values, Reads},
    {FN, "insert-before", fn_insert_before, Reads},
    {FN, "remove", fn_remove, Reads},
    {FN, "reverse", fn_reverse, Reads},
    {FN, "subsequence", fn_subsequence, Reads},
    {FN, "unordered", fn_unordered},
    {FN, "deep-equal", fn_deep_equal, Reads | Truth},
    {FN, "count", fn_count, Reads},
    {FN, "avg", fn_avg, Reads},
    {FN, "max", fn_max, Reads},
    {FN, "min", fn_min, Reads},
    {FN, "sum", fn_sum, Reads},
    {FN, "id", fn_id},
    {FN, "idref", fn_idref},
    {FN, "doc", fn_doc, Reads | Loads},
    {FN, "collection", fn_collection},
    {FN, "position", fn_position},
    {FN, "last", fn_last},
    {FN, "years-from-duration", fn_years_from_duration, Reads},
    {FN, "months-from-duration", fn_months_from_duration, Reads},
    {FN, "days-from-duration", fn_days_from_duration, Reads},
    {FN, "hours-from-duration", fn_hours_from_duration, Reads},
    {FN, "minutes-from-duration", fn_minutes_from_duration, Reads},
    {FN, "seconds-from-duration", fn_seconds_from_duration, Reads},
    {FN, "year-from-dateTime", fn_year_from_dateTime, Reads},
    {FN, "month-from-dateTime", fn_month_from_dateTime, Reads},
    {FN, "day-from-dateTime", fn_day_from_dateTime, Reads},
    {FN, "hours-from-dateTime", fn_hours_from_dateTime, Reads},
    {FN, "minutes-from-dateTime", fn_minutes_from_dateTime, Reads},
    {FN, "seconds-from-dateTime", fn_seconds_from_dateTime, Reads},
    {FN, "timezone-from-dateTime", fn_timezone_from_dateTime},
    {FN, "year-from-date", fn_year_from_date, Reads},
    {FN, "month-from-date", fn_month_from_date, Reads},
    {FN, "day-from-date", fn_day_from_date, Reads},
    {FN, "timezone-from-date", fn_timezone_from_date},
    {FN, "hours-from-time", fn_hours_from_time, Reads},
    {FN, "minutes-from-time", fn_minutes_from_time, Reads},
    {FN, "seconds-from-time", fn_seconds_from_time, Reads},
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
    {XS, "string", xs_string, Reads},
    {XS, "boolean", xs_boolean, Reads | Truth},
    {XS, "decimal", xs_decimal, Reads},
    {XS, "float", xs_float, Reads},
    {XS, "double", xs_double, Reads},
    {XS, "duration", xs_duration, Reads},
    {XS, "dateTime", xs_dateTime, Reads},
    {XS, "time", xs_time, Reads},
    {XS, "date", xs_date, Reads},
    {XS, "gYearMonth", xs_gYearMonth, Reads},
    {XS, "gYear", xs_gYear, Reads},
    {XS, "gMonthDay", xs_gMonthDay, Reads},
    {XS, "gDay", xs_gDay, Reads},
    {XS, "gMonth", xs_gMonth, Reads},
    {XS, "hexBinary", xs_hexBinary, Reads},
    {XS, "base64Binary", xs_base64Binary, Reads},
    {XS, "anyURI", xs_anyURI, Reads},
    {XS, "QName", xs_QName},
    {XS, "normalizedString", xs_normalizedString, Reads},
    {XS, "token", xs_token, Reads},
    {XS, "language", xs_language, Reads},
    {XS, "NMTOKEN", xs_NMTOKEN, Reads},
    {XS, "Name", xs_Name, Reads},
    {XS, "NCName", xs_NCName, Reads},
    {XS, "ID", xs_ID, Reads},
    {XS, "IDREF", xs_IDREF, Reads},
    {XS, "ENTITY", xs_ENTITY, Reads},
    {XS, "integer", xs_integer, Reads},
    {XS, "nonPositiveInteger", xs_nonPositiveInteger, Reads},
    {XS, "negativeInteger", xs_negativeInteger, Reads},
    {XS, "long", xs_long, Reads},
    {XS, "int", xs_int, Reads},
    {XS, "short", xs_short, Reads},
    {XS, "byte", xs_byte, Reads},
    {XS, "nonNegativeInteger", xs_nonNegativeInteger, Reads},
    {XS, "unsignedLong", xs_unsignedLong, Reads},
    {XS, "unsignedInt", xs_unsignedInt, Reads},
    {XS, "unsignedShort", xs_unsignedShort, Reads},
    {XS, "unsignedByte", xs_unsignedByte, Reads},
    {XS, "positiveInteger", xs_positiveInteger, Reads},
    {XS, "NOTATION", xs_NOTATION, Reads},
    {XDT, "yearMonthDuration", xdt_yearMonthDuration, Reads},
    {XDT, "dayTimeDuration", xdt_dayTimeDuration, Reads},
    {XDT, "untypedAtomic", xdt_untypedAtomic, Reads},
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
                      make<XQueryBuiltInFunction>(row.proc, row.traits));
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

XQueryProcedure XQueryBuiltInFunction::functionForQName(const Ref<XQueryQName>& qName) {
  const XQueryBuiltInFunction* entry = entryForQName(qName);
  return entry ? entry->proc() : nullptr;
}

std::span<const XQueryBuiltInFunction::Registration> XQueryBuiltInFunction::registrations() {
  return table;
}

}  // namespace xquery
