#include "Inputs.h"

#include "Documents.h"

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <string_view>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace cli {
namespace {

namespace fs = std::filesystem;

constexpr std::string_view packings[] = {".gz", ".xz", ".zst", ".bz2"};
constexpr std::string_view endingsOfXML[] = {".xml"};
constexpr std::string_view endingsOfHTML[] = {".html", ".htm"};

template <size_t count>
std::string_view withoutEnding(std::string_view name, const std::string_view (&endings)[count]) {
  for (const std::string_view ending : endings) {
    if (name.ends_with(ending)) return name.substr(0, name.size() - ending.size());
  }
  return name;
}

bool isWanted(const fs::directory_entry& entry, bool html) {
  const std::string name = entry.path().filename().string();
  const std::string_view unpacked = withoutEnding(std::string_view(name), packings);
  return html ? withoutEnding(unpacked, endingsOfHTML) != unpacked : isNamedXML(name);
}

bool isHidden(const fs::directory_entry& entry) {
  return entry.path().filename().string().starts_with('.');
}

// The entries of one folder by their names; what cannot be looked at is nothing that is wanted.
std::vector<fs::directory_entry> entriesOf(const fs::path& folder, std::error_code& error) {
  std::vector<fs::directory_entry> entries;
  for (fs::directory_iterator next(folder, error); !error && next != fs::directory_iterator();
       next.increment(error)) {
    if (!isHidden(*next)) entries.push_back(*next);
  }
  std::sort(entries.begin(), entries.end());
  return entries;
}

void addFolder(const Options& options, const std::string& folder, std::vector<Input>& inputs) {
  const size_t before = inputs.size();
  std::vector<fs::path> folders{folder};  // the next one last
  while (!folders.empty()) {
    const fs::path next = folders.back();
    folders.pop_back();
    std::error_code error, unknown;
    std::vector<fs::path> below;
    for (const fs::directory_entry& entry : entriesOf(next, error)) {
      if (entry.is_directory(unknown)) {
        if (!entry.is_symlink(unknown)) below.push_back(entry.path());
      } else if (entry.is_regular_file(unknown) && isWanted(entry, options.html)) {
        inputs.push_back({entry.path().string(), {}});
      }
    }
    if (error) inputs.push_back({next.string(), error.message()});
    folders.insert(folders.end(), below.rbegin(), below.rend());
  }
  const char* const kind = options.html ? "HTML" : "XML";
  if (inputs.size() == before) {
    inputs.push_back({folder, std::string("no ") + kind + " files in this folder"});
  }
}

void addInput(const Options& options, const std::string& path, std::vector<Input>& inputs) {
  std::error_code unknown;
  if (path != "-" && fs::is_directory(path, unknown)) {
    addFolder(options, path, inputs);
  } else {
    inputs.push_back({path, {}});
  }
}

// Takes what is before the separator off the text, and the separator.
std::string_view takeName(std::string_view& text, char separator) {
  const size_t end = std::min(text.find(separator), text.size());
  const std::string_view name = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return name;
}

// Whether a carriage return ends every line that is not empty, as in lists from other systems. In
// any other list it belongs to a name.
bool endsLinesWithReturns(std::string_view list) {
  bool hasLines = false;
  while (!list.empty()) {
    const std::string_view line = takeName(list, '\n');
    if (line.empty()) continue;
    if (!line.ends_with('\r')) return false;
    hasLines = true;
  }
  return hasLines;
}

// One with a zero in it has a zero behind each name.
void addList(const Options& options, const std::string& list, std::vector<Input>& inputs) {
  constexpr size_t mostBytes = size_t{1} << 30;
  const std::string text = readFile(list, mostBytes);
  std::string_view rest = text;
  const bool hasZeros = text.find('\0') != text.npos;
  if (!hasZeros && rest.starts_with(byteOrderMark)) rest.remove_prefix(byteOrderMark.size());
  const bool hasReturns = !hasZeros && endsLinesWithReturns(rest);
  while (!rest.empty()) {
    std::string_view name = takeName(rest, hasZeros ? '\0' : '\n');
    if (hasReturns && !name.empty()) name.remove_suffix(1);
    if (!name.empty()) addInput(options, std::string(name), inputs);
  }
}

void keepOneReader(const Options& options, std::vector<Input>& inputs) {
  bool isTaken = isReadBesideInputs(options);
  for (Input& input : inputs) {
    if (input.path == "-" && std::exchange(isTaken, true)) {
      input.failure = "can be read only once";
    }
  }
}

bool isSameFile(const struct stat& a, const struct stat& b) {
  return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

}  // namespace

bool isNamedXML(const std::string& path) {
  const std::string_view unpacked = withoutEnding(std::string_view(path), packings);
  return withoutEnding(unpacked, endingsOfXML) != unpacked;
}

bool isNamedDocument(const std::string& path, bool html) {
  const std::string_view unpacked = withoutEnding(std::string_view(path), packings);
  return isNamedXML(path) || (html && withoutEnding(unpacked, endingsOfHTML) != unpacked);
}

std::vector<Input> inputsOf(const Options& options) {
  std::vector<Input> inputs;
  for (const std::string& path : options.inputs) addInput(options, path, inputs);
  if (options.filesFrom) addList(options, *options.filesFrom, inputs);
  keepOneReader(options, inputs);
  return inputs;
}

void refuseOutputAsInput(const Options& options, const std::string& path) {
  struct stat output, input;
  if (options.outputFile || fstat(STDOUT_FILENO, &output) != 0 || !S_ISREG(output.st_mode)) return;
  const bool isThere =
      (path == "-" ? fstat(STDIN_FILENO, &input) : stat(path.c_str(), &input)) == 0;
  if (!isThere || !isSameFile(input, output)) return;
  throw Failure{StatusInput, "xquery: " + shownName(path) + ": this is where the output goes", {}};
}

}  // namespace cli
