// Errors as the host sees them. All texts are made with the handle, so that threads may look at it.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/errors.h"
#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Exception.h"
#include "xquery/XMLNode.h"

#include <optional>
#include <string>
#include <vector>

namespace xquery::capi {

struct PlaceTexts {
  std::string moduleURL;
  int64_t line = 0;
  int64_t column = 0;
  int64_t length = 0;
  std::string sourceLine;
};

struct CallTexts {
  std::string function;
  std::optional<PlaceTexts> place;
};

}  // namespace xquery::capi

struct xq_error : xquery::capi::Handle<xquery::capi::Tag::Error> {
  // The error with that number in a list, which has one at least.
  xq_error(xquery::Ref<xquery::NSArray> inList, size_t atIndex);
  // Of a document.
  explicit xq_error(const xquery::NSXMLParseError& error);

  int64_t number = 0;
  xq_category category = XQ_CATEGORY_INTERNAL;
  int64_t line = 0;
  int64_t column = 0;
  std::string message;
  std::string description;
  std::optional<xquery::capi::PlaceTexts> place;
  std::vector<xquery::capi::CallTexts> calls;
  int64_t callsLeftOut = 0;
  // All that were found, and which of them this one is.
  xquery::Ref<xquery::NSArray> list;
  size_t index = 0;
};

namespace xquery::capi {

// Hands the error to the host, if it wants it; answers the status.
xq_status giveError(xq_error** out, const Ref<NSError>& error);
xq_status giveErrors(xq_error** out, const Ref<NSArray>& errors);
xq_status giveError(xq_error** out, const NSXMLParseError& error);
// Ends an evaluation or a compilation that the host started in a callback of another one. That
// one's limit was reached, and it will notice as soon as the callback returns.
xq_status giveOuterLimit(xq_error** out, const NSException& limit);

// As `guarded`, for what may be called in a callback, and has an error to say so.
template <class Call>
xq_status guardedWithin(xq_error** out, Call call) noexcept {
  return guarded([&]() -> xq_status {
    try {
      return call();
    } catch (const NSException& limit) {
      return giveOuterLimit(out, limit);
    }
  });
}

}  // namespace xquery::capi
