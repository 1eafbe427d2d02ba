#include "LimitRows.h"

namespace bench {

std::string repeated(const std::string& text, int count) {
  std::string all;
  all.reserve(text.size() * static_cast<size_t>(count));
  for (int index = 0; index < count; ++index) {
    for (const char unit : text) {
      if (unit == '@') {
        all += std::to_string(index);
      } else {
        all += unit;
      }
    }
  }
  return all;
}

std::string doubledText(const std::string& text, int times, const std::string& name) {
  std::string query = "let $" + name + " := '" + text + "' ";
  const std::string again = "let $" + name + " := concat($" + name + ", $" + name + ") ";
  for (int time = 0; time < times; ++time) query += again;
  return query;
}

}  // namespace bench
