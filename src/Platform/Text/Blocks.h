// A long text in pieces that are one step of work each, so that going through it can be ended.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/String.h"

#include <cstdint>
#include <new>
#include <string>
#include <string_view>

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
template <class Unit>
NSStringView viewOf(const std::basic_string<Unit>& text) {
  return viewOf(std::basic_string_view<Unit>(text));
}

}  // namespace xquery
