// xquery_auction FACTOR, xquery_bibliography FACTOR, xquery_business FACTOR: writes such data to
// standard output.
#include "DataSets.h"

#include <cstdio>
#include <cstdlib>
#include <string>

int main(int argc, char** argv) {
  char* end = nullptr;
  const double factor = argc == 2 ? std::strtod(argv[1], &end) : 0;
  if (!end || *end || !(factor > 0 && factor <= 30)) {
    std::fprintf(stderr, "usage: %s FACTOR (above 0, at most 30; 1 gives about 110 MB)\n", argv[0]);
    return 2;
  }
  const std::string document = bench::generatedData(XQUERY_BENCH_DATA, factor);
  const bool written = std::fwrite(document.data(), 1, document.size(), stdout) == document.size();
  return written && std::fflush(stdout) == 0 ? 0 : 1;
}
