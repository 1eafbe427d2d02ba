// What unpacks packed text: a library for each format, behind one interface. Each is included in
// the file of its name only: Zlib, LZMA, Zstandard, BZip2.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>

namespace xquery {

class Unpacker {
 public:
  enum class Outcome : uint8_t {
    Unfinished,  // more packed bytes or more room are wanted
    Finished,    // a member, frame or stream ended; the next call begins another
    Damaged,
    TooLarge,  // would need more memory than is allowed
  };

  virtual ~Unpacker() = default;
  // Takes from the front of `packed` and fills `room` from its front; both are what is left
  // afterwards. A call with nothing packed gives what was held back. Throws std::bad_alloc.
  virtual Outcome unpack(std::string_view& packed, std::span<char>& room) = 0;
  // That the library has taken, in bytes.
  virtual size_t memory() const = 0;
};

// Each takes at most about so much memory.
[[nodiscard]] std::unique_ptr<Unpacker> unpackerOfGzip(size_t mostMemory);
[[nodiscard]] std::unique_ptr<Unpacker> unpackerOfXZ(size_t mostMemory);
[[nodiscard]] std::unique_ptr<Unpacker> unpackerOfZstandard(size_t mostMemory);
[[nodiscard]] std::unique_ptr<Unpacker> unpackerOfBZip2(size_t mostMemory);

}  // namespace xquery
