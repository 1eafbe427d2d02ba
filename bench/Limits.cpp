// How late expensive evaluations end, and how much memory they take beyond what they may: one row
// for each kind of work, the worst last. Each row runs in a process of its own, started from this
// program, so that none is burdened with what another left behind. Beside the time on the clock
// stands what the evaluating thread worked after the deadline, which a busy machine does not
// lengthen; it says nothing of an evaluation that waits for others.
//
//   xquery_limits                     under a deadline of 300 ms
//   xquery_limits --ceiling           under a ceiling of 64 MiB
//   xquery_limits --only TEXT ...     the rows whose names hold the text
//   xquery_limits --list              their names
#include "LimitRows.h"
#include "LimitServers.h"
#include "xquery/xquery.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <fstream>
#include <memory>
#include <poll.h>
#include <pthread.h>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <utility>
#include <vector>

namespace bench {
namespace {

using Clock = std::chrono::steady_clock;
using std::chrono::milliseconds;

constexpr milliseconds deadline(300);
constexpr uint64_t MiB = uint64_t{1} << 20;
constexpr uint64_t ceiling = 64 * MiB;
// What is not over by then is ended from outside.
constexpr milliseconds patience(20'000);

const std::vector<LimitRow>& rows() {
  static const std::vector<LimitRow> all = [] {
    std::vector<LimitRow> rows;
    for (const auto& table :
         {readingRows(), valueRows(), textRows(), sequenceRows(), treeRows(), programRows()}) {
      rows.insert(rows.end(), table.begin(), table.end());
    }
    return rows;
  }();
  return all;
}

// --- in the process of a row ---------------------------------------------------------------------

// A field of /proc/self/status, in MiB.
double statusMiB(const char* field) {
  std::ifstream file("/proc/self/status");
  std::string line;
  while (std::getline(file, line)) {
    if (line.starts_with(field)) return std::atof(line.c_str() + std::strlen(field)) / 1024;
  }
  return 0;
}

void startPeak() {
  std::ofstream("/proc/self/clear_refs") << "5";
}

class Host : public xquery::XQueryLoader {
 public:
  explicit Host(std::string resource) : _resource(std::move(resource)) {}
  std::optional<xquery::XQueryResource> load(const xquery::NSURL& URL,
                                             xquery::XQueryLoadPurpose) override {
    if (URL.scheme() == "missing") return std::nullopt;
    while (URL.scheme() == "silent") std::this_thread::sleep_for(std::chrono::hours(1));
    return xquery::XQueryResource{answer(), {}, {}, {}};
  }

 private:
  // A large one is asked for once, and handed over: a copy would be taken for the engine's memory.
  std::string answer() {
    constexpr size_t large = MiB;
    return _resource.size() < large ? _resource : std::exchange(_resource, {});
  }

  std::string _resource;
};

double processorMilliseconds(clockid_t clock) {
  timespec time = {};
  ::clock_gettime(clock, &time);
  return 1e3 * static_cast<double>(time.tv_sec) + 1e-6 * static_cast<double>(time.tv_nsec);
}

// What the thread that makes it works from the deadline on.
class Overtime {
 public:
  explicit Overtime(Clock::time_point start) {
    ::pthread_getcpuclockid(pthread_self(), &_processor);
    std::thread([this, start] {
      std::this_thread::sleep_until(start + deadline);
      _atDeadline = processorMilliseconds(_processor);
    }).detach();
  }
  double milliseconds() const {
    const double then = _atDeadline;
    return then < 0 ? 0 : processorMilliseconds(_processor) - then;
  }

 private:
  clockid_t _processor = CLOCK_THREAD_CPUTIME_ID;
  std::atomic<double> _atDeadline = -1;
};

struct Setting {
  xquery::XQueryLoading loading;
  xquery::XQueryLimits limits;
};

void replaceAll(std::string& text, const std::string& what, const std::string& with) {
  for (size_t at = text.find(what); at != text.npos; at = text.find(what, at + with.size())) {
    text.replace(at, what.size(), with);
  }
}

xquery::Ref<xquery::XQuery> compile(const LimitRow& row, const std::string& text,
                                    const Setting& setting) {
  const xquery::XQueryLimits none;
  return xquery::XQuery::xqueryWithSource(std::string_view(text), setting.loading,
                                          row.door == Door::Compile ? setting.limits : none);
}

std::string firstError(const xquery::XQuery& query) {
  const auto errors = query.parseErrors();
  if (!errors) return "";
  return xquery::cast<xquery::XQueryError>(errors->objectAtIndex(0))->msg()->utf8();
}

// Compiled and answered, and all that was made for it given back. The error, or nothing.
std::string runOnce(const LimitRow& row, const std::string& query, const Setting& setting,
                    const xquery::Value& item, Clock::time_point& start,
                    std::unique_ptr<Overtime>& overtime) {
  startPeak();
  start = Clock::now();
  if (row.door == Door::Compile) overtime = std::make_unique<Overtime>(start);
  const auto compiled = compile(row, query, setting);
  std::string error = firstError(*compiled);
  if (row.door == Door::Compile || !error.empty()) return error;
  const auto context = xquery::XQueryContext::xqueryContext();
  context->contextSetLoading(setting.loading);
  context->contextSetLimits(setting.limits);
  xquery::Ref<xquery::XQueryError> failure;
  start = Clock::now();
  overtime = std::make_unique<Overtime>(start);
  const auto items = context->evaluateXQuery(*compiled, {}, item, &failure);
  if (failure) error = failure->msg()->utf8();
  return error;
}

int runRow(const LimitRow& row, bool underCeiling) {
  const SilentServer silent;
  const EndlessServer endless;
  std::string query = row.query.text();
  const bool usesServer = query.find("-SERVER") != query.npos;
  replaceAll(query, "SILENT-SERVER", silent.URL());
  replaceAll(query, "ENDLESS-SERVER", endless.URL());
  Setting setting;
  if (!usesServer) setting.loading.loader = std::make_shared<Host>(row.resource.text());
  setting.loading.policy = xquery::XQueryLoadingPolicy::allowAll();
  setting.loading.policy.allowScheme("app").allowScheme("silent").allowScheme("missing");
  if (underCeiling) {
    setting.limits.memoryCeiling = ceiling;
  } else {
    setting.limits.duration = deadline;
  }
  const xquery::Value item =
      row.item ? xquery::NSXMLDocument::documentWithData(row.item.text(), 0) : nullptr;
  const double before = statusMiB("VmRSS:");
  Clock::time_point start;
  std::unique_ptr<Overtime> overtime;
  const std::string error = runOnce(row, query, setting, item, start, overtime);
  const auto taken = std::chrono::duration<double, std::milli>(Clock::now() - start);
  std::printf("%.0f %.0f %.0f %s\n", taken.count(), overtime ? overtime->milliseconds() : 0,
              statusMiB("VmHWM:") - before,
              error.empty() ? "finished" : error.substr(0, 60).c_str());
  std::fflush(stdout);
  std::_Exit(0);
}

// --- in the process that has asked ---------------------------------------------------------------

struct Outcome {
  std::string name;
  double milliseconds = 0;
  double overtime = 0;
  double MiB = 0;
  std::string end = "ended from outside";
};

std::string answerOf(int input, pid_t child) {
  std::string answer;
  const auto end = Clock::now() + patience;
  char piece[512];
  for (;;) {
    const auto left = std::chrono::duration_cast<milliseconds>(end - Clock::now());
    pollfd ready = {input, POLLIN, 0};
    if (left.count() <= 0 || ::poll(&ready, 1, static_cast<int>(left.count())) <= 0) break;
    const ssize_t count = ::read(input, piece, sizeof piece);
    if (count <= 0) break;
    answer.append(piece, static_cast<size_t>(count));
  }
  ::kill(child, SIGKILL);
  return answer;
}

Outcome outcomeOf(const LimitRow& row, bool underCeiling) {
  Outcome outcome;
  outcome.name = row.name;
  outcome.milliseconds = static_cast<double>(patience.count());
  int ends[2];
  if (::pipe(ends) != 0) return outcome;
  const pid_t child = ::fork();
  if (child == 0) {
    ::dup2(ends[1], STDOUT_FILENO);
    ::execl("/proc/self/exe", "xquery_limits", "--row", row.name,
            underCeiling ? "--ceiling" : nullptr, nullptr);
    ::_exit(127);
  }
  ::close(ends[1]);
  const std::string answer = answerOf(ends[0], child);
  ::close(ends[0]);
  ::waitpid(child, nullptr, 0);
  char end[128] = {};
  if (std::sscanf(answer.c_str(), "%lf %lf %lf %127[^\n]", &outcome.milliseconds, &outcome.overtime,
                  &outcome.MiB, end) == 4) {
    outcome.end = end;
  }
  return outcome;
}

void report(std::vector<Outcome> outcomes, bool underCeiling) {
  const auto badness = [&](const Outcome& outcome) {
    return underCeiling ? outcome.MiB : outcome.milliseconds;
  };
  std::stable_sort(outcomes.begin(), outcomes.end(),
                   [&](const Outcome& a, const Outcome& b) { return badness(a) < badness(b); });
  std::printf("%-44s %9s %9s %9s  %s\n", "work", underCeiling ? "ms" : "ms late", "work late",
              "peak MiB", "end");
  for (const Outcome& outcome : outcomes) {
    const double late = underCeiling ? 0 : static_cast<double>(deadline.count());
    std::printf("%-44s %9.0f %9.0f %9.0f  %s\n", outcome.name.c_str(), outcome.milliseconds - late,
                outcome.overtime, outcome.MiB, outcome.end.c_str());
  }
}

int list() {
  for (const LimitRow& row : rows()) std::puts(row.name);
  return 0;
}

int runAll(const std::string& only, bool underCeiling) {
  std::vector<Outcome> outcomes;
  for (const LimitRow& row : rows()) {
    if (std::string_view(row.name).find(only) == std::string_view::npos) continue;
    outcomes.push_back(outcomeOf(row, underCeiling));
  }
  report(std::move(outcomes), underCeiling);
  return 0;
}

int main(const std::vector<std::string>& arguments) {
  bool underCeiling = false;
  std::string only;
  std::string rowName;
  for (size_t index = 0; index < arguments.size(); ++index) {
    const bool hasValue = index + 1 < arguments.size();
    if (arguments[index] == "--list") return list();
    if (arguments[index] == "--ceiling") {
      underCeiling = true;
    } else if (arguments[index] == "--only" && hasValue) {
      only = arguments[++index];
    } else if (arguments[index] == "--row" && hasValue) {
      rowName = arguments[++index];
    } else {
      std::fputs("usage: xquery_limits [--ceiling] [--only TEXT] [--list]\n", stderr);
      return 2;
    }
  }
  for (const LimitRow& row : rows()) {
    if (rowName == row.name) return runRow(row, underCeiling);
  }
  return runAll(only, underCeiling);
}

}  // namespace
}  // namespace bench

int main(int count, char** arguments) {
  return bench::main({arguments + 1, arguments + count});
}
