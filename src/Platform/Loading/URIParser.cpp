#include "Platform/Loading/URIParser.h"

#include <uriparser/Uri.h>

namespace xquery {

namespace {

// A parsed reference; its parts point into the text it was parsed from.
class ParsedURI {
 public:
  ParsedURI() = default;
  explicit ParsedURI(std::string_view text) {
    // The library takes a null pointer for a mistake even when the text is empty.
    const char* first = text.empty() ? "" : text.data();
    _valid = uriParseSingleUriExA(&_uri, first, first + text.size(), nullptr) == URI_SUCCESS;
  }
  ParsedURI(const ParsedURI&) = delete;
  ParsedURI& operator=(const ParsedURI&) = delete;
  ~ParsedURI() {
    if (_valid) uriFreeUriMembersA(&_uri);
  }

  bool isValid() const { return _valid; }
  bool hasScheme() const { return _uri.scheme.first != nullptr; }

  void resolve(const ParsedURI& reference, const ParsedURI& base) {
    _valid =
        uriAddBaseUriExA(&_uri, &reference._uri, &base._uri, URI_RESOLVE_STRICTLY) == URI_SUCCESS;
    if (!_valid) uriFreeUriMembersA(&_uri);
  }

  // The library's own writer spells IPv6 addresses out; here every part stays as it was written.
  std::string toString() const {
    std::string out;
    if (hasScheme()) append(out, "", _uri.scheme, ":");
    if (hasHost()) {
      out += "//";
      append(out, "", _uri.userInfo, "@");
      const bool bracketed = _uri.hostData.ip6 || _uri.hostData.ipFuture.first;
      append(out, bracketed ? "[" : "", _uri.hostText, bracketed ? "]" : "");
      append(out, ":", _uri.portText, "");
    }
    bool slash = _uri.absolutePath || hasHost();
    for (const UriPathSegmentA* segment = _uri.pathHead; segment; segment = segment->next) {
      if (slash) out += '/';
      append(out, "", segment->text, "");
      slash = true;
    }
    if (!_uri.pathHead && _uri.absolutePath) out += '/';
    append(out, "?", _uri.query, "");
    append(out, "#", _uri.fragment, "");
    return out;
  }

 private:
  bool hasHost() const { return _uri.hostText.first != nullptr; }
  static void append(std::string& out, const char* before, const UriTextRangeA& part,
                     const char* after) {
    if (!part.first) return;
    out += before;
    out.append(part.first, part.afterLast);
    out += after;
  }

  UriUriA _uri = {};
  bool _valid = false;
};

}  // namespace

bool isURIReference(std::string_view text) {
  return ParsedURI(text).isValid();
}

std::optional<std::string> resolveURIReference(std::string_view reference, std::string_view base) {
  const ParsedURI parsedBase(base);
  const ParsedURI parsedReference(reference);
  if (!parsedBase.isValid() || !parsedReference.isValid() || !parsedBase.hasScheme()) {
    return std::nullopt;
  }
  ParsedURI resolved;
  resolved.resolve(parsedReference, parsedBase);
  if (!resolved.isValid()) return std::nullopt;
  return resolved.toString();
}

}  // namespace xquery
