// libbz2, for bzip2.
#include "Platform/Reading/Unpacker.h"

#include <algorithm>
#include <bzlib.h>
#include <climits>
#include <new>

namespace xquery {

namespace {

class BZip2Unpacker final : public Unpacker {
 public:
  BZip2Unpacker() { begin(); }
  ~BZip2Unpacker() override { BZ2_bzDecompressEnd(&_stream); }
  BZip2Unpacker(const BZip2Unpacker&) = delete;
  BZip2Unpacker& operator=(const BZip2Unpacker&) = delete;

  Outcome unpack(std::string_view& packed, std::span<char>& room) override;
  // With the largest blocks.
  size_t memory() const override { return size_t{3700} << 10; }

 private:
  void begin() {
    if (BZ2_bzDecompressInit(&_stream, 0, 0) != BZ_OK) throw std::bad_alloc();
  }

  bz_stream _stream = {};
};

Unpacker::Outcome BZip2Unpacker::unpack(std::string_view& packed, std::span<char>& room) {
  const auto taken = static_cast<unsigned>(std::min<size_t>(packed.size(), UINT_MAX));
  const auto filled = static_cast<unsigned>(std::min<size_t>(room.size(), UINT_MAX));
  _stream.next_in = const_cast<char*>(packed.data());
  _stream.avail_in = taken;
  _stream.next_out = room.data();
  _stream.avail_out = filled;
  const int answer = BZ2_bzDecompress(&_stream);
  packed.remove_prefix(taken - _stream.avail_in);
  room = room.subspan(filled - _stream.avail_out);
  switch (answer) {
    case BZ_STREAM_END:
      BZ2_bzDecompressEnd(&_stream);
      begin();
      return Outcome::Finished;
    case BZ_OK:
      return Outcome::Unfinished;
    case BZ_MEM_ERROR:
      throw std::bad_alloc();
    default:
      return Outcome::Damaged;
  }
}

}  // namespace

std::unique_ptr<Unpacker> unpackerOfBZip2(size_t) {
  return std::make_unique<BZip2Unpacker>();
}

}  // namespace xquery
