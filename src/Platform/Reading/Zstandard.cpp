// libzstd, for zstd.
#include "Platform/Reading/Unpacker.h"

#include <algorithm>
#include <bit>
#include <new>
#include <zstd.h>
#include <zstd_errors.h>

namespace xquery {

namespace {

class ZstandardUnpacker final : public Unpacker {
 public:
  explicit ZstandardUnpacker(size_t mostMemory);
  ~ZstandardUnpacker() override { ZSTD_freeDStream(_stream); }
  ZstandardUnpacker(const ZstandardUnpacker&) = delete;
  ZstandardUnpacker& operator=(const ZstandardUnpacker&) = delete;

  Outcome unpack(std::string_view& packed, std::span<char>& room) override;
  size_t memory() const override { return ZSTD_sizeof_DStream(_stream); }

 private:
  ZSTD_DStream* const _stream = ZSTD_createDStream();
};

// Nearly all that it takes is the window, whose size is a power of two.
ZstandardUnpacker::ZstandardUnpacker(size_t mostMemory) {
  if (!_stream) throw std::bad_alloc();
  const ZSTD_bounds bounds = ZSTD_dParam_getBounds(ZSTD_d_windowLogMax);
  const int largest = std::bit_width(mostMemory) - 1;
  ZSTD_DCtx_setParameter(_stream, ZSTD_d_windowLogMax,
                         std::clamp(largest, bounds.lowerBound, bounds.upperBound));
}

Unpacker::Outcome ZstandardUnpacker::unpack(std::string_view& packed, std::span<char>& room) {
  ZSTD_inBuffer in = {packed.data(), packed.size(), 0};
  ZSTD_outBuffer out = {room.data(), room.size(), 0};
  const size_t answer = ZSTD_decompressStream(_stream, &out, &in);
  packed.remove_prefix(in.pos);
  room = room.subspan(out.pos);
  if (answer == 0) return Outcome::Finished;
  if (!ZSTD_isError(answer)) return Outcome::Unfinished;
  switch (ZSTD_getErrorCode(answer)) {
    case ZSTD_error_frameParameter_windowTooLarge:
      return Outcome::TooLarge;
    case ZSTD_error_memory_allocation:
      throw std::bad_alloc();
    default:
      return Outcome::Damaged;
  }
}

}  // namespace

std::unique_ptr<Unpacker> unpackerOfZstandard(size_t mostMemory) {
  return std::make_unique<ZstandardUnpacker>(mostMemory);
}

}  // namespace xquery
