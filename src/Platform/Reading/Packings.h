// The formats of packed text that are read, and how each begins.
#pragma once

#include "Platform/Reading/Unpacker.h"

#include <cstdint>
#include <span>
#include <string_view>

namespace xquery {

// The bytes that a member of a format begins with.
struct PackedStart {
  std::string_view bytes;
  // The place of a byte of which only the upper half counts, as a digit has it.
  size_t loose = std::string_view::npos;
};

struct Packing {
  const char* name;
  std::span<const PackedStart> starts;
  // Zero bytes may stand behind a member in multiples of this.
  size_t padding;
  std::unique_ptr<Unpacker> (*unpacker)(size_t mostMemory);
};

// Whether a text that begins with these bytes, of which there may be more, is one of the packing.
enum class PackedFit : uint8_t { No, Perhaps, Yes };
[[nodiscard]] PackedFit fitOf(const Packing& packing, std::string_view bytes);

// No text in XML begins like any of them.
[[nodiscard]] std::span<const Packing> packings();
constexpr size_t longestPackedStart = 10;

// The packing of a whole text; null for plain text.
[[nodiscard]] const Packing* packingOf(std::string_view text);

}  // namespace xquery
