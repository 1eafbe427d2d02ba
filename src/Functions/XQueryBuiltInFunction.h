// The registry of built-in functions.
//
// It is keyed by name alone and knows nothing of argument counts: every procedure checks its own.
#pragma once

#include "Prolog/XQueryModules.h"
#include "Types/XQueryQName.h"
#include "xquery/Object.h"

#include <cstddef>
#include <span>
#include <string_view>

namespace xquery {

class XQueryContext;

// Evaluated arguments (a null pointer for none), their number, and the context. No argument is
// null, and none is an array of fewer than two elements. The answer is
//   a value         an item, an array (of any number of items) or NSNull
//   an XQueryError  a failure, which the call raises
//   null            wrong arguments: a wrong number of them, or of a kind that cannot be used
using XQueryProcedure = Value (*)(const Value* arguments, size_t count, XQueryContext& context);

class XQueryBuiltInFunction : public NSCounted {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::BuiltInFunction; }

  [[nodiscard]] static Ref<XQueryBuiltInFunction> builtInFunctionWithProc(XQueryProcedure proc);
  XQueryProcedure proc() const { return _proc; }
  // Whether the function answers equal values for the same arguments, fails alike, looks at nothing
  // else and does nothing else. Holds for calls with at least one argument: without any, some of
  // these functions take the context item.
  bool readsArgumentsOnly() const { return _readsArgumentsOnly; }
  // Whether a call asks the host for a document, which the host can tell.
  bool loadsDocuments() const;
  // Whether the function answers truth values and nothing else.
  bool answersTruth() const;

  // Null for a name that is not registered.
  static XQueryProcedure functionForQName(const Ref<XQueryQName>& qName);
  static const XQueryBuiltInFunction* entryForQName(const Ref<XQueryQName>& qName);

  struct Registration {
    XQueryNamespaceID namespaceID;
    std::string_view localName;
    XQueryProcedure proc;  // null: every call fails as one with wrong arguments
  };
  // Every built-in function, in the order of registration.
  static std::span<const Registration> registrations();

 protected:
  explicit XQueryBuiltInFunction(XQueryProcedure initWithProc, bool readsArgumentsOnly = false)
      : NSCounted(Kind::BuiltInFunction),
        _proc(initWithProc),
        _readsArgumentsOnly(readsArgumentsOnly) {}
  template <class T, class... Arguments>
  friend Ref<T> make(Arguments&&...);

 private:
  XQueryProcedure _proc;
  bool _readsArgumentsOnly;
};

}  // namespace xquery
