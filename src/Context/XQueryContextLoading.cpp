// The documents and raw bodies of one context.
#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Platform/Base/CountedBytes.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Text/ASCII.h"
#include "xquery/XMLNode.h"

#include <algorithm>

namespace xquery {

namespace {

constexpr uint32_t XMLOptions = NSXMLNodePreserveEmptyElements | NSXMLNodePreserveCDATA;
constexpr uint32_t HTMLOptions = XMLOptions | NSXMLDocumentTidyHTML;
static_assert(XMLOptions == 0x1000006 && HTMLOptions == 0x1000206);

// What fetching and parsing take.
constexpr size_t stackForLoading = size_t{80} * 1024;
static_assert(stackForLoading <= XQueryMostLibraryStack);

// What is kept of failures from one evaluation to the next: some ten thousand URLs of usual length.
constexpr size_t mostFailureBytes = size_t{4} << 20;

size_t bytesOf(const NSURL& URL) {
  constexpr size_t besidesText = 256;
  return besidesText + URL.absoluteString()->length();
}

bool isHTML(const XQueryResource& resource, const NSURL& URL) {
  if (resource.MIMEType && lowerCase(*resource.MIMEType) == "text/html") return true;
  const std::string whole = lowerCase(URL.relativePath());
  std::string_view path = whole;
  // What is packed is called after what is in it.
  for (const std::string_view ending : {".gz", ".xz", ".zst", ".bz2"}) {
    if (path.ends_with(ending)) path.remove_suffix(ending.size());
  }
  return path.ends_with(".html") || path.ends_with(".htm");
}

std::string reasonAndPlace(const NSXMLParseError& error) {
  if (error.line == 0) return error.message;
  return "line " + std::to_string(error.line) + ", column " + std::to_string(error.column) + ": " +
         error.message;
}

}  // namespace

void XQueryContextInternal::setLoading(const XQueryLoading& loading) {
  _loader = NSURLLoader::loaderWithLoading(loading);
}

Value XQueryContextInternal::XQueryDocumentForURL(const Ref<NSURL>& URL) {
  if (const auto found = _documentCache.find(URL); found != _documentCache.end()) {
    return found->second;
  }
  XQueryCheckStackFor(*this, stackForLoading);
  std::string reason;
  const Ref<NSXMLDocument> document = loadDocument(*URL, reason);
  // A document that a limit kept from being made is not missing.
  lookAtWork();
  const Value result = document ? Value(document) : Value(NSNull::null());
  _documentCache.insert_or_assign(URL, result);
  if (document) return result;
  _failureBytes += bytesOf(*URL);
  tellOfMissingDocument(*URL, std::move(reason));
  return result;
}

Ref<NSXMLDocument> XQueryContextInternal::loadDocument(const NSURL& URL, std::string& reason) {
  // The host may set other settings while its loader is called.
  const Ref<NSURLLoader> loader = _loader;
  const auto resource = loader->load(URL, XQueryLoadPurpose::Document);
  if (!resource) {
    reason = loader->failure();
    return nullptr;
  }
  CountedBytes counted;
  counted.add(resource->data.size());
  if (!NSURLLoader::hasUsableStatus(*resource)) {
    reason = "status " + std::to_string(*resource->statusCode);
    return nullptr;
  }
  const uint32_t options = isHTML(*resource, URL) ? HTMLOptions : XMLOptions;
  NSXMLParseError error;
  const auto document =
      documentWithBoundedData(resource->data, options, loader->loading().limits.mostBytes, error);
  if (document) {
    document->setURI(URL.absoluteString());
  } else {
    reason = reasonAndPlace(error);
  }
  return document;
}

void XQueryContextInternal::tellOfMissingDocument(const NSURL& URL, std::string reason) {
  const std::shared_ptr<XQueryClient> client = _client;
  if (!client) return;
  const XQueryMissingDocument document{withoutCredentials(URL.absoluteString()->utf8()),
                                       std::move(reason)};
  passingOnHostFailures([&] { client->XQueryClientMissesDocument(document, _owner); });
}

void XQueryContextInternal::forgetManyFailures() {
  if (_failureBytes <= mostFailureBytes) return;
  std::erase_if(_documentCache, [](const auto& entry) { return entry.second == NSNull::null(); });
  _documentCache.rehash(0);
  _failureBytes = 0;
}

Ref<NSData> XQueryContextInternal::URLBody(const Ref<NSURL>& URL) {
  // The documents are looked through here, not the handles: a handle is taken anew for each call,
  // and it is the loader that gives the same one again.
  if (_documentCache.contains(URL)) return {};
  XQueryCheckStackFor(*this, stackForLoading);
  const Ref<NSURLLoader> loader = _loader;
  const auto handle = loader->URLHandle(URL, XQueryLoadPurpose::Body, true);
  Ref<NSData> data = handle->resourceData(*loader);
  // A handle that holds nothing would be tried again.
  if (data) {
    _URLCache.insert_or_assign(URL, handle);
  } else {
    loader->forget(URL, XQueryLoadPurpose::Body);
  }
  return data;
}

}  // namespace xquery
