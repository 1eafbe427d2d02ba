#include "Declarations.h"

#include "SessionInput.h"

#include <algorithm>

namespace cli {
namespace {

constexpr std::string_view ofVariable = "$", ofFunction = "/", ofNamespace = "namespace ";

}  // namespace

void Declarations::add(const std::string& declaration) {
  using Kind = DeclarationName::Kind;
  const DeclarationName name = declarationName(declaration);
  switch (name.kind) {
    case Kind::Version:
      return;
    case Kind::Variable:
      return put(_definitions, {"$" + name.name, declaration});
    case Kind::Function:
      return put(_definitions, {name.name, declaration});
    case Kind::Namespace:
      return put(_namespaces, {name.name, declaration});
    default:
      return put(_settings, {name.name, declaration});
  }
}

// What replaces another takes its place, so that what refers to it still may; but it goes to the
// end where it refers to a variable that is declared later.
void Declarations::put(std::vector<Entry>& entries, Entry entry) {
  const auto former = std::find_if(entries.begin(), entries.end(),
                                   [&](const Entry& other) { return other.name == entry.name; });
  const std::vector<std::string> used = variablesIn(entry.text);
  const bool refersToLater = std::any_of(former, entries.end(), [&](const Entry& later) {
    return later.name != entry.name && later.name.starts_with(ofVariable) &&
           std::binary_search(used.begin(), used.end(), later.name.substr(1));
  });
  if (former != entries.end() && !refersToLater) {
    former->text = std::move(entry.text);
    return;
  }
  if (former != entries.end()) entries.erase(former);
  entries.push_back(std::move(entry));
}

std::string Declarations::prolog() const {
  std::string text;
  for (const auto* entries : {&_settings, &_namespaces, &_definitions}) {
    for (const Entry& entry : *entries) text += entry.text + "\n";
  }
  return text;
}

size_t Declarations::lines() const {
  const std::string text = prolog();
  return static_cast<size_t>(std::count(text.begin(), text.end(), '\n'));
}

std::vector<std::string> Declarations::variables() const {
  std::vector<std::string> names;
  for (const Entry& entry : _definitions) {
    if (entry.name.starts_with(ofVariable)) names.push_back(entry.name.substr(1));
  }
  return names;
}

std::vector<std::string> Declarations::functions() const {
  std::vector<std::string> names;
  for (const Entry& entry : _definitions) {
    const size_t slash = entry.name.find(ofFunction);
    if (!entry.name.starts_with(ofVariable)) names.push_back(entry.name.substr(0, slash));
  }
  return names;
}

std::map<std::string, std::string> Declarations::namespaces() const {
  std::map<std::string, std::string> found;
  for (const Entry& entry : _namespaces) {
    if (!entry.name.starts_with(ofNamespace)) continue;
    const size_t start = entry.text.find_first_of("\"'", entry.text.find('='));
    if (start == std::string::npos) continue;
    const size_t end = entry.text.find(entry.text[start], start + 1);
    if (end == std::string::npos) continue;
    found[entry.name.substr(ofNamespace.size())] = entry.text.substr(start + 1, end - start - 1);
  }
  return found;
}

}  // namespace cli
