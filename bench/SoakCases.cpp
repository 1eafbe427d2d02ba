#include "SoakCases.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <optional>
#include <string_view>
#include <tuple>
#include <unistd.h>
#include <utility>

namespace bench {

using namespace xquery;

namespace {

constexpr std::string_view folderMark = "@folder@";

std::string replaced(std::string text, std::string_view from, std::string_view by) {
  for (size_t at = 0; (at = text.find(from, at)) != text.npos; at += by.size()) {
    text.replace(at, from.size(), by);
  }
  return text;
}

std::pair<std::string, std::string> splitAt(const std::string& text, char separator) {
  const size_t at = std::min(text.find(separator), text.size());
  return {text.substr(0, at), text.substr(std::min(at + 1, text.size()))};
}

class Modules : public XQueryLoader {
 public:
  explicit Modules(std::map<std::string, std::string> modules) : _modules(std::move(modules)) {}
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    const auto found = _modules.find(URL.absoluteString()->utf8());
    if (found == _modules.end()) return std::nullopt;
    return XQueryResource{found->second, {}, {}, {}};
  }

 private:
  const std::map<std::string, std::string> _modules;
};

bool isRepeatable(const std::string& query) {
  return query.find("current-") == query.npos && query.find("real-date") == query.npos;
}

std::string printed(const NSObject& item) {
  std::string text = XQueryItemTypeName(item) + "\t";
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) {
    node->appendXMLTo(text);
  } else {
    text += XQueryItemStringValue(item);
  }
  return text;
}

// What a file says of a case.
struct Sections {
  SoakCase found;
  std::string xml;
  std::map<std::string, std::string> files;
  std::string section;
  std::string name;

  void header(const std::string& line) {
    std::tie(section, name) = splitAt(line, ' ');
    const auto [key, value] = splitAt(name, '=');
    if (section == "var") found.constants[key] = NSString::stringWithUTF8(value);
    if (section == "namespace") found.namespaces[key] = value;
  }
  void content(const std::string& line) {
    if (section == "xml") xml += line + "\n";
    if (section == "file") files[name] += line + "\n";
    if (section == "module") found.modules[name] += line + "\n";
    if (section == "query") found.text += (found.text.empty() ? "" : "\n") + line;
  }
};

}  // namespace

std::string soakAnswer(const XQuery& query, XQueryContext& context, const SoakCase& c) {
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, c.constants, c.document, &error);
  if (error) {
    return "error " + std::to_string(error->err()) + " line " + std::to_string(error->line()) +
           " " + (error->msg() ? error->msg()->utf8() : "") + "\n";
  }
  std::string text;
  for (size_t i = 0; items && i < items->count(); ++i) {
    text += printed(*items->objectAtIndex(i)) + "\n";
  }
  return text;
}

bool isSoakLimit(const std::string& answer) {
  return answer.starts_with("error 0 ") && answer.find(" limit: ") != answer.npos;
}

SoakCases::SoakCases()
    : _folder(std::filesystem::temp_directory_path() /
              ("xquery-soak-" + std::to_string(::getpid()))) {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(XQUERY_QUERY_CASES)) {
    if (entry.path().extension() == ".cases") files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  for (const auto& file : files) readFile(file);
}

SoakCases::~SoakCases() {
  std::error_code ignored;
  std::filesystem::remove_all(_folder, ignored);
}

void SoakCases::readFile(const std::filesystem::path& path) {
  std::ifstream in(path);
  Sections sections;
  const auto take = [&] {
    if (!sections.found.text.empty()) finish(sections.found, sections.xml, sections.files);
  };
  std::string line;
  for (int number = 1; std::getline(in, line); ++number) {
    if (line.starts_with("== ")) {
      take();
      sections = {};
      sections.found.file = path.filename().string();
      sections.found.line = number;
    } else if (line.starts_with("-- ")) {
      sections.header(line.substr(3));
    } else {
      sections.content(line);
    }
  }
  take();
}

void SoakCases::finish(SoakCase& c, const std::string& xml,
                       const std::map<std::string, std::string>& files) {
  if (!isRepeatable(c.text)) return;
  const std::filesystem::path folder = _folder / std::to_string(_all.size());
  for (const auto& [name, text] : files) {
    std::filesystem::create_directories((folder / name).parent_path());
    std::ofstream(folder / name, std::ios::binary) << text;
  }
  c.text = replaced(c.text, folderMark, "file://" + folder.string() + "/");
  if (!xml.empty()) {
    Value& document = _documents[xml];
    if (!document) document = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
    c.document = document;
  }
  c.plain = compiled(c, XQueryWay::Plain);
  c.planned = compiled(c, XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContextWithNamespaces(c.namespaces);
  c.alone = soakAnswer(*c.plain, *context, c);
  _all.push_back(std::move(c));
}

Ref<XQuery> SoakCases::compiled(const SoakCase& c, XQueryWay way) const {
  XQueryLoading loading;
  if (!c.modules.empty()) loading.loader = std::make_shared<Modules>(c.modules);
  for (const auto& [URL, text] : c.modules) {
    loading.policy.allowScheme(URL.substr(0, URL.find(':')));
  }
  return XQuery::xqueryWithSource(c.text, loading, XQueryLimits(), way);
}

}  // namespace bench
