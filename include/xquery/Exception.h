// How a run-time failure travels inside the engine. A host meets it in one place only: where its
// own client or loader, called by an evaluation, compiles or evaluates another query, and a limit
// of the evaluation around it is reached meanwhile. Clients let it pass; who stands between two
// languages, in one of which it cannot, keeps it and throws it again on the way back.
#pragma once

#include "xquery/Object.h"
#include "xquery/String.h"

#include <string>
#include <utility>

namespace xquery {

// The one exception type. A run-time error has the name "XQueryError" and the error's description
// as its reason.
class XQUERY_EXPORT NSException {
 public:
  NSException(std::string name, Ref<NSString> reason)
      : _name(std::move(name)), _reason(std::move(reason)) {}
  const std::string& name() const { return _name; }
  const Ref<NSString>& reason() const { return _reason; }

 private:
  std::string _name;
  Ref<NSString> _reason;
};

}  // namespace xquery
