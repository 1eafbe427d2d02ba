#include "Platform/Reading/KeptText.h"

#include <algorithm>
#include <cstring>

namespace xquery {

void KeptText::append(std::string_view bytes) {
  constexpr size_t pieceBytes = size_t{1} << 18;
  while (!bytes.empty()) {
    if (_pieces.empty() || _pieces.back().size() == pieceBytes) _pieces.emplace_back();
    ValueText<char>& piece = _pieces.back();
    const size_t part = std::min(bytes.size(), pieceBytes - piece.size());
    piece.append(bytes.substr(0, part));
    bytes.remove_prefix(part);
  }
}

size_t KeptText::read(char* buffer, size_t size) {
  if (_pieces.empty()) return 0;
  while (_at == _pieces[_piece].size() && _piece + 1 < _pieces.size()) {
    ++_piece;
    _at = 0;
  }
  const std::string_view piece = _pieces[_piece];
  const size_t count = std::min(size, piece.size() - _at);
  std::memcpy(buffer, piece.data() + _at, count);
  _at += count;
  return count;
}

}  // namespace xquery
