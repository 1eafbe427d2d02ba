#include "Platform/Reading/UnpackedInput.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <cstring>

namespace xquery {

namespace {

constexpr size_t pieceBytes = size_t{64} << 10;
// Of text; the slowest format unpacks some tens of megabytes a second.
constexpr size_t bytesPerStep = 256;
// At a time, so that the limits are looked at between.
constexpr size_t mostRoom = size_t{64} << 10;

// What is left to the evaluation of its memory. A thread may have given back more than it took.
size_t memoryLeft() {
  constexpr auto most = static_cast<int64_t>(UnpackedInput::mostMemory);
  const WorkMeter& meter = workMeter;
  if (meter.valueBytes <= meter.mostValueBytes - most) return UnpackedInput::mostMemory;
  return static_cast<size_t>(std::max<int64_t>(meter.mostValueBytes - meter.valueBytes, 0));
}

}  // namespace

UnpackedInput::UnpackedInput(TextInput input, TextRewinding rewind, uint64_t mostBytes)
    : _input(std::move(input)), _rewind(std::move(rewind)), _mostBytes(mostBytes) {
  lookAtStart();
}

// --- the bytes as they come --------------------------------------------------------------------

// Plain text mostly shows at its first byte, so that nobody waits for more.
void UnpackedInput::lookAtStart() {
  const auto mayBePacked = [this] {
    const std::string_view start(_start.data(), _startSize);
    return std::any_of(packings().begin(), packings().end(), [&](const Packing& packing) {
      return fitOf(packing, start) == PackedFit::Perhaps;
    });
  };
  while (_startSize < _start.size() && mayBePacked()) {
    const ptrdiff_t count = _input(_start.data() + _startSize, _start.size() - _startSize);
    _isOver = count == 0;
    _hasFailed = count < 0;
    if (count <= 0) break;
    _startSize += static_cast<size_t>(count);
  }
  _packing = packingOf({_start.data(), _startSize});
}

ptrdiff_t UnpackedInput::readRaw(char* buffer, size_t size) {
  if (const size_t count = std::min(size, _startSize - _startAt)) {
    std::memcpy(buffer, _start.data() + _startAt, count);
    _startAt += count;
    return static_cast<ptrdiff_t>(count);
  }
  if (_hasFailed) return -1;
  return _isOver ? 0 : _input(buffer, size);
}

ptrdiff_t UnpackedInput::read(char* buffer, size_t size) {
  return _packing ? unpack(buffer, size) : readRaw(buffer, size);
}

TextRewinding UnpackedInput::rewinding() {
  if (!_packing && !_rewind) return {};
  return [this] { return rewind(); };
}

bool UnpackedInput::rewind() {
  _failure.clear();
  _unpacker.reset();
  _packed = {};
  _isBetween = true;
  _holdsBack = false;
  _packedBytes = _unpackedBytes = 0;
  if (!_rewind) {
    _kept.rewind();
    _readsKept = true;
    return true;
  }
  _startSize = _startAt = 0;
  _isOver = _hasFailed = false;
  return _rewind();
}

// --- unpacking ---------------------------------------------------------------------------------

bool UnpackedInput::fail(const char* what) {
  _failure = std::string("the ") + _packing->name + " data " + what;
  return false;
}

// A limit of the evaluation is told as one.
bool UnpackedInput::failTooLarge() {
  if (_memory < mostMemory) {
    const size_t needed = std::max(_memory + 1, pieceBytes);
    countValueBlock(needed);
    uncountValueBytes(needed);
  }
  return fail("takes too much memory to unpack");
}

// Behind what is in the buffer. False where there is no more.
bool UnpackedInput::getMore() {
  if (_buffer.empty()) _buffer.resize(pieceBytes);
  if (!_packed.empty()) std::memmove(_buffer.data(), _packed.data(), _packed.size());
  char* const end = _buffer.data() + _packed.size();
  const size_t room = _buffer.size() - _packed.size();
  auto count = static_cast<ptrdiff_t>(_readsKept ? _kept.read(end, room) : 0);
  _readsKept = count > 0;
  if (count == 0) {
    count = readRaw(end, room);
    if (count > 0 && !_rewind) _kept.append({end, static_cast<size_t>(count)});
  }
  _isOver = count == 0;
  _hasFailed = count < 0;
  if (count <= 0) return false;
  _packed = {_buffer.data(), _packed.size() + static_cast<size_t>(count)};
  _packedBytes += static_cast<uint64_t>(count);
  return true;
}

// False at the end of the text, and where what follows is none of the format's.
bool UnpackedInput::beginMember() {
  size_t padding = 0;
  while (_packing->padding && _unpacker && (!_packed.empty() || getMore())) {
    const size_t zeros = std::min(_packed.find_first_not_of('\0'), _packed.size());
    padding += zeros;
    _packed.remove_prefix(zeros);
    if (!_packed.empty()) break;
    checkWork();
  }
  PackedFit fit;
  while ((fit = fitOf(*_packing, _packed)) == PackedFit::Perhaps && getMore()) continue;
  if (_hasFailed) return false;
  const bool isPadded = padding == 0 || padding % _packing->padding == 0;
  if (_packed.empty() && isPadded) return false;
  if (fit != PackedFit::Yes || !isPadded) return fail("is followed by something else");
  if (!_unpacker) {
    _memory = memoryLeft();
    _unpacker = _packing->unpacker(_memory);
  }
  _isBetween = false;
  return true;
}

// A little of the text, or none yet. False at its end, and where it fails.
bool UnpackedInput::unpackSome(std::span<char>& room) {
  if (_packed.empty() && !_holdsBack && !_isBetween && !getMore()) {
    return _hasFailed ? false : fail("ends too soon");
  }
  if (_isBetween && !beginMember()) return false;
  std::span<char> part = room.first(std::min(room.size(), mostRoom));
  const size_t offered = part.size();
  const size_t packed = _packed.size();
  const Unpacker::Outcome outcome = _unpacker->unpack(_packed, part);
  const size_t made = offered - part.size();
  room = room.subspan(made);
  _unpackedBytes += made;
  _holdsBack = part.empty();
  _counted.set(_unpacker->memory());
  checkWork(1 + (made + packed - _packed.size()) / bytesPerStep);
  if (outcome == Unpacker::Outcome::Damaged) return fail("is damaged");
  if (outcome == Unpacker::Outcome::TooLarge) return failTooLarge();
  if (outcome == Unpacker::Outcome::Finished) {
    _isBetween = true;
    _holdsBack = false;
  }
  const uint64_t most = std::max(bytesAtAnyRatio, _packedBytes * mostRatio);
  if (_unpackedBytes > std::min(most, _mostBytes)) return fail("unpacks to too much text");
  return true;
}

ptrdiff_t UnpackedInput::unpack(char* buffer, size_t size) {
  if (!_failure.empty()) return -1;
  std::span<char> room(buffer, size);
  while (room.size() == size) {
    if (unpackSome(room)) continue;
    return _failure.empty() && !_hasFailed ? 0 : -1;
  }
  return static_cast<ptrdiff_t>(size - room.size());
}

}  // namespace xquery
