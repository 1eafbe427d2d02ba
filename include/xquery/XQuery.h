// Compile a query once, evaluate it as often as you like.
//
// A query is immutable and may be evaluated by several threads at once, each with a context of its
// own. A context is for one thread at a time. Any number of threads may compile at once.
//
// Failures are handed back as XQueryError objects; the engine throws nothing at its caller. What a
// host's own client throws passes through, and so does what ends an evaluation at one of its limits
// while the client compiles or evaluates another query in it: clients let that pass too.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Error.h"
#include "xquery/Limits.h"
#include "xquery/Loading.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class XQueryInternal;
class XQueryContextInternal;
class XQueryContext;
struct XQueryStreamFailure;
struct XQueryStreamInput;

// Lexical variable name (UTF-8, prefix:local, without the dollar sign) to value: an item, an
// NSArray of items, or the NSNull. The prefix is resolved in the query's prolog; no prefix means no
// namespace. A name that does not resolve and a null value are passed over. Values are used as
// given: a plain NSString, for example, is an xdt:untypedAtomic value.
using XQueryVariables = std::map<std::string, Value>;

// Whether a compiled query is planned, so that it is evaluated with less work, or evaluated step by
// step as it is written. Nobody can tell the two apart but by the time they take; the plain way is
// there to compare with.
enum class XQueryWay : uint8_t {
  Planned,  // unless the environment variable XQUERY_PLAN is "0" when the query is compiled
  Plain,
  Explained,  // planned whatever the environment says; plan and warnings can be looked at
  Streamed,   // planned, to be evaluated record by record; where that cannot be done the query has
              // the compile error 0 "cannot be evaluated as a stream: " and the reason
  Profiled,   // as Planned, and each evaluation counts and times its expressions: see Profile.h
};

enum class XQueryPlanFormat : uint8_t {
  Text,  // a line for each expression, those that it consists of indented below it
  JSON,  // RFC 8259: an array of objects with "label", "line" (left out where there is none),
         // "role" (left out where there is none), "items", "deeds", "notes" and "parts"
  DOT,   // a graph, for the tools that draw such
};

// A compiled query. Errors found while compiling are kept in it.
//
//   auto query = XQuery::xqueryWithSource("//book[price > 10]/title");
//   if (auto errors = query->parseErrors()) {
//     for (const Value& error : errors->objects()) report(cast<XQueryError>(error)->description());
//   }
class XQUERY_EXPORT XQuery : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Query; }

  // Never null: a query that fails to compile carries its errors, and so does one without a source.
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(const Ref<NSString>& source);
  // UTF-8 text; text that is not well-formed UTF-8 is a compile error (3, no line).
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(std::string_view source);
  // Library modules are fetched while the query is compiled, from the locations that the imports
  // name. `loading` says how, and what relative locations are resolved against; without it any
  // file, http and https URL is read, and a location must be absolute. A module that cannot be had
  // is a compile error (47).
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(const Ref<NSString>& source,
                                                    const XQueryLoading& loading);
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(std::string_view source,
                                                    const XQueryLoading& loading);
  // The limits are those of the compilation alone, the fetching of modules included; the query that
  // reaches one has the compile error 0 with a message that begins with "limit: ". A ceiling counts
  // the compiled query and what compiling it takes.
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(const Ref<NSString>& source,
                                                    const XQueryLoading& loading,
                                                    const XQueryLimits& limits);
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(std::string_view source,
                                                    const XQueryLoading& loading,
                                                    const XQueryLimits& limits);
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(std::string_view source,
                                                    const XQueryLoading& loading,
                                                    const XQueryLimits& limits, XQueryWay way);
  [[nodiscard]] static Ref<XQuery> xqueryWithSource(const Ref<NSString>& source,
                                                    const XQueryLoading& loading,
                                                    const XQueryLimits& limits, XQueryWay way);

  // Null when the query compiled, else a new array of one XQueryError or more in the order found:
  // those of the parser, or, when it found none, those of the prolog and of names that do not
  // resolve. A module that was found but cannot be used has its own first error after the 47.
  Ref<NSArray> parseErrors() const;

  // How the query is evaluated: its expressions as they were written, with what is known of their
  // values, what each rule of the planner did with them, and where a rule saw its pattern and a
  // fact was missing. The texts are for people and may change. Null for a query that was not
  // compiled to be explained, and for one with errors.
  //
  //   auto query = XQuery::xqueryWithSource("count(//a[b = //c])", XQueryLoading(), XQueryLimits(),
  //                                         XQueryWay::Explained);
  //   if (auto plan = query->planDescription(XQueryPlanFormat::Text)) show(plan->utf8());
  Ref<NSString> planDescription(XQueryPlanFormat format) const;

 protected:
  explicit XQuery(std::unique_ptr<XQueryInternal> internal);
  ~XQuery() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  std::unique_ptr<XQueryInternal> _private;
  friend struct XQueryShell;
};

// A document that a query named and that is missing, malformed or forbidden; in UTF-8.
struct XQueryMissingDocument {
  std::string URL;     // resolved, without the user name and the password that it may hold
  std::string reason;  // for people: "No such file or directory", "not allowed", "status 404",
                       // "line 3, column 7: " and what is wrong there
};

// What a host may implement to hear fn:trace, and of documents that are missing. Without a client a
// trace is written to the log, one line of label and value, when the environment variable
// XQUERY_LOG is set, not empty and not "0".
//
//   class Tracer : public XQueryClient {
//     void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
//                                 XQueryContext&) override {
//       trace(label->utf8(), value);
//     }
//   };
//   context->contextSetClient(std::make_shared<Tracer>());
class XQUERY_EXPORT XQueryClient {
 public:
  virtual ~XQueryClient() = default;
  // `value` is what was traced, in any of the value shapes but null: the NSNull for the empty
  // sequence, an item, or an NSArray. Both live during the call; keep a Ref to hold them longer.
  // Called on the evaluating thread; evaluating against the same context from here is not allowed.
  // Unless overridden the trace is written to the log as it is without a client.
  virtual void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                                      XQueryContext& context);
  // A document could not be had, and fn:doc answers the empty sequence in place of an error. Called
  // once for each URL in the life of the context, and once more where the context has forgotten
  // that it is missing; on the evaluating thread, and with the same prohibition. Does nothing
  // unless overridden.
  virtual void XQueryClientMissesDocument(const XQueryMissingDocument& document,
                                          XQueryContext& context);
};

// The object against which queries are evaluated. It keeps, from one evaluation to the next:
//   - what the host gave it: client, namespaces, loading settings, limits
//   - the context item, which stays in force for an evaluation that is given none
//   - the clock: current-dateTime and its kin answer the moment when the context was first asked
//   - the documents that fn:doc loaded, and which URLs gave none: neither is fetched again, but
//     where such URLs come to more than 4 MiB all of them are forgotten between evaluations, and
//     between the records of a stream
//   - the base URIs recorded for constructed nodes, and its last error
//
// One context for many evaluations is right for one task over documents that do not change, such as
// a query asked of each file of a folder. A context of its own for each evaluation is right where
// evaluations must not learn of each other: the requests of a server, queries of different users,
// a document that may appear or change between two evaluations, a clock that should go on. Making
// one takes a microsecond, and the compiled query is shared all the same.
//
//   auto context = XQueryContext::xqueryContext();
//   Ref<XQueryError> error;
//   auto items = context->evaluateXQuery(*query, {{"limit", XQueryMakeInteger(10)}}, document,
//                                        &error);
//   if (const auto failure = XQueryFirstError(items, error)) {
//     report(failure->description()->utf8());
//   } else if (items) {
//     for (const Value& item : items->objects()) use(XQueryItemStringValue(*item));
//   }
class XQUERY_EXPORT XQueryContext : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Context; }

  [[nodiscard]] static Ref<XQueryContext> xqueryContext();
  // Prefix to URI, both UTF-8 (a pair that is not is passed over); consulted for names that could
  // not be resolved when the query was compiled. The empty prefix gives names without one their
  // namespace.
  [[nodiscard]] static Ref<XQueryContext> xqueryContextWithNamespaces(
      const std::map<std::string, std::string>& namespaces);

  // Accepts its argument and does nothing.
  void addXQueryProlog(const Value& prolog);

  // Evaluates and answers an array of items: nodes of the input tree, new nodes, atomic values. The
  // empty sequence is an empty array. The array and its items are the caller's to keep; a node
  // keeps its whole tree alive. When constructors recorded a base URI and the first item is an
  // element or a document made by this evaluation, that element is given an xml:base attribute
  // unless it has one. Nodes that were there before are not changed, so that other threads may read
  // them meanwhile: constructors take in copies of them.
  //
  // Null on error, and without an error when there is no value at all (an empty query, a library
  // module). A value may be an error too, such as what stands for the malformed `<!-- a -- b -->`:
  // as the first item of a result it is handed back as the error, behind others it stays among the
  // items, and the evaluation succeeds. XQueryFirstError finds either. `*error`, when `error` is
  // not null, is set to null first and on failure to the error: the first one of a
  // query that failed to compile, 16 "unresloved external variable - name" or "unresloved external
  // function - name", 0 and a text that begins with "limit: " when a limit of the context was
  // reached or the engine ran out of stack, memory or digits, or what an expression raised.
  //
  // A null or NSNull context item leaves the context item of an earlier evaluation in force.
  [[nodiscard]] Ref<NSArray> evaluateXQuery(const XQuery& query, const XQueryVariables& constants,
                                            const Value& contextItem,
                                            Ref<XQueryError>* error = nullptr);

  // Hears each item of the result of a stream, as soon as it is known; false ends the stream.
  // Called on the evaluating thread; evaluating against the same context from here is not allowed.
  using StreamReceiver = std::function<bool(const Value& item)>;
  // Evaluates a query that was compiled to be streamed, with the document as its context item, and
  // takes no more memory than the largest record does, however long the document is; values to be
  // told apart by distinct-values, and what the query keeps itself, apart. The items are those that
  // evaluateXQuery answers for the whole document, in their order. The limits are those of the
  // whole stream. The context item of an earlier evaluation stays in force for later ones.
  //
  // A record is gone when the next one is read: nodes that come from the document live during the
  // call alone. A host that still holds one of them, or a text of one, when the call returns ends
  // the stream with error 0 "a node of a stream is still referred to"; what it holds stays good.
  //
  //   auto query = XQuery::xqueryWithSource("/log/entry[@level = 'error']/text", XQueryLoading(),
  //                                         XQueryLimits(), XQueryWay::Streamed);
  //   XQueryStreamInput input{.path = "log.xml"};
  //   XQueryStreamFailure failure;
  //   const bool isComplete = context->evaluateStream(*query, {}, input, [&](const Value& item) {
  //     return write(XQueryItemStringValue(*item));
  //   }, failure);
  //
  // True when the document has been read to its end, or as far as it was of use: what decides or
  // completes the result ends the reading, and so does the receiver. False with `failure`
  // otherwise; items before the failure have been handed out. `failure` is made empty first.
  [[nodiscard]] bool evaluateStream(const XQuery& query, const XQueryVariables& constants,
                                    const XQueryStreamInput& input, const StreamReceiver& receive,
                                    XQueryStreamFailure& failure);

  // The context shares the client with the host; null takes it away.
  void contextSetClient(std::shared_ptr<XQueryClient> client);
  std::shared_ptr<XQueryClient> contextClient() const;

  // How documents, raw bodies and stylesheets are fetched from now on; at first any file, http and
  // https URL is. A document is fetched once in the life of a context, and one that could not be
  // had stays missing, whatever the settings are later, unless it was one of very many.
  void contextSetLoading(const XQueryLoading& loading);
  const XQueryLoading& contextLoading() const;
  // What each of the following evaluations may take; one that is under way keeps what was set when
  // it began.
  void contextSetLimits(XQueryLimits limits);
  const XQueryLimits& contextLimits() const;

  // Accepts its arguments and does nothing.
  void contextAddClientSelector(std::string_view selector, std::string_view forName);

  // Forgets what earlier evaluations left behind, as if the context were new: the context item, the
  // clock, documents and missing ones, the last error, the profile. Client, namespaces, loading
  // settings and limits stay. What it held is freed, but for what results of the host refer to; see
  // Memory.h for the memory itself. Answer: whether it did, which it does not while an evaluation
  // against the context is under way.
  bool contextReset();

 protected:
  XQueryContext();
  ~XQueryContext() override;
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  void beginEvaluation(const XQueryInternal& compiled);
  void endEvaluation();
  Value evaluateModule(const XQueryInternal& compiled, const XQueryVariables& constants,
                       const std::function<Value()>& body);
  Ref<NSArray> shapedResult(const Value& result, Ref<XQueryError>* error);
  std::unique_ptr<XQueryContextInternal> _private;
  friend struct XQueryContextShell;
};

// --- looking at the library ----------------------------------------------------------------------

// A function that every query may call without declaring it.
struct XQueryFunctionName {
  std::string namespaceURI;
  std::string localName;
  unsigned leastArguments;
  std::optional<unsigned> mostArguments;  // none: any number
};

// All of them, in no particular order: what an editor may offer.
[[nodiscard]] XQUERY_EXPORT std::vector<XQueryFunctionName> XQueryLibraryFunctions();

// --- looking at results --------------------------------------------------------------------------

// Whether a result failed: the error that its evaluation gave back or, when there is none, the
// first item that is an error. Null when there is neither, and for a result that is null as well.
[[nodiscard]] XQUERY_EXPORT Ref<NSError> XQueryFirstError(const Ref<NSArray>& items,
                                                          const Ref<XQueryError>& error = nullptr);

// The item's type as a query would write it: "xs:integer", "xdt:untypedAtomic", "element()",
// "attribute()", "text()", "comment()", "processing-instruction()", "document-node()",
// "namespace()", or "item()" for an item without a type, such as raw data or an error.
XQUERY_EXPORT std::string XQueryItemTypeName(const NSObject& item);
// The item's string value as UTF-8: a node's text, an atomic value's canonical form, the
// hexadecimal digits of raw data, an error's description.
XQUERY_EXPORT std::string XQueryItemStringValue(const NSObject& item);

}  // namespace xquery
