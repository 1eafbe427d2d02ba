// What was entered in a session: whether it is complete, and what its parts are.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace cli {

struct SessionInput {
  // Whether every bracket, string, comment and tag is closed. What closes more than was opened is
  // complete: the query has an error then, and it is for the parser to say which.
  bool isComplete = true;
  std::vector<std::string> declarations;  // of the prolog, each with its semicolon
  std::string body;                       // the rest; blanks and comments count as nothing
};

// Reads brackets, strings, comments and direct constructors, and nothing else: any text is taken.
SessionInput sessionInput(std::string_view text);

// What a declaration is known by: one that is known by the same replaces it.
struct DeclarationName {
  enum class Kind {
    Version,    // of the language
    Module,     // the text is a library module
    Setting,    // such as the base URI; these have to come first
    Namespace,  // and imports, which come next
    Variable,   // with its name, without the dollar sign
    Function,   // with its name and, behind a slash, the number of its parameters
  };
  Kind kind = Kind::Setting;
  std::string name;
};
DeclarationName declarationName(std::string_view declaration);

// Whether this is a name without a colon, as prefixes are.
bool isUnprefixedName(std::string_view text);

// Whether this is what stands behind a dollar sign: a name, with a prefix or without.
bool isVariableName(std::string_view text);

// The names behind dollar signs that occur in the text.
std::vector<std::string> variablesIn(std::string_view text);

}  // namespace cli
