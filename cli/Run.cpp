#include "Run.h"

#include "Documents.h"
#include "Evaluation.h"
#include "Inputs.h"
#include "Jobs.h"
#include "Messages.h"
#include "Output.h"
#include "Profile.h"
#include "Reports.h"
#include "Session.h"
#include "Signals.h"
#include "Splitting.h"
#include "Streaming.h"
#include "Streams.h"
#include "Timing.h"
#include "xquery/xquery.h"

namespace cli {
namespace {

using namespace xquery;

void printPlan(const Options& options, const XQuery& query) {
  Output output;
  const std::string plan = options.stream ? XQueryStreamDescription(query)
                                          : query.planDescription(*options.plan)->utf8();
  if (output.open(options.outputFile) && output.append(plan) && output.finish()) return;
  throw writingFailure(options.outputFile, output.error());
}

// Of a query without errors.
void reportWarnings(const Options& options, const XQuery& query, const Ref<NSString>& source) {
  if (options.quiet) return;
  if (!options.stream) return writeMessage(report(options, XQueryWarnings(query)));
  // What is compiled to be streamed tells why that cannot be, and nothing else.
  Options whole = options;
  whole.stream = false;
  writeMessage(report(options, XQueryWarnings(*compile(whole, source))));
}

// The profile is written of all that was evaluated, whatever became of it.
Status evaluateAll(const Options& options, const XQuery& query, const XQueryVariables& constants,
                   const std::optional<std::vector<Input>>& inputs, Phases& phases) {
  std::optional<Profile> profile;
  if (options.profileFile) profile.emplace(options, query);
  try {
    const Status status =
        runJobs(options, query, constants, inputs, phases, profile ? &*profile : nullptr);
    if (profile) profile->write(phases);
    return status;
  } catch (const Failure&) {
    if (profile) profile->writeAnyway(phases);
    throw;
  }
}

Status runPhases(const Options& options) {
  Phases phases;
  const Ref<NSString> source = queryText(options);
  const Ref<XQuery> query = phases.compile.measure([&] { return compile(options, source); });
  if (options.check) {
    reportWarnings(options, *query, source);
    return StatusResult;
  }
  if (options.plan) {
    printPlan(options, *query);
    return StatusResult;
  }
  const XQueryVariables constants = phases.parse.measure([&] { return bindConstants(options); });
  if (options.stream) {
    const Status status = options.splitPath ? runSplit(options, *query, constants, phases)
                                            : runStream(options, *query, constants, phases);
    if (options.time && (status == StatusResult || status == StatusFalse)) phases.report(false);
    return status;
  }
  std::optional<std::vector<Input>> inputs;
  if (options.hasInputs()) inputs = inputsOf(options);
  const Status status = evaluateAll(options, *query, constants, inputs, phases);
  if (options.time && (status == StatusResult || status == StatusFalse))
    phases.report(options.repeat > 1);
  return status;
}

}  // namespace

Status run(const Options& options) {
  try {
    return options.isSession ? runSession(options) : runPhases(options);
  } catch (const Failure& failure) {
    endIfInterrupted();
    writeMessage(report(options, failure));
    return failure.status;
  } catch (const std::exception& error) {
    writeMessage(report(options, {StatusInput, std::string("xquery: ") + error.what(), {}}));
    return StatusInput;
  }
}

}  // namespace cli
