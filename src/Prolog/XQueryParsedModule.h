// What a parse yields: the prolog items in source order, the body and the version; and how a module
// that another one imports gets parsed.
#pragma once

#include "Expr/XQueryExpr.h"
#include "Prolog/XQueryPrologItems.h"
#include "Prolog/XQueryRemark.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <utility>
#include <vector>

namespace xquery {

class XQueryParsedModule : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::ParsedModule; }

  // The body is null for a library module, the version for a query without version declaration.
  [[nodiscard]] static Ref<XQueryParsedModule> moduleWithPrologItems(
      std::vector<Ref<XQueryPrologItem>> prologItems, Ref<XQueryExpr> body, Ref<NSString> version) {
    return make<XQueryParsedModule>(std::move(prologItems), std::move(body), std::move(version));
  }

  // In a library module the first item is the module namespace.
  const std::vector<Ref<XQueryPrologItem>>& prologItems() const { return _prologItems; }
  const Ref<XQueryExpr>& body() const { return _body; }
  const Ref<NSString>& version() const { return _version; }
  // In the order in which they were read.
  const XQueryRemarks& remarks() const { return _remarks; }
  void setRemarks(XQueryRemarks remarks) { _remarks = std::move(remarks); }

 protected:
  XQueryParsedModule(std::vector<Ref<XQueryPrologItem>> prologItems, Ref<XQueryExpr> body,
                     Ref<NSString> version)
      : NSCounted(Kind::ParsedModule),
        _prologItems(std::move(prologItems)),
        _body(std::move(body)),
        _version(std::move(version)) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::vector<Ref<XQueryPrologItem>> _prologItems;
  Ref<XQueryExpr> _body;
  Ref<NSString> _version;
  XQueryRemarks _remarks;
};

struct XQueryParse {
  Ref<XQueryParsedModule> module;  // null when parsing failed, and for a text that says nothing
  std::vector<Ref<XQueryError>> errors;
};

// Parses the text behind a URL, and adds the places of its expressions to the others. The parser is
// in a room above this one and answers there.
[[nodiscard]] XQueryParse XQueryParseModule(const Ref<NSString>& source, const Ref<NSString>& URL,
                                            const Ref<XQueryPlaces>& places);

}  // namespace xquery
