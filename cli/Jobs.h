// One compiled query, evaluated for every input: by several threads where there are several.
#pragma once

#include "Inputs.h"
#include "Options.h"
#include "Profile.h"
#include "Timing.h"
#include "xquery/xquery.h"

#include <optional>
#include <vector>

namespace cli {

// Without inputs, nothing stands for evaluating once without a context item. Each input that fails
// is reported, and the others go on. Answers the gravest status; throws Failure for output that
// cannot be written. The profile, which may be null, is added to, and written before an interrupt
// ends the process.
[[nodiscard]] Status runJobs(const Options& options, const xquery::XQuery& query,
                             const xquery::XQueryVariables& constants,
                             const std::optional<std::vector<Input>>& inputs, Phases& phases,
                             Profile* profile);

}  // namespace cli
