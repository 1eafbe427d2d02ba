#include "Platform/Text/ASCII.h"
#include "xquery/Loading.h"

#include <algorithm>
#include <filesystem>
#include <system_error>

namespace xquery {

XQueryLoadingPolicy XQueryLoadingPolicy::allowAll() {
  return denyAll().allowScheme("file").allowScheme("http").allowScheme("https");
}

XQueryLoadingPolicy XQueryLoadingPolicy::denyAll() {
  return {};
}

XQueryLoadingPolicy& XQueryLoadingPolicy::allowScheme(std::string_view scheme) {
  _schemes.push_back(lowerCase(scheme));
  return *this;
}

XQueryLoadingPolicy& XQueryLoadingPolicy::allowFilesBelow(const std::string& folder) {
  std::error_code failure;
  const auto canonical = std::filesystem::canonical(folder, failure);
  if (failure || !std::filesystem::is_directory(canonical, failure)) return *this;
  _folders.push_back(canonical == canonical.root_path() ? "" : canonical.string());
  return *this;
}

bool XQueryLoadingPolicy::allowsScheme(std::string_view scheme) const {
  return std::find(_schemes.begin(), _schemes.end(), lowerCase(scheme)) != _schemes.end();
}

bool XQueryLoadingPolicy::isBelowAllowedFolder(std::string_view canonicalPath) const {
  return std::any_of(_folders.begin(), _folders.end(), [&](const std::string& folder) {
    return canonicalPath.size() > folder.size() && canonicalPath[folder.size()] == '/' &&
           canonicalPath.substr(0, folder.size()) == folder;
  });
}

bool XQueryLoadingPolicy::allowsURL(const NSURL& URL) const {
  const std::string scheme = URL.scheme();
  if (scheme.empty()) return false;
  if (allowsScheme(scheme)) return true;
  if (scheme != "file" || _folders.empty()) return false;
  const std::string path = URL.path();
  if (path.empty() || path[0] != '/' || path.find('\0') != path.npos) return false;
  std::error_code failure;
  const auto place = std::filesystem::weakly_canonical(path, failure);
  return !failure && isBelowAllowedFolder(place.string());
}

}  // namespace xquery
