// An input as it would be without packing. Packed text, which its first bytes show, is unpacked as
// it is read; plain text is handed on as it comes.
//
// Several members one after another are one text. What is cut short, damaged or followed by
// something else is a failure of the input, after the text before it.
//
// A few packed bytes may stand for any amount of text. Reading it ends at the limits of the
// evaluation that it is part of, and at a bound that ordinary data does not come near: what deflate
// can reach, which other formats exceed by far.
#pragma once

#include "Platform/Base/CountedBytes.h"
#include "Platform/Reading/KeptText.h"
#include "Platform/Reading/Packings.h"
#include "Platform/Reading/TextSource.h"

#include <array>
#include <cstdint>
#include <limits>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class UnpackedInput {
 public:
  // Looks at the first bytes of the input at once. At most so many bytes of text are unpacked.
  explicit UnpackedInput(TextInput input, TextRewinding rewind = {},
                         uint64_t mostBytes = std::numeric_limits<uint64_t>::max());
  UnpackedInput(const UnpackedInput&) = delete;
  UnpackedInput& operator=(const UnpackedInput&) = delete;

  bool isPacked() const { return _packing != nullptr; }
  TextInput input() {
    return [this](char* buffer, size_t size) { return read(buffer, size); };
  }
  // Empty for plain text that cannot be read again. Of packed text that cannot be, the packed bytes
  // are kept, which are fewer.
  TextRewinding rewinding();
  // What is wrong with the packed bytes; empty where nothing is.
  const std::string& failure() const { return _failure; }

  // Text may be so many times as long as it is packed, and this long anyway.
  static constexpr uint64_t mostRatio = 1000;
  static constexpr uint64_t bytesAtAnyRatio = uint64_t{256} << 20;
  // For unpacking, where the evaluation has no less.
  static constexpr size_t mostMemory = size_t{129} << 20;

 private:
  void lookAtStart();
  ptrdiff_t read(char* buffer, size_t size);
  ptrdiff_t readRaw(char* buffer, size_t size);
  bool rewind();

  ptrdiff_t unpack(char* buffer, size_t size);
  bool unpackSome(std::span<char>& room);
  bool beginMember();
  bool getMore();
  bool fail(const char* what);
  bool failTooLarge();

  const TextInput _input;
  const TextRewinding _rewind;
  const uint64_t _mostBytes;
  const Packing* _packing = nullptr;
  std::string _failure;

  // The bytes as they come.
  std::array<char, longestPackedStart> _start = {};  // looked at beforehand
  size_t _startSize = 0;
  size_t _startAt = 0;
  bool _isOver = false;
  bool _hasFailed = false;
  KeptText _kept;
  bool _readsKept = false;

  // The unpacking.
  std::unique_ptr<Unpacker> _unpacker;
  size_t _memory = 0;  // that the unpacker may take
  CountedBytes _counted;
  std::vector<char, ValueAllocator<char>> _buffer;
  std::string_view _packed;   // in the buffer, not yet unpacked
  bool _isBetween = true;     // members
  bool _holdsBack = false;    // text for which there was no room
  uint64_t _packedBytes = 0;  // read
  uint64_t _unpackedBytes = 0;
};

}  // namespace xquery
