// Stylesheets applied to a document with a loader that is there already.
#pragma once

#include "Platform/Loading/NSURLLoader.h"
#include "xquery/XMLNode.h"

#include <functional>
#include <string>

namespace xquery {

// Hears of what a stylesheet, or what it names, could not be had from, and why; once for each URL
// of a transformation, on the thread that asked for it.
using StylesheetMisses = std::function<void(const NSURL& URL, const std::string& reason)>;

// As the members of the document. Relative references of the stylesheet are resolved against the
// base URI, which may be empty. `failure` says why there is no result; `misses` may be empty.
Value XMLResultOfStylesheet(const NSXMLDocument& document, const NSString& stylesheet,
                            const std::string& baseURI,
                            const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                            std::string& failure, const StylesheetMisses& misses = {});
Value XMLResultOfStylesheetAtURL(const NSXMLDocument& document, const NSURL& URL,
                                 const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                                 std::string& failure, const StylesheetMisses& misses = {});

}  // namespace xquery
