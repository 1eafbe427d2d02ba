#include "Platform/Reading/Packings.h"

#include <algorithm>

namespace xquery {

namespace {

using namespace std::string_view_literals;

constexpr PackedStart startsOfGzip[] = {{"\x1F\x8B\x08"sv}};
constexpr PackedStart startsOfXZ[] = {{"\xFD\x37zXZ\0"sv}};
// A frame, and one that is to be skipped, of which there are sixteen kinds.
constexpr PackedStart startsOfZstandard[] = {{"\x28\xB5\x2F\xFD"sv}, {"\x50\x2A\x4D\x18"sv, 0}};
// A stream, and an empty one. They begin with letters, as HTML of bad quality may: so all that is
// fixed is looked at.
constexpr PackedStart startsOfBZip2[] = {{"BZh\x30\x31\x41\x59\x26\x53\x59"sv, 3},
                                         {"BZh\x30\x17\x72\x45\x38\x50\x90"sv, 3}};

// Tapes leave zeros behind gzip, which its own tools pass over.
constexpr Packing all[] = {
    {"gzip", startsOfGzip, 1, unpackerOfGzip},
    {"xz", startsOfXZ, 4, unpackerOfXZ},
    {"zstd", startsOfZstandard, 0, unpackerOfZstandard},
    {"bzip2", startsOfBZip2, 0, unpackerOfBZip2},
};

constexpr bool areShortEnough() {
  for (const Packing& packing : all) {
    for (const PackedStart& start : packing.starts) {
      if (start.bytes.size() > longestPackedStart) return false;
    }
  }
  return true;
}
static_assert(areShortEnough());

bool isAlike(char a, char b, bool isLoose) {
  const unsigned mask = isLoose ? 0xF0 : 0xFF;
  return ((static_cast<unsigned char>(a) ^ static_cast<unsigned char>(b)) & mask) == 0;
}

PackedFit fitOf(const PackedStart& start, std::string_view bytes) {
  const size_t count = std::min(bytes.size(), start.bytes.size());
  for (size_t at = 0; at < count; ++at) {
    if (!isAlike(bytes[at], start.bytes[at], at == start.loose)) return PackedFit::No;
  }
  return count == start.bytes.size() ? PackedFit::Yes : PackedFit::Perhaps;
}

}  // namespace

PackedFit fitOf(const Packing& packing, std::string_view bytes) {
  PackedFit best = PackedFit::No;
  for (const PackedStart& start : packing.starts) best = std::max(best, fitOf(start, bytes));
  return best;
}

std::span<const Packing> packings() {
  return all;
}

const Packing* packingOf(std::string_view text) {
  for (const Packing& packing : all) {
    if (fitOf(packing, text) == PackedFit::Yes) return &packing;
  }
  return nullptr;
}

}  // namespace xquery
