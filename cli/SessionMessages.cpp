#include "SessionMessages.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cstdint>
#include <string_view>
#include <system_error>

namespace cli {
namespace {

// What line numbers stand behind, in errors, in their JSON and in plans.
constexpr std::string_view heads[] = {"\" at line:", "\"line\":", "(line "};

}  // namespace

std::string withoutPrologLines(const std::string& text, size_t prologLines) {
  std::string result;
  for (size_t at = 0; at < text.size();) {
    const std::string_view rest = std::string_view(text).substr(at);
    const auto head = std::find_if(std::begin(heads), std::end(heads),
                                   [&](std::string_view each) { return rest.starts_with(each); });
    if (head == std::end(heads)) {
      result += text[at++];
      continue;
    }
    const std::string_view digits = rest.substr(head->size());
    uint64_t line = 0;
    const auto read = std::from_chars(digits.data(), digits.data() + digits.size(), line);
    if (read.ec != std::errc()) {
      result += text[at++];
      continue;
    }
    result += std::string(*head) + std::to_string(line > prologLines ? line - prologLines : line);
    at = static_cast<size_t>(read.ptr - text.data());
  }
  return result;
}

std::string importOfModule(const std::string& moduleDeclaration, const std::string& URL) {
  const size_t start = moduleDeclaration.find("module"), end = moduleDeclaration.rfind(';');
  return "import " + moduleDeclaration.substr(start, end - start) + " at \"" + URL + "\";";
}

}  // namespace cli
