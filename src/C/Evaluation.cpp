// Evaluating, as a whole and record by record.
#include "C/Contexts.h"
#include "C/Documents.h"
#include "C/Errors.h"
#include "C/Queries.h"
#include "C/Texts.h"
#include "C/Values.h"
#include "Platform/Base/Counting.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/Collection.h"
#include "xquery/Stream.h"

#include <functional>

using namespace xquery;
using namespace xquery::capi;

namespace {

// The items of a result that nobody else holds are taken over.
std::vector<Value> itemsOf(const Ref<NSArray>& result) {
  if (!result) return {};
  if (NSCounting::hasOneReference(*result)) return std::move(result->objects());
  return result->objects();
}

}  // namespace

xq_status xq_evaluate(xq_context* context, const xq_query* query, xq_value** items,
                      xq_error** error) {
  if (error) *error = nullptr;
  if (!items) return XQ_USAGE;
  *items = nullptr;
  if (!areGood(query)) return XQ_USAGE;
  const ContextUse use(context);
  if (!use) return XQ_USAGE;
  return guardedWithin(error, [&] {
    const Ref<XQuery> kept = query->query;  // a callback may free the handle
    Ref<XQueryError> failure;
    const auto result =
        context->context->evaluateXQuery(*kept, context->variables, context->item, &failure);
    if (const auto found = XQueryFirstError(result, failure)) return giveError(error, found);
    return giveNew(items, itemsOf(result));
  });
}

namespace {

// Hands the items of a stream to the host.
class Receiver {
 public:
  Receiver(xq_receive receive, void* data) : _receive(receive), _data(data) {}

  // Whether the stream goes on.
  bool operator()(const Value& item) {
    xq_value lent;
    lent.isLent = true;
    lent.items.push_back(item);
    const xq_status status = _receive(_data, &lent);
    _hasFailed = status != XQ_OK && status != XQ_END;
    return status == XQ_OK;
  }
  bool hasFailed() const { return _hasFailed; }

 private:
  const xq_receive _receive;
  void* const _data;
  bool _hasFailed = false;
};

xq_status stream(xq_context* context, const xq_query* query, const XQueryStreamInput& input,
                 Receiver receiver, xq_error** error) {
  const Ref<XQuery> kept = query->query;  // a callback may free the handle
  XQueryStreamFailure failure;
  const bool isComplete = context->context->evaluateStream(*kept, context->variables, input,
                                                           std::ref(receiver), failure);
  if (receiver.hasFailed()) return XQ_HOST;
  if (isComplete) return XQ_OK;
  return failure.error ? giveError(error, failure.error) : giveError(error, failure.reading);
}

// What both kinds of streams look at first, and what comes after them.
template <class Run>
xq_status streamBy(xq_context* context, const xq_query* query, xq_reading flags, bool isUsable,
                   xq_error** error, Run run) {
  if (error) *error = nullptr;
  if (!areGood(query) || !isUsable || !areReadingFlags(flags)) return XQ_USAGE;
  const ContextUse use(context);
  if (!use) return XQ_USAGE;
  return guardedWithin(error, [&] {
    XQueryStreamInput input;
    input.options = readingOptions(flags);
    return run(input);
  });
}

}  // namespace

xq_status xq_stream_file(xq_context* context, const xq_query* query, const char* path,
                         size_t length, xq_reading flags, xq_receive receive, void* data,
                         xq_error** error) {
  const GivenText text(path, length);
  const bool isUsable = path && text.isPath() && receive;
  return streamBy(context, query, flags, isUsable, error, [&](XQueryStreamInput& input) {
    input.path = text.view();
    return stream(context, query, input, Receiver(receive, data), error);
  });
}

xq_status xq_stream_input(xq_context* context, const xq_query* query, xq_read read, void* read_data,
                          xq_reading flags, xq_receive receive, void* data, xq_error** error) {
  const bool isUsable = read && receive;
  return streamBy(
      context, query, flags, isUsable, error, [&](XQueryStreamInput& input) -> xq_status {
        HostInput from(read, read_data);
        input.read = std::ref(from);
        const xq_status status = stream(context, query, input, Receiver(receive, data), error);
        if (!from.hasFailed()) return status;
        if (error) {
          xq_error_free(*error);
          *error = nullptr;
        }
        return XQ_HOST;
      });
}
