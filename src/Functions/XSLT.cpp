#include "Functions/XSLT.h"

#include "Context/XQueryContextInternal.h"
#include "Functions/URI.h"
#include "Platform/Base/HostFailure.h"
#include "Platform/Stylesheets/Stylesheet.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {
namespace {

// Null for other arguments than a document and something else.
const NSXMLDocument* documentOf(const Value* arguments, size_t count) {
  return count == 2 ? dyn_cast<NSXMLDocument>(arguments[0].get()) : nullptr;
}

StylesheetMisses tellingClient(XQueryContext& context) {
  return [&context](const NSURL& URL, const std::string& reason) {
    const std::shared_ptr<XQueryClient> client = context.contextClient();
    if (!client) return;
    const XQueryMissingDocument missing{withoutCredentials(URL.absoluteString()->utf8()), reason};
    passingOnHostFailures([&] { client->XQueryClientMissesDocument(missing, context); });
  };
}

}  // namespace

// What could not be loaded is told to the client, and nothing else of why a stylesheet gives no
// result.

Value ext_xslt(const Value* arguments, size_t count, XQueryContext& context) {
  const NSXMLDocument* document = documentOf(arguments, count);
  if (!document) return Value();
  const Value stylesheet = XQueryPromoteToString(arguments[1], context);
  const XQueryProlog* prolog = _internal(context).activeProlog();
  const Ref<NSURL> base = prolog ? prolog->locationBase() : Ref<NSURL>();
  // The host may set other settings while its loader is called.
  const Ref<NSURLLoader> loader = &_internal(context).loader();
  std::string ignored;
  return XMLResultOfStylesheet(*document, *cast<NSString>(stylesheet.get()),
                               base ? base->absoluteString()->utf8() : "", {}, *loader, ignored,
                               tellingClient(context));
}

Value ext_xslt_uri(const Value* arguments, size_t count, XQueryContext& context) {
  const NSXMLDocument* document = documentOf(arguments, count);
  if (!document) return Value();
  const Ref<NSString> reference = cast<NSString>(XQueryPromoteToString(arguments[1], context));
  if (reference->length() == 0) return Value();
  const Ref<NSURL> URL = XQueryURLInContext(reference, context);
  if (!URL) return Value();
  const Ref<NSURLLoader> loader = &_internal(context).loader();
  std::string ignored;
  return XMLResultOfStylesheetAtURL(*document, *URL, {}, *loader, ignored, tellingClient(context));
}

}  // namespace xquery
