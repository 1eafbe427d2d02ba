// Fetches what URLs name, under a policy and within limits; and handles, which keep what they
// fetched.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "xquery/Data.h"
#include "xquery/Loading.h"
#include "xquery/Object.h"

#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>

namespace xquery {

struct NSURLHash {
  size_t operator()(const Ref<NSURL>& URL) const { return URL->hash(); }
};
struct NSURLEqual {
  bool operator()(const Ref<NSURL>& a, const Ref<NSURL>& b) const { return a->isEqual(*b); }
};
// Counts toward the memory ceiling, since what could not be had is remembered as well.
template <class T>
using NSURLTable = std::unordered_map<Ref<NSURL>, T, NSURLHash, NSURLEqual,
                                      ValueAllocator<std::pair<const Ref<NSURL>, T>>>;

class NSURLLoader;

// A URL as it may be shown: without the user name and the password that it may hold.
std::string withoutCredentials(std::string_view URL);

// The bytes behind a URL, fetched when they are first asked for.
class NSURLHandle : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::URLHandle; }

  // Null when there are none; the next call tries again.
  Ref<NSData> resourceData(NSURLLoader& loader);

 protected:
  NSURLHandle(Ref<NSURL> URL, XQueryLoadPurpose purpose)
      : NSCounted(Kind::URLHandle), _URL(std::move(URL)), _purpose(purpose) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSURL> _URL;
  XQueryLoadPurpose _purpose;
  Ref<NSData> _data;
};

class NSURLLoader : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Internal; }
  [[nodiscard]] static Ref<NSURLLoader> loaderWithLoading(XQueryLoading loading = {});

  const XQueryLoading& loading() const { return _loading; }
  // Called at least every 50 ms while the network or the host is waited for; unless another is set,
  // the one that ends an evaluation at its limits. What it throws ends the load and passes through.
  void setCheckpoint(std::function<void()> checkpoint) { _checkpoint = std::move(checkpoint); }

  // Nothing when the URL may not be loaded, when it cannot be reached, and past the limits. A
  // server's answer is a resource whatever its status.
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose);
  // Why the last load gave nothing.
  const std::string& failure() const { return _failure; }
  // Whether the status, where there is one, says that the data is what was asked for.
  static bool hasUsableStatus(const XQueryResource& resource);

  // With `usingCache` the same handle for the same URL and purpose as long as this loader lives.
  Ref<NSURLHandle> URLHandle(const Ref<NSURL>& URL, XQueryLoadPurpose purpose, bool usingCache);
  // The next handle is another one.
  void forget(const Ref<NSURL>& URL, XQueryLoadPurpose purpose);

 protected:
  explicit NSURLLoader(XQueryLoading loading);
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<XQueryResource> loadAllowed(const NSURL& URL, XQueryLoadPurpose purpose);
  std::optional<XQueryResource> loadFromHost(const NSURL& URL, XQueryLoadPurpose purpose);
  std::optional<XQueryResource> loadFile(const NSURL& URL);
  std::optional<XQueryResource> loadFromServer(const NSURL& URL);
  bool mayFollow(const std::string& redirectURL);

  XQueryLoading _loading;
  std::function<void()> _checkpoint = lookAtWork;
  std::string _failure;
  NSURLTable<Ref<NSURLHandle>> _handles[4];  // by purpose
};

}  // namespace xquery
