// Runs the whole-query cases under tests/queries/cases, each of them plain, planned and profiled,
// over a document of which only that is read what the query needs, and record by record where that
// can be done. What a case looks like is in QueryCase.h.
#include "Engine/ErrorPlaceText.h"
#include "Platform/Loading/LoadingTestSupport.h"
#include "queries/QueryCase.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <map>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using namespace querytest;

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

class CaseTest : public testing::Test {
 public:
  explicit CaseTest(const CasePlace& place) : _case(readCase(place)) {}

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
    const std::string URL = folder.URL("");
    const auto query = compiledCase(_case, URL, way);
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
      if (error && isRefusal(*error)) return;
    } else {
      const auto items = context->evaluateXQuery(*query, _case.constants, document, &error);
      for (size_t i = 0; items && i < items->count(); ++i) {
        lines.push_back(printedItem(*items->objectAtIndex(i)));
      }
    }
    if (error && way == XQueryWay::Plain) {
      _plainPlace = replaced(placeText(*error), URL, folderMark);
    }
    // How deep an evaluation gets before it reaches a limit does.
    const bool isLimit = error && error->category() == XQueryErrorCategory::Limit;
    if (error && !isLimit && way == XQueryWay::Planned) {
      EXPECT_EQ(replaced(placeText(*error), URL, folderMark), _plainPlace) << _case.query;
    }
    if (!_case.error.empty()) {
      ASSERT_TRUE(error) << _case.file << ":" << _case.line << " expected an error";
      const bool withLine = _case.error.find(" line ") != std::string::npos;
      const std::string found = replaced(printedError(*error, withLine), URL, folderMark);
      EXPECT_TRUE(matches(found, _case.error)) << _case.file << ":" << _case.line << "\n  found    "
                                               << found << "\n  expected " << _case.error;
      return;
    }
    ASSERT_FALSE(error) << _case.file << ":" << _case.line << " " << error->description()->utf8();
    for (std::string& line : lines) line = replaced(line, URL, folderMark);
    EXPECT_EQ(lines, _case.result) << _case.file << ":" << _case.line;
  }

  bool canBeStreamed(const XQuery& query) const {
    const auto errors = query.parseErrors();
    return !_case.xml.empty() &&
           !(errors && cast<XQueryError>(errors->objects().front())->err() == 0);
  }

  // Some programs are refused when the stream begins: only the context knows its namespaces.
  static bool isRefusal(const XQueryError& error) {
    return error.err() == 0 &&
           error.description()->utf8().find("cannot be evaluated as a stream") != std::string::npos;
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
          lines.push_back(printedItem(*item));
          return true;
        },
        failure);
    error = failure.error;
    return isComplete || error;
  }

  const QueryCase _case;
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

// Each test runs in a process of its own, which registers all of them.
void registerCases() {
  const auto places = placesOfCases(XQUERY_SOURCE_DIR "/tests/queries/cases");
  std::map<std::string, int> seen;
  for (const CasePlace& place : places) {
    const std::string suite = "Query" + identifier(place.path.stem().string());
    std::string name = identifier(place.name);
    if (const int again = seen[suite + "." + name]++) name += "Again" + std::to_string(again);
    testing::RegisterTest(suite.c_str(), name.c_str(), nullptr, nullptr, place.path.c_str(),
                          place.line, [place]() -> testing::Test* { return new CaseTest(place); });
  }
}

const bool registered = [] {
  registerCases();
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
