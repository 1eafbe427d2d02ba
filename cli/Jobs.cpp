#include "Jobs.h"

#include "Documents.h"
#include "Evaluation.h"
#include "ItemWriter.h"
#include "Messages.h"
#include "MissingDocuments.h"
#include "Reports.h"
#include "Results.h"
#include "Signals.h"
#include "Stack.h"

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>

namespace cli {
namespace {

using namespace xquery;

unsigned numberOfJobs(const Options& options, size_t inputs) {
  const unsigned wanted =
      options.jobs > 0 ? options.jobs : std::max(1U, std::thread::hardware_concurrency());
  return static_cast<unsigned>(std::clamp<size_t>(inputs, 1, wanted));
}

class Jobs {
 public:
  Jobs(const Options& options, const XQuery& query, const XQueryVariables& constants,
       const std::optional<std::vector<Input>>& inputs, Phases& phases, Profile* profile)
      : _options(options),
        _query(query),
        _constants(constants),
        _inputs(inputs),
        _parts(inputs ? inputs->size() : 1),
        _jobs(numberOfJobs(options, _parts)),
        _results(options, framing(options), _jobs),
        _phases(phases),
        _profile(profile) {}

  Status run();

 private:
  // Counts one that is under way, until what it measured is in the profile.
  class Evaluating;

  Status status();
  // Takes one part after the other until there are no more; on each thread.
  void work();
  void makePart(size_t number, Phases& phases);
  Ref<NSArray> resultOf(const Input* input, Phases& phases);
  Ref<NSArray> evaluated(const Value& contextItem, Phases& phases);
  void endIfInterrupted();
  // What is said about one of several inputs names it, and what is said to a program always.
  std::string reported(const Input* input, const Failure& failure) const;

  const Options& _options;
  const XQuery& _query;
  const XQueryVariables& _constants;
  const std::optional<std::vector<Input>>& _inputs;
  const size_t _parts;
  const unsigned _jobs;
  Results _results;
  std::atomic<bool> _isAnyTrue = false;
  std::atomic<size_t> _next = 0;
  std::mutex _mutex;
  size_t _evaluations = 0;  // under way; under the mutex
  std::condition_variable _endOfEvaluation;
  Phases& _phases;
  const std::shared_ptr<MissingDocuments> _missing = std::make_shared<MissingDocuments>(_options);
  Profile* const _profile;  // null where none is asked for
};

// An interrupt ends the evaluations of all threads, each within a fraction of a second: what they
// have measured belongs to the profile. Others may read for as long as they like.
void Jobs::endIfInterrupted() {
  if (_profile && interruption()->load()) {
    std::unique_lock lock(_mutex);
    _endOfEvaluation.wait(lock, [&] { return _evaluations == 0; });
    _profile->writeAnyway(_phases);
  }
  cli::endIfInterrupted();
}

// This thread works too, so that all is done even where no other can be started.
Status Jobs::run() {
  const std::function<void()> each = [this] { work(); };
  std::vector<pthread_t> threads;
  while (threads.size() + 1 < _jobs) {
    const auto thread = startWithLargeStack(each, _jobs);
    if (!thread) break;
    threads.push_back(*thread);
  }
  work();
  for (const pthread_t thread : threads) pthread_join(thread, nullptr);
  endIfInterrupted();
  if (_results.finish(_parts)) return status();
  throw writingFailure(_options.outputFile, _results.error());
}

Status Jobs::status() {
  const Status gravest = _results.status();
  const bool isFalse = _options.exitStatus && !_isAnyTrue;
  return gravest == StatusResult && isFalse ? StatusFalse : gravest;
}

void Jobs::work() {
  Phases phases;
  for (size_t number = _next++; number < _parts && _results.begin(number); number = _next++) {
    makePart(number, phases);
  }
  const std::lock_guard lock(_mutex);
  _phases.add(phases);
}

void Jobs::makePart(size_t number, Phases& phases) {
  const Input* const input = _inputs ? &(*_inputs)[number] : nullptr;
  ResultPart part(_results, number);
  try {
    const Ref<NSArray> items = resultOf(input, phases);
    if (_options.exitStatus && isTrue(items.get())) _isAnyTrue = true;
    phases.print.measure([&] {
      part.begin();
      if (items) ItemWriter(_options, input ? inputName(input->path) : "", part).write(*items);
      part.end();
      return true;
    });
  } catch (const Failure& failure) {
    // Others may read or write meanwhile, for as long as they like.
    endIfInterrupted();
    part.end(failure.status, reported(input, failure));
  } catch (const std::exception& error) {
    part.end(StatusInput,
             reported(input, {StatusInput, std::string("xquery: ") + error.what(), {}}));
  }
}

Ref<NSArray> Jobs::resultOf(const Input* input, Phases& phases) {
  if (input && !input->failure.empty()) {
    throw Failure{StatusInput, "xquery: " + shownName(input->path) + ": " + input->failure, {}};
  }
  if (input) refuseOutputAsInput(_options, input->path);
  const Value contextItem = phases.parse.measure([&]() -> Value {
    if (!input) return nullptr;
    return readInput(_options, input->path, _query);
  });
  Ref<NSArray> items = evaluated(contextItem, phases);
  if (interruption()->load()) throw Failure{};
  return items;
}

class Jobs::Evaluating {
 public:
  explicit Evaluating(Jobs& jobs) : _jobs(jobs) {
    const std::lock_guard lock(_jobs._mutex);
    ++_jobs._evaluations;
  }
  ~Evaluating() {
    const std::lock_guard lock(_jobs._mutex);
    if (--_jobs._evaluations == 0) _jobs._endOfEvaluation.notify_all();
  }
  Evaluating(const Evaluating&) = delete;
  Evaluating& operator=(const Evaluating&) = delete;

 private:
  Jobs& _jobs;
};

Ref<NSArray> Jobs::evaluated(const Value& contextItem, Phases& phases) {
  const Evaluating evaluating(*this);
  Evaluation evaluation(_options, _missing);
  Ref<NSArray> items;
  try {
    for (unsigned n = 0; n < _options.repeat; n++) {
      items = nullptr;
      items = phases.evaluate.measure(
          [&] { return evaluation.evaluate(_query, _constants, contextItem); });
    }
  } catch (const Failure&) {
    if (_profile) _profile->add(evaluation.context(), true);
    throw;
  }
  if (_profile) _profile->add(evaluation.context(), false);
  return items;
}

std::string Jobs::reported(const Input* input, const Failure& failure) const {
  const bool isNamed = input && (_parts > 1 || _options.format == Format::JSON);
  return report(_options, failure, isNamed ? inputName(input->path) : "");
}

}  // namespace

Status runJobs(const Options& options, const XQuery& query, const XQueryVariables& constants,
               const std::optional<std::vector<Input>>& inputs, Phases& phases, Profile* profile) {
  return Jobs(options, query, constants, inputs, phases, profile).run();
}

}  // namespace cli
