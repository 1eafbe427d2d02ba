#include "Results.h"

#include "Signals.h"
#include "Streams.h"

#include <algorithm>
#include <utility>

namespace cli {
namespace {

constexpr size_t mostKept = size_t{1} << 20;  // of one part, in bytes
constexpr size_t aheadForEachJob = 8;         // parts

}  // namespace

Results::Results(const Options& options, Framing framing, unsigned jobs)
    : _options(options), _framing(std::move(framing)), _mostAhead(jobs * aheadForEachJob) {}

bool Results::begin(size_t number) {
  std::unique_lock lock(_mutex);
  _moved.wait(lock, [&] { return _isStopped || number < _next + _mostAhead; });
  return !_isStopped;
}

bool Results::awaitTurn(size_t number) {
  std::unique_lock lock(_mutex);
  _moved.wait(lock, [&] { return _isStopped || number == _next; });
  return !_isStopped;
}

bool Results::isTurn(size_t number) {
  const std::lock_guard lock(_mutex);
  return number == _next;
}

void Results::stop() {
  const std::lock_guard lock(_mutex);
  _isStopped = true;
  _moved.notify_all();
}

std::string Results::error() {
  return _output.error();
}

void Results::flush() {
  const std::lock_guard lock(_mutex);
  if (_isOpen) _output.flush();
}

bool Results::endsLine() {
  const std::lock_guard lock(_mutex);
  return _output.endsLine();
}

Status Results::status() {
  const std::lock_guard lock(_mutex);
  return _status;
}

// The output is opened when there is a first result, so that a file stays what it was where there
// is none.
bool Results::beginWriting(bool hasItems) {
  if (!_isOpen) {
    _isOpen = true;
    if (_options.isSession) _output.makeVisible();
    if (!_output.open(_options.outputFile) || !_output.append(_framing.opening)) return false;
  }
  if (!hasItems) return true;
  const bool isFirst = !std::exchange(_hasItems, true);
  return isFirst || write(_framing.between);
}

bool Results::write(std::string_view text) {
  // A session goes on when its result is not wanted any more.
  if (_options.isSession && interruption()->load()) {
    _output.discard();
    return false;
  }
  return _output.append(text);
}

void Results::end(size_t number, Part part) {
  const std::lock_guard lock(_mutex);
  if (_isStopped) return;
  _waiting.emplace(number, std::move(part));
  _moved.notify_all();  // once the lock is given up
  for (auto next = _waiting.find(_next); next != _waiting.end() && !_isStopped;
       next = _waiting.find(_next)) {
    const Part& ready = next->second;
    if (ready.hasResult && beginWriting(ready.hasItems)) write(ready.text);
    endTurn(ready);
    _waiting.erase(next);
  }
}

void Results::endTurn(const Part& part) {
  if (!part.message.empty()) writeMessage(part.message);
  _status = std::max(_status, part.status);
  if (_isOpen && !_output.error().empty()) _isStopped = true;
  ++_next;
}

bool Results::finish(size_t parts) {
  const std::lock_guard lock(_mutex);
  if (_isOpen && !_output.error().empty()) return false;
  if (_isStopped || (parts > 0 && !_isOpen)) return true;
  return beginWriting(false) && write(_framing.closing) && _output.finish();
}

// --- one part ------------------------------------------------------------------------------------

void ResultPart::begin() {
  _part.hasResult = true;
  if (_results.isTurn(_number)) takeTurn();
}

void ResultPart::beginItem() {
  if (std::exchange(_part.hasItems, true)) {
    append(_results._framing.between);
  } else if (_hasTurn) {
    _isStopped = !_results.beginWriting(true);
  }
}

bool ResultPart::append(std::string_view text) {
  if (_isStopped) return false;
  if (_hasTurn) {
    _isStopped = !_results.write(text);
  } else {
    _part.text += text;
    if (_part.text.size() > mostKept) takeTurn();
  }
  return !_isStopped;
}

void ResultPart::takeTurn() {
  _hasTurn = true;
  _isStopped = !_results.awaitTurn(_number) || !_results.beginWriting(_part.hasItems) ||
               !_results.write(_part.text);
  _part.text = {};
  _part.hasResult = false;  // from here on nothing waits
}

void ResultPart::end(Status status, std::string message) {
  _part.status = status;
  _part.message = std::move(message);
  _results.end(_number, std::move(_part));
}

}  // namespace cli
