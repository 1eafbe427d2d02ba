// Compile a query once, evaluate it as often as you like.
//
//   auto query = XQuery::xqueryWithSource("//book[price > 10]/title");
//   if (auto errors = query->parseErrors()) ...              // an NSArray of XQueryError
//   auto context = XQueryContext::xqueryContext();
//   Ref<XQueryError> error;
//   auto items = context->evaluateXQuery(*query, {}, document, &error);
//   if (!items) ...                                           // error->description()
//
// A query is immutable and may be evaluated by several threads at once, each with a context of its
// own. A context is for one thread at a time. Compilations are serialised by one lock.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <string_view>

#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class XQueryInternal;
class XQueryContextInternal;
class XQueryContext;

// Lexical variable name (prefix:local, without the dollar sign) to value: an item or an NSArray of
// items. The prefix is resolved in the query's prolog; no prefix means no namespace.
using XQueryConstants = std::map<std::string, Value>;

// A compiled query. Errors found while compiling are kept in it.
class XQUERY_EXPORT XQuery : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Query; }

  // Never null: a query that fails to compile carries its errors.
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(const Ref<NSString>& source);
  // UTF-8 text; text that is not well-formed UTF-8 is a compile error (3, no line).
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(std::string_view source);

  // A new array of XQueryError in the order found, or null when the query compiled.
  Ref<NSArray> parseErrors() const;

  XQueryInternal& _internal() const { return *_private; }

 protected:
  explicit XQuery(std::unique_ptr<XQueryInternal> internal);
  ~XQuery() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::unique_ptr<XQueryInternal> _private;
};

// What a host may implement to hear fn:trace.
class XQUERY_EXPORT XQueryClient {
 public:
  virtual ~XQueryClient() = default;
  // `value` is what was traced, in any of the value shapes but null; `label` is a string.
  virtual void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                                      XQueryContext& context) = 0;
};

// The object against which queries are evaluated. It keeps, from one evaluation to the next, its
// client, its namespaces, the current date-time, its last error and its focus.
class XQUERY_EXPORT XQueryContext : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Context; }

  [[nodiscard]] static Ref<XQueryContext> xqueryContext();
  // Prefix to URI; consulted for names that could not be resolved when the query was compiled.
  [[nodiscard]] static Ref<XQueryContext> xqueryContextWithNamespaces(
      const std::map<std::string, std::string>& namespaces);

  // Accepts its argument and does nothing.
  void addXQueryProlog(const Value& prolog);

  // Evaluates and answers an array of items: nodes of the input tree, new nodes, atomic values. The
  // empty sequence is an empty array. Null on error, with `*error` set when `error` is not null.
  // A null or NSNull context item leaves the context item of an earlier evaluation in force.
  [[nodiscard]] Ref<NSArray> evaluateXQuery(const XQuery& query, const XQueryConstants& constants,
                                            const Value& contextItem,
                                            Ref<XQueryError>* error = nullptr);

  void contextSetClient(std::shared_ptr<XQueryClient> client);
  std::shared_ptr<XQueryClient> contextClient() const;
  // Accepts its arguments and does nothing.
  void contextAddClientSelector(std::string_view selector, std::string_view forName);

  void _traceValue(const Value& value, const Ref<NSString>& forLabel);
  XQueryContextInternal& _internal() const { return *_private; }

 protected:
  XQueryContext();
  ~XQueryContext() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  Ref<NSArray> shapedResult(const Value& result, Ref<XQueryError>* error);
  std::unique_ptr<XQueryContextInternal> _private;
};

// --- looking at result items ---------------------------------------------------------------------

// The item's type as a query would write it: "xs:integer", "xdt:untypedAtomic", "element()",
// "attribute()", "text()", "comment()", "processing-instruction()", "document-node()",
// "namespace()", or "item()" for an item without a type.
XQUERY_EXPORT std::string XQueryItemTypeName(const NSObject& item);
// The item's string value (a node's text, an atomic value's canonical form), as UTF-8.
XQUERY_EXPORT std::string XQueryItemStringValue(const NSObject& item);
// An xdt:untypedAtomic value, as the command line binds its variables. Null when the text is not
// UTF-8.
[[nodiscard]] XQUERY_EXPORT Value XQueryUntypedAtomic(std::string_view utf8);

}  // namespace xquery
