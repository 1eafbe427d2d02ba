// The kernel keeps the largest resident size of a process; writing 5 to clear_refs makes it start
// again from the present one.
#include "PeakMemory.h"

#include "Engine.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <malloc.h>
#include <sys/wait.h>
#include <unistd.h>

namespace bench {
namespace {

// A field of /proc/self/status, in bytes.
double statusBytes(const char* field) {
  double kibibytes = 0;
  if (FILE* file = std::fopen("/proc/self/status", "r")) {
    char line[256];
    while (std::fgets(line, sizeof line, file)) {
      const size_t length = std::strlen(field);
      if (std::strncmp(line, field, length) == 0) kibibytes = std::atof(line + length);
    }
    std::fclose(file);
  }
  return kibibytes * 1024;
}

void startPeak() {
  if (FILE* file = std::fopen("/proc/self/clear_refs", "w")) {
    std::fputs("5", file);
    std::fclose(file);
  }
}

[[noreturn]] void becomeReporter(const std::string& query, int output) {
  ::dup2(output, STDOUT_FILENO);
  ::execl("/proc/self/exe", "xquery_bench", "--peak", query.c_str(), nullptr);
  ::_exit(127);
}

}  // namespace

double residentBytes() {
  malloc_trim(0);
  return statusBytes("VmRSS:");
}

int reportPeak(const char* text) {
  const auto query = compile(text);
  const auto context = xquery::XQueryContext::xqueryContext();
  startPeak();
  const double before = statusBytes("VmRSS:");
  evaluate(*context, *query, {});
  std::printf("%.0f\n", statusBytes("VmHWM:") - before);
  return 0;
}

double peakBytesOf(const std::string& query) {
  int ends[2];
  if (::pipe(ends) != 0) return 0;
  const pid_t child = ::fork();
  if (child == 0) becomeReporter(query, ends[1]);
  ::close(ends[1]);
  double bytes = 0;
  if (FILE* answer = ::fdopen(ends[0], "r")) {
    if (std::fscanf(answer, "%lf", &bytes) != 1) bytes = 0;
    std::fclose(answer);
  }
  if (child > 0) ::waitpid(child, nullptr, 0);
  return bytes;
}

}  // namespace bench
