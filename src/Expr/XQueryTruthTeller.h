// An expression of which it can be told whether it is true without making a value.
#pragma once

#include <optional>

namespace xquery {

class XQueryContext;

class XQueryTruthTeller {
 public:
  // The effective boolean value; nothing where it takes evaluating the expression to tell. Throws
  // where a limit of the evaluation is reached.
  virtual std::optional<bool> truth(const XQueryContext& context) const = 0;

 protected:
  ~XQueryTruthTeller() = default;
};

}  // namespace xquery
