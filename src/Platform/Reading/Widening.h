// UTF-8 into UTF-16, many bytes at a time.
//
// Where characters end among the next twelve bytes tells how many of them one step can take: six of
// at most two bytes, else four of at most three, else three of any length. A shuffle of the bytes
// puts each character into a lane of its own, the last byte lowest, and the bits that say how long
// it is are squeezed out of all lanes at once. Processors that move lanes together by a mask have a
// shorter way, `WidenByCompressing.h`.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace xquery {

struct Widened {
  size_t bytes;
  size_t units;
};

// Widens what comes first, some thousand bytes of a longer text; nothing where that is not UTF-8 or
// stands for what is no character of XML. Control characters are let pass. There must be room for a
// unit for each byte.
Widened widenSome(std::string_view bytes, char16_t* units);
// The same without vectors.
Widened widenSomePlainly(std::string_view bytes, char16_t* units);

// What one call widens at least of a longer text.
constexpr size_t widenedAtOnce = 8192;

// --- for vectors -------------------------------------------------------------------------------

struct WideningTables {
  // How many characters a step takes, and how long they may be.
  struct Shape {
    unsigned characters;
    unsigned longest;
    unsigned shuffles;  // as many as there are sequences of such lengths
  };
  static constexpr Shape shapes[] = {{6, 2, 64}, {4, 3, 81}, {3, 4, 64}};
  static constexpr size_t firstOfFour = 64;
  static constexpr size_t firstOfThree = 64 + 81;
  static constexpr size_t allShuffles = 64 + 81 + 64;
  static constexpr size_t bytesLookedAt = 12;
  static constexpr uint8_t none = 0x80;  // a byte of zero

  struct Step {
    uint8_t shuffle;
    uint8_t bytes;  // that it takes
  };

  WideningTables();

  alignas(16) uint8_t shuffles[allShuffles][16];
  // By a bit for each of the bytes that is the last of a character, the first byte in the lowest.
  Step steps[size_t{1} << bytesLookedAt];
};

// What is wrong with two bytes in a row is what the entries for both halves of the first and for
// the upper half of the second have in common. `Follows` is no fault where a third or fourth byte
// has to be, and one where it is missing there.
namespace utf8faults {

enum Bit : uint8_t {
  TooShort = 1U << 0,        // a lead and no byte that goes on
  TooLong = 1U << 1,         // a byte that goes on after a whole character
  Overlong3 = 1U << 2,       // E0 and less than A0
  TooLarge = 1U << 3,        // F4 and more than 8F, F5 and more
  Surrogate = 1U << 4,       // ED and more than 9F
  Overlong2 = 1U << 5,       // C0 and C1
  Overlong4 = 1U << 6,       // F0 and less than 90
  TooLarge1000 = Overlong4,  // F5 and more with 80 to 8F
  Follows = 1U << 7,         // two bytes that go on
};
constexpr uint8_t anyLower = TooShort | TooLong | Follows;
constexpr uint8_t large = anyLower | TooLarge | TooLarge1000;
constexpr uint8_t goesOn = TooLong | Overlong2 | Follows;

alignas(16) constexpr uint8_t firstUpper[16] = {
    TooLong,
    TooLong,
    TooLong,
    TooLong,
    TooLong,
    TooLong,
    TooLong,
    TooLong,  // ASCII
    Follows,
    Follows,
    Follows,
    Follows,                                         // goes on
    TooShort | Overlong2,                            // C
    TooShort,                                        // D
    TooShort | Overlong3 | Surrogate,                // E
    TooShort | TooLarge | TooLarge1000 | Overlong4,  // F
};
alignas(16) constexpr uint8_t firstLower[16] = {
    anyLower | Overlong3 | Overlong2 | Overlong4,  // 0
    anyLower | Overlong2,                          // 1
    anyLower,                                      // 2
    anyLower,                                      // 3
    anyLower | TooLarge,                           // 4
    large,
    large,
    large,
    large,
    large,
    large,
    large,
    large,
    large | Surrogate,  // D
    large,
    large,
};
alignas(16) constexpr uint8_t secondUpper[16] = {
    TooShort,
    TooShort,
    TooShort,
    TooShort,
    TooShort,
    TooShort,
    TooShort,
    TooShort,                                       // ASCII
    goesOn | Overlong3 | TooLarge1000 | Overlong4,  // 8
    goesOn | Overlong3 | TooLarge,                  // 9
    goesOn | Surrogate | TooLarge,                  // A
    goesOn | Surrogate | TooLarge,                  // B
    TooShort,
    TooShort,
    TooShort,
    TooShort,  // leads
};

}  // namespace utf8faults

}  // namespace xquery
