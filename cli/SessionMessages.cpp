#include "SessionMessages.h"

#include <charconv>
#include <cstdint>
#include <string_view>
#include <system_error>

namespace cli {

std::string withoutPrologLines(const std::string& plan, size_t prologLines) {
  constexpr std::string_view head = "(line ";
  std::string result;
  std::string_view rest = plan;
  for (size_t at = rest.find(head); at != rest.npos; at = rest.find(head)) {
    const size_t number = at + head.size();
    uint64_t line = 0;
    const auto read = std::from_chars(rest.data() + number, rest.data() + rest.size(), line);
    result += rest.substr(0, number);
    const size_t end =
        read.ec == std::errc() ? static_cast<size_t>(read.ptr - rest.data()) : number;
    const bool isOfEntry = end > number && !rest.substr(end).starts_with(" of ");
    if (isOfEntry && line > prologLines) {
      result += std::to_string(line - prologLines);
    } else {
      result += rest.substr(number, end - number);
    }
    rest.remove_prefix(end);
  }
  return result += rest;
}

std::string importOfModule(const std::string& moduleDeclaration, const std::string& URL) {
  const size_t start = moduleDeclaration.find("module"), end = moduleDeclaration.rfind(';');
  return "import " + moduleDeclaration.substr(start, end - start) + " at \"" + URL + "\";";
}

}  // namespace cli
