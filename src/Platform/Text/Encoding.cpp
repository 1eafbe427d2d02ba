#include "Platform/Text/Encoding.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"

#include <unicode/ucnv.h>
#include <unicode/ucnv_err.h>

#include <iterator>
#include <limits>
#include <memory>

namespace xquery {

namespace {

struct CloseConverter {
  void operator()(UConverter* converter) const { ucnv_close(converter); }
};
using Converter = std::unique_ptr<UConverter, CloseConverter>;

Converter converterNamed(const std::string& name) {
  UErrorCode status = U_ZERO_ERROR;
  Converter converter(ucnv_open(name.c_str(), &status));
  return U_SUCCESS(status) ? std::move(converter) : Converter();
}

// ICU's own name of the charset; null for one that IANA does not know. ICU reads what follows a
// comma as options of its own.
const char* nameOfCharset(const std::string& IANAName) {
  if (IANAName.find_first_of(std::string_view(",\0", 2)) != IANAName.npos) return nullptr;
  UErrorCode status = U_ZERO_ERROR;
  const char* name = ucnv_getCanonicalName(IANAName.c_str(), "IANA", &status);
  return U_SUCCESS(status) ? name : nullptr;
}

constexpr size_t unitsPerPiece = 4096;

// Nothing when the converter stops at bytes that are no text.
std::optional<std::u16string> decoded(std::string_view bytes, UConverter* converter) {
  std::u16string text;
  const char* source = bytes.data();
  const char* const end = source + bytes.size();
  char16_t piece[unitsPerPiece];
  UErrorCode status = U_ZERO_ERROR;
  do {
    checkWork();
    status = U_ZERO_ERROR;
    char16_t* target = piece;
    ucnv_toUnicode(converter, &target, piece + std::size(piece), &source, end, nullptr, true,
                   &status);
    appendInBlocks(text, std::u16string_view(piece, target));
  } while (status == U_BUFFER_OVERFLOW_ERROR);
  if (U_FAILURE(status)) return std::nullopt;
  return text;
}

bool isUTF8(std::string_view name) {
  return name == "UTF-8";
}

}  // namespace

Ref<NSString> stringWithBytes(std::string_view bytes, const std::string& encoding) {
  const Converter converter = converterNamed(encoding);
  if (!converter) return {};
  const auto text = decoded(bytes, converter.get());
  return text ? NSString::stringWithUTF16(*text) : Ref<NSString>();
}

Ref<NSString> stringWithBytesInCharset(std::string_view bytes, const std::string& IANAName) {
  const char* name = nameOfCharset(IANAName);
  if (!name || bytes.size() > std::numeric_limits<uint32_t>::max()) return {};
  if (isUTF8(name)) return NSString::stringWithUTF8(bytes);
  const Converter converter = converterNamed(name);
  if (!converter) return {};
  UErrorCode status = U_ZERO_ERROR;
  ucnv_setToUCallBack(converter.get(), UCNV_TO_U_CALLBACK_STOP, nullptr, nullptr, nullptr, &status);
  const auto text = decoded(bytes, converter.get());
  return text ? NSString::stringWithUTF16(*text) : Ref<NSString>();
}

std::optional<std::string> bytesInCharset(NSStringView text, const std::string& IANAName) {
  const char* name = nameOfCharset(IANAName);
  if (!name) return std::nullopt;
  if (isUTF8(name)) return text.utf8();
  const Converter converter = converterNamed(name);
  if (!converter) return std::nullopt;
  UErrorCode status = U_ZERO_ERROR;
  ucnv_setFromUCallBack(converter.get(), UCNV_FROM_U_CALLBACK_STOP, nullptr, nullptr, nullptr,
                        &status);
  const std::u16string units = text.utf16();
  std::string bytes;
  const char16_t* source = units.data();
  const char16_t* const end = source + units.size();
  char piece[unitsPerPiece];
  do {
    checkWork();
    status = U_ZERO_ERROR;
    char* target = piece;
    ucnv_fromUnicode(converter.get(), &target, piece + std::size(piece), &source, end, nullptr,
                     true, &status);
    appendInBlocks(bytes, std::string_view(piece, target));
  } while (status == U_BUFFER_OVERFLOW_ERROR);
  if (U_FAILURE(status)) return std::nullopt;
  return bytes;
}

}  // namespace xquery
