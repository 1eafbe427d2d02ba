#include "Streaming.h"

#include "Evaluation.h"
#include "Inputs.h"
#include "ItemWriter.h"
#include "Messages.h"
#include "MissingDocuments.h"
#include "OptionsTable.h"
#include "Reports.h"
#include "Results.h"
#include "Signals.h"

#include <string>
#include <utility>

namespace cli {
namespace {

using namespace xquery;

class Stream {
 public:
  Stream(const Options& options, const XQuery& query)
      : _options(options),
        _query(query),
        _path(options.inputs.front()),
        _results(options, framing(options), 1),
        _part(_results, 0),
        _writer(options, inputName(_path), _part) {}

  Status run(const XQueryVariables& constants, Phases& phases);

 private:
  // None when all was read and written.
  std::optional<Failure> evaluate(const XQueryVariables& constants);
  bool receive(const Value& item);
  void beginOnce();
  std::string nameForReport() const;
  Status finish(const std::optional<Failure>& failure);

  const Options& _options;
  const XQuery& _query;
  const std::string _path;
  Results _results;
  ResultPart _part;
  ItemWriter _writer;
  bool _hasBegun = false, _hasItems = false, _isTrue = false;
};

Status Stream::run(const XQueryVariables& constants, Phases& phases) {
  return finish(phases.evaluate.measure([&] { return evaluate(constants); }));
}

std::optional<Failure> Stream::evaluate(const XQueryVariables& constants) {
  refuseOutputAsInput(_options, _path);
  XQueryStreamInput input;
  input.beforeWaiting = [this] { _results.flush(); };
  return evaluateRecords(_options, _query, constants, std::move(input),
                         [this](const Value& item) { return receive(item); });
}

bool Stream::receive(const Value& item) {
  if (_options.exitStatus) _isTrue = _hasItems || isTrue(NSArray::arrayWithObjects({item}).get());
  _hasItems = true;
  beginOnce();
  _writer.write(*item);
  return !_part.isStopped();
}

void Stream::beginOnce() {
  if (!_hasBegun) _part.begin();
  _hasBegun = true;
}

std::string Stream::nameForReport() const {
  return _options.format == Format::JSON ? inputName(_path) : "";
}

Status Stream::finish(const std::optional<Failure>& failure) {
  if (interruption()->load()) {
    _results.stop();
    endIfInterrupted();
  }
  if (failure) {
    _results.flush();
    _part.end(failure->status, report(_options, *failure, nameForReport()));
    if (_options.outputFile) _results.stop();
  } else {
    beginOnce();
    _part.end();
  }
  if (!_results.finish(1)) throw writingFailure(_options.outputFile, _results.error());
  if (failure) return failure->status;
  return _options.exitStatus && !_isTrue ? StatusFalse : StatusResult;
}

}  // namespace

void checkStream(const Options& options) {
  const auto refuse = [](const char* what) { throw WrongUsage("--stream " + std::string(what)); };
  if (options.check || options.plan == XQueryPlanFormat::Text) return;
  if (options.plan) refuse("excludes --plan=json and --plan=dot");
  if (options.inputs.size() != 1 || options.filesFrom) refuse("requires one INPUT");
  if (options.html) refuse("excludes --html");
  if (options.repeat > 1) refuse("excludes --repeat");
}

// The line of progress is gone when it ends.
std::optional<Failure> evaluateRecords(const Options& options, const XQuery& query,
                                       const XQueryVariables& constants, XQueryStreamInput input,
                                       const std::function<bool(const Value& item)>& receive) {
  const std::string& path = options.inputs.front();
  Evaluation evaluation(options, std::make_shared<MissingDocuments>(options));
  DocumentProgress progress(options, path);
  input.path = path;
  input.options = readingMode(options);
  input.progress = progress.callback();
  Ref<NSError> errorItem;  // ends the stream as a failure does
  const auto receiveItem = [&](const Value& item) {
    errorItem = Ref<NSError>(dyn_cast<NSError>(item.get()));
    return !errorItem && receive(item);
  };
  XQueryStreamFailure failure;
  const bool isWhole = evaluation.evaluateStream(query, constants, input, receiveItem, failure);
  if (errorItem) return Failure{StatusQueryError, description(*errorItem), {errorItem}};
  if (isWhole) return std::nullopt;
  if (failure.error) {
    return Failure{StatusQueryError, description(*failure.error), {failure.error}};
  }
  // Nothing has failed where the receiver wanted no more.
  if (failure.reading.message.empty()) return std::nullopt;
  return readingFailure(path, failure.reading);
}

Status runStream(const Options& options, const XQuery& query, const XQueryVariables& constants,
                 Phases& phases) {
  return Stream(options, query).run(constants, phases);
}

}  // namespace cli
