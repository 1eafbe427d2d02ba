// Evaluating record by record.
//
//   XMLRecords             makes the next record, in the memory of the one before
//     XQueryStreamProgram  what is evaluated for it, with its document as the context item
//       XQueryStreamFolding  puts the values together, and emits what is known of the result
//         receiver         the host
//
// There may be several such parts, and an expression around them, which is evaluated at the end.
//
// Before the next record is made nobody may refer to the one before. What the engine itself keeps
// between two evaluations of an expression is dropped here: the frame of local variables, kept
// values, the focus where an error left it. What the folding keeps is apart from the document. So
// whatever is counted then beyond the references of the driver is held by the host, which ends the
// stream: its nodes must stay what they are.
//
// Everything happens within one evaluation: declarations are evaluated once, limits count from its
// beginning, and of the items made only the first is marked with its base URI.
#include "Context/LimitWatch.h"
#include "Context/XQueryContextInternal.h"
#include "Engine/BaseURIDecoration.h"
#include "Engine/Streams/XQueryStreamFolding.h"
#include "Engine/XQueryInternal.h"
#include "Expr/XQueryAsking.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Reading/InputFile.h"
#include "Platform/Reading/UnpackedInput.h"
#include "Platform/Reading/XMLRecords.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Types/XQueryErrors.h"
#include "xquery/Stream.h"

#include <cstring>
#include <deque>
#include <optional>
#include <utility>

namespace xquery {

namespace {

bool cannotGoBack() {
  return false;
}

// The names of the ways to the records, as the context resolves them; it knows their prefixes.
class RecordPaths {
 public:
  RecordPaths(const XQueryStreamProgram& program, XQueryContext& context) {
    for (const auto& record : program.records) {
      XMLRecordPath& path = _paths.emplace_back();
      for (const XQueryStreamProgram::Step& step : record) {
        path.push_back({step.isAnywhere, step.name ? nameOf(*step.name, context) : nullptr});
      }
    }
  }
  std::span<const XMLRecordPath> paths() const { return _paths; }

 private:
  const NSXMLExpandedName* nameOf(const XQueryNameTest& test, XQueryContext& context) {
    if (const NSXMLExpandedName* bound = test.boundName()) return bound;
    const Ref<XQueryQName> name = test.qNameForContext(&context);
    if (name) _names.push_back(XQueryNameTest::interned(*name));
    // The name of nothing, where no node can have it.
    if (!name || !_names.back().get()) _names.emplace_back(NSStringView(), NSStringView());
    return _names.back().get();
  }

  std::vector<XMLRecordPath> _paths;
  std::vector<NSXMLExpandedNameRef> _names;  // that the steps refer to
};

// Puts the focus back, and drops the variables, which may hold nodes of the last record.
class FormerFocus {
 public:
  explicit FormerFocus(XQueryContextInternal& context)
      : _context(context), _item(context.contextItem()), _position(context.position()) {}
  ~FormerFocus() {
    _context.setContextItem(_item, _position);
    _context._setInScopeVariables(nullptr);
  }
  FormerFocus(const FormerFocus&) = delete;
  FormerFocus& operator=(const FormerFocus&) = delete;

 private:
  XQueryContextInternal& _context;
  const Value _item;
  const int64_t _position;
};

class Stream {
 public:
  Stream(const XQueryStreamProgram& program, XQueryContext& context, const XQueryStreamInput& input,
         const XQueryContext::StreamReceiver& receive, XQueryStreamFailure& failure)
      : _program(program),
        _context(context),
        _internal(xquery::_internal(context)),
        _input(input),
        _receive(receive),
        _failure(failure) {}

  // The value, but for items that have been handed out; null after a failure. What fails within the
  // evaluation is the context's.
  Value run() {
    if (_input.read) return runOver(_input.read);
    InputFile file(_input.path);
    if (!file.isOpen()) return fail(std::strerror(file.failure()));
    const auto read = [&](char* buffer, size_t size) {
      return file.read(buffer, size, _input.progress, _input.beforeWaiting);
    };
    Value result = runOver(read);
    return file.failure() && !_isDecided ? fail(std::strerror(file.failure())) : result;
  }

 private:
  Value fail(const std::string& message) {
    _failure.reading = {message, 0, 0};
    return {};
  }

  Value runOver(const TextInput& read) {
    UnpackedInput unpacked(read, cannotGoBack);
    TextSource source(unpacked.input(), cannotGoBack);
    source.takeAsItComes();
    const RecordPaths paths(_program, _context);
    XMLRecords records(source, paths.paths(), _input.options);
    const FormerFocus former(_internal);
    makeFoldings();
    NSXMLParseError error;
    const bool isWellFormed = evaluateAll(records, error);
    if (_hasFailed) return {};
    // The document may be whole where what it is packed in is not.
    if (!_isDecided && !unpacked.failure().empty()) return fail(unpacked.failure());
    if (!isWellFormed) {
      _failure.reading = error;
      return {};
    }
    return _firstError ? _firstError : result();
  }

  void makeFoldings() {
    XQueryStreamFolding::Emit emitOne;
    if (!_program.around) emitOne = [this](const Value& item) { return emit(item); };
    for (const XQueryStreamProgram::Part& part : _program.parts) {
      _foldings.emplace_back(part, _context, emitOne);
    }
  }

  // Of what stands around the folds, where anything does.
  Value result() {
    if (!_program.around) return _foldings.front().result();
    int64_t variable = _program.firstVariable;
    for (XQueryStreamFolding& folding : _foldings) {
      const Ref<XQueryError> former = _internal.error();
      Value value = NSNull::null();
      if (!folding.failure()) {
        value = XQueryAsk(folding.each(), _context, [&] { return folding.result(); });
      }
      if (!value && !keepFailure(folding, former)) return {};
      if (!value) value = NSNull::null();
      const Value failure = folding.failure() ? Value(folding.failure()) : Value(NSNull::null());
      _internal.setVariable(std::move(value), variable++);
      _internal.setVariable(failure, variable++);
    }
    return _program.around->evaluateWithContext(_context);
  }

  // For whoever asks for the value. False where the failure is one of the whole.
  bool keepFailure(XQueryStreamFolding& folding, const Ref<XQueryError>& former) {
    if (!_internal.isFailing() || folding.isSure() || _internal.isFailingForGood()) return false;
    folding.setFailure(_internal.tracedError());
    _internal.passOverFailure(former);
    return true;
  }

  // False, with the error, where the document is not well formed.
  bool evaluateAll(XMLRecords& records, NSXMLParseError& error) {
    _internal._setInScopeVariables(nullptr);
    _internal.setContextItem(records.document(), 1);
    const uint32_t references = records.references();
    const auto receive = [&](const NSXMLElement& record) {
      if (_input.beforeRecord) _input.beforeRecord(record, records.elementsKept());
      if (!evaluateRecord()) return false;
      _internal._setInScopeVariables(nullptr);
      _internal.clearKept();
      _internal.forgetManyFailures();
      _internal.setContextItem(records.document(), 1);
      if (!_isDecided && records.references() != references) {
        _internal.raise(XQueryErrors::nodeOfAStreamKept.error());
      }
      return !_isDecided;
    };
    return records.read(receive, error);
  }

  // False after an error.
  bool evaluateRecord() {
    _isDecided = true;
    for (XQueryStreamFolding& folding : _foldings) {
      if (!folding.isDecided() && !evaluateRecordFor(folding)) return false;
      _isDecided = _isDecided && folding.isDecided();
    }
    return true;
  }
  bool evaluateRecordFor(XQueryStreamFolding& folding) {
    const Ref<XQueryError> former = _internal.error();
    const Value value = folding.each().evaluateWithContext(_context);
    if (value) add(value, folding);
    _hasFailed = _internal.isFailing() && !keepFailure(folding, former);
    return !_hasFailed;
  }

  // Where somebody may pass over a failure nothing is handed out yet.
  void add(const Value& value, XQueryStreamFolding& folding) {
    if (!_program.around) {
      folding.add(value);
      return;
    }
    static_cast<void>(XQueryAsk(folding.each(), _context, [&] { return folding.add(value); }));
  }

  bool emit(const Value& item) {
    const bool isFirst = !std::exchange(_hasEmitted, true);
    if (isFirst && isa<XQueryError>(item.get())) {
      _firstError = item;
      return false;
    }
    if (isFirst) XQueryDecorateWithBaseURI(item.get(), _internal);
    return passingOnHostFailures([&] { return _receive(item); });
  }

  const XQueryStreamProgram& _program;
  XQueryContext& _context;
  XQueryContextInternal& _internal;
  const XQueryStreamInput& _input;
  const XQueryContext::StreamReceiver& _receive;
  XQueryStreamFailure& _failure;
  std::deque<XQueryStreamFolding> _foldings;  // of the parts
  bool _hasEmitted = false;
  bool _hasFailed = false;
  bool _isDecided = false;  // before the end of the document
  Value _firstError;        // which is the error of the whole
};

}  // namespace

bool XQueryContext::evaluateStream(const XQuery& query, const XQueryVariables& constants,
                                   const XQueryStreamInput& input, const StreamReceiver& receive,
                                   XQueryStreamFailure& failure) {
  failure = {};
  const XQueryInternal& compiled = _internal(query);
  if (compiled.isError()) {
    failure.error = compiled.errors().front();
    return false;
  }
  const XQueryStreamProgram* program = compiled.streamProgram();
  if (!program) {
    failure.error = XQueryErrors::notAStream.error("it was not compiled to be");
    return false;
  }
  failure.error = program->refusalIn(*this, *compiled.prolog());
  if (failure.error) return false;
  const XQueryContextInternal::UnderWay underWay(*_private);
  const NSXMLEra era;
  beginEvaluation(compiled);
  Stream stream(*program, *this, input, receive, failure);
  const Value result = evaluateModule(compiled, constants, [&] { return stream.run(); });
  endEvaluation();
  const Ref<NSArray> items = shapedResult(result, &failure.error);
  if (failure.error) failure.reading = {};
  if (!items || failure.error) return false;
  for (const Value& item : items->objects()) {
    if (!receive(item)) break;
  }
  return true;
}

std::string XQueryStreamDescription(const XQuery& query) {
  const XQueryStreamProgram* const program = _internal(query).streamProgram();
  return program ? program->description : std::string();
}

}  // namespace xquery
