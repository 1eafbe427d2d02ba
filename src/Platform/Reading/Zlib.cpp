// zlib, for gzip.
#include "Platform/Reading/Unpacker.h"

#include <algorithm>
#include <climits>
#include <new>
#include <zlib.h>

namespace xquery {

namespace {

constexpr int gzipWindow = 16 + MAX_WBITS;  // the largest, in the format of gzip alone

class GzipUnpacker final : public Unpacker {
 public:
  GzipUnpacker() {
    if (inflateInit2(&_stream, gzipWindow) != Z_OK) throw std::bad_alloc();
  }
  ~GzipUnpacker() override { inflateEnd(&_stream); }
  GzipUnpacker(const GzipUnpacker&) = delete;
  GzipUnpacker& operator=(const GzipUnpacker&) = delete;

  Outcome unpack(std::string_view& packed, std::span<char>& room) override;
  size_t memory() const override { return size_t{48} << 10; }

 private:
  z_stream _stream = {};
};

Unpacker::Outcome GzipUnpacker::unpack(std::string_view& packed, std::span<char>& room) {
  const auto taken = static_cast<uInt>(std::min<size_t>(packed.size(), UINT_MAX));
  const auto filled = static_cast<uInt>(std::min<size_t>(room.size(), UINT_MAX));
  _stream.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(packed.data()));
  _stream.avail_in = taken;
  _stream.next_out = reinterpret_cast<Bytef*>(room.data());
  _stream.avail_out = filled;
  const int answer = inflate(&_stream, Z_NO_FLUSH);
  packed.remove_prefix(taken - _stream.avail_in);
  room = room.subspan(filled - _stream.avail_out);
  switch (answer) {
    case Z_STREAM_END:
      inflateReset(&_stream);
      return Outcome::Finished;
    case Z_OK:
    case Z_BUF_ERROR:
      return Outcome::Unfinished;
    case Z_MEM_ERROR:
      throw std::bad_alloc();
    default:
      return Outcome::Damaged;
  }
}

}  // namespace

std::unique_ptr<Unpacker> unpackerOfGzip(size_t) {
  return std::make_unique<GzipUnpacker>();
}

}  // namespace xquery
