#include "NameCompletion.h"

#include "SessionInput.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <string_view>
#include <system_error>
#include <utility>

namespace cli {
namespace {

namespace fs = std::filesystem;

constexpr const char* keywords[] = {"ancestor",
                                    "ancestor-or-self",
                                    "and",
                                    "ascending",
                                    "attribute",
                                    "base-uri",
                                    "by",
                                    "case",
                                    "cast",
                                    "castable",
                                    "child",
                                    "collation",
                                    "comment",
                                    "construction",
                                    "declare",
                                    "default",
                                    "descendant",
                                    "descendant-or-self",
                                    "descending",
                                    "div",
                                    "document",
                                    "element",
                                    "else",
                                    "empty",
                                    "encoding",
                                    "eq",
                                    "every",
                                    "except",
                                    "external",
                                    "following",
                                    "following-sibling",
                                    "for",
                                    "function",
                                    "ge",
                                    "greatest",
                                    "gt",
                                    "idiv",
                                    "if",
                                    "import",
                                    "in",
                                    "instance",
                                    "intersect",
                                    "is",
                                    "item",
                                    "le",
                                    "least",
                                    "let",
                                    "lt",
                                    "mod",
                                    "module",
                                    "namespace",
                                    "ne",
                                    "node",
                                    "of",
                                    "or",
                                    "order",
                                    "ordered",
                                    "ordering",
                                    "parent",
                                    "preceding",
                                    "preceding-sibling",
                                    "preserve",
                                    "processing-instruction",
                                    "return",
                                    "satisfies",
                                    "schema",
                                    "self",
                                    "some",
                                    "stable",
                                    "strip",
                                    "text",
                                    "then",
                                    "to",
                                    "treat",
                                    "typeswitch",
                                    "union",
                                    "unordered",
                                    "validate",
                                    "variable",
                                    "version",
                                    "where",
                                    "xmlspace",
                                    "xquery"};

// Namespaces that have a prefix in every query.
constexpr std::pair<std::string_view, const char*> usualPrefixes[] = {
    {"http://www.w3.org/2004/10/xpath-functions", "fn"},
    {"http://www.w3.org/2001/XMLSchema", "xs"},
    {"http://www.w3.org/2004/10/xpath-datatypes", "xdt"}};

bool isOfName(char byte) {
  const auto value = static_cast<unsigned char>(byte);
  return value >= 0x80 || std::isalnum(value) ||
         std::string_view("_-.:$").find(byte) != std::string_view::npos;
}

void keepStarting(const std::string& start, std::vector<std::string>& words) {
  std::erase_if(words, [&](const std::string& word) { return !word.starts_with(start); });
  std::sort(words.begin(), words.end());
  words.erase(std::unique(words.begin(), words.end()), words.end());
}

// A folder ends with a slash; what begins with a dot is offered where a dot was typed.
Completions filesAt(const std::string& text, size_t start) {
  Completions found{start, {}};
  const std::string typed = text.substr(start);
  const size_t slash = typed.rfind('/');
  const std::string folder = slash == typed.npos ? "" : typed.substr(0, slash + 1);
  const std::string name = typed.substr(folder.size());
  std::error_code failure;
  for (fs::directory_iterator next(folder.empty() ? "." : folder, failure), end;
       !failure && next != end; next.increment(failure)) {
    std::error_code unknown;
    const std::string entry = next->path().filename().string();
    if (entry.starts_with('.') && !name.starts_with('.')) continue;
    found.words.push_back(folder + entry + (next->is_directory(unknown) ? "/" : ""));
  }
  keepStarting(typed, found.words);
  return found;
}

Completions commandAt(const std::string& text, std::span<const char* const> commands) {
  const size_t space = text.find(' ');
  if (space == text.npos) {
    Completions found{0, {commands.begin(), commands.end()}};
    keepStarting(text, found.words);
    return found;
  }
  const std::string command = text.substr(0, space);
  size_t file = text.find_first_not_of(' ', space);
  if (command == ":doc" && file != text.npos) {
    file = text.find_first_not_of(' ', std::min(text.find(' ', file), text.size()));
  } else if (command != ":load") {
    return {};
  }
  return file == text.npos ? Completions() : filesAt(text, file);
}

std::vector<std::string> functionNames(const std::map<std::string, std::string>& namespaces) {
  std::vector<std::string> names;
  for (const xquery::XQueryFunctionName& function : xquery::XQueryLibraryFunctions()) {
    for (const auto& [URI, prefix] : usualPrefixes) {
      if (function.namespaceURI != URI) continue;
      names.push_back(std::string(prefix) + ":" + function.localName + "(");
      if (std::string_view(prefix) == "fn") names.push_back(function.localName + "(");
    }
    for (const auto& [prefix, URI] : namespaces) {
      if (function.namespaceURI == URI) names.push_back(prefix + ":" + function.localName + "(");
    }
  }
  return names;
}

}  // namespace

Completions completeName(const std::string& textBeforeCursor, const std::string& typed,
                         const Declarations& declarations,
                         const std::map<std::string, std::string>& namespaces,
                         std::span<const char* const> commands) {
  if (typed.empty() && textBeforeCursor.starts_with(':')) {
    return commandAt(textBeforeCursor, commands);
  }
  size_t start = textBeforeCursor.size();
  while (start > 0 && isOfName(textBeforeCursor[start - 1])) --start;
  // The part of a path behind an axis.
  if (const size_t axis = textBeforeCursor.rfind("::");
      axis != std::string::npos && axis >= start) {
    start = axis + 2;
  }
  const size_t dollar = textBeforeCursor.rfind('$');
  const bool isVariable = dollar != std::string::npos && dollar >= start;
  if (isVariable) start = dollar;
  const std::string name = textBeforeCursor.substr(start);
  if (name.empty()) return {};

  Completions found{start, {}};
  if (isVariable) {
    for (const std::string& text : {typed, textBeforeCursor.substr(0, start)}) {
      for (const std::string& variable : variablesIn(text)) found.words.push_back("$" + variable);
    }
    for (const std::string& variable : declarations.variables()) {
      found.words.push_back("$" + variable);
    }
  } else {
    found.words = functionNames(namespaces);
    for (const std::string& function : declarations.functions()) {
      found.words.push_back(function + "(");
    }
    found.words.insert(found.words.end(), std::begin(keywords), std::end(keywords));
  }
  keepStarting(name, found.words);
  return found;
}

}  // namespace cli
