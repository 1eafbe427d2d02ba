#include "Platform/Stylesheets/Stylesheet.h"

#include "Platform/Base/CountedBytes.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Reading/XMLDocuments.h"
#include "Platform/Stylesheets/LibXSLT.h"
#include "xquery/Error.h"
#include "xquery/Loading.h"

#include <new>

namespace xquery {

namespace {

// White space in a stylesheet and in what it reads is the stylesheet's own affair.
constexpr uint32_t options = NSXMLNodePreserveWhitespace;

// What a reference to the stylesheet itself resolves to where it has no other URL.
constexpr const char* noURL = "stylesheet:";

Ref<NSXMLDocument> load(const NSURL& URL, XQueryLoadPurpose purpose, NSURLLoader& loader,
                        std::string& failure) {
  const auto resource = loader.load(URL, purpose);
  if (!resource || !NSURLLoader::hasUsableStatus(*resource)) {
    failure = "cannot load " + withoutCredentials(URL.absoluteString()->utf8());
    return nullptr;
  }
  CountedBytes counted;
  counted.add(resource->data.size());
  NSXMLParseError error;
  const uint64_t mostBytes = loader.loading().limits.mostBytes;
  const auto document = documentWithBoundedData(resource->data, options, mostBytes, error);
  if (!document) {
    failure = withoutCredentials(URL.absoluteString()->utf8()) + ", line " +
              std::to_string(error.line) + ": " + error.message;
  }
  return document;
}

Value apply(const NSXMLDocument& document, const NSXMLDocument& stylesheet,
            const std::string& stylesheetURL, const NSXMLDocument::XSLTArguments& arguments,
            NSURLLoader& loader, std::string& failure) {
  const std::string ownURL = stylesheetURL.empty() ? noURL : stylesheetURL;
  const auto loadNamed = [&](const std::string& name, bool isStylesheet) {
    if (name == ownURL && !isStylesheet) {
      return Ref<NSXMLDocument>(const_cast<NSXMLDocument*>(&stylesheet));
    }
    const auto URL = NSURL::URLWithString(NSString::stringWithUTF8Replacing(name));
    if (!URL) return Ref<NSXMLDocument>();
    std::string ignored;
    const auto purpose = isStylesheet ? XQueryLoadPurpose::Stylesheet : XQueryLoadPurpose::Document;
    return load(*URL, purpose, loader, ignored);
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
                            std::string& failure) {
  NSXMLParseError error;
  const auto parsed = NSXMLDocument::documentWithData(stylesheet.utf8(), options, &error);
  if (!parsed) {
    failure = "line " + std::to_string(error.line) + ": " + error.message;
    return nullptr;
  }
  return apply(document, *parsed, baseURI, arguments, loader, failure);
}

Value XMLResultOfStylesheetAtURL(const NSXMLDocument& document, const NSURL& URL,
                                 const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                                 std::string& failure) {
  const auto stylesheet = load(URL, XQueryLoadPurpose::Stylesheet, loader, failure);
  if (!stylesheet) return nullptr;
  return apply(document, *stylesheet, URL.absoluteString()->utf8(), arguments, loader, failure);
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
