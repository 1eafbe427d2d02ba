// Long texts for tests.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace xquery {

inline std::string repeated(std::string_view text, size_t count) {
  std::string result;
  result.reserve(text.size() * count);
  for (size_t times = 0; times < count; ++times) result += text;
  return result;
}

}  // namespace xquery
