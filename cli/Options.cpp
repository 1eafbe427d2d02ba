#include "Options.h"

#include "Completions.h"
#include "Inputs.h"
#include "Messages.h"
#include "OptionsTable.h"
#include "Output.h"
#include "Splitting.h"
#include "Streaming.h"
#include "Streams.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <sstream>
#include <string_view>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace cli {
namespace {

constexpr const char* footer =
    "QUERYFILE is a file in UTF-8; -e gives the query itself. INPUT is the document that becomes "
    "the\n"
    "context item, \"-\" stands for standard input; without INPUT there is no context item. With\n"
    "several INPUTs, or a folder of them, the query is evaluated for each on its own. Without a\n"
    "query, on a terminal, a session begins that asks for one after the other.\n\n"
    "Exit status: 0 for a result, 1 for an error in the query, 2 for wrong usage, 3 for input "
    "that\n"
    "cannot be read or parsed or output that cannot be written, 4 with --exit-status for a result\n"
    "that is empty or false.";

// The usage line of the two forms; the rest is the library's.
class Help : public CLI::Formatter {
 public:
  std::string make_usage(const CLI::App*, std::string) const override {
    return "Usage: xquery [options] QUERYFILE [INPUT...]\n"
           "       xquery [options] -e QUERY [INPUT...]\n"
           "       xquery [options] [INPUT.xml]\n"
           "       xquery [options] --split PATH --records N INPUT FOLDER\n";
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
  // For whoever packs or installs the command.
  addTexts(app, "--completions", "")->group("");
  addTexts(app, "arguments", "")
      ->expected(0, CLI::detail::expected_max_vector_size)
      ->allow_extra_args()
      ->take_all()
      ->group("");
}

// The library splits what stands in brackets at its commas, file names too. With this in front of
// them it does not.
constexpr char bracketMark = '\1';

void parse(CLI::App& app, int argc, char** argv) {
  std::vector<std::string> arguments;  // the last one first
  for (int index = argc - 1; index > 0; --index) {
    const std::string_view argument = argv[index];
    const bool isInBrackets = argument.starts_with('[');
    arguments.push_back((isInBrackets ? std::string(1, bracketMark) : "") + std::string(argument));
  }
  app.parse(std::move(arguments));
}

std::vector<std::string> given(const CLI::App& app, const char* name) {
  std::vector<std::string> values = app.get_option(name)->results();
  for (std::string& value : values) {
    if (value.starts_with(std::string{bracketMark, '['})) value.erase(0, 1);
  }
  return values;
}

void applyOptions(const CLI::App& app, Options& options) {
  for (const OptionRow& row : optionRows()) {
    const std::vector<std::string> values = given(app, row.name);
    if (row.takes == Takes::Value && values.size() > 1) {
      throw WrongUsage(std::string(row.name) + " may be given only once");
    }
    for (const std::string& value : values) {
      if (row.takes == Takes::Nothing && value != "true") {
        throw WrongUsage(std::string(row.name) + " takes no value");
      }
      row.apply(row, value, options);
    }
  }
}

// A terminal where a query is expected and none is named: a document is none by its name.
bool beginsSession(const Options& options) {
  if (!isatty(STDIN_FILENO) || !isatty(STDOUT_FILENO) || options.inputs.size() > 1) return false;
  return options.inputs.empty() || isNamedDocument(options.inputs.front(), options.html);
}

// What is about one query, or about its only result, has no meaning then.
void checkSession(const Options& options) {
  const std::pair<bool, const char*> wrong[] = {{options.outputFile.has_value(), "-o"},
                                                {options.filesFrom.has_value(), "--files-from"},
                                                {options.profileFile.has_value(), "--profile"},
                                                {options.jobs > 0, "--jobs"},
                                                {options.stream, "--stream"},
                                                {options.check, "--check"},
                                                {options.plan.has_value(), "--plan"},
                                                {options.exitStatus, "--exit-status"}};
  for (const auto& [isGiven, name] : wrong) {
    if (isGiven) throw WrongUsage(std::string(name) + ": QUERYFILE or -e QUERY is required");
  }
  for (const Binding& document : options.documents) {
    if (document.value == "-") throw WrongUsage("--doc: standard input is the session's own");
  }
}

// Gives the positional arguments their meaning.
void interpretArguments(const CLI::App& app, Options& options) {
  options.inputs = given(app, "arguments");
  if (options.splitPath || options.records > 0) return interpretSplit(options);
  if (options.queryText) return;
  options.isSession = beginsSession(options);
  if (options.isSession) return;
  if (options.inputs.empty()) throw WrongUsage("QUERYFILE or -e QUERY is required");
  options.queryFile = options.inputs.front();
  options.inputs.erase(options.inputs.begin());
}

bool isSameFile(const std::string& a, const std::string& b) {
  std::error_code unknown;
  return a == b || std::filesystem::equivalent(a, b, unknown);
}

// What is not evaluated as a whole has no profile. Whoever forgets to name a file has named
// something else, which must not be overwritten.
void checkProfile(const Options& options) {
  if (!options.profileFile) return;
  const char* const other = options.check    ? "--check"
                            : options.plan   ? "--plan"
                            : options.stream ? "--stream"
                                             : nullptr;
  if (other) throw WrongUsage("--profile does not go with " + std::string(other));
  std::vector<std::string> others = options.inputs;
  if (!options.queryText) others.push_back(options.queryFile);
  if (options.outputFile) others.push_back(*options.outputFile);
  if (options.filesFrom) others.push_back(*options.filesFrom);
  for (const Binding& document : options.documents) others.push_back(document.value);
  for (const std::string& path : others) {
    if (!isSameFile(path, *options.profileFile)) continue;
    throw WrongUsage("--profile: " + path + " is named as something else too");
  }
}

// A result may well take the place of an input, but hardly that of the query.
void checkOutput(const Options& options) {
  if (!options.outputFile || options.queryText || options.queryFile == "-") return;
  if (!isSameFile(options.queryFile, *options.outputFile)) return;
  throw WrongUsage("-o: " + *options.outputFile + " is the query");
}

void checkTogether(const Options& options) {
  const bool isWhole = options.format == Format::XML || options.format == Format::JSON;
  if (isWhole && options.separator) {
    throw WrongUsage("--separator does not go with --as xml and --as json");
  }
  if (options.check && options.plan) throw WrongUsage("--check does not go with --plan");
  if (options.indent && (options.format == Format::HTML || options.format == Format::Text)) {
    throw WrongUsage("--indent does not go with --as html and --as text");
  }
  checkProfile(options);
  checkOutput(options);
}

ptrdiff_t readersBesideInputs(const Options& options) {
  ptrdiff_t readers = options.filesFrom == "-";
  readers += !options.queryText && !options.isSession && options.queryFile == "-";
  for (const Binding& document : options.documents) readers += document.value == "-";
  return readers;
}

void checkStandardInput(const Options& options) {
  const auto inputs = std::count(options.inputs.begin(), options.inputs.end(), "-");
  if (inputs + readersBesideInputs(options) > 1)
    throw WrongUsage("standard input can be read only once");
}

// Help and the like are output as any other.
Status print(const std::string& text) {
  Output output;
  if (output.open(std::nullopt) && output.append(text) && output.finish()) return StatusResult;
  writeMessage("xquery: cannot write standard output: " + output.error() + "\n");
  return StatusInput;
}

Status print(const CLI::App& app, const CLI::Success& request) {
  std::ostringstream text;
  app.exit(request, text, text);
  return print(text.str());
}

Status printCompletions(const std::string& shell) {
  const std::optional<std::string> script = completions(shell);
  if (!script) throw WrongUsage("--completions: expected bash, zsh or fish, not \"" + shell + "\"");
  return print(*script);
}

// How many letters have to be put in, taken away or changed to make one text of the other, and
// neighbours to be swapped.
size_t distance(std::string_view a, std::string_view b) {
  std::vector<std::vector<size_t>> steps(a.size() + 1, std::vector<size_t>(b.size() + 1));
  for (size_t i = 0; i <= a.size(); ++i) {
    for (size_t j = 0; j <= b.size(); ++j) {
      if (i == 0 || j == 0) {
        steps[i][j] = i + j;
        continue;
      }
      steps[i][j] = std::min(
          {steps[i - 1][j] + 1, steps[i][j - 1] + 1, steps[i - 1][j - 1] + (a[i - 1] != b[j - 1])});
      const bool isSwapped = i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1];
      if (isSwapped) steps[i][j] = std::min(steps[i][j], steps[i - 2][j - 2] + 1);
    }
  }
  return steps[a.size()][b.size()];
}

// Of a name as it is given, without its value.
std::string_view withoutDashes(std::string_view name) {
  name.remove_prefix(std::min(name.find_first_not_of('-'), name.size()));
  return name.substr(0, name.find('='));
}

// The shortest option that begins so; empty when none does.
std::string optionThatBegins(std::string_view name) {
  constexpr size_t leastOfStart = 3;
  std::string found;
  if (name.size() < leastOfStart) return found;
  for (const OptionRow& row : optionRows()) {
    if (!withoutDashes(row.name).starts_with(name)) continue;
    if (found.empty() || std::string_view(row.name).size() < found.size()) found = row.name;
  }
  return found;
}

// The option that may have been meant; empty when none is near.
std::string nearestOption(const std::string& wrong) {
  constexpr size_t longest = 32;
  const std::string_view name = withoutDashes(wrong);
  std::string nearest = optionThatBegins(name);
  size_t least = (name.size() + 1) / 3;
  if (!nearest.empty() || name.size() > longest) return nearest;
  for (const OptionRow& row : optionRows()) {
    const size_t steps = distance(name, withoutDashes(row.name));
    if (steps > least || withoutDashes(row.name).size() <= steps) continue;
    if (steps == least && !nearest.empty()) continue;
    nearest = row.name;
    least = steps;
  }
  return nearest;
}

// What was not understood is what looks like an option, the last one first.
std::string unknownOption(const std::vector<std::string>& arguments) {
  const std::string& wrong = arguments.back();
  const std::string nearest = nearestOption(wrong);
  return "unknown option " + wrong + (nearest.empty() ? "" : "; did you mean " + nearest + "?");
}

// The library's message begins with the option that stands without its value, unless the help does
// not show it, which is so for one.
std::string missingValue(const std::string& message) {
  const std::string shown = message.substr(0, message.find(':'));
  const std::string name = shown.empty() ? "--completions" : shown;
  for (const OptionRow& row : optionRows()) {
    if (name == row.name) return name + ": expected " + row.value;
  }
  return name + ": expected a value";
}

Status explain(const std::string& error) {
  writeMessage("xquery: " + visibleName(error) + "\nTry xquery --help.\n");
  return StatusUsage;
}

}  // namespace

bool isReadBesideInputs(const Options& options) {
  return readersBesideInputs(options) > 0;
}

std::optional<Status> parseOptions(int argc, char** argv, Options& options) {
  CLI::App app("Evaluates an XQuery and writes each item of the result on a line of its own.");
  declareOptions(app);
  try {
    parse(app, argc, argv);
    applyOptions(app, options);
    const std::vector<std::string>& shell = app.get_option("--completions")->results();
    if (!shell.empty()) return printCompletions(shell.front());
    interpretArguments(app, options);
    if (options.isSession) checkSession(options);
    checkStandardInput(options);
    if (options.stream) checkStream(options);
    checkTogether(options);
  } catch (const CLI::Success& success) {
    return print(app, success);
  } catch (const CLI::ExtrasError&) {
    return explain(unknownOption(app.remaining()));
  } catch (const CLI::ArgumentMismatch& error) {
    return explain(missingValue(error.what()));
  } catch (const CLI::ParseError& error) {
    return explain(error.what());
  } catch (const WrongUsage& error) {
    return explain(error.what());
  }
  return std::nullopt;
}

}  // namespace cli
