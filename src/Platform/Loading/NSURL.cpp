#include "Platform/Loading/PercentEscapes.h"
#include "Platform/Loading/URIParser.h"
#include "Platform/Text/ASCII.h"
#include "xquery/URL.h"

#include <filesystem>
#include <string_view>
#include <system_error>

namespace xquery {

namespace {

struct Parts {
  std::string_view scheme, authority, path;
};

// Of a text that is a URI reference.
Parts partsOf(const NSString& reference) {
  const NSStringView view = reference.view();
  std::string_view rest(view.asciiUnits(), view.length());
  rest = rest.substr(0, rest.find_first_of("?#"));
  Parts parts;
  // A colon after a slash belongs to the path.
  if (const size_t end = rest.find_first_of(":/"); end != rest.npos && rest[end] == ':') {
    parts.scheme = rest.substr(0, end);
    rest.remove_prefix(end + 1);
  }
  if (rest.substr(0, 2) == "//") {
    const size_t end = rest.find('/', 2);
    parts.authority = rest.substr(2, end == rest.npos ? end : end - 2);
    rest = end == rest.npos ? std::string_view() : rest.substr(end);
  }
  parts.path = rest;
  return parts;
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

Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text) {
  // Every character of a URI is ASCII.
  if (!text || text->view().isWide()) return nullptr;
  const NSStringView view = text->view();
  if (!isURIReference({view.asciiUnits(), view.length()})) return nullptr;
  return make<NSURL>(text);
}

Ref<NSURL> NSURL::URLWithString(const Ref<NSString>& text, const NSURL& base) {
  if (!text || text->view().isWide()) return nullptr;
  const NSStringView reference = text->view();
  const NSStringView baseText = base._text->view();
  const std::optional<std::string> resolved = resolveURIReference(
      {reference.asciiUnits(), reference.length()}, {baseText.asciiUnits(), baseText.length()});
  if (!resolved) return nullptr;
  return make<NSURL>(NSString::stringWithASCII(*resolved), text);
}

std::string NSURL::scheme() const {
  return lowerCase(partsOf(*_text).scheme);
}

std::string NSURL::host() const {
  std::string_view host = partsOf(*_text).authority;
  if (const size_t at = host.rfind('@'); at != host.npos) host.remove_prefix(at + 1);
  // A colon inside brackets is part of an IPv6 address.
  const size_t colon = host.rfind(':');
  if (colon != host.npos && host.find(']', colon) == host.npos) host = host.substr(0, colon);
  return std::string(host);
}

std::string NSURL::path() const {
  return unescaped(partsOf(*_text).path);
}

std::string NSURL::relativePath() const {
  return unescaped(partsOf(*_reference).path);
}

}  // namespace xquery
