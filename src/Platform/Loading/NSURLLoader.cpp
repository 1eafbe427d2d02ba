#include "Platform/Loading/NSURLLoader.h"

#include "Platform/Base/NSLog.h"
#include "Platform/Loading/AddressKinds.h"
#include "Platform/Loading/Curl.h"
#include "Platform/Loading/HostLoad.h"
#include "Platform/Loading/LocalFile.h"

#include <algorithm>

namespace xquery {

namespace {

constexpr std::string_view blanks = " \t";

// A Content-Type without its parameters.
std::optional<std::string> MIMETypeOf(const std::optional<std::string>& contentType) {
  if (!contentType) return std::nullopt;
  std::string_view type = *contentType;
  type = type.substr(0, type.find(';'));
  type.remove_prefix(std::min(type.find_first_not_of(blanks), type.size()));
  type = type.substr(0, type.find_last_not_of(blanks) + 1);
  if (type.empty()) return std::nullopt;
  return std::string(type);
}

bool forbidsAddresses(const XQueryLoadingPolicy& policy) {
  using Kind = XQueryAddressKind;
  constexpr Kind kinds[] = {Kind::Loopback, Kind::LinkLocal, Kind::Private, Kind::Special};
  return std::any_of(std::begin(kinds), std::end(kinds),
                     [&](Kind kind) { return policy.forbidsAddresses(kind); });
}

// Empty where any is allowed.
std::function<bool(const sockaddr&)> addressRuleOf(const XQueryLoadingPolicy& policy) {
  if (!forbidsAddresses(policy)) return nullptr;
  return [&policy](const sockaddr& address) {
    const auto kind = kindOfAddress(address);
    return !kind || !policy.forbidsAddresses(*kind);
  };
}

}  // namespace

std::string withoutCredentials(std::string_view URL) {
  const size_t start = URL.find("//");
  if (start == URL.npos) return std::string(URL);
  const size_t end = std::min(URL.find_first_of("/?#", start + 2), URL.size());
  const size_t at = URL.substr(0, end).rfind('@');
  if (at == URL.npos || at < start) return std::string(URL);
  return std::string(URL.substr(0, start + 2)).append(URL.substr(at + 1));
}

Ref<NSURLLoader> NSURLLoader::loaderWithLoading(XQueryLoading loading) {
  return make<NSURLLoader>(std::move(loading));
}

NSURLLoader::NSURLLoader(XQueryLoading loading)
    : NSCounted(Kind::Internal), _loading(std::move(loading)) {}

bool NSURLLoader::hasUsableStatus(const XQueryResource& resource) {
  const int status = resource.statusCode.value_or(0);
  return status == 0 || status == 200 || status == 304;
}

std::optional<XQueryResource> NSURLLoader::load(const NSURL& URL, XQueryLoadPurpose purpose) {
  _failure.clear();
  auto resource = loadAllowed(URL, purpose);
  if (!resource && XQueryLogEnabled()) {
    NSLog("cannot load " + withoutCredentials(URL.absoluteString()->utf8()) + ": " + _failure);
  }
  return resource;
}

std::optional<XQueryResource> NSURLLoader::loadAllowed(const NSURL& URL,
                                                       XQueryLoadPurpose purpose) {
  if (!_loading.policy.allowsURL(URL)) {
    const bool isRelative = URL.scheme().empty();
    _failure = isRelative ? "a relative URL, and nothing to resolve it against" : "not allowed";
    return std::nullopt;
  }
  if (_loading.loader) return loadFromHost(URL, purpose);
  const std::string scheme = URL.scheme();
  if (scheme == "file") return loadFile(URL);
  if (scheme == "http" || scheme == "https") return loadFromServer(URL);
  _failure = "unknown scheme";
  return std::nullopt;
}

std::optional<XQueryResource> NSURLLoader::loadFromHost(const NSURL& URL,
                                                        XQueryLoadPurpose purpose) {
  // The host may set other settings, and so take its loader away, while it is called.
  const std::shared_ptr<XQueryLoader> loader = _loading.loader;
  auto resource = xquery::loadFromHost(loader, URL, purpose, _checkpoint);
  if (!resource) _failure = "the host has no such resource";
  if (resource && resource->data.size() > _loading.limits.mostBytes) {
    _failure = "more bytes than allowed";
    return std::nullopt;
  }
  return resource;
}

std::optional<XQueryResource> NSURLLoader::loadFile(const NSURL& URL) {
  auto data = readLocalFile(URL, _loading.policy, _loading.limits.mostBytes, _failure);
  if (!data) return std::nullopt;
  return XQueryResource{std::move(*data), {}, {}, URL.absoluteString()->utf8()};
}

bool NSURLLoader::mayFollow(const std::string& redirectURL) {
  const auto URL = NSURL::URLWithString(NSString::stringWithUTF8(redirectURL));
  const std::string scheme = URL ? URL->scheme() : "";
  if (scheme != "http" && scheme != "https") return false;
  return _loading.policy.allowsURL(*URL);
}

std::optional<XQueryResource> NSURLLoader::loadFromServer(const NSURL& URL) {
  using Clock = std::chrono::steady_clock;
  using std::chrono::milliseconds;
  const XQueryLoadingLimits& limits = _loading.limits;
  // What libcurl would take for the host then is not what the policy was asked about.
  if (URL.host().empty()) {
    _failure = "no host";
    return std::nullopt;
  }
  // The end of a very long time is beyond what the clock counts, so what is left is counted.
  const milliseconds total = std::max(limits.totalTimeout, milliseconds::zero());
  const auto start = Clock::now();
  CurlRequest request = {URL.absoluteString()->utf8(),
                         limits.connectTimeout,
                         total,
                         limits.mostBytes,
                         addressRuleOf(_loading.policy),
                         _checkpoint};
  for (int redirects = 0;; ++redirects) {
    auto response = fetchWithCurl(request, _failure);
    if (!response) return std::nullopt;
    if (response->redirectURL.empty()) {
      return XQueryResource{std::move(response->data), response->statusCode,
                            MIMETypeOf(response->contentType), request.URL};
    }
    if (redirects >= limits.mostRedirects) {
      _failure = "too many redirects";
      return std::nullopt;
    }
    if (!mayFollow(response->redirectURL)) {
      _failure =
          "redirected to " + withoutCredentials(response->redirectURL) + ", which is not allowed";
      return std::nullopt;
    }
    request.URL = std::move(response->redirectURL);
    request.totalTimeout = total - std::chrono::duration_cast<milliseconds>(Clock::now() - start);
    if (request.totalTimeout <= milliseconds::zero()) {
      _failure = "the time is up";
      return std::nullopt;
    }
  }
}

// --- handles -------------------------------------------------------------------------------------

Ref<NSData> NSURLHandle::resourceData(NSURLLoader& loader) {
  if (_data) return _data;
  auto resource = loader.load(*_URL, _purpose);
  if (resource && NSURLLoader::hasUsableStatus(*resource)) {
    _data = NSData::dataWithBytes(std::move(resource->data));
  }
  return _data;
}

Ref<NSURLHandle> NSURLLoader::URLHandle(const Ref<NSURL>& URL, XQueryLoadPurpose purpose,
                                        bool usingCache) {
  if (!usingCache) return make<NSURLHandle>(URL, purpose);
  Ref<NSURLHandle>& handle = _handles[static_cast<size_t>(purpose)][URL];
  if (!handle) handle = make<NSURLHandle>(URL, purpose);
  return handle;
}

void NSURLLoader::forget(const Ref<NSURL>& URL, XQueryLoadPurpose purpose) {
  _handles[static_cast<size_t>(purpose)].erase(URL);
}

}  // namespace xquery
