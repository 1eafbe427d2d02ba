#include "Platform/TextEncoding.h"

#include <unicode/ucnv.h>

#include <memory>
#include <new>

namespace xquery {

namespace {

struct CloseConverter {
  void operator()(UConverter* converter) const { ucnv_close(converter); }
};

}  // namespace

Ref<NSString> stringWithBytes(std::string_view bytes, const std::string& encoding) {
  UErrorCode status = U_ZERO_ERROR;
  const std::unique_ptr<UConverter, CloseConverter> converter(ucnv_open(encoding.c_str(), &status));
  if (U_FAILURE(status) || !converter) return {};
  std::u16string text;
  const char* source = bytes.data();
  const char* const end = source + bytes.size();
  char16_t piece[4096];
  do {
    status = U_ZERO_ERROR;
    char16_t* target = piece;
    ucnv_toUnicode(converter.get(), &target, piece + std::size(piece), &source, end, nullptr, true,
                   &status);
    text.append(piece, target);
  } while (status == U_BUFFER_OVERFLOW_ERROR);
  return NSString::stringWithUTF16(text);
}

}  // namespace xquery
