// Text between the host and the library.
#include "C/Texts.h"

#include <cstdlib>
#include <cstring>
#include <new>

namespace xquery::capi {

GivenText::GivenText(const char* text, size_t length) {
  if (text) {
    _text = length == XQ_NUL ? std::string_view(text) : std::string_view(text, length);
  } else {
    _isGood = length == 0 || length == XQ_NUL;
  }
}

bool emptied(xq_text* text) {
  if (!text) return false;
  if (text->capacity == 0) {
    text->data = "";
  } else {
    const_cast<char*>(text->data)[0] = 0;
  }
  text->length = 0;
  return true;
}

namespace {

// Room for so many bytes and the zero behind them. Grows by half at least, so that texts that grow
// one by one do not ask for memory each time.
char* roomFor(xq_text& text, size_t length) {
  if (length < text.capacity) return const_cast<char*>(text.data);
  if (length >= PTRDIFF_MAX) throw std::bad_alloc();
  size_t capacity = text.capacity + text.capacity / 2;
  if (capacity < length + 1) capacity = length + 1;
  if (capacity < 32) capacity = 32;
  char* old = text.capacity ? const_cast<char*>(text.data) : nullptr;
  char* data = static_cast<char*>(std::realloc(old, capacity));
  if (!data) throw std::bad_alloc();
  text.data = data;
  text.capacity = capacity;
  return data;
}

}  // namespace

xq_status fill(xq_text& text, std::string_view utf8) {
  char* data = roomFor(text, utf8.size());
  if (!utf8.empty()) std::memcpy(data, utf8.data(), utf8.size());
  data[utf8.size()] = 0;
  text.length = utf8.size();
  return XQ_OK;
}

xq_status fill(xq_text& text, NSStringView string) {
  if (string.isWide()) return fill(text, string.utf8());
  return fill(text, std::string_view(string.asciiUnits(), string.length()));
}

xq_status fill(xq_text& text, const Ref<NSString>& string) {
  return string ? fill(text, string->view()) : XQ_END;
}

}  // namespace xquery::capi

using namespace xquery::capi;

xq_status xq_text_free(xq_text* text) {
  if (!text) return XQ_OK;
  if (text->capacity) std::free(const_cast<char*>(text->data));
  *text = {"", 0, 0};
  return XQ_OK;
}
