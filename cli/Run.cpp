#include "Run.h"

#include "Documents.h"
#include "ItemWriter.h"
#include "Messages.h"
#include "Output.h"
#include "Streams.h"
#include "Timing.h"
#include "xquery/xquery.h"

#include <string_view>

namespace cli {
namespace {

using namespace xquery;

// What a query names beside it is looked for beside its file, or in the working folder.
Ref<XQuery> compile(const Options& options, const Ref<NSString>& source) {
  XQueryLoading loading;
  const auto URL = NSURL::fileURLWithPath(options.queryText ? "./" : options.queryFile);
  if (URL) loading.moduleURL = URL->absoluteString()->utf8();
  const XQueryWay way = options.plan ? XQueryWay::Explained : XQueryWay::Planned;
  Ref<XQuery> query = XQuery::xqueryWithSource(source, loading, XQueryLimits(), way);
  const Ref<NSArray> errors = query->parseErrors();
  if (!errors || errors->count() == 0) return query;
  throw Failure{StatusQueryError, descriptions(*errors)};
}

// Null for a query that has no value and no error, such as a library module. A value that is an
// error counts as one wherever it stands, and then nothing is printed.
Ref<NSArray> evaluate(XQueryContext& context, const XQuery& query, const XQueryConstants& constants,
                      const Value& contextItem) {
  Ref<XQueryError> error;
  Ref<NSArray> items = context.evaluateXQuery(query, constants, contextItem, &error);
  if (const Ref<NSError> failure = XQueryFirstError(items, error)) {
    throw Failure{StatusQueryError, description(*failure)};
  }
  return items;
}

// Opens the output, has it written and closes it.
template <class Write>
bool print(const Options& options, Write write) {
  Output output;
  const std::string name = options.outputFile.value_or("standard output");
  if (output.open(options.outputFile)) {
    write(output);
    if (output.finish()) return true;
  }
  throw Failure{StatusInput, "xquery: cannot write " + name + ": " + output.error()};
}

bool printPlan(const Options& options, const XQuery& query) {
  return print(options, [&](Output& output) {
    output.append(query.planDescription(*options.plan)->utf8());
  });
}

void runPhases(const Options& options) {
  Phases phases;
  const Ref<NSString> source = queryText(options);
  const Ref<XQuery> query = phases.compile.measure([&] { return compile(options, source); });
  if (options.plan) {
    printPlan(options, *query);
    return;
  }
  Value contextItem;
  const XQueryConstants constants = phases.parse.measure([&] {
    if (options.input) {
      contextItem =
          readDocument(options, *options.input, options.html ? Markup::HTML : Markup::XML);
    }
    return bindConstants(options);
  });
  const Ref<XQueryContext> context = XQueryContext::xqueryContextWithNamespaces(options.namespaces);
  Ref<NSArray> items;
  for (unsigned n = 0; n < options.repeat; n++) {
    items = nullptr;
    items =
        phases.evaluate.measure([&] { return evaluate(*context, *query, constants, contextItem); });
  }
  phases.print.measure([&] {
    return print(options, [&](Output& output) {
      if (items) writeItems(options, *items, output);
    });
  });
  if (options.time) phases.report(options.repeat > 1);
}

}  // namespace

Status run(const Options& options) {
  try {
    runPhases(options);
    return StatusResult;
  } catch (const Failure& failure) {
    writeMessage(visible(failure.message) + "\n");
    return failure.status;
  } catch (const std::exception& error) {
    writeMessage("xquery: " + visible(error.what()) + "\n");
    return StatusInput;
  }
}

}  // namespace cli
