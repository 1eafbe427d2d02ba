// Sequences as handles.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/values.h"
#include "xquery/Collection.h"

#include <vector>

struct xq_value : xquery::capi::Handle<xquery::capi::Tag::Value> {
  xq_value() = default;
  explicit xq_value(std::vector<xquery::Value> of) : items(std::move(of)) {}

  std::vector<xquery::Value> items;
  bool isLent = false;  // to a callback: the host must not free it
};

namespace xquery::capi {

// As the engine takes it: the NSNull, the item, or an array of the host's own.
Value asOneValue(const xq_value& value);

}  // namespace xquery::capi
