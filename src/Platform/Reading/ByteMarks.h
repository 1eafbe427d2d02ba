// Where markup may be in a text: for each byte, whether it may end a run of text, a value or a
// name, in one bit each. A pass over the text finds them many bytes at a time, with the widest
// vectors that the processor has; reading then goes from bit to bit and looks at few bytes.
#pragma once

#include <cstddef>
#include <cstdint>

namespace xquery {

// Of 64 bytes, the first in the lowest bit.
struct ByteMarks {
  // "<", "&", ">" and control characters but tab and line feed.
  uint64_t text;
  // Both quotes, "<", "&", ">" and control characters.
  uint64_t value;
  // White space, "=", "/", "<", ">" and control characters. Whatever else cannot be in a name
  // either is found when a name is looked at for the first time.
  uint64_t name;
  // Not ASCII.
  uint64_t wide;
};

constexpr size_t bytesPerMarks = 64;

// Of so many times 64 bytes.
void markBytes(const char* bytes, size_t count, ByteMarks* marks);
// The same without vectors.
void markBytesPlainly(const char* bytes, size_t count, ByteMarks* marks);

// The classes of a byte are the bits that the entries for its two halves have in common: each bit
// stands for all bytes with one of some upper halves and one of some lower halves. Bytes that are
// not ASCII are in none.
namespace byteclasses {

enum Bit : uint8_t {
  Control = 1U << 0,        // but those with the lower halves of tab and line feed
  HighControl = 1U << 1,    // the others of the second sixteen
  TabOrLineFeed = 1U << 2,  //
  Ampersand = 1U << 3,
  Quote = 1U << 4,
  SpaceOrSlash = 1U << 5,
  Angle = 1U << 6,
  Equals = 1U << 7,
};
constexpr uint8_t ofText = Control | HighControl | Ampersand | Angle;
constexpr uint8_t ofValue = ofText | TabOrLineFeed | Quote;
constexpr uint8_t ofName = Control | HighControl | TabOrLineFeed | SpaceOrSlash | Angle | Equals;

// By the lower half of a byte.
alignas(16) constexpr uint8_t lower[16] = {
    Control | SpaceOrSlash,       // 0
    Control,                      // 1
    Control | Quote,              // 2
    Control,                      // 3
    Control,                      // 4
    Control,                      // 5
    Control | Ampersand,          // 6
    Control | Quote,              // 7
    Control,                      // 8
    HighControl | TabOrLineFeed,  // 9
    HighControl | TabOrLineFeed,  // A
    Control,                      // B
    Control | Angle,              // C
    Control | Equals,             // D
    Control | Angle,              // E
    Control | SpaceOrSlash,       // F
};
// By the upper half.
alignas(16) constexpr uint8_t upper[16] = {
    Control | TabOrLineFeed,           // 00
    Control | HighControl,             // 10
    Ampersand | Quote | SpaceOrSlash,  // 20
    Angle | Equals,                    // 30
};

}  // namespace byteclasses

}  // namespace xquery
