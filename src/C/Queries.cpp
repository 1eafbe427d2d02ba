// Compiling, and what is known of a compiled query.
#include "C/Queries.h"

#include "C/Errors.h"
#include "C/Options.h"
#include "C/Texts.h"
#include "xquery/Stream.h"

using namespace xquery;
using namespace xquery::capi;

namespace xquery::capi {

WarningTexts::WarningTexts(const XQueryWarning& warning)
    : identifier(warning.identifier),
      text(warning.text->utf8()),
      name(warning.name ? warning.name->utf8() : ""),
      moduleURL(warning.module ? warning.module->utf8() : ""),
      line(warning.line),
      column(warning.column) {}

}  // namespace xquery::capi

xq_query::xq_query(Ref<XQuery> compiled, XQueryWay inWay) : query(std::move(compiled)), way(inWay) {
  if (way != XQueryWay::Explained) return;
  for (const XQueryWarning& warning : XQueryWarnings(*query)) warnings.emplace_back(warning);
}

xq_status xq_compile(const char* text, size_t length, const xq_options* options, xq_query** query,
                     xq_error** error) {
  if (error) *error = nullptr;
  if (!query) return XQ_USAGE;
  *query = nullptr;
  const GivenText source(text, length);
  if (!source.isGood() || (options && !areGood(options))) return XQ_USAGE;
  return guardedWithin(error, [&] {
    const XQueryWay way = options ? options->way : XQueryWay::Planned;
    // Copies: the loader may change the options, or free them.
    const XQueryLoading loading = options ? options->loading : XQueryLoading();
    const XQueryLimits limits = options ? options->limits : XQueryLimits();
    const auto compiled = XQuery::xqueryWithSource(source.view(), loading, limits, way);
    if (const auto errors = compiled->parseErrors()) return giveErrors(error, errors);
    return giveNew(query, compiled, way);
  });
}

xq_status xq_query_free(xq_query* query) {
  return freeHandle(query);
}

static_assert(XQ_PLAN_TEXT == static_cast<int>(XQueryPlanFormat::Text));
static_assert(XQ_PLAN_JSON == static_cast<int>(XQueryPlanFormat::JSON));
static_assert(XQ_PLAN_DOT == static_cast<int>(XQueryPlanFormat::DOT));

xq_status xq_query_plan(const xq_query* query, xq_plan_format format, xq_text* plan) {
  if (!emptied(plan) || !areGood(query)) return XQ_USAGE;
  if (format < XQ_PLAN_TEXT || format > XQ_PLAN_DOT) return XQ_USAGE;
  return guarded([&] {
    return fill(*plan, query->query->planDescription(static_cast<XQueryPlanFormat>(format)));
  });
}

xq_status xq_query_stream_plan(const xq_query* query, xq_text* plan) {
  if (!emptied(plan) || !areGood(query)) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const std::string text = XQueryStreamDescription(*query->query);
    return text.empty() ? XQ_END : fill(*plan, text);
  });
}

xq_status xq_query_warning(const xq_query* query, size_t index, xq_warning* warning) {
  if (!warning) return XQ_USAGE;
  *warning = {{"", 0}, {"", 0}, {"", 0}, {"", 0}, 0, 0};
  if (!areGood(query)) return XQ_USAGE;
  if (index >= query->warnings.size()) return XQ_END;
  const WarningTexts& texts = query->warnings[index];
  *warning = {borrowed(texts.identifier), borrowed(texts.text), borrowed(texts.name),
              borrowed(texts.moduleURL),  texts.line,           texts.column};
  return XQ_OK;
}
