#include "Platform/Loading/GatheredBytes.h"

#include <algorithm>

namespace xquery {

namespace {

constexpr size_t leastChunk = size_t{64} << 10;
constexpr size_t mostChunk = size_t{1} << 20;

}  // namespace

void GatheredBytes::addChunk() {
  const size_t size =
      _chunks.empty() ? std::max(_expected, leastChunk) : std::clamp(_size, leastChunk, mostChunk);
  _counted.add(size);
  _chunks.emplace_back().reserve(size);
}

void GatheredBytes::append(std::string_view bytes) {
  while (!bytes.empty()) {
    if (_chunks.empty() || _chunks.back().size() == _chunks.back().capacity()) addChunk();
    std::string& chunk = _chunks.back();
    const size_t count = std::min(bytes.size(), chunk.capacity() - chunk.size());
    chunk.append(bytes.substr(0, count));
    bytes.remove_prefix(count);
    _size += count;
  }
}

std::string GatheredBytes::take() {
  if (_chunks.size() == 1) return std::move(_chunks.front());
  std::string all;
  all.reserve(_size);
  for (std::string& chunk : _chunks) {
    all.append(chunk);
    std::string().swap(chunk);
  }
  return all;
}

}  // namespace xquery
