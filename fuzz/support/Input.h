// The bytes of an input, taken piece by piece; at their end everything is 0 or empty.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery::fuzz {

class Input {
 public:
  Input(const uint8_t* data, size_t size)
      : _left(reinterpret_cast<const char*>(data), data ? size : 0) {}

  bool isEmpty() const { return _left.empty(); }
  uint8_t byte() {
    if (_left.empty()) return 0;
    const auto byte = static_cast<uint8_t>(_left.front());
    _left.remove_prefix(1);
    return byte;
  }
  size_t below(size_t bound) { return byte() % bound; }
  bool chance(size_t oneIn) { return below(oneIn) == 0; }

  // Up to the next line break, which is dropped.
  std::string_view line() {
    const size_t at = std::min(_left.find('\n'), _left.size());
    const std::string_view line = _left.substr(0, at);
    _left.remove_prefix(std::min(at + 1, _left.size()));
    return line;
  }
  std::string_view bytes(size_t most) {
    const std::string_view taken = _left.substr(0, most);
    _left.remove_prefix(taken.size());
    return taken;
  }
  std::string_view rest() { return bytes(_left.size()); }

 private:
  std::string_view _left;
};

}  // namespace xquery::fuzz
