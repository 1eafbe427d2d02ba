#include "SoakCases.h"

#include <fstream>
#include <unistd.h>
#include <utility>

namespace bench {

using namespace xquery;
using querytest::QueryCase;

namespace {

bool isRepeatable(const std::string& query) {
  return query.find("current-") == query.npos && query.find("real-date") == query.npos;
}

// The cases of the tests are over before most limits are looked at. Each of these takes some
// milliseconds and a megabyte or more.
constexpr const char* longQueries[] = {
    "sum(for $i in 1 to 20000 return string-length(string($i)))",
    "count(distinct-values(for $i in 1 to 20000 return concat('value ', $i)))",
    "string-length(string-join(for $i in 1 to 20000 return 'some text', ' '))",
    "count(<a>{for $i in 1 to 5000 return <b n='{$i}'>{$i, 'text'}</b>}</a>//b[@n > 2500])",
    "(for $i in 1 to 20000 order by $i mod 101, $i descending return $i)[10000]",
    "declare function local:f($n) { if ($n = 0) then () else (string($n), local:f($n - 1)) };"
    "count(local:f(300)) + sum(for $i in 1 to 10 return count(local:f(200)))",
};

}  // namespace

std::string soakAnswer(const XQuery& query, XQueryContext& context, const SoakCase& c) {
  Ref<XQueryError> error;
  const auto items = context.evaluateXQuery(query, c.text.constants, c.document, &error);
  if (error) {
    return "error " + std::to_string(error->err()) + " line " + std::to_string(error->line()) +
           " " + (error->msg() ? error->msg()->utf8() : "") + "\n";
  }
  std::string text;
  for (size_t i = 0; items && i < items->count(); ++i) {
    text += querytest::printedItem(*items->objectAtIndex(i)) + "\n";
  }
  return text;
}

bool isSoakLimit(const std::string& answer, std::string_view text) {
  return answer.starts_with("error 0 ") && answer.find(text) != answer.npos;
}

SoakCases::SoakCases()
    : _folder(std::filesystem::temp_directory_path() /
              ("xquery-soak-" + std::to_string(::getpid()))) {
  for (const auto& place : querytest::placesOfCases(XQUERY_QUERY_CASES)) {
    const QueryCase text = querytest::readCase(place);
    if (isRepeatable(text.query)) add(text);
  }
  for (const char* const query : longQueries) {
    QueryCase text;
    text.file = query;
    text.query = query;
    add(text);
    ++_longCount;
  }
}

SoakCases::~SoakCases() {
  std::error_code ignored;
  std::filesystem::remove_all(_folder, ignored);
}

void SoakCases::add(const QueryCase& text) {
  const std::filesystem::path folder = _folder / std::to_string(_all.size());
  for (const auto& [name, content] : text.files) {
    std::filesystem::create_directories((folder / name).parent_path());
    std::ofstream(folder / name, std::ios::binary) << content;
  }
  SoakCase c;
  c.text = text;
  c.folderURL = "file://" + folder.string() + "/";
  if (!text.xml.empty()) {
    Value& document = _documents[text.xml];
    if (!document) {
      document = NSXMLDocument::documentWithData(text.xml, NSXMLNodePreserveWhitespace);
    }
    c.document = document;
  }
  c.plain = querytest::compiledCase(text, c.folderURL, XQueryWay::Plain);
  c.planned = querytest::compiledCase(text, c.folderURL, XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContextWithNamespaces(text.namespaces);
  c.alone = soakAnswer(*c.plain, *context, c);
  _all.push_back(std::move(c));
}

}  // namespace bench
