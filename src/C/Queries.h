// Compiled queries as handles.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/queries.h"
#include "xquery/Warnings.h"
#include "xquery/XQuery.h"

#include <string>
#include <vector>

namespace xquery::capi {

struct WarningTexts {
  explicit WarningTexts(const XQueryWarning& warning);

  std::string identifier;
  std::string text;
  std::string name;
  std::string moduleURL;
  int64_t line;
  int64_t column;
};

}  // namespace xquery::capi

struct xq_query : xquery::capi::Handle<xquery::capi::Tag::Query> {
  xq_query(xquery::Ref<xquery::XQuery> compiled, xquery::XQueryWay inWay);

  const xquery::Ref<xquery::XQuery> query;
  const xquery::XQueryWay way;
  // Of an explained query. Made with the handle, so that threads may look at it.
  std::vector<xquery::capi::WarningTexts> warnings;
};
