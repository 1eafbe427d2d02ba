// Contexts as handles: what the host has set for the evaluations to come.
#pragma once

#include "C/Handles.h"
#include "xquery/capi/queries.h"
#include "xquery/XQuery.h"

#include <atomic>
#include <memory>

namespace xquery::capi {

class Client;

}  // namespace xquery::capi

struct xq_context : xquery::capi::Handle<xquery::capi::Tag::Context> {
  explicit xq_context(xquery::Ref<xquery::XQueryContext> ofEngine);
  ~xq_context();

  const xquery::Ref<xquery::XQueryContext> context;
  const std::shared_ptr<xquery::capi::Client> client;
  xquery::XQueryVariables variables;
  xquery::Value item;
  // Whether a call is under way: of this thread, in one of whose callbacks the host is, or of
  // another one, which must not be.
  mutable std::atomic<bool> isInUse = false;
};

namespace xquery::capi {

// Takes a context for one call.
class ContextUse {
 public:
  explicit ContextUse(const xq_context* context)
      : _context(areGood(context) && !context->isInUse.exchange(true) ? context : nullptr) {}
  ContextUse(const ContextUse&) = delete;
  ContextUse& operator=(const ContextUse&) = delete;
  ~ContextUse() {
    if (_context) _context->isInUse.store(false);
  }

  // Whether it is a context that nobody else uses.
  explicit operator bool() const { return _context != nullptr; }

 private:
  const xq_context* const _context;
};

}  // namespace xquery::capi
