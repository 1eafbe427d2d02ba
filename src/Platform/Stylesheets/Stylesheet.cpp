#include "Platform/Stylesheets/Stylesheet.h"

#include "Platform/Base/CountedBytes.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Stylesheets/LibXSLT.h"
#include "xquery/Error.h"
#include "xquery/Loading.h"

#include <new>
#include <optional>
#include <set>

namespace xquery {

namespace {

// White space in a stylesheet and in what it reads is the stylesheet's own affair.
constexpr uint32_t options = NSXMLNodePreserveWhitespace;

// What a reference to the stylesheet itself resolves to where it has no other URL.
constexpr const char* noURL = "stylesheet:";

// Whether an answer of a server is what was asked for; `reason` says why not.
bool isUsable(const std::optional<XQueryResource>& resource, const NSURLLoader& loader,
              std::string& reason) {
  if (!resource) {
    reason = loader.failure();
  } else if (!NSURLLoader::hasUsableStatus(*resource)) {
    reason = "status " + std::to_string(*resource->statusCode);
  }
  return reason.empty() && resource;
}

// Loads for one transformation.
class Loads {
 public:
  Loads(NSURLLoader& loader, const StylesheetMisses& misses) : _loader(loader), _misses(misses) {}

  Ref<NSXMLDocument> load(const NSURL& URL, XQueryLoadPurpose purpose, std::string& failure) {
    std::string reason;
    const auto resource = _loader.load(URL, purpose);
    if (!isUsable(resource, _loader, reason)) {
      failure = "cannot load " + withoutCredentials(URL.absoluteString()->utf8());
      tell(URL, reason);
      return nullptr;
    }
    CountedBytes counted;
    counted.add(resource->data.size());
    NSXMLParseError error;
    const uint64_t mostBytes = _loader.loading().limits.mostBytes;
    const auto document = documentWithBoundedData(resource->data, options, mostBytes, error);
    // A document that a limit kept from being made is not missing.
    lookAtWork();
    if (document) return document;
    const std::string line = "line " + std::to_string(error.line);
    failure = withoutCredentials(URL.absoluteString()->utf8()) + ", " + line + ": " + error.message;
    tell(URL, error.line == 0
                  ? error.message
                  : line + ", column " + std::to_string(error.column) + ": " + error.message);
    return nullptr;
  }

 private:
  void tell(const NSURL& URL, const std::string& reason) {
    if (_misses && _told.insert(URL.absoluteString()->utf8()).second) _misses(URL, reason);
  }

  NSURLLoader& _loader;
  const StylesheetMisses& _misses;
  std::set<std::string> _told;
};

Value apply(const NSXMLDocument& document, const NSXMLDocument& stylesheet,
            const std::string& stylesheetURL, const NSXMLDocument::XSLTArguments& arguments,
            Loads& loads, std::string& failure) {
  const std::string ownURL = stylesheetURL.empty() ? noURL : stylesheetURL;
  const auto loadNamed = [&](const std::string& name, bool isStylesheet) {
    if (name == ownURL && !isStylesheet) {
      return Ref<NSXMLDocument>(const_cast<NSXMLDocument*>(&stylesheet));
    }
    const auto URL = NSURL::URLWithString(NSString::stringWithUTF8Replacing(name));
    if (!URL) return Ref<NSXMLDocument>();
    std::string ignored;
    const auto purpose = isStylesheet ? XQueryLoadPurpose::Stylesheet : XQueryLoadPurpose::Document;
    return loads.load(*URL, purpose, ignored);
  };
  const Ref<NSString> documentURI = document.documentURI();
  return transformWithLibXSLT(
      {document, documentURI ? documentURI->utf8() : "", stylesheet, ownURL, arguments, loadNamed},
      failure);
}

// For a member: the value, or an error that says why there is none.
template <class Make>
Value valueOrError(Make make, const XQueryLoading& loading, Ref<NSError>* error) {
  std::string failure;
  Value value;
  try {
    value = make(*NSURLLoader::loaderWithLoading(loading), failure);
  } catch (const HostFailure& hostFailure) {
    hostFailure.giveBack();
  } catch (const std::bad_alloc&) {
    failure = "out of memory";
  }
  if (error) *error = value ? nullptr : NSError::errorWithDomain("XSLT", 1, failure);
  return value;
}

}  // namespace

Value XMLResultOfStylesheet(const NSXMLDocument& document, const NSString& stylesheet,
                            const std::string& baseURI,
                            const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                            std::string& failure, const StylesheetMisses& misses) {
  NSXMLParseError error;
  const auto parsed = NSXMLDocument::documentWithData(stylesheet.utf8(), options, &error);
  if (!parsed) {
    failure = "line " + std::to_string(error.line) + ": " + error.message;
    return nullptr;
  }
  Loads loads(loader, misses);
  return apply(document, *parsed, baseURI, arguments, loads, failure);
}

Value XMLResultOfStylesheetAtURL(const NSXMLDocument& document, const NSURL& URL,
                                 const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                                 std::string& failure, const StylesheetMisses& misses) {
  Loads loads(loader, misses);
  const auto stylesheet = loads.load(URL, XQueryLoadPurpose::Stylesheet, failure);
  if (!stylesheet) return nullptr;
  return apply(document, *stylesheet, URL.absoluteString()->utf8(), arguments, loads, failure);
}

Value NSXMLDocument::objectByApplyingXSLTString(const Ref<NSString>& stylesheet,
                                                const XSLTArguments& arguments,
                                                Ref<NSError>* error) const {
  return objectByApplyingXSLTString(stylesheet, arguments, XQueryLoading(), error);
}

Value NSXMLDocument::objectByApplyingXSLTString(const Ref<NSString>& stylesheet,
                                                const XSLTArguments& arguments,
                                                const XQueryLoading& loading,
                                                Ref<NSError>* error) const {
  const auto make = [&](NSURLLoader& loader, std::string& failure) {
    return XMLResultOfStylesheet(*this, *stylesheet, "", arguments, loader, failure);
  };
  return valueOrError(make, loading, error);
}

Value NSXMLDocument::objectByApplyingXSLTAtURL(const Ref<NSURL>& URL,
                                               const XSLTArguments& arguments,
                                               Ref<NSError>* error) const {
  return objectByApplyingXSLTAtURL(URL, arguments, XQueryLoading(), error);
}

Value NSXMLDocument::objectByApplyingXSLTAtURL(const Ref<NSURL>& URL,
                                               const XSLTArguments& arguments,
                                               const XQueryLoading& loading,
                                               Ref<NSError>* error) const {
  const auto make = [&](NSURLLoader& loader, std::string& failure) {
    return XMLResultOfStylesheetAtURL(*this, *URL, arguments, loader, failure);
  };
  return valueOrError(make, loading, error);
}

}  // namespace xquery
