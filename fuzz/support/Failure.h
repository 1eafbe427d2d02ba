// How a target tells what it has found.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

namespace xquery::fuzz {

[[noreturn]] inline void fail(std::string_view what, std::string_view detail = {}) {
  std::fprintf(stderr, "%.*s\n%.*s\n", static_cast<int>(what.size()), what.data(),
               static_cast<int>(detail.size()), detail.data());
  std::abort();
}

inline void check(bool isRight, std::string_view what, std::string_view detail = {}) {
  if (!isRight) fail(what, detail);
}

inline void checkEqual(std::string_view found, std::string_view expected, std::string_view what) {
  if (found == expected) return;
  fail(what, "found    " + std::string(found) + "\nexpected " + std::string(expected));
}

}  // namespace xquery::fuzz
