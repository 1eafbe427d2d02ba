#include "Options.h"

#include "Messages.h"
#include "OptionsTable.h"
#include "Output.h"
#include "Streams.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <memory>
#include <sstream>

namespace cli {
namespace {

constexpr const char* footer =
    "QUERYFILE is a file in UTF-8; -e gives the query itself. INPUT is the document that becomes "
    "the\n"
    "context item, \"-\" stands for standard input; without INPUT there is no context item. With\n"
    "several INPUTs, or a folder of them, the query is evaluated for each on its own.\n\n"
    "Exit status: 0 for a result, 1 for an error in the query, 2 for wrong usage, 3 for input "
    "that\n"
    "cannot be read or parsed or output that cannot be written.";

// The usage line of the two forms; the rest is the library's.
class Help : public CLI::Formatter {
 public:
  std::string make_usage(const CLI::App*, std::string) const override {
    return "Usage: xquery [options] QUERYFILE [INPUT...]\n"
           "       xquery [options] -e QUERY [INPUT...]\n";
  }
  // The value belongs to the name where it may be left out.
  std::string make_option_name(const CLI::Option* option, bool isPositional) const override {
    const std::string name = CLI::Formatter::make_option_name(option, isPositional);
    for (const OptionRow& row : optionRows()) {
      if (row.takes == Takes::MaybeValue && name.starts_with(row.name)) {
        return std::string(row.name) + "[=" + row.value + "]";
      }
    }
    return name;
  }
};

// The texts that stand behind an option, or of the positional arguments, as they were given.
CLI::Option* addTexts(CLI::App& app, const std::string& name, const char* help) {
  return app.add_option(name, CLI::callback_t([](const CLI::results_t&) { return true; }), help);
}

void declareOption(CLI::App& app, const OptionRow& row) {
  CLI::Option* option = nullptr;
  switch (row.takes) {
    case Takes::Nothing:
      option = app.add_flag(row.name, row.help);
      break;
    case Takes::MaybeValue:
      option = app.add_flag(std::string(row.name) + "{" + words(row).front() + "}", row.help);
      break;
    case Takes::Value:
      option = addTexts(app, row.name, row.help)->type_name(row.value);
      break;
    case Takes::Values:
      option = addTexts(app, row.name, row.help)->type_name(row.value)->take_all();
      break;
  }
  option->group(row.group);
}

void declareOptions(CLI::App& app) {
  app.formatter(std::make_shared<Help>());
  app.footer(footer);
  app.set_version_flag("--version", "xquery " XQUERY_VERSION);
  for (const OptionRow& row : optionRows()) declareOption(app, row);
  addTexts(app, "arguments", "")
      ->expected(0, CLI::detail::expected_max_vector_size)
      ->allow_extra_args()
      ->take_all()
      ->group("");
}

void applyOptions(const CLI::App& app, Options& options) {
  for (const OptionRow& row : optionRows()) {
    for (const std::string& value : app.get_option(row.name)->results()) {
      if (row.takes == Takes::Nothing && value != "true") {
        throw WrongUsage(std::string(row.name) + " takes no value");
      }
      row.apply(row, value, options);
    }
  }
}

// Gives the positional arguments their meaning.
void interpretArguments(const CLI::App& app, Options& options) {
  options.inputs = app.get_option("arguments")->results();
  if (options.queryText) return;
  if (options.inputs.empty()) throw WrongUsage("QUERYFILE or -e QUERY is required");
  options.queryFile = options.inputs.front();
  options.inputs.erase(options.inputs.begin());
}

void checkStandardInput(const Options& options) {
  auto readers = std::count(options.inputs.begin(), options.inputs.end(), "-");
  readers += options.filesFrom == "-";
  for (const Binding& document : options.documents) readers += document.value == "-";
  if (readers > 1) throw WrongUsage("standard input can be read only once");
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

Status explain(const std::string& error) {
  writeMessage("xquery: " + visible(error) + "\nTry xquery --help.\n");
  return StatusUsage;
}

}  // namespace

std::optional<Status> parseOptions(int argc, char** argv, Options& options) {
  CLI::App app("Evaluates an XQuery and writes each item of the result on a line of its own.");
  declareOptions(app);
  try {
    app.parse(argc, argv);
    applyOptions(app, options);
    interpretArguments(app, options);
    checkStandardInput(options);
  } catch (const CLI::Success& success) {
    return print(app, success);
  } catch (const CLI::ParseError& error) {
    return explain(error.what());
  } catch (const WrongUsage& error) {
    return explain(error.what());
  }
  return std::nullopt;
}

}  // namespace cli
