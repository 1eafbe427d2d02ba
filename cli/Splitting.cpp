#include "Splitting.h"

#include "Documents.h"
#include "Inputs.h"
#include "OptionsTable.h"
#include "Output.h"
#include "Pieces.h"
#include "Streaming.h"

#include <filesystem>
#include <optional>
#include <string>
#include <system_error>
#include <utility>

namespace cli {
namespace {

using namespace xquery;

// What lies in the folder already would be taken for pieces.
void prepareFolder(const std::string& folder) {
  std::error_code error;
  std::filesystem::create_directories(folder, error);
  if (error) throw writingFailure(folder, error.message());
  const bool isEmpty = std::filesystem::is_empty(folder, error);
  if (error) throw writingFailure(folder, error.message());
  if (!isEmpty) throw writingFailure(folder, "the folder is not empty");
}

class Split {
 public:
  explicit Split(const Options& options)
      : _options(options),
        _pieces(*options.splitFolder, options.records,
                [this](const std::string& path) { tellOfPiece(path); }) {}

  void run(const XQuery& query, const XQueryVariables& constants);

 private:
  // A stream hears of a failure by false, and ends.
  template <class Step>
  bool isDone(const Step& step) {
    try {
      step();
      return true;
    } catch (const Failure& failure) {
      _failure = failure;
      return false;
    }
  }
  void tellOfPiece(const std::string& path);
  void evaluate(const XQuery& query, const XQueryVariables& constants);

  const Options& _options;
  Output _names;
  Pieces _pieces;
  std::optional<Failure> _failure;
};

void Split::run(const XQuery& query, const XQueryVariables& constants) {
  refuseOutputAsInput(_options, _options.inputs.front());
  prepareFolder(*_options.splitFolder);
  if (!_names.open(std::nullopt)) throw writingFailure(std::nullopt, _names.error());
  evaluate(query, constants);
  _pieces.finish();
  if (!_names.finish()) throw writingFailure(std::nullopt, _names.error());
}

void Split::evaluate(const XQuery& query, const XQueryVariables& constants) {
  XQueryStreamInput input;
  input.beforeRecord = [this](const NSXMLElement& record, size_t elementsKept) {
    _pieces.beginRecord(record, elementsKept);
  };
  const auto receive = [this](const Value& item) { return isDone([&] { _pieces.add(*item); }); };
  const auto failure = evaluateRecords(_options, query, constants, std::move(input), receive);
  if (_failure) throw *_failure;
  if (failure) throw *failure;
}

// At once, for whoever works on a piece while the next one is made.
void Split::tellOfPiece(const std::string& path) {
  if (_names.append(path + "\n") && _names.flush()) return;
  throw writingFailure(std::nullopt, _names.error());
}

void checkOptions(const Options& options) {
  const std::pair<bool, const char*> wrong[] = {
      {options.queryText.has_value(), "-e"},
      {options.filesFrom.has_value(), "--files-from"},
      {options.html, "--html"},
      {options.jobs > 0, "--jobs"},
      {options.repeat > 1, "--repeat"},
      {options.profileFile.has_value(), "--profile"},
      {options.outputFile.has_value(), "-o"},
      {options.format != Format::Lines && options.format != Format::JSON, "--as"},
      {options.types, "--types"},
      {options.indent, "--indent"},
      {options.separator.has_value(), "--separator"},
      {options.withName, "--with-name"},
      {options.exitStatus, "--exit-status"},
  };
  for (const auto& [isGiven, name] : wrong) {
    if (isGiven) throw WrongUsage("--split excludes " + std::string(name));
  }
}

}  // namespace

void interpretSplit(Options& options) {
  if (!options.splitPath) throw WrongUsage("--records requires --split PATH");
  checkOptions(options);
  if (options.records == 0) throw WrongUsage("--split requires --records N");
  if (options.inputs.size() != 2 || options.inputs.back().empty()) {
    throw WrongUsage("--split requires one INPUT and a FOLDER");
  }
  options.splitFolder = options.inputs.back();
  options.inputs.pop_back();
  options.queryText = options.splitPath;
  options.stream = true;
}

Status runSplit(const Options& options, const XQuery& query, const XQueryVariables& constants,
                Phases& phases) {
  phases.evaluate.measure([&] {
    Split(options).run(query, constants);
    return true;
  });
  return StatusResult;
}

}  // namespace cli
