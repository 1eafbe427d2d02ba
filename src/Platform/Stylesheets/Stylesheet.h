// Stylesheets applied to a document with a loader that is there already.
#pragma once

#include "Platform/Loading/NSURLLoader.h"
#include "xquery/XMLNode.h"

#include <string>

namespace xquery {

// As the members of the document. Relative references of the stylesheet are resolved against the
// base URI, which may be empty. `failure` says why there is no result.
Value XMLResultOfStylesheet(const NSXMLDocument& document, const NSString& stylesheet,
                            const std::string& baseURI,
                            const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                            std::string& failure);
Value XMLResultOfStylesheetAtURL(const NSXMLDocument& document, const NSURL& URL,
                                 const NSXMLDocument::XSLTArguments& arguments, NSURLLoader& loader,
                                 std::string& failure);

}  // namespace xquery
