// Whether the context item has a name: "name() = 'a'", "local-name(.) eq 'a'".
#pragma once

#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Operators/XQueryPlannedExpr.h"
#include "xquery/String.h"

#include <optional>

namespace xquery {

class XQueryNameComparison : public XQueryPlannedExpr, private XQueryNodeQuestion {
 public:
  enum class Name : uint8_t { Qualified, Local };

  [[nodiscard]] static Ref<XQueryNameComparison> exprWithPlain(Ref<XQueryExpr> plain, Name which,
                                                               Ref<NSString> text) {
    return make<XQueryNameComparison>(std::move(plain), which, std::move(text));
  }

  // One of the shared truth values for an element or an attribute; of any other item what the
  // expression itself answers.
  Value computeValue(XQueryContext& context) const override;
  const XQueryNodeQuestion* nodeQuestion() const override { return this; }

 protected:
  XQueryNameComparison(Ref<XQueryExpr> plain, Name which, Ref<NSString> text)
      : XQueryPlannedExpr(std::move(plain)), _which(which), _text(std::move(text)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::optional<bool> holdsFor(NSXMLNode* node, const XQueryContext& context) const override;

  const Name _which;
  const Ref<NSString> _text;
};

}  // namespace xquery
