// Text as the tools of each format pack it.
#pragma once

#include <bzlib.h>
#include <cstdint>
#include <lzma.h>
#include <stdexcept>
#include <string>
#include <string_view>
#include <zlib.h>
#include <zstd.h>

namespace packing {

inline void require(bool isTrue) {
  if (!isTrue) throw std::runtime_error("cannot pack");
}

inline std::string gzip(std::string_view text) {
  constexpr int window = 16 + MAX_WBITS, memory = 8;
  z_stream stream = {};
  require(deflateInit2(&stream, 6, Z_DEFLATED, window, memory, Z_DEFAULT_STRATEGY) == Z_OK);
  std::string packed(deflateBound(&stream, text.size()), '\0');
  stream.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(text.data()));
  stream.avail_in = static_cast<uInt>(text.size());
  stream.next_out = reinterpret_cast<Bytef*>(packed.data());
  stream.avail_out = static_cast<uInt>(packed.size());
  require(deflate(&stream, Z_FINISH) == Z_STREAM_END);
  packed.resize(stream.total_out);
  deflateEnd(&stream);
  return packed;
}

inline std::string xz(std::string_view text) {
  lzma_stream stream = LZMA_STREAM_INIT;
  require(lzma_easy_encoder(&stream, 0, LZMA_CHECK_CRC64) == LZMA_OK);
  std::string packed(lzma_stream_buffer_bound(text.size()) + 64, '\0');
  stream.next_in = reinterpret_cast<const uint8_t*>(text.data());
  stream.avail_in = text.size();
  stream.next_out = reinterpret_cast<uint8_t*>(packed.data());
  stream.avail_out = packed.size();
  require(lzma_code(&stream, LZMA_FINISH) == LZMA_STREAM_END);
  packed.resize(stream.total_out);
  lzma_end(&stream);
  return packed;
}

// As if it had come in pieces: the frame does not tell how long the text is.
inline std::string zstd(std::string_view text) {
  ZSTD_CCtx* const context = ZSTD_createCCtx();
  ZSTD_CCtx_setParameter(context, ZSTD_c_checksumFlag, 1);
  std::string packed(ZSTD_compressBound(text.size()) + 64, '\0');
  ZSTD_inBuffer in = {text.data(), text.size(), 0};
  ZSTD_outBuffer out = {packed.data(), packed.size(), 0};
  require(!ZSTD_isError(ZSTD_compressStream2(context, &out, &in, ZSTD_e_continue)));
  require(ZSTD_compressStream2(context, &out, &in, ZSTD_e_end) == 0);
  ZSTD_freeCCtx(context);
  packed.resize(out.pos);
  return packed;
}

inline std::string bzip2(std::string_view text) {
  auto size = static_cast<unsigned>(text.size() + text.size() / 100 + 600);
  std::string packed(size, '\0');
  require(BZ2_bzBuffToBuffCompress(packed.data(), &size, const_cast<char*>(text.data()),
                                   static_cast<unsigned>(text.size()), 9, 0, 0) == BZ_OK);
  packed.resize(size);
  return packed;
}

struct Format {
  const char* name;
  std::string (*pack)(std::string_view text);
  std::string padding;  // that may follow
};

inline const Format formats[] = {
    {"gzip", gzip, std::string(3, '\0')},
    {"xz", xz, std::string(8, '\0')},
    {"zstd", zstd, ""},
    {"bzip2", bzip2, ""},
};

}  // namespace packing
