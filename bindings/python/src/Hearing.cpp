// Compiled as the library is, without run-time type information: a class that is derived from one
// of the library's needs that of its base otherwise, which is nowhere.
#include "Hearing.h"

#include <utility>

namespace xquery::python {
namespace {

class Client : public XQueryClient {
 public:
  Client(TraceHearing trace, MissingHearing missing)
      : _trace(std::move(trace)), _missing(std::move(missing)) {}

  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext& context) override {
    if (_trace) {
      _trace(value, label);
    } else {
      XQueryClient::XQueryClientTraceValue(value, label, context);
    }
  }

  void XQueryClientMissesDocument(const XQueryMissingDocument& document, XQueryContext&) override {
    _missing(document);
  }

 private:
  TraceHearing _trace;
  MissingHearing _missing;
};

}  // namespace

std::shared_ptr<XQueryClient> clientHearing(TraceHearing trace, MissingHearing missing) {
  return std::make_shared<Client>(std::move(trace), std::move(missing));
}

}  // namespace xquery::python
