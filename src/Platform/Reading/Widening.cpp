#include "Platform/Reading/Widening.h"

#include "Platform/Text/UTF8.h"

#include <algorithm>
#include <cstring>
#include <iterator>

namespace xquery {

namespace {

bool isCharacter(char32_t point) {
  // What is no UTF-8 is above all others.
  return point < 0xFFFE || (point > 0xFFFF && point != invalidCodePoint);
}

struct Lengths {
  unsigned each[WideningTables::bytesLookedAt];
  unsigned count = 0;
};

// Of the characters that end among the bytes.
Lengths lengthsOf(unsigned ends) {
  Lengths lengths;
  unsigned length = 0;
  for (size_t byte = 0; byte < WideningTables::bytesLookedAt; ++byte) {
    ++length;
    if (!(ends >> byte & 1U)) continue;
    lengths.each[lengths.count++] = length;
    length = 0;
  }
  return lengths;
}

bool isOf(const WideningTables::Shape& shape, const Lengths& lengths) {
  return lengths.count >= shape.characters &&
         *std::max_element(lengths.each, lengths.each + shape.characters) <= shape.longest;
}

// Of the sequences of lengths that have the shape.
size_t numberOf(const WideningTables::Shape& shape, const Lengths& lengths) {
  size_t number = 0;
  for (unsigned which = 0; which < shape.characters; ++which) {
    number = number * shape.longest + lengths.each[which] - 1;
  }
  return number;
}

// Each character in a lane, its last byte lowest. Answers the bytes that they take.
unsigned makeShuffle(const WideningTables::Shape& shape, const Lengths& lengths,
                     uint8_t (&shuffle)[16]) {
  const size_t lane = shape.longest > 2 ? 4 : 2;
  std::fill(std::begin(shuffle), std::end(shuffle), WideningTables::none);
  unsigned end = 0;
  for (unsigned which = 0; which < shape.characters; ++which) {
    end += lengths.each[which];
    for (unsigned byte = 0; byte < lengths.each[which]; ++byte) {
      shuffle[which * lane + byte] = static_cast<uint8_t>(end - 1 - byte);
    }
  }
  return end;
}

}  // namespace

// Each shuffle is made as often as it is found.
WideningTables::WideningTables() {
  for (unsigned ends = 0; ends < std::size(steps); ++ends) {
    const Lengths lengths = lengthsOf(ends);
    steps[ends] = {0, bytesLookedAt};  // of nothing that is well formed
    size_t first = 0;
    for (const Shape& shape : shapes) {
      if (isOf(shape, lengths)) {
        const size_t number = first + numberOf(shape, lengths);
        const unsigned bytes = makeShuffle(shape, lengths, shuffles[number]);
        steps[ends] = {static_cast<uint8_t>(number), static_cast<uint8_t>(bytes)};
        break;
      }
      first += shape.shuffles;
    }
  }
}

Widened widenSomePlainly(std::string_view bytes, char16_t* units) {
  const auto* const begin = reinterpret_cast<const unsigned char*>(bytes.data());
  const unsigned char* const end = begin + bytes.size();
  const unsigned char* const enough = begin + std::min(bytes.size(), widenedAtOnce);
  char16_t* to = units;
  const unsigned char* at = begin;
  while (at < enough) {
    const unsigned char* next = at;
    const char32_t point = readUTF8(next, end);
    if (!isCharacter(point)) break;
    if (point < 0x10000) {
      *to++ = static_cast<char16_t>(point);
    } else {
      *to++ = static_cast<char16_t>(0xD7C0 + (point >> 10));
      *to++ = static_cast<char16_t>(0xDC00 + (point & 0x3FF));
    }
    at = next;
  }
  return {static_cast<size_t>(at - begin), static_cast<size_t>(to - units)};
}

}  // namespace xquery
