// Who hears of traces and of missing documents, as functions.
#pragma once

#include <xquery/XQuery.h>

#include <functional>
#include <memory>

namespace xquery::python {

using TraceHearing = std::function<void(const Value& value, const Ref<NSString>& label)>;
using MissingHearing = std::function<void(const XQueryMissingDocument& document)>;

// Without a function for traces they are written to the log.
std::shared_ptr<XQueryClient> clientHearing(TraceHearing trace, MissingHearing missing);

}  // namespace xquery::python
