// How much room there is on a terminal, and how much of it characters take.
#pragma once

#include <cstddef>
#include <string_view>

namespace cli {

// Of the terminal that a standard stream leads to; 80 where it leads to none or none tells.
size_t columnsOfTerminal(int stream);

// The columns of one character in UTF-8: two for a wide one (ideographs, most emoji), none for what
// is drawn over the one before it (accents, joiners, variation selectors), else one. What is no
// UTF-8 takes a column for each byte.
size_t widthOfCharacter(std::string_view character);

}  // namespace cli
