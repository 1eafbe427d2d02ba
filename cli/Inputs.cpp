#include "Inputs.h"

#include "Documents.h"

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <string_view>
#include <system_error>

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

// One with a zero in it has a zero behind each name.
void addList(const Options& options, const std::string& list, std::vector<Input>& inputs) {
  const std::string text = list == "-" ? readStandardInput() : readFile(list);
  const char separator = text.find('\0') == text.npos ? '\n' : '\0';
  for (std::string_view rest = text; !rest.empty();) {
    const size_t end = std::min(rest.find(separator), rest.size());
    if (end > 0) addInput(options, std::string(rest.substr(0, end)), inputs);
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
}

}  // namespace

bool isNamedXML(const std::string& path) {
  const std::string_view unpacked = withoutEnding(std::string_view(path), packings);
  return withoutEnding(unpacked, endingsOfXML) != unpacked;
}

std::vector<Input> inputsOf(const Options& options) {
  std::vector<Input> inputs;
  for (const std::string& path : options.inputs) addInput(options, path, inputs);
  if (options.filesFrom) addList(options, *options.filesFrom, inputs);
  return inputs;
}

}  // namespace cli
