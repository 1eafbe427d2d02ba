#include "Platform/Loading/LocalPath.h"

#include "Platform/Loading/PercentEscapes.h"

#include <vector>

namespace xquery {

namespace {

// With its escapes, since an escaped slash separates nothing.
std::string_view escapedPathOf(std::string_view URL) {
  URL = URL.substr(0, URL.find_first_of("?#"));
  URL.remove_prefix(URL.find(':') + 1);
  if (!URL.starts_with("//")) return URL;
  const size_t path = URL.find('/', 2);
  return path == URL.npos ? std::string_view() : URL.substr(path);
}

bool isLocalHost(const std::string& host) {
  return host.empty() || host == "localhost";
}

// Names from the root on.
class Names {
 public:
  void add(std::string_view name) {
    _endsInFolder = name.empty() || name == "." || name == "..";
    if (!_endsInFolder) {
      _names.emplace_back(name);
    } else if (name == ".." && !_names.empty()) {
      _names.pop_back();
    }
  }
  std::string path() const {
    std::string text;
    for (const std::string& name : _names) text.append("/").append(name);
    if (_endsInFolder) text += '/';
    return text;
  }

 private:
  std::vector<std::string> _names;
  bool _endsInFolder = true;
};

// Calls `function` for each part between slashes, until it answers false.
template <class Function>
bool forEachSegment(std::string_view path, Function function) {
  for (size_t start = 1; start <= path.size();) {
    const size_t end = std::min(path.find('/', start), path.size());
    if (!function(path.substr(start, end - start))) return false;
    start = end + 1;
  }
  return true;
}

}  // namespace

std::optional<std::string> localPathOf(const NSURL& URL) {
  if (URL.scheme() != "file" || !isLocalHost(URL.host())) return std::nullopt;
  const NSStringView text = URL.absoluteString()->view();
  const std::string_view path = escapedPathOf({text.asciiUnits(), text.length()});
  if (!path.starts_with('/')) return std::nullopt;
  Names names;
  const bool isPath = forEachSegment(path, [&](std::string_view segment) {
    const std::string name = unescaped(segment);
    constexpr std::string_view inNoName("/\0", 2);
    if (name.find_first_of(inNoName) != name.npos) return false;
    names.add(name);
    return true;
  });
  if (!isPath) return std::nullopt;
  return names.path();
}

std::string withoutDots(std::string_view path) {
  Names names;
  forEachSegment(path, [&](std::string_view segment) {
    names.add(segment);
    return true;
  });
  return names.path();
}

}  // namespace xquery
