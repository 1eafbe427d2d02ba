#include "Options.h"

#include "Messages.h"
#include "Output.h"
#include "Streams.h"
#include "xquery/xquery.h"

#include <CLI/CLI.hpp>

#include <memory>
#include <sstream>

namespace cli {
namespace {

constexpr const char* footer =
    "QUERYFILE is a file in UTF-8; -e gives the query itself. INPUT is the document that becomes "
    "the\n"
    "context item, \"-\" stands for standard input; without INPUT there is no context item.\n\n"
    "Exit status: 0 for a result, 1 for an error in the query, 2 for wrong usage, 3 for input "
    "that\n"
    "cannot be read or parsed or output that cannot be written.";

// The usage line of the two forms; the rest is the library's.
class Help : public CLI::Formatter {
 public:
  std::string make_usage(const CLI::App*, std::string) const override {
    return "Usage: xquery [options] QUERYFILE [INPUT]\n"
           "       xquery [options] -e QUERY [INPUT]\n";
  }
};

// Whether a value is for the query to see or a path, which may be any bytes.
enum class Bound { Text, File };

// Splits NAME=VALUE at the first "="; the name must not be empty.
Binding splitBinding(const std::string& option, const std::string& text, Bound bound) {
  const size_t equals = text.find('=');
  if (equals == std::string::npos || equals == 0) {
    throw CLI::ValidationError(option, "expected a name, \"=\" and a value, not \"" + text + "\"");
  }
  // The library would pass over a name or a value that it cannot read.
  if (!xquery::NSString::stringWithUTF8(bound == Bound::Text ? text : text.substr(0, equals))) {
    throw CLI::ValidationError(option, "not UTF-8 text: \"" + text + "\"");
  }
  return {text.substr(0, equals), text.substr(equals + 1)};
}

std::vector<Binding> splitBindings(const std::string& option, const std::vector<std::string>& texts,
                                   Bound bound) {
  std::vector<Binding> bindings;
  for (const std::string& text : texts) bindings.push_back(splitBinding(option, text, bound));
  return bindings;
}

xquery::XQueryPlanFormat planFormat(const std::string& name) {
  using xquery::XQueryPlanFormat;
  if (name == "text") return XQueryPlanFormat::Text;
  if (name == "json") return XQueryPlanFormat::JSON;
  if (name == "dot") return XQueryPlanFormat::DOT;
  throw CLI::ValidationError("--plan", "expected text, json or dot, not \"" + name + "\"");
}

struct RawOptions {
  std::string query, first, second, output, plan;
  std::vector<std::string> variables, documents, namespaces;
};

void declareOptions(CLI::App& app, RawOptions& raw, Options& options) {
  app.formatter(std::make_shared<Help>());
  app.footer(footer);
  app.set_version_flag("--version", "xquery " XQUERY_VERSION);
  app.add_option("-e", raw.query, "The text of the query")->type_name("QUERY");
  app.add_flag("--types", options.types, "Put the type and a tab before each item");
  const auto addPairs = [&app](const char* name, std::vector<std::string>& target,
                               const char* description, const char* type) {
    app.add_option(name, target, description)->type_name(type)->allow_extra_args(false);
  };
  addPairs("--var", raw.variables, "Bind an external variable to an untyped value", "NAME=VALUE");
  addPairs("--doc", raw.documents, "Bind an external variable to a document", "NAME=FILE");
  addPairs("--namespace", raw.namespaces, "Make a namespace prefix known to the query", "P=URI");
  app.add_flag("--html", options.html, "Read INPUT as HTML");
  app.add_flag("--strip-space", options.stripSpace, "Drop text of white space only from documents");
  app.add_option("-o", raw.output, "Write the result to a file")->type_name("FILE");
  app.add_flag("--time", options.time, "Report the time of each phase on standard error");
  app.add_option("--repeat", options.repeat, "Evaluate N times, print the result once")
      ->type_name("N")
      ->check(CLI::Range(1U, 1000000000U));
  app.add_flag("--plan{text}", raw.plan,
               "Show how the query is evaluated instead of its result: --plan, --plan=json or "
               "--plan=dot");
  app.add_option("first", raw.first)->group("");
  app.add_option("second", raw.second)->group("");
}

// Gives the positional arguments and the NAME=VALUE texts their meaning.
void interpret(const CLI::App& app, const RawOptions& raw, Options& options) {
  const bool hasFirst = app.count("first") > 0, hasSecond = app.count("second") > 0;
  if (app.count("-e") > 0) {
    if (hasSecond) throw CLI::ExtrasError({raw.second});
    options.queryText = raw.query;
    if (hasFirst) options.input = raw.first;
  } else {
    if (!hasFirst) throw CLI::RequiredError("QUERYFILE or -e QUERY");
    options.queryFile = raw.first;
    if (hasSecond) options.input = raw.second;
  }
  if (app.count("-o") > 0) options.outputFile = raw.output;
  if (app.count("--plan") > 0) options.plan = planFormat(raw.plan);
  options.variables = splitBindings("--var", raw.variables, Bound::Text);
  options.documents = splitBindings("--doc", raw.documents, Bound::File);
  for (Binding& binding : splitBindings("--namespace", raw.namespaces, Bound::Text)) {
    options.namespaces[binding.name] = binding.value;
  }
}

// Help and version are output like any other.
Status print(const CLI::App& app, const CLI::Success& request) {
  std::ostringstream text;
  app.exit(request, text, text);
  Output output;
  if (output.open(std::nullopt) && output.append(text.str()) && output.finish()) {
    return StatusResult;
  }
  writeMessage("xquery: cannot write standard output: " + output.error() + "\n");
  return StatusInput;
}

}  // namespace

std::optional<Status> parseOptions(int argc, char** argv, Options& options) {
  CLI::App app("Evaluates an XQuery and writes each item of the result on a line of its own.");
  RawOptions raw;
  declareOptions(app, raw, options);
  try {
    app.parse(argc, argv);
    interpret(app, raw, options);
  } catch (const CLI::Success& success) {
    return print(app, success);
  } catch (const CLI::ParseError& error) {
    writeMessage("xquery: " + visible(error.what()) + "\nTry xquery --help.\n");
    return StatusUsage;
  }
  return std::nullopt;
}

}  // namespace cli
