#include "queries/QueryCase.h"

#include "Engine/ModuleTable.h"

#include <algorithm>
#include <fstream>

namespace xquery::querytest {

namespace {

constexpr std::string_view nameMark = "== ";

// `text` up to the first `separator`, which is dropped with it.
std::string takeUpTo(std::string& text, char separator) {
  const size_t at = text.find(separator);
  std::string head = text.substr(0, at);
  text = at == std::string::npos ? "" : text.substr(at + 1);
  return head;
}

void readHeader(QueryCase& c, std::string header, std::string& section, std::string& name) {
  section = takeUpTo(header, ' ');
  name = header;
  if (section == "var") {
    const std::string variable = takeUpTo(header, '=');
    c.constants[variable] = NSString::stringWithUTF8(header);
  } else if (section == "namespace") {
    const std::string prefix = takeUpTo(header, '=');
    c.namespaces[prefix] = header;
  } else if (section == "error") {
    c.error = header;
  }
}

}  // namespace

std::vector<CasePlace> placesOfCases(const std::filesystem::path& folder) {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    if (entry.path().extension() == ".cases") files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  std::vector<CasePlace> places;
  for (const auto& file : files) {
    std::ifstream in(file);
    std::string line;
    for (int number = 1; std::getline(in, line); ++number) {
      if (line.starts_with(nameMark))
        places.push_back({file, number, line.substr(nameMark.size())});
    }
  }
  return places;
}

QueryCase readCase(const CasePlace& place) {
  QueryCase c;
  c.file = place.path.filename().string();
  c.line = place.line;
  std::ifstream in(place.path);
  std::string line, section, sectionName;
  for (int number = 1; std::getline(in, line); ++number) {
    if (number <= place.line) continue;
    if (line.starts_with(nameMark)) break;
    if (line.starts_with("-- ")) {
      readHeader(c, line.substr(3), section, sectionName);
    } else if (section == "xml") {
      c.xml += line + "\n";
    } else if (section == "file") {
      c.files[sectionName] += line + "\n";
    } else if (section == "module") {
      c.modules[sectionName] += line + "\n";
    } else if (section == "query") {
      c.query += line + "\n";
    } else if (section == "result" && !line.empty()) {
      c.result.push_back(line);
    }
  }
  // The last line break belongs to the file, not to the query.
  if (!c.query.empty()) c.query.pop_back();
  return c;
}

Ref<XQuery> compiledCase(const QueryCase& c, std::string_view folderURL, XQueryWay way) {
  return XQuery::xqueryWithSource(std::string_view(replaced(c.query, folderMark, folderURL)),
                                  c.modules.empty() ? XQueryLoading() : loadingOf(c.modules),
                                  XQueryLimits(), way);
}

std::string replaced(std::string text, std::string_view from, std::string_view by) {
  for (size_t at = 0; (at = text.find(from, at)) != text.npos; at += by.size()) {
    text.replace(at, from.size(), by);
  }
  return text;
}

std::string printedItem(const NSObject& item) {
  std::string text = XQueryItemTypeName(item) + "\t";
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) {
    node->appendXMLTo(text);
  } else {
    text += XQueryItemStringValue(item);
  }
  return text;
}

}  // namespace xquery::querytest
