#include "Platform/Loading/PercentEscapes.h"
#include "Platform/Loading/URIReference.h"
#include "Platform/Text/ASCII.h"
#include "xquery/URL.h"

#include <filesystem>
#include <string_view>
#include <system_error>

namespace xquery {

namespace {

std::string_view textOf(const NSString& string) {
  const NSStringView view = string.view();
  return {view.asciiUnits(), view.length()};
}

// What a path may hold as it is, of the characters that a URL allows there.
bool isPlainInPath(char byte) {
  constexpr std::string_view marks = "/-._~!$&'()*+,;=:@";
  const char lower = lowerCase(byte);
  return (lower >= 'a' && lower <= 'z') || (byte >= '0' && byte <= '9') ||
         marks.find(byte) != marks.npos;
}

std::string escapedPath(std::string_view path) {
  constexpr std::string_view digits = "0123456789ABCDEF";
  std::string out;
  for (const char byte : path) {
    const auto value = static_cast<unsigned char>(byte);
    if (isPlainInPath(byte)) {
      out += byte;
    } else {
      out += {'%', digits[value >> 4], digits[value & 15]};
    }
  }
  return out;
}

}  // namespace

Ref<NSURL> NSURL::fileURLWithPath(std::string_view path) {
  std::error_code failure;
  const std::string absolute = std::filesystem::absolute(path, failure).string();
  if (failure) return nullptr;
  return make<NSURL>(NSString::stringWithASCII("file://" + escapedPath(absolute)));
}

// URLs are kept in caches: they have a text of their own, not one that keeps a document alive.
Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text) {
  // Every character of a URI is ASCII.
  if (!text || text->view().isWide() || !isURIReference(textOf(*text))) return nullptr;
  return make<NSURL>(NSString::stringWithView(text->view()));
}

Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text, const NSURL& base) {
  if (!text || text->view().isWide()) return nullptr;
  const std::optional<URIText> resolved = resolveURIReference(textOf(*text), textOf(*base._text));
  if (!resolved) return nullptr;
  return make<NSURL>(NSString::stringWithASCII(*resolved), NSString::stringWithView(text->view()));
}

std::string NSURL::scheme() const {
  return lowerCase(partsOfURIReference(textOf(*_text)).scheme.value_or(""));
}

std::string NSURL::host() const {
  std::string_view host = partsOfURIReference(textOf(*_text)).authority.value_or("");
  if (const size_t at = host.rfind('@'); at != host.npos) host.remove_prefix(at + 1);
  // A colon inside brackets is part of an IPv6 address.
  const size_t colon = host.rfind(':');
  if (colon != host.npos && host.find(']', colon) == host.npos) host = host.substr(0, colon);
  return std::string(host);
}

std::string NSURL::path() const {
  return unescaped(partsOfURIReference(textOf(*_text)).path);
}

std::string NSURL::relativePath() const {
  return unescaped(partsOfURIReference(textOf(*_reference)).path);
}

}  // namespace xquery
