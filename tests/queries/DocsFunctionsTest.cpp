// Holds docs/functions.md to the registry. An entry begins with a heading
//
//   ### fn:name(arguments) as type
//
// or with a row of a table whose first cell is `fn:name(arguments) as type`, and ends where the
// next one begins.
#include "DocsExamples.h"
#include "Functions/XQueryBuiltInFunction.h"

#include <gtest/gtest.h>

#include <cctype>
#include <cstdint>
#include <cstring>
#include <set>

namespace xquery::docs {
namespace {

struct Entry {
  std::string name;  // with its prefix
  std::string type;  // of the result, as written; empty when there is none
  int line = 0;
  std::vector<Example> examples;
};

Entry entryOf(std::string_view line, int number) {
  for (const auto& [start, end] : {std::pair{"### ", ""}, std::pair{"| `", "` |"}}) {
    if (!line.starts_with(start)) continue;
    line.remove_prefix(std::strlen(start));
    if (*end) line = line.substr(0, line.find(end));
    const size_t type = line.rfind(") as ");
    return {std::string(line.substr(0, line.find('('))),
            type == line.npos ? "" : std::string(line.substr(type + 5)),
            number,
            {}};
  }
  return {};
}

std::vector<Entry> readEntries() {
  const Document document = readDocument("docs/functions.md");
  std::vector<Entry> entries;
  for (size_t i = 0; i < document.lines.size(); ++i) {
    Entry entry = entryOf(document.lines[i], static_cast<int>(i) + 1);
    if (!entry.name.empty()) entries.push_back(std::move(entry));
  }
  for (size_t i = 0; i < entries.size(); ++i) {
    for (const Example& example : document.examples) {
      const bool isBefore = i + 1 == entries.size() || example.line < entries[i + 1].line;
      if (example.line >= entries[i].line && isBefore) entries[i].examples.push_back(example);
    }
  }
  return entries;
}

// As the document names functions: "xs:string".
std::string nameOf(const XQueryBuiltInFunction::Registration& row) {
  const char* prefix = row.namespaceID == XQueryNamespaceFN    ? "fn"
                       : row.namespaceID == XQueryNamespaceXS  ? "xs"
                       : row.namespaceID == XQueryNamespaceXDT ? "xdt"
                                                               : "ext";
  return std::string(prefix) + ":" + std::string(row.localName);
}

// Whether the query calls the function of an entry, whose prefix may be left out when it is "fn".
bool calls(std::string_view query, std::string_view name) {
  const bool isStandard = name.starts_with("fn:");
  const std::string call = std::string(isStandard ? name.substr(3) : name) + "(";
  for (size_t at = 0; (at = query.find(call, at)) != query.npos; ++at) {
    const std::string_view before = query.substr(0, at);
    if (isStandard && before.ends_with("fn:")) return true;
    // "name(" is no call of name in "local-name(" and in "p:name(".
    const char last = before.empty() ? ' ' : before.back();
    if (!std::isalnum(static_cast<unsigned char>(last)) && !std::strchr("-_.:", last)) return true;
  }
  return false;
}

// Whether the query is one call of the function and nothing else.
bool isCall(std::string_view query, std::string_view name) {
  if (name.starts_with("fn:") && !query.starts_with("fn:")) name.remove_prefix(3);
  if (!query.starts_with(std::string(name) + "(")) return false;
  int depth = 0;
  for (size_t at = name.size(); at < query.size(); ++at) {
    if (query[at] == '(') ++depth;
    if (query[at] == ')' && --depth == 0) return at + 1 == query.size();
  }
  return false;
}

// Whether an item of the one type is what a signature calls by the other one.
bool isOfType(const std::string& item, const std::string& type) {
  static const std::set<std::string> numbers{"xs:double", "xs:float", "xs:decimal", "xs:integer"};
  if (type == "item()") return true;
  if (type == "node()") return item.ends_with(")") && item != "item()";
  if (type == "xdt:anyAtomicType") return !item.ends_with(")");
  if (type == "number") return numbers.contains(item);
  return item == type;
}

// The types of the result as the query names them; empty for none and for a failure.
std::vector<std::string> typesOf(const Example& example) {
  XQueryLoading loading;
  loading.moduleURL = "file://" XQUERY_SOURCE_DIR "/examples/query.xq";
  const auto query = XQuery::xqueryWithSource(std::string_view(example.query), loading);
  Ref<XQueryError> error;
  const auto items = XQueryContext::xqueryContext()->evaluateXQuery(*query, {}, {}, &error);
  std::vector<std::string> types;
  if (error || !items) return types;
  for (const Value& item : items->objects()) types.push_back(XQueryItemTypeName(*item));
  return types;
}

void expectType(const Entry& entry, const Example& example) {
  if (example.result.starts_with("error ")) return;
  std::string type = entry.type;
  ASSERT_NE(type, "none") << example.place;
  const char last = type.back();
  if (last == '?' || last == '*') type.pop_back();
  const std::vector<std::string> types = typesOf(example);
  const bool isEmpty = type == "empty()";
  EXPECT_GE(types.size(), isEmpty || last == '*' || last == '?' ? 0u : 1u) << example.place;
  EXPECT_LE(types.size(), isEmpty ? 0u : last == '*' ? SIZE_MAX : 1u) << example.place;
  for (const std::string& item : types) {
    EXPECT_TRUE(isOfType(item, type)) << example.place << " " << item << " for " << entry.type;
  }
}

TEST(FunctionsDocument, HasOneEntryForEachFunctionAndNoOther) {
  std::multiset<std::string> documented, registered;
  for (const Entry& entry : readEntries()) documented.insert(entry.name);
  for (const auto& row : XQueryBuiltInFunction::registrations()) registered.insert(nameOf(row));
  EXPECT_EQ(documented, registered);
}

TEST(FunctionsDocument, EachEntryHasAnExampleThatCallsTheFunction) {
  for (const Entry& entry : readEntries()) {
    bool isCalled = false;
    for (const Example& example : entry.examples) {
      isCalled = isCalled || calls(example.query, entry.name);
    }
    EXPECT_TRUE(isCalled) << entry.name << ", line " << entry.line;
  }
}

TEST(FunctionsDocument, ResultsHaveTheTypeOfTheSignature) {
  for (const Entry& entry : readEntries()) {
    EXPECT_NE(entry.type, "") << entry.name;
    if (entry.type.empty()) continue;
    for (const Example& example : entry.examples) {
      if (isCall(example.query, entry.name)) expectType(entry, example);
    }
  }
}

TEST(FunctionsDocument, TheIndexNamesEachFunction) {
  const Document document = readDocument("docs/functions.md");
  std::string index;
  for (const std::string& line : document.lines) {
    if (line.starts_with("- **[")) index += line + "\n";
  }
  for (const Entry& entry : readEntries()) {
    const std::string name = entry.name.starts_with("fn:") ? entry.name.substr(3) : entry.name;
    EXPECT_NE(index.find("[" + name + "](#"), index.npos) << entry.name;
  }
}

// --- what is refused -----------------------------------------------------------------------------

// Fewest and most arguments of a heading: "text, pattern?, ..." has two at least.
struct Arity {
  size_t least = 0, most = 0;
};

Arity arityOf(const std::string& heading) {
  const size_t open = heading.find('(') + 1;
  const std::string arguments = heading.substr(open, heading.find(") as ") - open);
  Arity arity;
  for (size_t at = 0; at < arguments.size();) {
    const size_t end = std::min(arguments.find(", ", at), arguments.size());
    const std::string each = arguments.substr(at, end - at);
    ++arity.most;
    if (each.find('?') == each.npos && each.find("...") == each.npos) ++arity.least;
    at = std::min(end + 2, arguments.size());
  }
  return arity;
}

// Calls of the function with so many arguments, of every kind.
std::vector<std::string> callsWith(const std::string& name, size_t count) {
  static const std::vector<std::string> all = {"()",
                                               "'x'",
                                               "''",
                                               "1",
                                               "-1.5",
                                               "(1, 2)",
                                               "<a/>",
                                               "(<a/>, <b/>)",
                                               "xs:date('2004-01-01')",
                                               "xs:QName('a')",
                                               "$bytes",
                                               "'a b'",
                                               "<a x='y'/>/@x",
                                               "true()",
                                               "substring(codepoints-to-string((65536, 65)), 2)"};
  static const std::vector<std::string> few = {"()", "'x'", "''", "1", "<a/>", "'a b'"};
  std::vector<std::string> calls{name + "("};
  for (size_t n = 0; n < count; ++n) {
    std::vector<std::string> longer;
    for (const std::string& call : calls) {
      for (const std::string& value : n == 0 ? all : few) {
        longer.push_back(call + (n ? ", " : "") + value);
      }
    }
    calls = std::move(longer);
  }
  for (std::string& call : calls) call += ")";
  return calls;
}

bool isRefused(const std::string& call, const Ref<XQueryContext>& context) {
  static const std::string bytes =
      "let $bytes := ext:binary-find(xs:hexBinary('0102'), xs:hexBinary('01'), "
      "xs:hexBinary('02')) return ";
  Ref<XQueryError> error;
  const auto query = XQuery::xqueryWithSource(std::string_view(bytes + call));
  static_cast<void>(context->evaluateXQuery(*query, {}, {}, &error));
  return error && error->err() == 17;
}

// The first call that is refused; empty for none. Nothing can be loaded.
std::string refusedCall(const std::string& name, Arity arity) {
  constexpr size_t mostTried = 3;
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  XQueryLoading loading;
  loading.policy = XQueryLoadingPolicy::denyAll();
  context->contextSetLoading(loading);
  std::vector<std::string> calls;
  // What is refused for what two arguments are to each other.
  if (name == "fn:dateTime") {
    calls.emplace_back("dateTime(xs:date('2004-01-01Z'), xs:time('00:00:00+01:00'))");
  }
  for (size_t count = arity.least; count <= std::min(arity.most, mostTried); ++count) {
    for (const std::string& call : callsWith(name, count)) calls.push_back(call);
  }
  for (const std::string& call : calls) {
    if (isRefused(call, context)) return call;
  }
  return {};
}

// What the document says of each function: its entry, what its section begins with, and the entry
// that it refers to in place of repeating it.
class Sayings {
 public:
  Sayings() : _document(readDocument("docs/functions.md")), _entries(readEntries()) {}

  const std::vector<Entry>& entries() const { return _entries; }
  const std::string& heading(const Entry& entry) const {
    return _document.lines[static_cast<size_t>(entry.line) - 1];
  }
  std::string of(size_t index) const {
    std::string text = own(_entries[index]);
    for (const char* same : {"\nThe same with ", "\nThe same of "}) {
      if (text.find(same) != text.npos && index > 0) text += own(_entries[index - 1]);
    }
    for (size_t i = 0; i < _entries.size(); ++i) {
      const std::string reference = "s `" + _entries[i].name + "`";
      if (i != index && text.find(reference) != text.npos) text += own(_entries[i]);
    }
    return text;
  }

 private:
  std::string own(const Entry& entry) const {
    const auto line = static_cast<size_t>(entry.line) - 1;
    std::string text;
    size_t section = line;
    while (section > 0 && !_document.lines[section].starts_with("## ")) --section;
    for (size_t at = section + 1; at < line && !isEntry(at); ++at) {
      text += _document.lines[at] + "\n";
    }
    text += _document.lines[line] + "\n";
    const bool isRow = _document.lines[line].starts_with("|");
    for (size_t at = line + 1; !isRow && at < _document.lines.size() && !isHeading(at); ++at) {
      text += _document.lines[at] + "\n";
    }
    return text;
  }
  bool isHeading(size_t line) const { return _document.lines[line].starts_with("##"); }
  bool isEntry(size_t line) const {
    return isHeading(line) || _document.lines[line].starts_with("| `");
  }

  Document _document;
  std::vector<Entry> _entries;
};

TEST(FunctionsDocument, SaysOfExactlyThoseThatRefuseArgumentsThatTheyDo) {
  const Sayings sayings;
  for (size_t i = 0; i < sayings.entries().size(); ++i) {
    const Entry& entry = sayings.entries()[i];
    const std::string call = refusedCall(entry.name, arityOf(sayings.heading(entry)));
    const bool isSaid = sayings.of(i).find("efused") != std::string::npos;
    EXPECT_EQ(isSaid, !call.empty()) << entry.name << ", line " << entry.line << ": " << call;
  }
}

// "Refused for this: do that", or in brackets, or as another entry says.
TEST(FunctionsDocument, SaysWhatToDoInPlaceOfWhatIsRefused) {
  const Document document = readDocument("docs/functions.md");
  int refusals = 0;
  for (const std::string& line : document.lines) {
    if (line.starts_with("- ")) continue;  // how to read an entry
    for (size_t at = line.find("efused"); at != line.npos; at = line.find("efused", at + 1)) {
      ++refusals;
      const std::string rest = line.substr(at);
      const bool hasRemedy = rest.find(": ") != rest.npos || rest.find('(') != rest.npos ||
                             rest.find(" as `") != rest.npos || rest.find("as above") != rest.npos;
      EXPECT_TRUE(hasRemedy || line.find(". Use `") != line.npos ||
                  rest.find(". Compare") != rest.npos)
          << line;
    }
  }
  EXPECT_GT(refusals, 40);
}

}  // namespace
}  // namespace xquery::docs
