// What standard error hears about a failure.
#pragma once

#include "Documents.h"
#include "Options.h"
#include "xquery/xquery.h"

#include <string>
#include <vector>

namespace cli {

// Lines of text or, with --as json, of JSON, ready for a terminal. `input` names what of several
// inputs failed; empty where there is no need to say.
std::string report(const Options& options, const Failure& failure, const std::string& input = {});
// The same of warnings; of a prefix that the command line declares there is none.
std::string report(const Options& options, const std::vector<xquery::XQueryWarning>& warnings);

// The same about a document that could not be had, and that there are more of them.
std::string warning(const Options& options, const xquery::XQueryMissingDocument& document);
std::string warningOfMore(const Options& options);

}  // namespace cli
