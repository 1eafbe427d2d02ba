#include "Platform/Loading/FolderWalk.h"
#include "Platform/Loading/LocalPath.h"
#include "Platform/Loading/ServerURL.h"
#include "Platform/Text/ASCII.h"
#include "xquery/Loading.h"

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <system_error>

namespace xquery {

namespace {

constexpr uint8_t everyKind = 0xFF;

uint8_t bitOf(XQueryAddressKind kind) {
  return static_cast<uint8_t>(1U << static_cast<unsigned>(kind));
}

std::string withoutLastSlash(std::string path) {
  if (path.ends_with('/')) path.pop_back();
  return path;
}

// What is below the folder; empty when nothing is.
std::string_view below(std::string_view path, std::string_view folder) {
  if (path.size() <= folder.size() || path[folder.size()] != '/') return {};
  return path.starts_with(folder) ? path.substr(folder.size() + 1) : std::string_view();
}

bool isServerScheme(const std::string& scheme) {
  return scheme == "http" || scheme == "https";
}

}  // namespace

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
  const std::string place = withoutLastSlash(canonical.string());
  // Without ".." the spelling may be that of another folder, where a link stands before it.
  std::string spelling = withoutDots(std::filesystem::absolute(folder, failure).string());
  if (failure || std::filesystem::canonical(spelling, failure) != canonical) spelling = place;
  _folders.push_back({withoutLastSlash(std::move(spelling)), place});
  return *this;
}

XQueryLoadingPolicy& XQueryLoadingPolicy::allowHost(std::string_view name) {
  _hosts.push_back(lowerCase(name));
  return *this;
}

XQueryLoadingPolicy& XQueryLoadingPolicy::allowURLsBelow(std::string_view URL) {
  if (auto prefix = normalisedServerPrefix(URL)) _URLs.push_back(std::move(*prefix));
  return *this;
}

XQueryLoadingPolicy& XQueryLoadingPolicy::forbidAddresses(XQueryAddressKind kind) {
  _forbiddenAddresses |= bitOf(kind);
  return *this;
}

XQueryLoadingPolicy& XQueryLoadingPolicy::forbidLocalAddresses() {
  _forbiddenAddresses = everyKind;
  return *this;
}

bool XQueryLoadingPolicy::allowsScheme(std::string_view scheme) const {
  return std::find(_schemes.begin(), _schemes.end(), lowerCase(scheme)) != _schemes.end();
}

bool XQueryLoadingPolicy::allowsHost(std::string_view name) const {
  if (_hosts.empty()) return true;
  std::string host = lowerCase(name);
  if (host.ends_with('.')) host.pop_back();
  return std::any_of(_hosts.begin(), _hosts.end(), [&](const std::string& allowed) {
    if (!allowed.starts_with("*.")) return host == allowed;
    const std::string_view ending = std::string_view(allowed).substr(1);
    return host.size() > ending.size() && host.ends_with(ending);
  });
}

bool XQueryLoadingPolicy::forbidsAddresses(XQueryAddressKind kind) const {
  return (_forbiddenAddresses & bitOf(kind)) != 0;
}

std::optional<XQueryLoadingPolicy::Place> XQueryLoadingPolicy::placeBelowFolder(
    std::string_view path) const {
  for (const Folder& folder : _folders) {
    for (const std::string& name : {folder.place, folder.spelling}) {
      const std::string_view rest = below(path, name);
      if (!rest.empty()) return Place{folder.place, std::string(rest)};
    }
  }
  return std::nullopt;
}

bool XQueryLoadingPolicy::isBelowAllowedFolder(std::string_view canonicalPath) const {
  return std::any_of(_folders.begin(), _folders.end(), [&](const Folder& folder) {
    return !below(canonicalPath, folder.place).empty();
  });
}

bool XQueryLoadingPolicy::allowsHostOf(const NSURL& URL) const {
  const std::string host = URL.host();
  if (!host.empty()) return allowsHost(host);
  // What some clients make of such a URL has a host nevertheless.
  return _hosts.empty() || !isServerScheme(URL.scheme());
}

bool XQueryLoadingPolicy::isBelowAllowedURL(const NSURL& URL) const {
  if (_URLs.empty()) return false;
  const auto asked = normalisedServerURL(URL.absoluteString()->utf8());
  return asked && std::any_of(_URLs.begin(), _URLs.end(), [&](const std::string& prefix) {
           return isBelowServerURL(*asked, prefix);
         });
}

bool XQueryLoadingPolicy::allowsURL(const NSURL& URL) const {
  const std::string scheme = URL.scheme();
  if (scheme.empty()) return false;
  if (isBelowAllowedURL(URL)) return true;
  if (allowsScheme(scheme)) return scheme == "file" || allowsHostOf(URL);
  if (scheme != "file" || _folders.empty()) return false;
  const auto path = localPathOf(URL);
  if (!path || !placeBelowFolder(*path)) return false;
  return findBelowAllowedFolders(*this, *path).isOpen() || errno != EXDEV;
}

}  // namespace xquery
