// --stream: the query evaluated for one input record by record, each item written as it is found.
#pragma once

#include "Documents.h"
#include "Options.h"
#include "Timing.h"
#include "xquery/xquery.h"

#include <functional>
#include <optional>

namespace cli {

// The usage is wrong where the options ask for what a stream cannot do; throws WrongUsage.
void checkStream(const Options& options);

// What was found before a failure stays written, since somebody may have read it; but a file is
// replaced by a complete result or not at all. Throws Failure when it cannot be written.
Status runStream(const Options& options, const xquery::XQuery& query,
                 const xquery::XQueryVariables& constants, Phases& phases);

// Reads the one INPUT, as the options say, and hands each item to `receive`, which answers whether
// it wants more. Of `input` only what is called meanwhile is looked at. None when all was read or
// no more was wanted; else what went wrong, an item that is an error included.
std::optional<Failure> evaluateRecords(
    const Options& options, const xquery::XQuery& query, const xquery::XQueryVariables& constants,
    xquery::XQueryStreamInput input, const std::function<bool(const xquery::Value& item)>& receive);

}  // namespace cli
