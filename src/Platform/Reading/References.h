// The references that a reader knows without declarations: characters by number, and the five
// predefined entities; and what else differs between a text as it is written and as it is read.
#pragma once

#include "Platform/Text/Blocks.h"

#include <string_view>

namespace xquery {

// Each appends what the bytes stand for, in UTF-8, and throws NotTaken for any other reference.
//
// Of a text: line ends are read as line feeds.
void appendTextOf(std::string_view bytes, ValueText<char>& text);
// Of the value of an attribute: white space that is not given by number is read as spaces.
void appendValueOf(std::string_view bytes, ValueText<char>& value);
// Of a section, a comment, an instruction, in which there are no references: line ends only.
void appendLinesOf(std::string_view bytes, ValueText<char>& text);

}  // namespace xquery
