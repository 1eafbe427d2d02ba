#include "Platform/Loading/URIReference.h"

#include <algorithm>
#include <array>
#include <cstdint>

namespace xquery {

namespace {

// --- characters ----------------------------------------------------------------------------------

// What a character is good for; a set of these.
enum CharacterUse : uint8_t {
  InScheme = 1,
  InRegisteredName = 2,
  InUserInfo = 4,
  InPath = 8,
  InQuery = 16,  // and in a fragment
  InPort = 32,
  InFutureAddress = 64,
};

using UseTable = std::array<uint8_t, 128>;

constexpr UseTable makeUseTable() {
  UseTable table{};
  const auto allow = [&table](std::string_view characters, int uses) {
    for (const char character : characters) {
      auto& entry = table[static_cast<size_t>(character)];
      entry = static_cast<uint8_t>(entry | uses);
    }
  };
  constexpr std::string_view letters = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
  constexpr std::string_view digits = "0123456789";
  constexpr int inAnyPart = InRegisteredName | InUserInfo | InPath | InQuery;
  allow(letters, InScheme | inAnyPart | InFutureAddress);
  allow(digits, InScheme | InPort | inAnyPart | InFutureAddress);
  allow("-._~!$&'()*+,;=", inAnyPart | InFutureAddress);
  allow("+-.", InScheme);
  allow(":", InUserInfo | InPath | InQuery | InFutureAddress);
  allow("@", InPath | InQuery);
  allow("/", InPath | InQuery);
  allow("?", InQuery);
  return table;
}

constexpr UseTable uses = makeUseTable();

bool isDigit(char character) {
  return character >= '0' && character <= '9';
}
bool isLetter(char character) {
  return (character >= 'A' && character <= 'Z') || (character >= 'a' && character <= 'z');
}
bool isHexadecimal(char character) {
  return isDigit(character) || (character >= 'A' && character <= 'F') ||
         (character >= 'a' && character <= 'f');
}

bool isOfUse(char character, CharacterUse use) {
  const auto byte = static_cast<unsigned char>(character);
  return byte < uses.size() && (uses[byte] & use) != 0;
}

// Whether every character may stand there, or is part of an escape where there may be some.
bool consistsOf(std::string_view text, CharacterUse use, bool mayEscape) {
  size_t inEscape = 0;  // hexadecimal digits that are still to come
  bool allowed = true;
  inBlocks(text, [&](std::string_view block) {
    for (const char character : block) {
      if (inEscape > 0) {
        allowed = allowed && isHexadecimal(character);
        --inEscape;
      } else if (!isOfUse(character, use)) {
        allowed = allowed && mayEscape && character == '%';
        inEscape = 2;
      }
    }
  });
  return allowed && inEscape == 0;
}

// --- hosts ---------------------------------------------------------------------------------------

// Up to `separator`, which goes with it.
std::string_view takeUpTo(char separator, std::string_view& text) {
  const size_t end = std::min(text.find(separator), text.size());
  const std::string_view head = text.substr(0, end);
  text.remove_prefix(std::min(end + 1, text.size()));
  return head;
}

// Four numbers up to 255 without leading zeros.
bool isIPv4Address(std::string_view text) {
  if (std::count(text.begin(), text.end(), '.') != 3 || text.ends_with('.')) return false;
  while (!text.empty()) {
    const std::string_view number = takeUpTo('.', text);
    if (number.empty() || number.size() > 3 ||
        !std::all_of(number.begin(), number.end(), isDigit)) {
      return false;
    }
    if (number.size() > 1 && number.front() == '0') return false;
    int value = 0;
    for (const char digit : number) value = value * 10 + (digit - '0');
    if (value > 255) return false;
  }
  return true;
}

// How many groups of 16 bits the text gives, separated by colons; an IPv4 address, which may be the
// last one, gives two. Nothing when it is something else.
std::optional<int> groupsOfIPv6(std::string_view text, bool mayEndInIPv4) {
  int groups = 0;
  if (text.ends_with(':')) return std::nullopt;
  while (!text.empty()) {
    const std::string_view group = takeUpTo(':', text);
    if (mayEndInIPv4 && text.empty() && isIPv4Address(group)) return groups + 2;
    const bool isGroup = !group.empty() && group.size() <= 4 &&
                         std::all_of(group.begin(), group.end(), isHexadecimal);
    if (!isGroup) return std::nullopt;
    ++groups;
  }
  return groups;
}

bool isIPv6Address(std::string_view text) {
  constexpr size_t longest = 45;  // eight groups, the last two as an IPv4 address
  constexpr int allGroups = 8;
  if (text.size() > longest) return false;
  const size_t gap = text.find("::");
  if (gap == std::string_view::npos) return groupsOfIPv6(text, true) == allGroups;
  const auto before = groupsOfIPv6(text.substr(0, gap), false);
  const auto after = groupsOfIPv6(text.substr(gap + 2), true);
  return before && after && *before + *after < allGroups;
}

// "v", a version in hexadecimal, a point, and at least one character more.
bool isFutureAddress(std::string_view text) {
  if (!text.starts_with('v') && !text.starts_with('V')) return false;
  const size_t point = text.find('.');
  if (point == std::string_view::npos || point < 2 || point + 1 == text.size()) return false;
  const std::string_view version = text.substr(1, point - 1);
  return std::all_of(version.begin(), version.end(), isHexadecimal) &&
         consistsOf(text.substr(point + 1), InFutureAddress, false);
}

bool isHostWithPort(std::string_view text) {
  std::string_view port;
  if (text.starts_with('[')) {
    const size_t end = text.find(']');
    if (end == std::string_view::npos) return false;
    const std::string_view address = text.substr(1, end - 1);
    if (!isIPv6Address(address) && !isFutureAddress(address)) return false;
    port = text.substr(end + 1);
    if (!port.empty() && port.front() != ':') return false;
    port.remove_prefix(port.empty() ? 0 : 1);
  } else {
    const std::string_view host = takeUpTo(':', text);
    port = text;
    if (!consistsOf(host, InRegisteredName, true)) return false;
  }
  return consistsOf(port, InPort, false);
}

bool isAuthority(std::string_view text) {
  const size_t at = text.find('@');
  if (at == std::string_view::npos) return isHostWithPort(text);
  return consistsOf(text.substr(0, at), InUserInfo, true) && isHostWithPort(text.substr(at + 1));
}

bool isScheme(std::string_view text) {
  return !text.empty() && isLetter(text.front()) && consistsOf(text, InScheme, false);
}

// --- resolution ----------------------------------------------------------------------------------

// Writes paths segment by segment, without the segments "." and "..".
class PathWriter {
 public:
  explicit PathWriter(URIText& out) : _out(out), _start(out.size()) {}

  // A path, or the beginning of one up to a slash.
  void append(std::string_view path) {
    WorkPacer pacer;
    while (!path.empty()) {
      pacer.turn();
      const size_t end = std::min(path.find('/'), path.size());
      appendSegment(path.substr(0, end), end < path.size());
      path.remove_prefix(std::min(end + 1, path.size()));
    }
  }
  // Where no authority stands before it, two slashes at the start of the path would begin one.
  void finish(bool hasAuthority) {
    if (_owesSlash) _out += '/';
    if (!hasAuthority && written().starts_with("//")) _out.insert(_start, "/.");
  }

 private:
  std::string_view written() const { return std::string_view(_out).substr(_start); }

  void appendSegment(std::string_view segment, bool endsInSlash) {
    if (segment == "." || segment == "..") {
      // At the start of a path without a slash they mean nothing.
      if (written().empty() && !_owesSlash) return;
      if (segment == "..") removeSegment();
      _owesSlash = true;
      return;
    }
    if (_owesSlash) _out += '/';
    appendInBlocks(_out, segment);
    _owesSlash = endsInSlash;
  }
  // The last segment written, with the slash before it.
  void removeSegment() {
    const size_t slash = std::min(written().rfind('/'), written().size());
    const size_t kept = slash == written().size() ? 0 : slash;
    checkUnits(static_cast<uint32_t>(written().size() - kept));
    _out.resize(_start + kept);
  }

  URIText& _out;
  size_t _start;
  bool _owesSlash = false;  // a slash follows what is written
};

void appendPart(URIText& out, std::string_view before, const std::optional<std::string_view>& part,
                std::string_view after) {
  if (!part) return;
  out.append(before);
  appendInBlocks(out, *part);
  out.append(after);
}

}  // namespace

URIParts partsOfURIReference(std::string_view text) {
  checkUnits(static_cast<uint32_t>(text.size()));
  URIParts parts;
  if (const size_t hash = text.find('#'); hash != text.npos) {
    parts.fragment = text.substr(hash + 1);
    text = text.substr(0, hash);
  }
  if (const size_t mark = text.find('?'); mark != text.npos) {
    parts.query = text.substr(mark + 1);
    text = text.substr(0, mark);
  }
  // A colon after a slash belongs to the path.
  const size_t colon = text.substr(0, text.find('/')).find(':');
  if (colon != text.npos) {
    parts.scheme = text.substr(0, colon);
    text.remove_prefix(colon + 1);
  }
  if (text.starts_with("//")) {
    const size_t end = std::min(text.find('/', 2), text.size());
    parts.authority = text.substr(2, end - 2);
    text.remove_prefix(end);
  }
  parts.path = text;
  return parts;
}

bool isURIReference(std::string_view text) {
  const URIParts parts = partsOfURIReference(text);
  return (!parts.scheme || isScheme(*parts.scheme)) &&
         (!parts.authority || isAuthority(*parts.authority)) &&
         consistsOf(parts.path, InPath, true) &&
         consistsOf(parts.query.value_or(""), InQuery, true) &&
         consistsOf(parts.fragment.value_or(""), InQuery, true);
}

std::optional<URIText> resolveURIReference(std::string_view reference, std::string_view base) {
  if (!isURIReference(reference) || !isURIReference(base)) return std::nullopt;
  const URIParts given = partsOfURIReference(reference);
  const URIParts around = partsOfURIReference(base);
  if (!around.scheme) return std::nullopt;
  const bool isAbsolute = given.scheme.has_value();
  const bool hasOwnAuthority = isAbsolute || given.authority;
  const bool hasOwnPath = hasOwnAuthority || !given.path.empty();
  const auto& authority = hasOwnAuthority ? given.authority : around.authority;

  URIText out;
  out.reserve(reference.size() + base.size() + 4);
  appendPart(out, "", isAbsolute ? given.scheme : around.scheme, ":");
  appendPart(out, "//", authority, "");
  if (!hasOwnPath) {
    appendInBlocks(out, around.path);
  } else {
    PathWriter path(out);
    if (!hasOwnAuthority && !given.path.starts_with('/')) {
      if (authority && around.path.empty()) path.append("/");
      path.append(around.path.substr(0, around.path.rfind('/') + 1));
    }
    path.append(given.path);
    path.finish(authority.has_value());
  }
  appendPart(out, "?", hasOwnPath || given.query ? given.query : around.query, "");
  appendPart(out, "#", given.fragment, "");
  return out;
}

}  // namespace xquery
