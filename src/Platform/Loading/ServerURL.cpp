#include "Platform/Loading/ServerURL.h"

#include "Platform/Loading/PercentEscapes.h"
#include "Platform/Loading/URIReference.h"
#include "Platform/Text/ASCII.h"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <cstdio>

namespace xquery {

namespace {

// Characters that mean the same with and without an escape.
bool isUnreserved(char byte) {
  constexpr std::string_view marks = "-._~";
  const char letter = lowerCase(byte);
  return (letter >= 'a' && letter <= 'z') || (byte >= '0' && byte <= '9') ||
         marks.find(byte) != marks.npos;
}

std::string withoutNeedlessEscapes(std::string_view text) {
  std::string out;
  for (size_t index = 0; index < text.size(); ++index) {
    const std::string_view escape = text.substr(index, 3);
    if (text[index] != '%' || escape.size() < 3) {
      out += text[index];
      continue;
    }
    const char byte = unescaped(escape).front();
    if (isUnreserved(byte)) {
      out += byte;
    } else {
      char written[4];
      std::snprintf(written, sizeof written, "%%%02X", static_cast<unsigned char>(byte));
      out += written;
    }
    index += 2;
  }
  return out;
}

// Whether a server that decodes the path, takes "\" for "/" or drops parameters would go up in it.
bool mayGoUp(std::string_view path) {
  std::string decoded = unescaped(path);
  std::replace(decoded.begin(), decoded.end(), '\\', '/');
  for (std::string_view rest = decoded; !rest.empty();) {
    const size_t end = std::min(rest.find('/'), rest.size());
    const std::string_view segment = rest.substr(0, end);
    if (segment.substr(0, segment.find(';')) == "..") return true;
    rest.remove_prefix(std::min(end + 1, rest.size()));
  }
  return false;
}

// With a colon before it; nothing for what is no port. A port that the scheme has anyway is left
// out.
std::optional<std::string> normalisedPort(std::string_view port, std::string_view scheme) {
  if (port.empty()) return "";
  uint16_t number = 0;
  const auto read = std::from_chars(port.data(), port.data() + port.size(), number);
  if (read.ec != std::errc() || read.ptr != port.data() + port.size()) return std::nullopt;
  const bool isUsual = (scheme == "http" && number == 80) || (scheme == "https" && number == 443);
  return isUsual ? "" : ":" + std::to_string(number);
}

std::optional<std::string> normalisedAuthority(std::string_view authority,
                                               std::string_view scheme) {
  if (authority.find_first_of("@%") != authority.npos) return std::nullopt;
  // A colon inside brackets is part of an address.
  const size_t bracket = authority.rfind(']');
  const size_t colon = authority.find(':', bracket == authority.npos ? 0 : bracket);
  std::string host = lowerCase(authority.substr(0, colon));
  if (host.ends_with('.')) host.pop_back();
  if (host.empty()) return std::nullopt;
  const auto port = normalisedPort(
      colon == authority.npos ? std::string_view() : authority.substr(colon + 1), scheme);
  return port ? std::optional(host + *port) : std::nullopt;
}

}  // namespace

std::optional<std::string> normalisedServerURL(std::string_view URL) {
  if (!isURIReference(URL)) return std::nullopt;
  const URIParts given = partsOfURIReference(URL);
  if (!given.scheme || !given.authority) return std::nullopt;
  const std::string scheme = lowerCase(*given.scheme);
  const auto authority = normalisedAuthority(*given.authority, scheme);
  if (!authority || scheme == "file") return std::nullopt;

  // Resolving removes "." and "..".
  const std::string root = scheme + "://" + *authority;
  const auto resolved = resolveURIReference(root + std::string(given.path), root);
  if (!resolved) return std::nullopt;
  const std::string_view path = std::string_view(*resolved).substr(root.size());
  if (mayGoUp(path)) return std::nullopt;
  return root + (path.empty() ? "/" : withoutNeedlessEscapes(path));
}

std::optional<std::string> normalisedServerPrefix(std::string_view URL) {
  if (URL.find_first_of("?#") != URL.npos) return std::nullopt;
  return normalisedServerURL(URL);
}

bool isBelowServerURL(std::string_view URL, std::string_view prefix) {
  if (!URL.starts_with(prefix)) return false;
  return URL.size() == prefix.size() || prefix.ends_with('/') || URL[prefix.size()] == '/';
}

}  // namespace xquery
