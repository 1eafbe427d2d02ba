// What a client does unless a host says otherwise. Compiled with the run-time type information that
// the library does without: a host whose own compiler has it on derives from the class.
#include "Platform/Base/NSLog.h"
#include "Types/XQueryValues.h"
#include "xquery/XQuery.h"

namespace xquery {

void XQueryClient::XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                                          XQueryContext&) {
  if (!XQueryLogEnabled()) return;
  NSLog(XQueryDescription(label.get())->utf8() + " " + XQueryDescription(value.get())->utf8());
}

void XQueryClient::XQueryClientMissesDocument(const XQueryMissingDocument&, XQueryContext&) {}

}  // namespace xquery
