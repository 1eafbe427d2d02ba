// A long text in pieces that are one step of work each, so that going through it can be ended.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/String.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>
#include <string>
#include <string_view>
#include <type_traits>

namespace xquery {

constexpr uint32_t unitsPerBlock = 8192;

// After so many units were looked at in one go: only long texts are work of their own.
inline void checkUnits(uint32_t count) {
  if (count >= unitsPerBlock) checkWork(count / unitsPerBlock);
}

// Calls `work` with each piece in turn; of a text of one piece with the text itself.
template <class Text, class Work>
void inBlocks(std::basic_string_view<Text> text, Work work) {
  for (; text.size() > unitsPerBlock; text.remove_prefix(unitsPerBlock)) {
    work(text.substr(0, unitsPerBlock));
    checkWork();
  }
  work(text);
}

// The first such byte, or `end`.
inline const char* findInBlocks(const char* at, const char* end, char byte) {
  constexpr size_t bytesPerStep = size_t{1} << 16;  // these are passed quickly
  while (at < end) {
    const size_t count = std::min(static_cast<size_t>(end - at), bytesPerStep);
    if (const void* found = std::memchr(at, byte, count)) return static_cast<const char*>(found);
    at += count;
    checkWork();
  }
  return end;
}

// Text that counts as memory of values while it is put together.
template <class Unit>
using ValueText = std::basic_string<Unit, std::char_traits<Unit>, ValueAllocator<Unit>>;

// Room for more units. A long text that has to move for it moves in blocks.
template <class Text>
void makeRoom(Text& text, size_t more) {
  const size_t needed = text.size() + more;
  if (needed <= text.capacity() || text.size() <= unitsPerBlock) return;
  Text larger;
  larger.reserve(std::max(needed, 2 * text.capacity()));
  inBlocks(std::basic_string_view<typename Text::value_type>(text),
           [&larger](auto block) { larger.append(block); });
  text.swap(larger);
}

template <class Text, class Unit>
void appendInBlocks(Text& text, std::basic_string_view<Unit> piece) {
  makeRoom(text, piece.size());
  inBlocks(piece, [&text](std::basic_string_view<Unit> block) {
    if constexpr (std::is_same_v<Unit, typename Text::value_type>) {
      text.append(block);
    } else {
      text.append(block.begin(), block.end());
    }
  });
}

// The units of the text, in the width in which they are stored.
template <class Work>
auto withUnitsOf(NSStringView text, Work work) {
  return text.isWide() ? work(std::u16string_view(text.wideUnits(), text.length()))
                       : work(std::string_view(text.asciiUnits(), text.length()));
}

// A text that outgrew 32 bits while it was written is as good as memory that is not there.
template <class Unit>
NSStringView viewOf(std::basic_string_view<Unit> text) {
  if (text.size() >= NSStringView::notFound) throw std::bad_alloc();
  return {text.data(), static_cast<uint32_t>(text.size())};
}
template <class Unit, class Allocator>
NSStringView viewOf(const std::basic_string<Unit, std::char_traits<Unit>, Allocator>& text) {
  return viewOf(std::basic_string_view<Unit>(text));
}

}  // namespace xquery
