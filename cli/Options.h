// What the command line asks for.
#pragma once

#include "xquery/XQuery.h"

#include <chrono>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace cli {

// The exit statuses.
enum Status : int {
  StatusResult = 0,
  StatusQueryError = 1,
  StatusUsage = 2,
  StatusInput = 3,  // input that cannot be read or parsed, output that cannot be written
  StatusFalse = 4,  // with --exit-status, a result that is empty or false
};

struct Binding {
  std::string name;
  std::string value;
};

// How results are written.
enum class Format {
  Lines,  // nodes as XML, values as text
  XML,    // one document
  HTML,
  JSON,  // one array
  Text,
};

enum class Color { Auto, Always, Never };

struct Options {
  std::optional<std::string> queryText;   // -e
  std::string queryFile;                  // used when there is no text
  std::vector<std::string> inputs;        // files and folders; "-": standard input
  std::optional<std::string> filesFrom;   // a file with names of more
  std::optional<std::string> outputFile;  // none: standard output
  std::vector<Binding> variables;
  std::vector<Binding> documents;
  std::map<std::string, std::string> namespaces;
  bool types = false;
  bool html = false;
  bool stripSpace = false;
  bool time = false;
  bool stream = false;                           // there is an input then, or a plan is asked for
  std::optional<std::string> splitPath;          // the query then, and `stream` is set
  std::optional<std::string> splitFolder;        // where the pieces go
  unsigned records = 0;                          // in each piece
  std::optional<xquery::XQueryPlanFormat> plan;  // to be shown instead of the result
  std::optional<std::string> profileFile;
  unsigned repeat = 1;
  unsigned jobs = 0;  // 0: as many as there are processors
  bool withName = false;
  bool isSession = false;  // queries come from the terminal, one after the other
  // Of the prolog that a session puts before what is entered: messages do not count them.
  size_t linesBefore = 0;
  Format format = Format::Lines;
  bool indent = false;
  Color color = Color::Auto;
  bool exitStatus = false, check = false, quiet = false, progress = false;
  xquery::XQueryLoadingPolicy policy = xquery::XQueryLoadingPolicy::allowAll();
  bool hasAllowed = false;                          // and so nothing else is
  std::optional<std::chrono::nanoseconds> timeout;  // of compiling, and of each evaluation
  std::optional<uint64_t> memory;                   // in bytes, of the same
  std::optional<std::string> separator;             // none: a line feed behind each item

  // Without any there is no context item.
  bool hasInputs() const { return !inputs.empty() || filesFrom; }
};

// Whether standard input is the query, a list of inputs, or the document of a variable.
bool isReadBesideInputs(const Options& options);

// Fills `options`. A status means that the command ends here: help or version was printed, or the
// usage was wrong and has been explained on standard error.
[[nodiscard]] std::optional<Status> parseOptions(int argc, char** argv, Options& options);

}  // namespace cli
