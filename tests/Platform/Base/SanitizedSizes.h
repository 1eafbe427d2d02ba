// How large the large inputs of tests are. What takes a second takes ten under a sanitizer, and
// what a sanitizer sees in a quarter of the input it sees in all of it.
#pragma once

#ifdef XQUERY_SANITIZED
inline constexpr int largeInputDivisor = 4;
#else
inline constexpr int largeInputDivisor = 1;
#endif
