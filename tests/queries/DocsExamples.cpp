#include "DocsExamples.h"

#include <filesystem>
#include <fstream>
#include <sstream>

namespace xquery::docs {
namespace {

const std::string root = XQUERY_SOURCE_DIR;

std::string textOfFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

// What stands between the start and the end of a comment of its kind; empty for another line.
std::string directive(std::string_view line, std::string_view kind) {
  const std::string start = "<!-- " + std::string(kind) + ": ";
  constexpr std::string_view end = " -->";
  if (!line.starts_with(start) || !line.ends_with(end)) return "";
  return std::string(line.substr(start.size(), line.size() - start.size() - end.size()));
}

// The text of the code that begins at `at`, a back quote; `at` goes behind it.
std::string takeCode(std::string_view line, size_t& at) {
  const size_t end = line.find('`', at + 1);
  if (end == line.npos) return "";
  const std::string code(line.substr(at + 1, end - at - 1));
  at = end + 1;
  return code;
}

class Reader {
 public:
  explicit Reader(Document& document) : _document(document) {}

  void read() {
    for (size_t at = 0; at < lines().size();) {
      const std::string& line = lines()[at];
      if (const auto input = directive(line, "input"); !input.empty()) {
        _input = input == "none" ? "" : input;
      }
      if (const auto variable = directive(line, "var"); !variable.empty()) _variable = variable;
      if (line.starts_with("```")) {
        readBlock(at);
      } else {
        readLine(at++);
      }
    }
  }

 private:
  const std::vector<std::string>& lines() const { return _document.lines; }

  Example example(size_t at, std::string separator) const {
    Example example;
    example.line = static_cast<int>(at) + 1;
    example.place = _document.name + ":" + std::to_string(example.line);
    example.separator = std::move(separator);
    return example;
  }

  void fault(size_t at, std::string_view text) {
    _document.faults.push_back(example(at, "").place + ": " + std::string(text));
  }

  void readLine(size_t number) {
    constexpr std::string_view arrow = " → ";
    const std::string_view line = lines()[number];
    for (size_t at = 0; (at = line.find('`', at)) != line.npos;) {
      Example found = example(number, ", ");
      found.query = takeCode(line, at);
      if (found.query.empty()) return;
      if (line.substr(at, arrow.size()) != arrow) continue;
      at += arrow.size();
      if (at >= line.size() || line[at] != '`') {
        fault(number, "an arrow without a result");
        continue;
      }
      found.result = takeCode(line, at);
      _document.examples.push_back(std::move(found));
    }
  }

  // The lines of the block that begins at `at`; `at` goes behind its end.
  std::string takeBlock(size_t& at) {
    const size_t start = at++;
    std::string text;
    for (; at < lines().size() && lines()[at] != "```"; ++at) {
      text += (at == start + 1 ? "" : "\n") + lines()[at];
    }
    if (at == lines().size()) fault(start, "a block without an end");
    ++at;
    return text;
  }

  void readBlock(size_t& at) {
    const size_t start = at;
    const std::string text = takeBlock(at);
    if (lines()[start] != "```xquery") return;
    Example found = example(start, "\n");
    found.query = text;
    found.input = _input;
    found.variable = std::move(_variable);
    _variable.clear();
    while (at < lines().size() && lines()[at].empty()) ++at;
    if (at >= lines().size() || lines()[at] != "```text") {
      return fault(start, "a query without a result");
    }
    found.result = takeBlock(at);
    _document.examples.push_back(std::move(found));
  }

  Document& _document;
  std::string _input, _variable;
};

std::string printed(const NSObject& item) {
  if (const auto* node = dyn_cast<NSXMLNode>(&item)) return node->XMLString()->utf8();
  return XQueryItemStringValue(item);
}

XQueryVariables constantsOf(const Example& example) {
  const size_t equals = example.variable.find('=');
  if (equals == std::string::npos) return {};
  return {{example.variable.substr(0, equals),
           NSString::stringWithUTF8(std::string_view(example.variable).substr(equals + 1))}};
}

}  // namespace

Document documentOf(std::string name, std::string_view text) {
  Document document;
  document.name = std::move(name);
  std::istringstream in{std::string(text)};
  for (std::string line; std::getline(in, line);) document.lines.push_back(line);
  Reader(document).read();
  return document;
}

Document readDocument(const std::string& name) {
  return documentOf(name, textOfFile(root + "/" + name));
}

std::vector<Document> readDocuments() {
  std::vector<Document> documents{readDocument("README.md")};
  for (const auto& entry : std::filesystem::directory_iterator(root + "/docs")) {
    if (entry.path().extension() != ".md") continue;
    documents.push_back(readDocument("docs/" + entry.path().filename().string()));
  }
  return documents;
}

std::string evaluated(const Example& example, XQueryWay way) {
  XQueryLoading loading;
  loading.moduleURL = "file://" + root + "/examples/query.xq";
  const auto compiled =
      XQuery::xqueryWithSource(std::string_view(example.query), loading, XQueryLimits(), way);
  Ref<NSXMLDocument> input;
  if (!example.input.empty()) {
    input =
        NSXMLDocument::documentWithFile(root + "/" + example.input, NSXMLNodePreserveWhitespace);
    if (!input) return "no input";
  }
  const auto context = XQueryContext::xqueryContext();
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*compiled, constantsOf(example), input, &error);
  if (error) return "error " + std::to_string(error->err()) + " " + error->msg()->utf8();
  if (!items) return "()";
  std::string text;
  for (size_t i = 0; i < items->count(); ++i) {
    text += (i == 0 ? "" : example.separator) + printed(*items->objectAtIndex(i));
  }
  return items->count() == 0 ? "()" : text;
}

std::string failuresOf(const Document& document) {
  std::string failures;
  for (const std::string& fault : document.faults) failures += fault + "\n";
  for (const Example& example : document.examples) {
    for (const XQueryWay way : {XQueryWay::Plain, XQueryWay::Planned}) {
      const std::string result = evaluated(example, way);
      if (result == example.result) continue;
      failures += example.place + ": " + example.query + "\n  gives " + result + "\n  and not " +
                  example.result + "\n";
    }
  }
  return failures;
}

}  // namespace xquery::docs
