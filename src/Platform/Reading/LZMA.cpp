// liblzma, for xz.
#include "Platform/Reading/Unpacker.h"

#include <algorithm>
#include <lzma.h>
#include <new>

namespace xquery {

namespace {

class XZUnpacker final : public Unpacker {
 public:
  explicit XZUnpacker(size_t mostMemory) : _mostMemory(mostMemory) { begin(); }
  ~XZUnpacker() override { lzma_end(&_stream); }
  XZUnpacker(const XZUnpacker&) = delete;
  XZUnpacker& operator=(const XZUnpacker&) = delete;

  Outcome unpack(std::string_view& packed, std::span<char>& room) override;
  size_t memory() const override { return lzma_memusage(&_stream); }

 private:
  // What the stream has taken is used again.
  void begin() {
    const uint64_t most = std::max<uint64_t>(_mostMemory, 1);
    if (lzma_stream_decoder(&_stream, most, 0) != LZMA_OK) throw std::bad_alloc();
  }

  const size_t _mostMemory;
  lzma_stream _stream = LZMA_STREAM_INIT;
};

Unpacker::Outcome XZUnpacker::unpack(std::string_view& packed, std::span<char>& room) {
  _stream.next_in = reinterpret_cast<const uint8_t*>(packed.data());
  _stream.avail_in = packed.size();
  _stream.next_out = reinterpret_cast<uint8_t*>(room.data());
  _stream.avail_out = room.size();
  const lzma_ret answer = lzma_code(&_stream, LZMA_RUN);
  packed.remove_prefix(packed.size() - _stream.avail_in);
  room = room.last(_stream.avail_out);
  switch (answer) {
    case LZMA_STREAM_END:
      begin();
      return Outcome::Finished;
    case LZMA_OK:
    case LZMA_BUF_ERROR:
      return Outcome::Unfinished;
    case LZMA_MEMLIMIT_ERROR:
      return Outcome::TooLarge;
    case LZMA_MEM_ERROR:
      throw std::bad_alloc();
    default:
      return Outcome::Damaged;
  }
}

}  // namespace

std::unique_ptr<Unpacker> unpackerOfXZ(size_t mostMemory) {
  return std::make_unique<XZUnpacker>(mostMemory);
}

}  // namespace xquery
