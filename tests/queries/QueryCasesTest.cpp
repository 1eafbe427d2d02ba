// Runs the whole-query cases under tests/queries/cases, each of them plain, planned and profiled,
// over a document of which only that is read what the query needs, and record by record where that
// can be done. A file holds any number of cases:
//
//   == what the case shows
//   -- var n=5                      (optional, repeatable: an untyped atomic external variable)
//   -- namespace p=urn:p            (optional, repeatable: a context namespace)
//   -- xml                          (optional: the context document, to the next section)
//   <a><b/></a>
//   -- file NAME                    (optional, repeatable: a file to load; "@folder@" stands in the
//   <c/>                             query and its result for the URL of its folder)
//   -- module URI                   (optional, repeatable: what there is at that location when the
//   module namespace m = "urn:m";    query is compiled; nowhere else is looked then)
//   -- query
//   //b
//   -- result                       (one line per item: type, tab, text as the command prints it)
//   element()	<b/>
//   -- error 6 line 1 invalid type for operator     (instead of a result; "line N" is optional,
//                                                    "..." stands for any text)
#include "Engine/ErrorPlaceText.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <fstream>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {
namespace {

struct Case {
  std::string file;
  int line = 0;
  XQueryVariables constants;
  std::map<std::string, std::string> namespaces;
  std::string xml;
  std::map<std::string, std::string> files;
  std::map<std::string, std::string> modules;
  std::string query;
  std::vector<std::string> result;
  std::string error;  // empty when a result is expected
};

// `text` up to the first `separator`, which is dropped with it.
std::string takeUpTo(std::string& text, char separator) {
  const size_t at = text.find(separator);
  std::string head = text.substr(0, at);
  text = at == std::string::npos ? "" : text.substr(at + 1);
  return head;
}

void readHeader(Case& c, std::string header, std::string& section, std::string& name) {
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

// Where a case stands. Each test runs in a process of its own, which registers all of them: it
// reads no more of the others than their names.
struct Place {
  std::filesystem::path path;
  int line = 0;  // of its name
};

constexpr std::string_view nameMark = "== ";

Case readCase(const Place& place) {
  Case c;
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
  return c;
}

std::string replaced(std::string text, std::string_view from, std::string_view by) {
  for (size_t at = 0; (at = text.find(from, at)) != text.npos; at += by.size()) {
    text.replace(at, from.size(), by);
  }
  return text;
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

// "6 line 1 message", as the cases write errors.
std::string printedError(const XQueryError& error, bool withLine) {
  std::string text = std::to_string(error.err());
  if (withLine) text += " line " + std::to_string(error.line());
  return text + " " + (error.msg() ? error.msg()->utf8() : "");
}

// Whether `text` is `pattern`, in which "..." stands for any text, also none.
bool matches(std::string_view text, std::string_view pattern) {
  constexpr std::string_view any = "...";
  size_t gap = pattern.find(any);
  if (gap == pattern.npos) return text == pattern;
  if (text.substr(0, gap) != pattern.substr(0, gap)) return false;
  text.remove_prefix(gap);
  pattern.remove_prefix(gap + any.size());
  while ((gap = pattern.find(any)) != pattern.npos) {
    const size_t at = text.find(pattern.substr(0, gap));
    if (at == text.npos) return false;
    text.remove_prefix(at + gap);
    pattern.remove_prefix(gap + any.size());
  }
  return text.size() >= pattern.size() && text.substr(text.size() - pattern.size()) == pattern;
}

// Gives out the modules of a case.
class ModuleLoader : public XQueryLoader {
 public:
  explicit ModuleLoader(std::map<std::string, std::string> modules)
      : _modules(std::move(modules)) {}
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    const auto found = _modules.find(URL.absoluteString()->utf8());
    if (found == _modules.end()) return std::nullopt;
    return XQueryResource{found->second, {}, {}, {}};
  }

 private:
  std::map<std::string, std::string> _modules;
};

XQueryLoading compileLoading(const Case& c) {
  XQueryLoading loading;
  if (c.modules.empty()) return loading;
  loading.loader = std::make_shared<ModuleLoader>(c.modules);
  // Locations of any scheme that the case thinks up.
  for (const auto& [URL, text] : c.modules)
    loading.policy.allowScheme(URL.substr(0, URL.find(':')));
  return loading;
}

class QueryCase : public testing::Test {
 public:
  explicit QueryCase(const Place& place) : _case(readCase(place)) {}

  void TestBody() override {
    const std::pair<XQueryWay, const char*> ways[] = {{XQueryWay::Plain, "plain"},
                                                      {XQueryWay::Planned, "planned"},
                                                      {XQueryWay::Profiled, "profiled"},
                                                      {XQueryWay::Streamed, "streamed"}};
    for (const auto& [way, name] : ways) {
      SCOPED_TRACE(name);
      run(way);
    }
    SCOPED_TRACE("projected");
    run(XQueryWay::Planned, true);
  }

 private:
  // A place and calls do not depend on the way either.
  std::string _plainPlace;

  // `isProjected`: of the document only that is read what the query needs.
  void run(XQueryWay way, bool isProjected = false) {
    const TestFolder folder;
    for (const auto& [name, text] : _case.files) folder.write(name, text);
    constexpr std::string_view place = "@folder@";
    const std::string URL = folder.URL("");
    const std::string text = replaced(_case.query, place, URL);
    // The last line break belongs to the file, not to the query.
    const auto query = XQuery::xqueryWithSource(
        std::string_view(text).substr(0, text.empty() ? 0 : text.size() - 1), compileLoading(_case),
        XQueryLimits(), way);
    Value document;
    if (!_case.xml.empty()) {
      NSXMLParseError failure;
      constexpr uint32_t options = NSXMLNodePreserveWhitespace;
      document = isProjected ? XQueryProjectedDocumentWithData(*query, _case.xml, options, &failure)
                             : NSXMLDocument::documentWithData(_case.xml, options, &failure);
      ASSERT_TRUE(document) << failure.message;
    }
    const auto context = XQueryContext::xqueryContextWithNamespaces(_case.namespaces);
    Ref<XQueryError> error;
    std::vector<std::string> lines;
    if (way == XQueryWay::Streamed) {
      if (!canBeStreamed(*query) || !stream(*query, *context, lines, error)) return;
    } else {
      const auto items = context->evaluateXQuery(*query, _case.constants, document, &error);
      for (size_t i = 0; items && i < items->count(); ++i) {
        lines.push_back(printed(*items->objectAtIndex(i)));
      }
    }
    if (error && way == XQueryWay::Plain) {
      _plainPlace = replaced(placeText(*error), URL, place);
    }
    // How deep an evaluation gets before it reaches a limit does.
    const bool isLimit = error && error->category() == XQueryErrorCategory::Limit;
    if (error && !isLimit && way == XQueryWay::Planned) {
      EXPECT_EQ(replaced(placeText(*error), URL, place), _plainPlace) << _case.query;
    }
    if (!_case.error.empty()) {
      ASSERT_TRUE(error) << _case.file << ":" << _case.line << " expected an error";
      const bool withLine = _case.error.find(" line ") != std::string::npos;
      const std::string found = replaced(printedError(*error, withLine), URL, place);
      EXPECT_TRUE(matches(found, _case.error)) << _case.file << ":" << _case.line << "\n  found    "
                                               << found << "\n  expected " << _case.error;
      return;
    }
    ASSERT_FALSE(error) << _case.file << ":" << _case.line << " " << error->description()->utf8();
    for (std::string& line : lines) line = replaced(line, URL, place);
    EXPECT_EQ(lines, _case.result) << _case.file << ":" << _case.line;
  }

  bool canBeStreamed(const XQuery& query) const {
    const auto errors = query.parseErrors();
    return !_case.xml.empty() &&
           !(errors && cast<XQueryError>(errors->objects().front())->err() == 0);
  }

  // False where the document is none that is read so.
  bool stream(const XQuery& query, XQueryContext& context, std::vector<std::string>& lines,
              Ref<XQueryError>& error) const {
    XQueryStreamInput input;
    input.options = NSXMLNodePreserveWhitespace;
    input.read = [left = std::string_view(_case.xml)](char* buffer, size_t size) mutable {
      const size_t count = left.copy(buffer, std::min(size, size_t{7}));
      left.remove_prefix(count);
      return static_cast<ptrdiff_t>(count);
    };
    XQueryStreamFailure failure;
    const bool isComplete = context.evaluateStream(
        query, _case.constants, input,
        [&](const Value& item) {
          lines.push_back(printed(*item));
          return true;
        },
        failure);
    error = failure.error;
    return isComplete || error;
  }

  Case _case;
};

// A test name has letters and digits only.
std::string identifier(const std::string& text) {
  std::string name;
  bool upper = true;
  for (const char c : text) {
    if (std::isalnum(static_cast<unsigned char>(c))) {
      name += upper ? static_cast<char>(std::toupper(static_cast<unsigned char>(c))) : c;
      upper = false;
    } else {
      upper = true;
    }
  }
  return name;
}

void registerCases(const std::filesystem::path& folder) {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    if (entry.path().extension() == ".cases") files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  for (const auto& file : files) {
    const std::string suite = "Query" + identifier(file.stem().string());
    std::map<std::string, int> seen;
    std::ifstream in(file);
    std::string line;
    for (int number = 1; std::getline(in, line); ++number) {
      if (!line.starts_with(nameMark)) continue;
      std::string name = identifier(line.substr(nameMark.size()));
      if (const int again = seen[name]++) name += "Again" + std::to_string(again);
      testing::RegisterTest(
          suite.c_str(), name.c_str(), nullptr, nullptr, file.c_str(), number,
          [place = Place{file, number}]() -> testing::Test* { return new QueryCase(place); });
    }
  }
}

const bool registered = [] {
  registerCases(std::filesystem::path(XQUERY_SOURCE_DIR) / "tests/queries/cases");
  return true;
}();

TEST(QueryCases, ErrorPatternsMatchWhole) {
  EXPECT_TRUE(matches("6 divide by zero", "6 divide by zero"));
  EXPECT_FALSE(matches("6 divide by zero", "6 divide by"));
  EXPECT_TRUE(matches("6 divide by zero", "6 ...ivi... by zero"));
  EXPECT_TRUE(matches("6 Division by zero", "6 ...ivi... by zero"));
  EXPECT_FALSE(matches("6 Division by zero", "7 ... by zero"));
  EXPECT_FALSE(matches("6 Division by one", "6 ... by zero"));
  EXPECT_TRUE(matches("0 line 1 anything", "0 line 1 ..."));
  EXPECT_FALSE(matches("ab", "ab...b"));
}

TEST(QueryCases, AreRead) {
  EXPECT_TRUE(registered);
}

}  // namespace
}  // namespace xquery
