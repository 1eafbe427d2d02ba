// What a session offers for the name that is being typed.
#pragma once

#include "Declarations.h"
#include "LineEditor.h"

#include <map>
#include <span>
#include <string>
#include <vector>

namespace cli {

// Commands and names of files behind ":", variables behind "$", otherwise functions and keywords.
// `typed` is what stands in the lines before the one that is being edited.
Completions completeName(const std::string& textBeforeCursor, const std::string& typed,
                         const Declarations& declarations,
                         const std::map<std::string, std::string>& namespaces,
                         std::span<const char* const> commands);

}  // namespace cli
