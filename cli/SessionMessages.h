// Texts about a query of a session, which is compiled with the prolog of the session before it.
#pragma once

#include <cstddef>
#include <string>

namespace cli {

// A plan counts lines from the start of the prolog: the same with lines counted from the start of
// what was entered. Lines of the prolog itself stay what they are, and so do those of modules.
std::string withoutPrologLines(const std::string& plan, size_t prologLines);

// The import of a library module: of its first declaration and the URL of its file.
std::string importOfModule(const std::string& moduleDeclaration, const std::string& URL);

}  // namespace cli
