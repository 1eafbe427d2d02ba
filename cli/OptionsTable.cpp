#include "OptionsTable.h"

#include "xquery/String.h"

#include <algorithm>
#include <charconv>
#include <cstdint>

namespace cli {
namespace {

using xquery::NSString;
using xquery::XQueryPlanFormat;

[[noreturn]] void refuse(const OptionRow& row, const std::string& expected,
                         const std::string& value) {
  throw WrongUsage(std::string(row.name) + ": expected " + expected + ", not \"" + value + "\"");
}

// --- ways to take a value ------------------------------------------------------------------------

template <auto member>
void set(const OptionRow&, const std::string&, Options& options) {
  options.*member = true;
}

template <auto member>
void take(const OptionRow&, const std::string& value, Options& options) {
  options.*member = value;
}

// "a, b or c"
std::string enumerated(const std::vector<std::string>& words) {
  std::string text;
  for (size_t i = 0; i < words.size(); ++i) {
    if (i > 0) text += i + 1 < words.size() ? ", " : " or ";
    text += words[i];
  }
  return text;
}

// The words of the row are in the order of the enumeration.
template <auto member, class Enumeration>
void choose(const OptionRow& row, const std::string& value, Options& options) {
  const std::vector<std::string> known = words(row);
  const auto found = std::find(known.begin(), known.end(), value);
  if (found == known.end()) refuse(row, enumerated(known), value);
  options.*member = static_cast<Enumeration>(found - known.begin());
}

template <auto member, unsigned most>
void count(const OptionRow& row, const std::string& value, Options& options) {
  unsigned number = 0;
  const char* const end = value.data() + value.size();
  const auto read = std::from_chars(value.data(), end, number);
  if (read.ec != std::errc() || read.ptr != end || number < 1 || number > most) {
    refuse(row, "a number from 1 to " + std::to_string(most), value);
  }
  options.*member = number;
}

// Splits NAME=VALUE at the first "=".
Binding split(const OptionRow& row, const std::string& text) {
  const size_t equals = text.find('=');
  if (equals == std::string::npos) refuse(row, "a name, \"=\" and a value", text);
  return {text.substr(0, equals), text.substr(equals + 1)};
}

Binding splitNamed(const OptionRow& row, const std::string& text) {
  Binding binding = split(row, text);
  if (binding.name.empty()) refuse(row, "a name, \"=\" and a value", text);
  return binding;
}

// The library would pass over a name or a value that it cannot read.
void needText(const OptionRow& row, const std::string& text) {
  if (NSString::stringWithUTF8(text)) return;
  throw WrongUsage(std::string(row.name) + ": not UTF-8 text: \"" + text + "\"");
}

void takeVariable(const OptionRow& row, const std::string& text, Options& options) {
  needText(row, text);
  options.variables.push_back(splitNamed(row, text));
}

// The path may be any bytes.
void takeDocument(const OptionRow& row, const std::string& text, Options& options) {
  const Binding binding = splitNamed(row, text);
  needText(row, binding.name);
  options.documents.push_back(binding);
}

void takeNamespace(const OptionRow& row, const std::string& text, Options& options) {
  needText(row, text);
  const Binding binding = splitNamed(row, text);
  options.namespaces[binding.name] = binding.value;
}

// --- the table -----------------------------------------------------------------------------------

constexpr const char* ofQuery = "The query";
constexpr const char* ofInput = "Its input";
constexpr const char* ofResult = "The result";
constexpr const char* ofReports = "Reports";

constexpr OptionRow rows[] = {
    {ofQuery, "-e", Takes::Value, "QUERY", Offers::Nothing, "The text of the query",
     take<&Options::queryText>},
    {ofQuery, "--var", Takes::Values, "NAME=VALUE", Offers::Nothing,
     "Bind an external variable to an untyped value", takeVariable},
    {ofQuery, "--doc", Takes::Values, "NAME=FILE", Offers::Files,
     "Bind an external variable to a document", takeDocument},
    {ofQuery, "--namespace", Takes::Values, "P=URI", Offers::Nothing,
     "Make a namespace prefix known to the query", takeNamespace},
    {ofInput, "--html", Takes::Nothing, "", Offers::Nothing, "Read INPUT as HTML",
     set<&Options::html>},
    {ofInput, "--files-from", Takes::Value, "LIST", Offers::Files,
     "Read more INPUTs from a file, a line each or with a zero behind each",
     take<&Options::filesFrom>},
    {ofInput, "--jobs", Takes::Value, "N", Offers::Nothing,
     "Work on N inputs at a time; without it, one for each processor", count<&Options::jobs, 1024>},
    {ofInput, "--strip-space", Takes::Nothing, "", Offers::Nothing,
     "Drop text of white space only from documents", set<&Options::stripSpace>},
    {ofResult, "--types", Takes::Nothing, "", Offers::Nothing,
     "Put the type and a tab before each item", set<&Options::types>},
    {ofResult, "--with-name", Takes::Nothing, "", Offers::Nothing,
     "Put the name of the input and a tab before each item", set<&Options::withName>},
    {ofResult, "-o", Takes::Value, "FILE", Offers::Files, "Write the result to a file",
     take<&Options::outputFile>},
    {ofReports, "--plan", Takes::MaybeValue, "text|json|dot", Offers::Words,
     "Show how the query is evaluated instead of its result",
     choose<&Options::plan, XQueryPlanFormat>},
    {ofReports, "--time", Takes::Nothing, "", Offers::Nothing,
     "Report the time of each phase on standard error", set<&Options::time>},
    {ofReports, "--repeat", Takes::Value, "N", Offers::Nothing,
     "Evaluate N times, print the result once", count<&Options::repeat, 1'000'000'000>},
};

}  // namespace

std::span<const OptionRow> optionRows() {
  return rows;
}

std::vector<std::string> words(const OptionRow& row) {
  std::vector<std::string> found;
  for (std::string_view rest = row.value; !rest.empty();) {
    const size_t end = std::min(rest.find('|'), rest.size());
    found.emplace_back(rest.substr(0, end));
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
  return found;
}

}  // namespace cli
