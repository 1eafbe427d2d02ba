// Long texts for tests, and texts chosen to be hard on tables.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

inline std::string repeated(std::string_view text, size_t count) {
  std::string result;
  result.reserve(text.size() * count);
  for (size_t times = 0; times < count; ++times) result += text;
  return result;
}

// Different texts whose hashes are one, where four units at a time are mixed in and multiplied by a
// number that everybody knows: whatever the first four lead to, the second four undo it.
inline std::vector<std::u16string> meetingTexts(size_t count) {
  constexpr uint64_t multiplier = 0x9E3779B97F4A7C15U;
  constexpr uint64_t meetingPoint = 0x0061006200630064U;
  std::vector<std::u16string> texts;
  for (uint64_t first = 0; first < count; ++first) {
    uint64_t hash = (8 * multiplier ^ first) * multiplier;
    hash ^= hash >> 32;
    const uint64_t words[] = {first, hash ^ meetingPoint};
    std::u16string text(8, u' ');
    std::memcpy(text.data(), words, sizeof words);
    texts.push_back(std::move(text));
  }
  return texts;
}

}  // namespace xquery
