#include "OptionsTable.h"

#include "SessionInput.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <filesystem>
#include <system_error>
#include <utility>

namespace cli {
namespace {

using namespace xquery;

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

template <auto member>
void takeFile(const OptionRow& row, const std::string& value, Options& options) {
  if (value.empty()) refuse(row, "the name of a file", value);
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
  if (!isVariableName(binding.name)) refuse(row, "a name, \"=\" and a value", text);
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
  needText(row, text.substr(0, text.find('=')));
  options.documents.push_back(splitNamed(row, text));
}

void takeNamespace(const OptionRow& row, const std::string& text, Options& options) {
  needText(row, text);
  const Binding binding = split(row, text);
  // As a prolog may not, which says so with these words.
  if (binding.name == "xml" || binding.name == "xmlns") {
    throw WrongUsage(std::string(row.name) + ": prefix " + binding.name + " can't be redeclared");
  }
  if (!binding.name.empty() && !isUnprefixedName(binding.name)) {
    refuse(row, "a prefix, \"=\" and a URI", text);
  }
  options.namespaces[binding.name] = binding.value;
}

// The marks that a shell makes it hard to write: \n, \t, \0 and, for the mark itself, \\.
void takeSeparator(const OptionRow& row, const std::string& text, Options& options) {
  static constexpr std::string_view letters = "nt0\\", meanings("\n\t\0\\", 4);
  std::string separator;
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] != '\\') {
      separator += text[i];
      continue;
    }
    const size_t found = ++i < text.size() ? letters.find(text[i]) : letters.npos;
    if (found == letters.npos) refuse(row, "\\n, \\t, \\0 or \\\\ where there is a \\", text);
    separator += meanings[found];
  }
  options.separator = separator;
}

void takeProfile(const OptionRow& row, const std::string& path, Options& options) {
  const auto isNamed = [&](std::string_view ending) { return path.ends_with(ending); };
  if (!isNamed(".json") && !isNamed(".txt") && !isNamed(".html")) {
    refuse(row, "a file named .html, .json or .txt", path);
  }
  options.profileFile = path;
}

// --- limits --------------------------------------------------------------------------------------

void takeTimeout(const OptionRow& row, const std::string& text, Options& options) {
  constexpr double most = 1e9;
  double seconds = 0;
  const char* const end = text.data() + text.size();
  const auto read = std::from_chars(text.data(), end, seconds);
  if (read.ec != std::errc() || read.ptr != end || !(seconds > 0 && seconds <= most)) {
    refuse(row, "a number of seconds", text);
  }
  options.timeout = std::chrono::nanoseconds(static_cast<int64_t>(seconds * 1e9));
}

void takeMemory(const OptionRow& row, const std::string& text, Options& options) {
  static constexpr std::string_view units = "KMG";
  uint64_t bytes = 0;
  const char* const end = text.data() + text.size();
  const auto read = std::from_chars(text.data(), end, bytes);
  unsigned shift = 0;
  if (read.ec == std::errc() && read.ptr + 1 == end) {
    const size_t unit = units.find(static_cast<char>(*read.ptr & ~0x20));
    if (unit != units.npos) shift = 10 * (static_cast<unsigned>(unit) + 1);
  }
  const bool isWhole = read.ptr == end || shift > 0;
  if (read.ec != std::errc() || !isWhole || bytes == 0 || bytes > (UINT64_MAX >> shift)) {
    refuse(row, "a number of bytes, or one followed by K, M or G", text);
  }
  options.memory = bytes << shift;
}

void denyAll(const OptionRow&, const std::string&, Options& options) {
  options.policy = XQueryLoadingPolicy::denyAll();
}

// What is below no URL, such as one with a user name, is not below itself either.
void allowURLsBelow(const OptionRow& row, const std::string& text, Options& options) {
  const Ref<NSURL> URL = NSURL::URLWithString(NSString::stringWithUTF8(text));
  const bool isOnServer = URL && (URL->scheme() == "http" || URL->scheme() == "https") &&
                          XQueryLoadingPolicy::denyAll().allowURLsBelow(text).allowsURL(*URL);
  if (!isOnServer) refuse(row, "a folder, or a URL such as https://example.org/data/", text);
  options.policy.allowURLsBelow(text);
}

void allow(const OptionRow& row, const std::string& text, Options& options) {
  if (!std::exchange(options.hasAllowed, true)) options.policy = XQueryLoadingPolicy::denyAll();
  std::error_code unknown;
  if (text.find("://") != text.npos) {
    allowURLsBelow(row, text, options);
  } else if (std::filesystem::is_directory(text, unknown)) {
    options.policy.allowFilesBelow(text);
  } else {
    throw WrongUsage(std::string(row.name) + ": there is no folder " + text);
  }
}

// --- the table -----------------------------------------------------------------------------------

constexpr const char* ofQuery = "The query";
constexpr const char* ofInput = "Its input";
constexpr const char* ofResult = "The result";
constexpr const char* ofLimits = "Its limits";
constexpr const char* ofReports = "Reports";

constexpr OptionRow rows[] = {
    {ofQuery, "-e", Takes::Value, "QUERY", Offers::Nothing, "The text of the query",
     take<&Options::queryText>},
    {ofQuery, "--var", Takes::Values, "NAME=VALUE", Offers::Nothing,
     "Bind an external variable to an untyped value", takeVariable},
    {ofQuery, "--doc", Takes::Values, "NAME=FILE", Offers::Files,
     "Bind an external variable to a document", takeDocument},
    {ofQuery, "--namespace", Takes::Values, "P=URI", Offers::Nothing,
     "Make a namespace prefix known to the query; without P, that of names without a prefix",
     takeNamespace},
    {ofInput, "--html", Takes::Nothing, "", Offers::Nothing,
     "Read INPUT as HTML, and documents of --doc that are not named .xml", set<&Options::html>},
    {ofInput, "--files-from", Takes::Value, "LIST", Offers::Files,
     "Read more INPUTs from a file, a line each or with a zero behind each",
     takeFile<&Options::filesFrom>},
    {ofInput, "--jobs", Takes::Value, "N", Offers::Nothing,
     "Work on N inputs at a time; without it, one for each processor", count<&Options::jobs, 1024>},
    {ofInput, "--strip-space", Takes::Nothing, "", Offers::Nothing,
     "Drop text of white space only from documents", set<&Options::stripSpace>},
    {ofInput, "--stream", Takes::Nothing, "", Offers::Nothing,
     "Evaluate INPUT record by record, in the memory of one record, and write each item as it is "
     "found; a query for which that cannot be done is refused",
     set<&Options::stream>},
    {ofInput, "--split", Takes::Value, "PATH", Offers::Nothing,
     "Cut INPUT into documents of as many of the elements that PATH gives as --records says, and "
     "name them; the last argument is the FOLDER they are written to",
     take<&Options::splitPath>},
    {ofInput, "--records", Takes::Value, "N", Offers::Nothing, "That number, with --split",
     count<&Options::records, 1'000'000'000>},
    {ofResult, "--types", Takes::Nothing, "", Offers::Nothing,
     "Put the type and a tab before each item", set<&Options::types>},
    {ofResult, "--as", Takes::Value, "lines|xml|html|json|text", Offers::Words,
     "Write the result as lines of XML and text, as one XML document, as HTML, as an array, or as "
     "text alone",
     choose<&Options::format, Format>},
    {ofResult, "--indent", Takes::Nothing, "", Offers::Nothing,
     "Write each element on a line of its own where that changes no text", set<&Options::indent>},
    {ofResult, "--separator", Takes::Value, "S", Offers::Nothing,
     "Write S between the items, \\n, \\t and \\0 meaning what they do elsewhere, in place of a "
     "line feed behind each",
     takeSeparator},
    {ofResult, "--with-name", Takes::Nothing, "", Offers::Nothing,
     "Put the name of the input and a tab before each item", set<&Options::withName>},
    {ofResult, "--exit-status", Takes::Nothing, "", Offers::Nothing,
     "End with status 4 when the result is empty or false", set<&Options::exitStatus>},
    {ofResult, "-o", Takes::Value, "FILE", Offers::Files, "Write the result to a file",
     takeFile<&Options::outputFile>},
    {ofLimits, "--timeout", Takes::Value, "SECONDS", Offers::Nothing,
     "End an evaluation that takes longer", takeTimeout},
    {ofLimits, "--memory", Takes::Value, "BYTES", Offers::Nothing,
     "End an evaluation whose values take more; with K, M or G for larger units", takeMemory},
    {ofLimits, "--deny-all", Takes::Nothing, "", Offers::Nothing,
     "Let the query load no files and nothing from the network", denyAll},
    {ofLimits, "--allow", Takes::Values, "FOLDER-or-URL", Offers::Folders,
     "Let the query load what is below a folder or a URL, and nothing else", allow},
    {ofReports, "--check", Takes::Nothing, "", Offers::Nothing,
     "Compile the query and report its errors and warnings, without evaluating it",
     set<&Options::check>},
    {ofReports, "--plan", Takes::MaybeValue, "text|json|dot", Offers::Words,
     "Show how the query is evaluated instead of its result",
     choose<&Options::plan, XQueryPlanFormat>},
    {ofReports, "--profile", Takes::Value, "FILE", Offers::Files,
     "Write where the time of the evaluation went to a file, by its name a page (.html), text "
     "(.txt) or .json",
     takeProfile},
    {ofReports, "--time", Takes::Nothing, "", Offers::Nothing,
     "Report the time of each phase on standard error", set<&Options::time>},
    {ofReports, "--repeat", Takes::Value, "N", Offers::Nothing,
     "Evaluate N times, print the result once", count<&Options::repeat, 1'000'000'000>},
    {ofReports, "--color", Takes::Value, "auto|always|never", Offers::Words,
     "Color messages: on a terminal, always or never", choose<&Options::color, Color>},
    {ofReports, "--quiet", Takes::Nothing, "", Offers::Nothing,
     "Show neither the progress of reading nor warnings", set<&Options::quiet>},
    {ofReports, "--progress", Takes::Nothing, "", Offers::Nothing,
     "Show the progress of each of several inputs too", set<&Options::progress>},
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
