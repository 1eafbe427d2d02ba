// Whether the time of the built-in functions grows in proportion to what they are given.
#pragma once

namespace bench {

// Measures each function over 10 to 1,000,000 items, or characters of a text, and prints the time
// per item at each size and how it grows over the last tenfold. The exit status of the program: 0
// when no function's time grows more than 50 times as its input grows ten times. A function in
// proportion grows 10 times, and more where the input no longer fits the caches; one that compares
// every pair grows 100 times.
[[nodiscard]] int reportFunctions();

}  // namespace bench
