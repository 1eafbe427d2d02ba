// The letters below 0x80 in text of bytes, whatever encoding the rest is in.
#pragma once

#include <string>
#include <string_view>

namespace xquery {

// No locale takes part, and what is not ASCII stays as it is.
constexpr char lowerCase(char letter) {
  return letter >= 'A' && letter <= 'Z' ? static_cast<char>(letter - 'A' + 'a') : letter;
}

inline std::string lowerCase(std::string_view text) {
  std::string lower(text);
  for (char& letter : lower) letter = lowerCase(letter);
  return lower;
}

}  // namespace xquery
