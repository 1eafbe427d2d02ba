// What may be loaded, from where, and by whom.
#include "C/Callbacks.h"
#include "C/Options.h"
#include "C/Texts.h"
#include "xquery/URL.h"

#include <string>

using namespace xquery;
using namespace xquery::capi;

// Lives during the call of a loader.
struct xq_resource : Handle<Tag::Resource> {
  XQueryResource resource;
};

namespace {

// Changes the options by a text; the change is made on a copy, since it may fail half way.
template <class Change>
xq_status changePolicy(xq_options* options, const char* text, size_t length, Change change) {
  const GivenText given(text, length);
  if (!given.isGood()) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    if (!given.string()) return XQ_INPUT;
    XQueryLoadingPolicy policy = changed.loading.policy;
    change(policy, given.view());
    changed.loading.policy = std::move(policy);
    return XQ_OK;
  });
}

xq_status setModuleURL(xq_options& options, const Ref<NSURL>& URL) {
  if (!URL || URL->scheme().empty()) return XQ_INPUT;
  options.loading.moduleURL = URL->absoluteString()->utf8();
  return XQ_OK;
}

class Loader : public XQueryLoader {
 public:
  Loader(xq_load fetch, HostData data) : _fetch(fetch), _data(std::move(data)) {}

  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose purpose) override {
    const std::string text = URL.absoluteString()->utf8();
    xq_resource filled;
    switch (
        _fetch(_data.get(), text.c_str(), text.size(), static_cast<xq_purpose>(purpose), &filled)) {
      case XQ_OK:
        return std::move(filled.resource);
      case XQ_END:
        return std::nullopt;
      default:
        throw HostFailed();
    }
  }

 private:
  const xq_load _fetch;
  const HostData _data;
};

static_assert(XQ_PURPOSE_DOCUMENT == static_cast<int>(XQueryLoadPurpose::Document));
static_assert(XQ_PURPOSE_MODULE == static_cast<int>(XQueryLoadPurpose::Module));
static_assert(XQ_PURPOSE_BODY == static_cast<int>(XQueryLoadPurpose::Body));
static_assert(XQ_PURPOSE_STYLESHEET == static_cast<int>(XQueryLoadPurpose::Stylesheet));

static_assert(XQ_ADDRESSES_LOOPBACK == static_cast<int>(XQueryAddressKind::Loopback));
static_assert(XQ_ADDRESSES_LINK_LOCAL == static_cast<int>(XQueryAddressKind::LinkLocal));
static_assert(XQ_ADDRESSES_PRIVATE == static_cast<int>(XQueryAddressKind::Private));
static_assert(XQ_ADDRESSES_SPECIAL == static_cast<int>(XQueryAddressKind::Special));

}  // namespace

// --- the policy ----------------------------------------------------------------------------------

xq_status xq_options_deny_all(xq_options* options) {
  return changeOptions(options, [](xq_options& changed) {
    changed.loading.policy = XQueryLoadingPolicy::denyAll();
    return XQ_OK;
  });
}

xq_status xq_options_allow_all(xq_options* options) {
  return changeOptions(options, [](xq_options& changed) {
    changed.loading.policy = XQueryLoadingPolicy::allowAll();
    return XQ_OK;
  });
}

xq_status xq_options_allow_scheme(xq_options* options, const char* scheme, size_t length) {
  return changePolicy(
      options, scheme, length,
      [](XQueryLoadingPolicy& policy, std::string_view text) { policy.allowScheme(text); });
}

xq_status xq_options_allow_files_below(xq_options* options, const char* folder, size_t length) {
  const GivenText path(folder, length);
  if (!path.isPath()) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    XQueryLoadingPolicy policy = changed.loading.policy;
    policy.allowFilesBelow(std::string(path.view()));
    changed.loading.policy = std::move(policy);
    return XQ_OK;
  });
}

xq_status xq_options_allow_urls_below(xq_options* options, const char* url, size_t length) {
  return changePolicy(options, url, length, [](XQueryLoadingPolicy& policy, std::string_view text) {
    policy.allowURLsBelow(text);
  });
}

xq_status xq_options_allow_host(xq_options* options, const char* name, size_t length) {
  return changePolicy(
      options, name, length,
      [](XQueryLoadingPolicy& policy, std::string_view text) { policy.allowHost(text); });
}

xq_status xq_options_forbid_addresses(xq_options* options, xq_addresses addresses) {
  if (addresses < XQ_ADDRESSES_LOOPBACK || addresses > XQ_ADDRESSES_LOCAL) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    XQueryLoadingPolicy& policy = changed.loading.policy;
    if (addresses == XQ_ADDRESSES_LOCAL) {
      policy.forbidLocalAddresses();
    } else {
      policy.forbidAddresses(static_cast<XQueryAddressKind>(addresses));
    }
    return XQ_OK;
  });
}

xq_status xq_options_allows_url(const xq_options* options, const char* url, size_t length,
                                int* is_allowed) {
  if (!is_allowed) return XQ_USAGE;
  *is_allowed = 0;
  const GivenText text(url, length);
  if (!areGood(options) || !text.isGood()) return XQ_USAGE;
  return guarded([&]() -> xq_status {
    const Ref<NSString> string = text.string();
    const Ref<NSURL> URL = string ? NSURL::URLWithString(string) : nullptr;
    if (!URL) return XQ_INPUT;
    *is_allowed = options->loading.policy.allowsURL(*URL);
    return XQ_OK;
  });
}

// --- how much, and relative to what --------------------------------------------------------------

xq_status xq_options_set_loading_limit(xq_options* options, xq_loading_limit limit,
                                       uint64_t value) {
  return changeOptions(options, [&](xq_options& changed) -> xq_status {
    XQueryLoadingLimits& limits = changed.loading.limits;
    const auto small = static_cast<int32_t>(std::min<uint64_t>(value, INT32_MAX));
    switch (limit) {
      case XQ_LOADING_CONNECT_MILLISECONDS:
        limits.connectTimeout = std::chrono::milliseconds(small);
        return XQ_OK;
      case XQ_LOADING_TOTAL_MILLISECONDS:
        limits.totalTimeout = std::chrono::milliseconds(small);
        return XQ_OK;
      case XQ_LOADING_REDIRECTS:
        limits.mostRedirects = small;
        return XQ_OK;
      case XQ_LOADING_BYTES:
        limits.mostBytes = value;
        return XQ_OK;
      case XQ_LOADING_MODULES:
        limits.mostModules = static_cast<uint32_t>(small);
        return XQ_OK;
      default:
        return XQ_USAGE;
    }
  });
}

xq_status xq_options_set_base_url(xq_options* options, const char* url, size_t length) {
  const GivenText text(url, length);
  if (!text.isGood()) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) -> xq_status {
    const Ref<NSString> string = text.string();
    return string ? setModuleURL(changed, NSURL::URLWithString(string)) : XQ_INPUT;
  });
}

xq_status xq_options_set_base_path(xq_options* options, const char* path, size_t length) {
  const GivenText text(path, length);
  if (!text.isPath()) return XQ_USAGE;
  return changeOptions(options, [&](xq_options& changed) {
    return setModuleURL(changed, NSURL::fileURLWithPath(text.view()));
  });
}

// --- the host's own loader -----------------------------------------------------------------------

xq_status xq_options_set_loader(xq_options* options, xq_load load, void* data, xq_destroy destroy) {
  HostData kept(data, destroy);
  return changeOptions(options, [&](xq_options& changed) {
    changed.loading.loader = load ? std::make_shared<Loader>(load, std::move(kept)) : nullptr;
    return XQ_OK;
  });
}

namespace {

template <class Change>
xq_status changeResource(xq_resource* resource, const char* text, size_t length, Change change) {
  const GivenText given(text, length);
  if (!areGood(resource) || !given.isGood()) return XQ_USAGE;
  return guarded([&] {
    change(resource->resource, given.view());
    return XQ_OK;
  });
}

}  // namespace

xq_status xq_resource_set_data(xq_resource* resource, const char* bytes, size_t length) {
  return changeResource(resource, bytes, length, [](XQueryResource& filled, std::string_view text) {
    filled.data = std::string(text);
  });
}

xq_status xq_resource_add_data(xq_resource* resource, const char* bytes, size_t length) {
  return changeResource(resource, bytes, length, [](XQueryResource& filled, std::string_view text) {
    filled.data.append(text);
  });
}

xq_status xq_resource_set_status(xq_resource* resource, int status) {
  if (!areGood(resource)) return XQ_USAGE;
  resource->resource.statusCode = status;
  return XQ_OK;
}

xq_status xq_resource_set_media_type(xq_resource* resource, const char* type, size_t length) {
  return changeResource(resource, type, length, [](XQueryResource& filled, std::string_view text) {
    filled.MIMEType = std::string(text);
  });
}
