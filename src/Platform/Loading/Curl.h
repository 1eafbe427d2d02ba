// libcurl, as the way to http and https servers. Nothing else of the library includes its headers.
#pragma once

#include <chrono>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>

struct sockaddr;

namespace xquery {

struct CurlRequest {
  std::string URL;
  std::chrono::milliseconds connectTimeout;
  std::chrono::milliseconds totalTimeout;
  uint64_t mostBytes;
  // Asked before each connection; without it any address is connected to, or a proxy. It must not
  // throw.
  std::function<bool(const sockaddr&)> allowsAddress;
  // Called at least every 50 ms while the request lasts. What it throws ends the request and passes
  // through.
  std::function<void()> checkpoint;
};

struct CurlResponse {
  std::string data;
  int statusCode = 0;
  std::optional<std::string> contentType;  // with its parameters
  // Where the server redirects to, as an absolute URL; empty when it does not.
  std::string redirectURL;
};

// One request. Redirects are not followed: whether one may be is for the caller to say. Nothing,
// and why in `failure`, unless a whole response came back.
std::optional<CurlResponse> fetchWithCurl(const CurlRequest& request, std::string& failure);

}  // namespace xquery
