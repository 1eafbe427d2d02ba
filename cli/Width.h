// How much room characters take on a terminal.
#pragma once

#include <cstddef>
#include <string_view>

namespace cli {

// The columns of one character in UTF-8: two for a wide one (ideographs, most emoji), none for what
// is drawn over the one before it (accents, joiners, variation selectors), else one. What is no
// UTF-8 takes a column for each byte.
size_t widthOfCharacter(std::string_view character);

}  // namespace cli
